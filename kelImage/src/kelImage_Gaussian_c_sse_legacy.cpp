// Gaussian 7x7: weights (2, 7, 14, 18, 14, 7, 2) / 64, rounded after each pass, in blocks of 16 columns.
// Rests on the row helpers and on the multiplication of unsigned bytes by signed ones (SSSE3).
#include <algorithm>

#include "kelImage_Private.h"
#include "kelImage_Vector.h"

namespace {

using kel::load16;
using kel::store16;
using kel::store8;
using kel::weigh;
using kel::weights;

constexpr kelValue_s32 kReach = 3;  // taps on either side of the centre, and rows left alone at top and bottom
constexpr kelValue_s32 kMargin = 8; // columns left alone on the left
constexpr kelValue_s32 kBlockAcross = 8, kBlockDown = 16;

struct Two {
    __m128i first, second;
};

// (sum + 32) >> 6 as the rounding multiplication (sum * 512 + 2^14) >> 15; a sum is at most 16320, a result 255.
inline __m128i rounded(__m128i sum) {
    return _mm_mulhrs_epi16(sum, _mm_set1_epi16(512));
}

// Eight values v0 .. v7 come in as pairs; the first sum is centred on v3, the second on v4:
//   v0  v1   v2  v3   v4  v5   v6  v7
//    2   7   14  18   14   7    2   -    first
//    -   2    7  14   18  14    7   2    second
inline Two smooth(__m128i v01, __m128i v23, __m128i v45, __m128i v67) {
    const __m128i first = _mm_add_epi16(_mm_add_epi16(weigh(v01, weights(2, 7)), weigh(v23, weights(14, 18))),
                                        _mm_add_epi16(weigh(v45, weights(14, 7)), weigh(v67, weights(2, 0))));
    const __m128i second = _mm_add_epi16(_mm_add_epi16(weigh(v01, weights(0, 2)), weigh(v23, weights(7, 14))),
                                         _mm_add_epi16(weigh(v45, weights(18, 14)), weigh(v67, weights(7, 2))));
    return {rounded(first), rounded(second)};
}

// Eight columns from s as 16-bit values. Reads s[-3] .. s[12].
inline __m128i eightAcross(const uint8_t* s) {
    const __m128i a = load16(s - 3);
    const Two of = smooth(a, _mm_srli_si128(a, 2), _mm_srli_si128(a, 4), _mm_srli_si128(a, 6));
    return _mm_unpacklo_epi16(of.first, of.second);
}

// Sixteen columns from s: pairs of neighbouring bytes give the even columns first, the odd ones second.
inline __m128i sixteenAcross(const uint8_t* s) {
    const Two of = smooth(load16(s - 3), load16(s - 1), load16(s + 1), load16(s + 3));
    return _mm_or_si128(of.first, _mm_slli_epi16(of.second, 8));
}

// Columns kMargin .. end-1 and, after them, eight zeros: callers rely on that tail.
void rowAcross(uint8_t* t, const uint8_t* s, kelValue_s32 end) {
    kelValue_s32 x = kMargin;
    for (; x <= end - 16; x += 16)
        store16(t + x, sixteenAcross(s + x));
    if (x < end)
        store8(t + x, _mm_packus_epi16(eightAcross(s + x), _mm_setzero_si128()));
    store8(t + end, _mm_setzero_si128());
}

// Two output rows of columns x .. x+15 at once: they share the pairs that eight scratch rows form.
inline Two blockDown(const uint8_t* t, ptrdiff_t step, const uint8_t* last) {
    const __m128i v0 = load16(t), v1 = load16(t + step), v2 = load16(t + 2 * step), v3 = load16(t + 3 * step);
    const __m128i v4 = load16(t + 4 * step), v5 = load16(t + 5 * step), v6 = load16(t + 6 * step), v7 = load16(last);
    const Two low =
        smooth(_mm_unpacklo_epi8(v0, v1), _mm_unpacklo_epi8(v2, v3), _mm_unpacklo_epi8(v4, v5), _mm_unpacklo_epi8(v6, v7));
    const Two high =
        smooth(_mm_unpackhi_epi8(v0, v1), _mm_unpackhi_epi8(v2, v3), _mm_unpackhi_epi8(v4, v5), _mm_unpackhi_epi8(v6, v7));
    return {_mm_packus_epi16(low.first, high.first), _mm_packus_epi16(low.second, high.second)};
}

// The eight even columns of a block, followed by eight zeros.
inline __m128i evenColumns(__m128i block) {
    return _mm_packus_epi16(_mm_and_si128(block, _mm_set1_epi16(0x00ff)), _mm_setzero_si128());
}

// Rows y and y+1 of the destination, y odd; the second also into `half`, which takes rows of even number only.
void twoRowsDown(kelImage_t* dst, kelImage_t* half, const kelImage_t* tmp, kelValue_s32 y, kelValue_s32 end) {
    const uint8_t* const t = kel::row<uint8_t>(tmp, y - kReach);
    uint8_t* const first = kel::row<uint8_t>(dst, y);
    uint8_t* const second = kel::row<uint8_t>(dst, y + 1);
    uint8_t* const halved = half ? kel::row<uint8_t>(half, (y + 1) / 2) : nullptr;
    const ptrdiff_t step = tmp->step;
    for (kelValue_s32 x = kMargin; x < end; x += kBlockDown) {
        const Two out = blockDown(t + x, step, t + x + 7 * step);
        store16(first + x, out.first);
        store16(second + x, out.second);
        // The zeros behind the last block stay, also where they run on into the next row: callers rely on them.
        if (halved)
            store16(halved + x / 2, evenColumns(out.second));
    }
}

// The last row where their number is odd; y is odd, so `half` has no part in it.
void oneRowDown(kelImage_t* dst, const kelImage_t* tmp, kelValue_s32 y, kelValue_s32 end) {
    const uint8_t* const t = kel::row<uint8_t>(tmp, y - kReach);
    for (kelValue_s32 x = kMargin; x < end; x += kBlockDown)
        store16(kel::row<uint8_t>(dst, y) + x, blockDown(t + x, tmp->step, t + x).first);
}

} // namespace

extern "C" {

void applyKelFilterGaussianSSE7X7_downsampling(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp) {
    KEL_ASSERT(src->data != NULL && dst->data != NULL && tmp->data != NULL);
    KEL_ASSERT(dst->type == src->type && src->width == dst->width && dst->height == src->height);
    if (dst->type != KEL_PIXEL_TYPE_U8G)
        return;
    KEL_ASSERT(tmp->type == KEL_PIXEL_TYPE_U8G);

    // The pass across has the scratch image's extent, whatever is written after it; callers rely on that.
    const kelValue_s32 endAcross = kel::blocksEnd(tmp->width, kMargin, kBlockAcross);
    const kelValue_s32 endDown = kel::blocksEnd(dst->width, kMargin, kBlockDown);
    const kelValue_s32 rowsAcross = endAcross > kMargin ? tmp->height : 0;
    kelValue_s32 across = 0;
    const auto acrossUpTo = [&](kelValue_s32 rows) {
        for (; across < std::min(rows, rowsAcross); ++across)
            rowAcross(kel::row<uint8_t>(tmp, across), kel::row<uint8_t>(src, across), endAcross);
    };
    // Two rows down as soon as their scratch rows are there, while these are still in the cache. A source row has been read
    // before the destination row of its number is written, so the two may be one image.
    const kelValue_s32 rowsEnd = dst->height - kReach;
    for (kelValue_s32 y = kReach; y < rowsEnd; y += 2) {
        const kelValue_s32 rows = std::min(rowsEnd - y, 2);
        acrossUpTo(y + rows + kReach);
        if (rows == 2)
            twoRowsDown(dst, half, tmp, y, endDown);
        else
            oneRowDown(dst, tmp, y, endDown);
    }
    acrossUpTo(rowsAcross);
}

void applyKelFilterGaussianSSE7X7(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussianSSE7X7_downsampling(dst, NULL, src, tmp);
}

} // extern "C"
