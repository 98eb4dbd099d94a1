// Gaussian 5x5: weights (1, 4, 6, 4, 1) / 16 both ways, rounded once; and the names that lead to the vector 7x7.
// Rests on the row helpers; the inner blocks are vectors, ends of rows are exact to the pixel.
#include <algorithm>
#include <string.h>

#include "kelImage_Private.h"
#include "kelImage_Vector.h"

namespace {

using kel::load16;
using kel::store16;
using kel::weigh;
using kel::weights;

constexpr kelValue_s32 kReach = 2;  // taps on either side of the centre, and the border that comes out as zero
constexpr kelValue_s32 kBlock = 16; // columns of a vector block
constexpr int kRound = 128, kShift = 8;

// Columns kReach .. end-1, by blocks where one fits; the last block ends at `end` and may overlap the one before.
template <class Block, class Single> void forInnerColumns(kelValue_s32 end, Block block, Single single) {
    kelValue_s32 x = kReach;
    if (end - x < kBlock) {
        for (; x < end; ++x)
            single(x);
        return;
    }
    for (; x <= end - kBlock; x += kBlock)
        block(x);
    if (x < end)
        block(end - kBlock);
}

template <class T> void clearEnds(T* row, kelValue_s32 width) {
    std::fill_n(row, std::min(width, kReach), T(0));
    std::fill_n(row + std::max(width - kReach, 0), std::min(width, kReach), T(0));
}

// 16 sums of one row at s: 0..4080.
inline void blockAcross(int16_t* t, const uint8_t* s) {
    const __m128i a = load16(s - 2), b = load16(s), c = load16(s + 2);
    const __m128i even =
        _mm_add_epi16(_mm_add_epi16(weigh(a, weights(1, 4)), weigh(b, weights(6, 4))), weigh(c, weights(1, 0)));
    const __m128i odd = _mm_add_epi16(_mm_add_epi16(weigh(a, weights(0, 1)), weigh(b, weights(4, 6))), weigh(c, weights(4, 1)));
    store16(t, _mm_unpacklo_epi16(even, odd));
    store16(t + 8, _mm_unpackhi_epi16(even, odd));
}

void rowAcross(int16_t* t, const uint8_t* s, kelValue_s32 width) {
    forInnerColumns(
        width - kReach, [=](kelValue_s32 x) { blockAcross(t + x, s + x); },
        [=](kelValue_s32 x) { t[x] = static_cast<int16_t>(s[x - 2] + 4 * s[x - 1] + 6 * s[x] + 4 * s[x + 1] + s[x + 2]); });
    clearEnds(t, width);
}

// Eight smoothed values of five rows: the sum is at most 65280, 65408 rounded, which is unsigned 16 bits.
inline __m128i eightDown(__m128i a, __m128i b, __m128i c, __m128i d, __m128i e) {
    const __m128i four = _mm_add_epi16(_mm_add_epi16(b, d), c);
    const __m128i outer = _mm_add_epi16(_mm_add_epi16(a, e), _mm_set1_epi16(kRound));
    const __m128i sum = _mm_add_epi16(_mm_add_epi16(outer, _mm_slli_epi16(four, 2)), _mm_slli_epi16(c, 1));
    return _mm_srli_epi16(sum, kShift);
}

void rowDown(uint8_t* dst, const int16_t* a, const int16_t* b, const int16_t* c, const int16_t* d, const int16_t* e,
             kelValue_s32 width) {
    const auto eight = [=](kelValue_s32 x) {
        return eightDown(load16(a + x), load16(b + x), load16(c + x), load16(d + x), load16(e + x));
    };
    forInnerColumns(
        width - kReach, [=](kelValue_s32 x) { store16(dst + x, _mm_packus_epi16(eight(x), eight(x + 8))); },
        [=](kelValue_s32 x) {
            const int sum = a[x] + 4 * b[x] + 6 * c[x] + 4 * d[x] + e[x];
            dst[x] = static_cast<uint8_t>((sum + kRound) >> kShift);
        });
    clearEnds(dst, width);
}

// Every second value of a row, from the first.
void rowHalved(uint8_t* half, const uint8_t* row, kelValue_s32 width) {
    kelValue_s32 x = 0;
    for (; x <= width - 2 * kBlock; x += 2 * kBlock) {
        const __m128i low = _mm_set1_epi16(0x00ff);
        store16(half + x / 2, _mm_packus_epi16(_mm_and_si128(load16(row + x), low), _mm_and_si128(load16(row + x + 16), low)));
    }
    for (; x < width; x += 2)
        half[x / 2] = row[x];
}

void smoothRow(kelImage_t* dst, kelImage_t* half, const kelImage_t* tmp, kelValue_s32 y) {
    uint8_t* const out = kel::row<uint8_t>(dst, y);
    const auto t = [=](kelValue_s32 offset) { return kel::row<int16_t>(tmp, y + offset); };
    if (y >= kReach && y < dst->height - kReach)
        rowDown(out, t(-2), t(-1), t(0), t(1), t(2), dst->width);
    else
        memset(out, 0, static_cast<size_t>(dst->width));
    if (half && y % 2 == 0)
        rowHalved(kel::row<uint8_t>(half, y / 2), out, dst->width);
}

} // namespace

extern "C" {

void applyKelFilterGaussian5X5_downsampling(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp) {
    KEL_ASSERT(src->data != NULL && dst->data != NULL && tmp->data != NULL);
    KEL_ASSERT(dst->type == src->type && src->width == dst->width && dst->height == src->height);
    if (dst->type != KEL_PIXEL_TYPE_U8G)
        return;
    KEL_ASSERT(tmp->type == KEL_PIXEL_TYPE_S16G);
    if (dst->width < 1)
        return;
    // Row y across, then row y - kReach down while its five rows are still in the cache. Row y of the source is read before row
    // y - kReach of the destination is written, so the two may be one image.
    for (kelValue_s32 y = 0; y < dst->height + kReach; ++y) {
        if (y < dst->height)
            rowAcross(kel::row<int16_t>(tmp, y), kel::row<uint8_t>(src, y), dst->width);
        if (y >= kReach)
            smoothRow(dst, half, tmp, y - kReach);
    }
}

void applyKelFilterGaussian5X5(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussian5X5_downsampling(dst, NULL, src, tmp);
}

void applyKelFilterGaussian7X7_downsampling(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussianSSE7X7_downsampling(dst, half, src, tmp);
}

void applyKelFilterGaussian7X7(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussian7X7_downsampling(dst, NULL, src, tmp);
}

} // extern "C"
