// Kernels of single pixels and of local means: contrast, and binarization against a threshold or a mean.
#ifndef KEL_IMAGE_POINT_KERNELS_H
#define KEL_IMAGE_POINT_KERNELS_H

#include "kelImage_Kernels.h"
#include "kelImage_Walk.h"

namespace {

// ---- Contrast

// Least and greatest byte of columns x .. end-1, as far as whole vectors go; returns the first column that is left.
template <class V>
ptrdiff_t extendRange(kel::Range& range, const uint8_t* s, ptrdiff_t pitch, ptrdiff_t x, ptrdiff_t end, ptrdiff_t rows) {
    V least = V::bytes(range.least), greatest = V::bytes(range.greatest);
    const ptrdiff_t last = x + (end - x) / V::kBytes * V::kBytes;
    for (ptrdiff_t y = 0; y < rows; ++y, s += pitch)
        for (ptrdiff_t i = x; i < last; i += V::kBytes) {
            const V bytes = V::load(s + i);
            least = minBytes(least, bytes);
            greatest = maxBytes(greatest, bytes);
        }
    uint8_t low[V::kBytes], high[V::kBytes];
    store(low, least);
    store(high, greatest);
    for (int i = 0; i < V::kBytes; ++i) {
        range.least = low[i] < range.least ? low[i] : range.least;
        range.greatest = high[i] > range.greatest ? high[i] : range.greatest;
    }
    return last;
}

kel::Range rangeOf(const uint8_t* s, ptrdiff_t pitch, ptrdiff_t width, ptrdiff_t rows) {
    kel::Range range;
    extendRange<Lanes1>(range, s, pitch, extendRange<Wide>(range, s, pitch, 0, width, rows), width, rows);
    return range;
}

// (s - least) * scale in single precision, rounded by the thread's mode.
void stretch(uint8_t* d, const uint8_t* s, ptrdiff_t width, int least, float scale) {
    walk<16, 1, 1>(d, s, width, [=](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        const V zero = V::zero(), bytes = subBytes(V::load(from), V::bytes(least));
        const auto scaled = [=](V longs) { return rounded(floatsOf(longs) * V::floats(scale)); };
        const auto words = [=](V eight) { return packLongs(scaled(lowWords(eight, zero)), scaled(highWords(eight, zero))); };
        store(to, packWords(words(lowBytes(bytes, zero)), words(highBytes(bytes, zero))));
    });
}

// ---- Binarization

void binarize(uint8_t* d, const uint8_t* s, ptrdiff_t width, int threshold) {
    walk<16, 1, 1>(d, s, width, [=](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, atLeastBytes(V::load(from), V::bytes(threshold)));
    });
}

// The local mean has weights (2, 7, 14, 18, 14, 7, 2) / 64 at distances of 4 pixels. A sum is at most 64 * 255 = 16320.
constexpr ptrdiff_t kDistance = 4;

// The words of a mean from pairs of bytes at either side of the centre, and the centre's own.
template <class V> V weightedMean(V outer, V middle, V inner, V centre) {
    const V ends = addWords(weighBytes(outer, V::bytes(2)), weighBytes(middle, V::bytes(7)));
    const V core = addWords(weighBytes(inner, V::bytes(14)), weighBytes(centre, V::bytes(18)));
    return shiftRightWords<6>(addWords(ends, core));
}

// Means of whole vectors of pixels at p, taps `pitch` bytes apart.
template <class V> V localMeans(const uint8_t* p, ptrdiff_t pitch) {
    const V zero = V::zero(), centre = V::load(p);
    const V outer0 = V::load(p - 3 * pitch), outer1 = V::load(p + 3 * pitch);
    const V middle0 = V::load(p - 2 * pitch), middle1 = V::load(p + 2 * pitch);
    const V inner0 = V::load(p - pitch), inner1 = V::load(p + pitch);
    return packWords(
        weightedMean(lowBytes(outer0, outer1), lowBytes(middle0, middle1), lowBytes(inner0, inner1), lowBytes(centre, zero)),
        weightedMean(highBytes(outer0, outer1), highBytes(middle0, middle1), highBytes(inner0, inner1),
                     highBytes(centre, zero)));
}

// The same for 8 pixels, followed by zeros; reads 8 bytes at each tap.
Lanes1 localMeansOfEight(const uint8_t* p, ptrdiff_t pitch) {
    const auto both = [=](ptrdiff_t tap) {
        return lowBytes(Lanes1::loadHalf(p - tap * pitch), Lanes1::loadHalf(p + tap * pitch));
    };
    const Lanes1 centre = lowBytes(Lanes1::loadHalf(p), Lanes1::zero());
    return packWords(weightedMean(both(3), both(2), both(1), centre), Lanes1::zero());
}

// Means along a row for columns begin .. end-1, a multiple of 8, and 8 zeros behind them. Single eights read 8 bytes a tap, so
// that nothing behind the padded row is touched.
void localMeansAcross(uint8_t* t, const uint8_t* s, ptrdiff_t begin, ptrdiff_t end) {
    const ptrdiff_t whole = begin + (end - begin) / 16 * 16;
    walkColumns<16>(begin, whole,
                    [=](auto of, ptrdiff_t x) { store(t + x, localMeans<LanesOf<decltype(of)>>(s + x, kDistance)); });
    if (whole < end)
        storeHalf(t + whole, localMeansOfEight(s + whole, kDistance));
    storeHalf(t + end, Lanes1::zero());
}

// Columns begin .. end-1 of a row against the means down the columns of t.
void binarizeByMeans(uint8_t* d, const uint8_t* s, const uint8_t* t, ptrdiff_t pitch, ptrdiff_t begin, ptrdiff_t end) {
    walkColumns<16>(begin, end, [=](auto of, ptrdiff_t x) {
        using V = LanesOf<decltype(of)>;
        store(d + x, atLeastBytes(V::load(s + x), localMeans<V>(t + x, kDistance * pitch)));
    });
}

} // namespace

#endif
