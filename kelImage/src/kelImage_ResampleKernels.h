// Kernels of resampling: grey averaged at whole-number ratios, and four-byte pixels enlarged or reduced at any ratio.
#ifndef KEL_IMAGE_RESAMPLE_KERNELS_H
#define KEL_IMAGE_RESAMPLE_KERNELS_H

#include "kelImage_Kernels.h"
#include "kelImage_Walk.h"

namespace {

// ---- Grey at whole-number ratios: (a + b + c + d + 2) / 4 of a pixel, its neighbour, and those below. For the usual ratios the
// compiler makes vectors of it.

template <int R>
void averageAtRatio(uint8_t* __restrict d, const uint8_t* __restrict s, const uint8_t* __restrict below, ptrdiff_t width,
                    ptrdiff_t neighbour, ptrdiff_t ratio) {
    const ptrdiff_t stride = R ? R : ratio;
    const uint8_t *const t = s + neighbour, *const belowT = below + neighbour;
    for (ptrdiff_t x = 0; x < width; ++x) {
        const ptrdiff_t i = x * stride;
        d[x] = static_cast<uint8_t>((s[i] + t[i] + below[i] + belowT[i] + 2) >> 2);
    }
}

void averageOfFour(uint8_t* d, const uint8_t* s, const uint8_t* below, ptrdiff_t width, ptrdiff_t neighbour, ptrdiff_t ratio) {
    switch (ratio) {
    case 1:
        return averageAtRatio<1>(d, s, below, width, neighbour, ratio);
    case 2:
        return averageAtRatio<2>(d, s, below, width, neighbour, ratio);
    case 3:
        return averageAtRatio<3>(d, s, below, width, neighbour, ratio);
    case 4:
        return averageAtRatio<4>(d, s, below, width, neighbour, ratio);
    default:
        return averageAtRatio<0>(d, s, below, width, neighbour, ratio);
    }
}

// ---- Linear enlargement: (p * (256 - weight) + next * weight) >> 8, at most 255 * 256 before the shift.

template <class V> V mixed(V p, V next, V weight) {
    return shiftRightWords<8>(addWords(mulWords(p, subWords(V::words(256), weight)), mulWords(next, weight)));
}

// Three channels of two pixels a lane, and of their neighbours, as words; the fourth becomes 0.
constexpr Sixteen kPixels = {{0, -1, 1, -1, 2, -1, -1, -1, 8, -1, 9, -1, 10, -1, -1, -1}},
                  kNeighbours = {{4, -1, 5, -1, 6, -1, -1, -1, 12, -1, 13, -1, 14, -1, -1, -1}};

// Words of whole vectors of two pixels a lane; a weight stands four times a pixel.
template <class V> V mixedAcross(const uint32_t* s, const int32_t* index, const uint16_t* weights) {
    const V pairs = V::loadEights(s, index, 2);
    return mixed(shuffle(pairs, V::every(kPixels)), shuffle(pairs, V::every(kNeighbours)), V::load(weights));
}

// Pixel i lies between s[index[i]] and the next one in memory; `width` is a multiple of 4.
void enlargeAcross(uint32_t* d, const uint32_t* s, const int32_t* index, const uint16_t* weights, ptrdiff_t width) {
    walkColumns<4>(0, width, [=](auto of, ptrdiff_t i) {
        using V = LanesOf<decltype(of)>;
        constexpr ptrdiff_t half = 2 * V::kLanes;
        store(d + i, narrowedWords(mixedAcross<V>(s, index + i, weights + 4 * i),
                                   mixedAcross<V>(s, index + i + half, weights + 4 * (i + half))));
    });
}

// Mixes two rows byte by byte.
void mixRows(uint8_t* d, const uint8_t* above, const uint8_t* below, int weight, ptrdiff_t bytes) {
    if (weight == 0) {
        memcpy(d, above, static_cast<size_t>(bytes));
        return;
    }
    const ptrdiff_t whole = bytes / 16 * 16;
    walkColumns<16>(0, whole, [=](auto of, ptrdiff_t i) {
        using V = LanesOf<decltype(of)>;
        const V a = V::load(above + i), b = V::load(below + i), zero = V::zero(), w = V::words(weight);
        store(d + i,
              packWords(mixed(lowBytes(a, zero), lowBytes(b, zero), w), mixed(highBytes(a, zero), highBytes(b, zero), w)));
    });
    for (ptrdiff_t i = whole; i < bytes; ++i)
        d[i] = static_cast<uint8_t>((above[i] * (256 - weight) + below[i] * weight) >> 8);
}

// ---- Reduction of four-byte pixels: averages of inputs under a box, each with its weight, rounding down. Of a row, inputs come
// in groups of neighbours, of rows in pairs, with their weights side by side. Four words of weights go with a group and a pixel.

// Weights up to 16: sums are words of at most 255 * 16. Groups are pairs, their weights two bytes, four times. Division by the box
// is a multiplication with its reciprocal, rounded up: exact while 255 * box * box < 2^16.
struct WordBox {
    static constexpr ptrdiff_t kWeights = 4; // words of them for a pixel
    uint32_t reciprocal;
    explicit WordBox(uint32_t box) : reciprocal((65536 + box - 1) / box) {}

    // Four pixels a lane from all their pairs of inputs.
    template <class V>
    V across(const uint32_t* s, const int32_t* index, const uint16_t* weights, ptrdiff_t pairs, ptrdiff_t pitch) const {
        static constexpr Sixteen sideBySide = {{0, 4, 1, 5, 2, 6, 3, 7, 8, 12, 9, 13, 10, 14, 11, 15}};
        constexpr ptrdiff_t half = 2 * V::kLanes;
        const auto weighedPair = [=](ptrdiff_t i) {
            return weighBytes(shuffle(V::loadEights(s, index + i, 2), V::every(sideBySide)), V::load(weights + 4 * i));
        };
        V low = V::zero(), high = V::zero();
        for (ptrdiff_t k = 0; k < pairs; ++k) {
            low = addWords(low, weighedPair(k * pitch));
            high = addWords(high, weighedPair(k * pitch + half));
        }
        return narrowedWords(divided(low), divided(high));
    }
    // Whole vectors of bytes of such rows, again in pairs.
    template <class V> V down(const uint8_t* const* row, const uint16_t* weights, ptrdiff_t pairs, ptrdiff_t i) const {
        V low = V::zero(), high = V::zero();
        for (ptrdiff_t k = 0; k < pairs; ++k, row += 2, weights += 2) {
            const V a = V::load(row[0] + i), b = V::load(row[1] + i), w = V::words(weights[1] << 8 | weights[0]);
            low = addWords(low, weighBytes(lowBytes(a, b), w));
            high = addWords(high, weighBytes(highBytes(a, b), w));
        }
        return packWords(divided(low), divided(high));
    }

private:
    template <class V> V divided(V sums) const { return mulHighWords(sums, V::words(static_cast<int>(reciprocal))); }
};

// One pixel of four and its neighbour side by side as words of four channels.
template <int first>
constexpr Sixteen kWordsSideBySide = {
    {first, -1, first + 4, -1, first + 1, -1, first + 5, -1, first + 2, -1, first + 6, -1, first + 3, -1, first + 7, -1}};

// Weights and the box are even, the box up to 8206, and so are sums, longs below 2^21. Groups are fours: weights of their first two
// inputs, and behind those of all pixels the ones of the other two. One more than a sum over the box is off by less than 256 / 2^22
// in single precision, however the thread rounds, and 1 / 8206 or more from whole numbers.
struct LongBox {
    static constexpr ptrdiff_t kWeights = 8;
    float reciprocal;
    explicit LongBox(uint32_t box) : reciprocal(1 / static_cast<float>(box)) {}

    template <class V>
    V across(const uint32_t* s, const int32_t* index, const uint16_t* weights, ptrdiff_t fours, ptrdiff_t pitch) const {
        const V zero = V::zero();
        V sums[4] = {zero, zero, zero, zero}; // a pixel a lane
        for (ptrdiff_t k = 0; k < fours; ++k, index += pitch, weights += 2 * kWeights * pitch)
            for (ptrdiff_t j = 0; j < 4; ++j) {
                const uint16_t* const w = weights + kWeights * j * V::kLanes;
                const V pixels = V::loadSixteens(s, index + j * V::kLanes);
                const V firstTwo = weighWords(shuffle(pixels, V::every(kWordsSideBySide<0>)), V::load(w)),
                        lastTwo = weighWords(shuffle(pixels, V::every(kWordsSideBySide<8>)), V::load(w + kWeights * pitch));
                sums[j] = addLongs(sums[j], addLongs(firstTwo, lastTwo));
            }
        return longsInTurn(inBytes(sums));
    }
    template <class V> V down(const uint8_t* const* row, const uint16_t* weights, ptrdiff_t pairs, ptrdiff_t i) const {
        const V zero = V::zero();
        V sums[4] = {zero, zero, zero, zero};
        for (ptrdiff_t k = 0; k < pairs; ++k, row += 2, weights += 2) {
            const V a = V::load(row[0] + i), b = V::load(row[1] + i), w = V::longs(weights[1] << 16 | weights[0]);
            const V low = lowBytes(a, b), high = highBytes(a, b);
            const V words[4] = {lowBytes(low, zero), highBytes(low, zero), lowBytes(high, zero), highBytes(high, zero)};
            for (int j = 0; j < 4; ++j)
                sums[j] = addLongs(sums[j], weighWords(words[j], w));
        }
        return inBytes(sums);
    }

private:
    template <class V> V inBytes(const V* sums) const {
        return packWords(packLongs(divided(sums[0]), divided(sums[1])), packLongs(divided(sums[2]), divided(sums[3])));
    }
    template <class V> V divided(V sums) const { return truncated(timesDifference(sums, -1, reciprocal)); }
};

// Pixel i averages the groups of neighbours from s[index[i]], s[index[pitch + i]], ... on; `width`, a multiple of 4, is the
// pitch of both tables in pixels.
template <class Box>
void reduceAcross(uint32_t* d, const uint32_t* s, const int32_t* index, const uint16_t* weights, ptrdiff_t groups,
                  ptrdiff_t width, uint32_t box) {
    const Box by(box);
    walkColumns<4>(0, width, [=](auto of, ptrdiff_t i) {
        store(d + i, by.template across<LanesOf<decltype(of)>>(s, index + i, weights + Box::kWeights * i, groups, width));
    });
}

// Averages rows byte by byte; there are twice as many rows and weights as pairs.
template <class Box>
void reduceDown(uint8_t* d, const uint8_t* const* row, const uint16_t* weights, ptrdiff_t pairs, ptrdiff_t bytes,
                uint32_t box) {
    const Box by(box);
    const ptrdiff_t whole = bytes / 16 * 16;
    walkColumns<16>(
        0, whole, [=](auto of, ptrdiff_t i) { store(d + i, by.template down<LanesOf<decltype(of)>>(row, weights, pairs, i)); });
    for (ptrdiff_t i = whole; i < bytes; ++i) {
        uint32_t sum = 0;
        for (ptrdiff_t k = 0; k < 2 * pairs; ++k)
            sum += weights[k] * uint32_t(row[k][i]);
        d[i] = static_cast<uint8_t>(sum / box);
    }
}

// ---- Two to one both ways: halves across, then down, each rounding down.

// An average rounds up; together with the one that rounds down it makes the sum.
template <class V> V halfOfSum(V a, V b) {
    return subBytes(addBytes(a, b), averageBytes(a, b));
}

template <class V> V halvedAcross(const uint32_t* s) { // halves of lanes are still to be put in order
    const V low = V::load(s), high = V::load(s + V::kBytes / 4);
    return halfOfSum(evenLongs(low, high), oddLongs(low, high));
}

void halveBothWays(uint32_t* d, const uint32_t* above, const uint32_t* below, ptrdiff_t width) {
    const ptrdiff_t whole = width / 4 * 4;
    walkColumns<4>(0, whole, [=](auto of, ptrdiff_t x) {
        using V = LanesOf<decltype(of)>;
        store(d + x, ordered(halfOfSum(halvedAcross<V>(above + 2 * x), halvedAcross<V>(below + 2 * x))));
    });
    const auto half = [](uint32_t a, uint32_t b) { return (a & b) + ((a ^ b) >> 1 & 0x7f7f7f7f); };
    for (ptrdiff_t x = whole; x < width; ++x)
        d[x] = half(half(above[2 * x], above[2 * x + 1]), half(below[2 * x], below[2 * x + 1]));
}

} // namespace

#endif
