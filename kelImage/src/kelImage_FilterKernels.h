// Kernels of the neighbourhood filters: Gaussian 5x5 and 7x7 by rows, cross operator, Sobel magnitude, and the candidates of
// the keypoint detector.
#ifndef KEL_IMAGE_FILTER_KERNELS_H
#define KEL_IMAGE_FILTER_KERNELS_H

#include "kelImage_Walk.h"

namespace {

// first * byte0 + second * byte1 of every pair of bytes, in words.
template <int first, int second, class V> V weighed(V pairs) {
    return weighBytes(pairs, V::words(second * 256 + (first & 255)));
}

// ---- Gaussian 5x5: weights (1, 4, 6, 4, 1) both ways, rounded once. Sums across are 0..4080; down they are at most 65280, with
// the half that rounds them 65408, which is unsigned 16 bits.

constexpr ptrdiff_t kReach5 = 2; // taps on either side of the centre, and the columns at either end that come out as zero
constexpr int kRound5 = 128, kShift5 = 8;

// Columns kReach5 .. end-1, by blocks of 16 a lane where one fits; the last block ends at `end` and may overlap the one before.
template <class Block, class Single> void forInnerColumns(ptrdiff_t end, Block block, Single single) {
    const auto blocks = [=](auto of) {
        constexpr ptrdiff_t columns = 16 * LanesOf<decltype(of)>::kLanes;
        ptrdiff_t x = kReach5;
        for (; x <= end - columns; x += columns)
            block(of, x);
        if (x < end)
            block(of, end - columns);
    };
    if (end - kReach5 >= 16 * Wide::kLanes)
        return blocks(Of<Wide>());
    if (end - kReach5 >= 16)
        return blocks(Of<Lanes1>());
    for (ptrdiff_t x = kReach5; x < end; ++x)
        single(x);
}

template <class T> void clearEnds(T* row, ptrdiff_t width) {
    const ptrdiff_t ends = width < kReach5 ? width : kReach5;
    for (ptrdiff_t i = 0; i < ends; ++i)
        row[i] = row[width - 1 - i] = 0;
}

void fiveAcross(int16_t* t, const uint8_t* s, ptrdiff_t width) {
    forInnerColumns(
        width - kReach5,
        [=](auto of, ptrdiff_t x) {
            using V = LanesOf<decltype(of)>;
            const V a = V::load(s + x - 2), b = V::load(s + x), c = V::load(s + x + 2);
            const V even = addWords(addWords(weighed<1, 4>(a), weighed<6, 4>(b)), weighed<1, 0>(c));
            const V odd = addWords(addWords(weighed<0, 1>(a), weighed<4, 6>(b)), weighed<4, 1>(c));
            storeInTurn(t + x, lowWords(even, odd), highWords(even, odd));
        },
        [=](ptrdiff_t x) { t[x] = static_cast<int16_t>(s[x - 2] + 4 * s[x - 1] + 6 * s[x] + 4 * s[x + 1] + s[x + 2]); });
    clearEnds(t, width);
}

void fiveDown(uint8_t* d, const int16_t* const* row, ptrdiff_t width) {
    const int16_t *const a = row[0], *const b = row[1], *const c = row[2], *const e = row[3], *const f = row[4];
    forInnerColumns(
        width - kReach5,
        [=](auto of, ptrdiff_t x) {
            using V = LanesOf<decltype(of)>;
            const auto words = [=](ptrdiff_t i) {
                const V centre = V::load(c + i);
                const V inner = addWords(addWords(V::load(b + i), V::load(e + i)), centre);
                const V outer = addWords(addWords(V::load(a + i), V::load(f + i)), V::words(kRound5));
                return shiftRightWords<kShift5>(addWords(addWords(outer, shiftLeftWords<2>(inner)), shiftLeftWords<1>(centre)));
            };
            store(d + x, narrowedWords(words(x), words(x + V::kBytes / 2)));
        },
        [=](ptrdiff_t x) {
            const int sum = a[x] + 4 * b[x] + 6 * c[x] + 4 * e[x] + f[x];
            d[x] = static_cast<uint8_t>((sum + kRound5) >> kShift5);
        });
    clearEnds(d, width);
}

// ---- Gaussian 7x7: weights (2, 7, 14, 18, 14, 7, 2) / 64, rounded after each pass.

template <class V> struct Two { V first, second; };

// (sum + 32) >> 6 as the rounding multiplication (sum * 512 + 2^14) >> 15; a sum is at most 16320, a result 255.
template <class V> V sixtyFourth(V sum) {
    return mulRoundedWords(sum, V::words(512));
}

// Eight values v0 .. v7 come in as pairs; the first sum is centred on v3, the second on v4:
//   v0  v1   v2  v3   v4  v5   v6  v7
//    2   7   14  18   14   7    2   -    first
//    -   2    7  14   18  14    7   2    second
template <class V> Two<V> smooth(V v01, V v23, V v45, V v67) {
    const V first =
        addWords(addWords(weighed<2, 7>(v01), weighed<14, 18>(v23)), addWords(weighed<14, 7>(v45), weighed<2, 0>(v67)));
    const V second =
        addWords(addWords(weighed<0, 2>(v01), weighed<7, 14>(v23)), addWords(weighed<18, 14>(v45), weighed<7, 2>(v67)));
    return {sixtyFourth(first), sixtyFourth(second)};
}

// Columns begin .. end-1, a multiple of 8, and 8 zeros behind them. Pairs of neighbouring bytes give the even columns first,
// the odd ones second.
void sevenAcross(uint8_t* t, const uint8_t* s, ptrdiff_t begin, ptrdiff_t end) {
    const ptrdiff_t whole = begin + (end - begin) / 16 * 16;
    walkColumns<16>(begin, whole, [=](auto of, ptrdiff_t x) {
        using V = LanesOf<decltype(of)>;
        const Two<V> of7 = smooth(V::load(s + x - 3), V::load(s + x - 1), V::load(s + x + 1), V::load(s + x + 3));
        store(t + x, of7.first | shiftLeftWords<8>(of7.second));
    });
    if (whole < end) { // eight columns; reads nothing behind those that they need
        const Lanes1 a = Lanes1::load(s + whole - 3), zero = Lanes1::zero();
        const Two<Lanes1> of7 = smooth(a, joined<2>(a, zero), joined<4>(a, zero), joined<6>(a, zero));
        storeHalf(t + whole, of7.first | shiftLeftWords<8>(of7.second));
    }
    storeHalf(t + end, Lanes1::zero());
}

// Two output rows at once: they share the pairs that eight scratch rows form.
template <class V> Two<V> sevenRows(const uint8_t* t, ptrdiff_t pitch, const uint8_t* last) {
    const V v0 = V::load(t), v1 = V::load(t + pitch), v2 = V::load(t + 2 * pitch), v3 = V::load(t + 3 * pitch);
    const V v4 = V::load(t + 4 * pitch), v5 = V::load(t + 5 * pitch), v6 = V::load(t + 6 * pitch), v7 = V::load(last);
    const Two<V> low = smooth(lowBytes(v0, v1), lowBytes(v2, v3), lowBytes(v4, v5), lowBytes(v6, v7));
    const Two<V> high = smooth(highBytes(v0, v1), highBytes(v2, v3), highBytes(v4, v5), highBytes(v6, v7));
    return {packWords(low.first, high.first), packWords(low.second, high.second)};
}

// Columns begin .. end-1 of two rows; the even columns of the second go into `half` too, where it is given, with 8 zeros behind
// the last of them.
void sevenDownTwice(uint8_t* first, uint8_t* second, uint8_t* half, const uint8_t* t, ptrdiff_t pitch, ptrdiff_t begin,
                    ptrdiff_t end) {
    walkColumns<16>(begin, end, [=](auto of, ptrdiff_t x) {
        using V = LanesOf<decltype(of)>;
        const Two<V> rows = sevenRows<V>(t + x, pitch, t + x + 7 * pitch);
        store(first + x, rows.first);
        store(second + x, rows.second);
        if (half)
            storeHalf(half + x / 2, narrowedWords(rows.second & V::words(0x00ff), V::zero()));
    });
    if (half && begin < end)
        storeHalf(half + end / 2, Lanes1::zero());
}

void sevenDown(uint8_t* d, const uint8_t* t, ptrdiff_t pitch, ptrdiff_t begin, ptrdiff_t end) {
    walkColumns<16>(begin, end, [=](auto of, ptrdiff_t x) {
        using V = LanesOf<decltype(of)>;
        store(d + x, sevenRows<V>(t + x, pitch, t + x).first);
    });
}

// ---- Cross operator: (left + right) + (up + down) - 2 * (centre + centre) at a distance: -1020..1020.

template <class V> V cross(V leftRight, V upDown, V centreTwice) {
    return addWords(addWords(weighed<1, 1>(leftRight), weighed<1, 1>(upDown)), weighed<-2, -2>(centreTwice));
}

void crossRow(int16_t* d, const uint8_t* s, ptrdiff_t pitch, ptrdiff_t distance, ptrdiff_t begin, ptrdiff_t end) {
    walkColumns<16>(begin, end, [=](auto of, ptrdiff_t x) {
        using V = LanesOf<decltype(of)>;
        const V left = V::load(s + x - distance), right = V::load(s + x + distance), centre = V::load(s + x);
        const V up = V::load(s + x - distance * pitch), down = V::load(s + x + distance * pitch);
        storeInTurn(d + x, cross(lowBytes(left, right), lowBytes(up, down), lowBytes(centre, centre)),
                    cross(highBytes(left, right), highBytes(up, down), highBytes(centre, centre)));
    });
}

// ---- Sobel magnitude in single precision, by the thread's rounding mode. Gradients are exact in 16 bits (-1020..1020); the sum
// of their squares, at most 2080800, is in single precision.

template <class V> V rootsOfSquares(V gxgy) {
    return rounded(rootOf(floatsOf(weighWords(gxgy, gxgy))));
}

// Pairs of neighbours (left, right) above, in the middle and below, and (above, below).
template <class V> V magnitudesOf(V above, V middle, V below, V aboveBelow) {
    const V gx = addWords(addWords(weighed<1, -1>(above), weighed<1, -1>(below)), weighed<2, -2>(middle));
    const V gy = addWords(subWords(weighed<1, 1>(above), weighed<1, 1>(below)), weighed<2, -2>(aboveBelow));
    return packLongs(rootsOfSquares(lowWords(gx, gy)), rootsOfSquares(highWords(gx, gy)));
}

// Sixteen columns a lane.
template <class V> void sobelBlock(int16_t* d, const uint8_t* s, ptrdiff_t pitch) {
    const uint8_t *const a = s - pitch, *const b = s + pitch;
    const V aLeft = V::load(a - 1), aRight = V::load(a + 1), left = V::load(s - 1), right = V::load(s + 1);
    const V bLeft = V::load(b - 1), bRight = V::load(b + 1), up = V::load(a), down = V::load(b);
    storeInTurn(d, magnitudesOf(lowBytes(aLeft, aRight), lowBytes(left, right), lowBytes(bLeft, bRight), lowBytes(up, down)),
                magnitudesOf(highBytes(aLeft, aRight), highBytes(left, right), highBytes(bLeft, bRight), highBytes(up, down)));
}

// Columns begin .. end-1, a multiple of 4, and 4 zeros behind them.
void sobelRow(int16_t* d, const uint8_t* s, ptrdiff_t pitch, ptrdiff_t begin, ptrdiff_t end) {
    const ptrdiff_t whole = begin + (end - begin) / 16 * 16;
    walkColumns<16>(begin, whole, [=](auto of, ptrdiff_t x) { sobelBlock<LanesOf<decltype(of)>>(d + x, s + x, pitch); });
    if (whole < end) {
        int16_t last[16];
        sobelBlock<Lanes1>(last, s + whole, pitch);
        memcpy(d + whole, last, static_cast<size_t>(end - whole) * sizeof *d);
    }
    storeHalf(d + end, Lanes1::zero());
}

// ---- Keypoints: columns where the response is beyond both limits and beyond its left, right, upper and lower neighbour.

template <class V> V strongExtrema(const int16_t* r, ptrdiff_t pitch, int strong) {
    const V left = V::load(r - 1), right = V::load(r + 1), up = V::load(r - pitch), down = V::load(r + pitch),
            here = V::load(r);
    const V most = maxWords(maxWords(left, right), maxWords(up, down)),
            least = minWords(minWords(left, right), minWords(up, down));
    return greaterWords(here, maxWords(most, V::words(strong - 1))) | greaterWords(minWords(least, V::words(1 - strong)), here);
}

// 64 columns a mask; bit i stands for column i. Reads columns -1 .. 64 * masks of three rows.
void extremaMasks(uint64_t* mask, const int16_t* r, ptrdiff_t pitch, ptrdiff_t masks, int strong) {
    constexpr int half = Wide::kBytes / 2;
    for (ptrdiff_t i = 0; i < masks; ++i, r += 64) {
        mask[i] = 0;
        for (int x = 0; x < 64; x += 2 * half)
            mask[i] |= signsOfWords(strongExtrema<Wide>(r + x, pitch, strong), strongExtrema<Wide>(r + x + half, pitch, strong))
                       << x;
    }
}

} // namespace

#endif
