// Binarization of 8-bit grey, 16 pixels at a time: against one threshold, and against a local mean. Rests on SSE4.1.
#include <algorithm>

#include "kelImage_Blocks.h"
#include "kelImage_Private.h"

using kel::load16;
using kel::load8;
using kel::row;
using kel::store16;
using kel::store8;

namespace {

// 255 where s >= t as unsigned bytes, else 0.
__m128i atLeast(__m128i s, __m128i t) {
    return _mm_cmpeq_epi8(_mm_max_epu8(s, t), s);
}

// The kernel of the local mean, (2, 7, 14, 18, 14, 7, 2) / 64 at distances of 4 pixels. A sum is at most 64 * 255 = 16320.
constexpr int kMargin = 16; // pixels at either end that have no mean: 12 of the kernel, rounded up to a block
constexpr ptrdiff_t kDistance = 4;

// 2 * a + 7 * b + 14 * c of pairs of bytes side by side, and 18 of the centre, in words.
__m128i weighted(__m128i outer, __m128i middle, __m128i inner, __m128i centre) {
    const __m128i a = _mm_maddubs_epi16(outer, _mm_set1_epi8(2)), b = _mm_maddubs_epi16(middle, _mm_set1_epi8(7));
    const __m128i c = _mm_maddubs_epi16(inner, _mm_set1_epi8(14)), d = _mm_maddubs_epi16(centre, _mm_set1_epi8(18));
    return _mm_srli_epi16(_mm_add_epi16(_mm_add_epi16(a, b), _mm_add_epi16(c, d)), 6);
}

// Means of 8 pixels at `p`, taps `pitch` bytes apart, in words; reads 8 bytes at each tap.
__m128i means8(const uint8_t* p, ptrdiff_t pitch) {
    const auto both = [=](ptrdiff_t tap) { return _mm_unpacklo_epi8(load8(p - tap * pitch), load8(p + tap * pitch)); };
    return weighted(both(3), both(2), both(1), _mm_unpacklo_epi8(load8(p), _mm_setzero_si128()));
}

// The same for 16 pixels, in bytes; reads 16 bytes at each tap.
__m128i means16(const uint8_t* p, ptrdiff_t pitch) {
    const __m128i zero = _mm_setzero_si128(), centre = load16(p);
    const __m128i outer0 = load16(p - 3 * pitch), outer1 = load16(p + 3 * pitch);
    const __m128i middle0 = load16(p - 2 * pitch), middle1 = load16(p + 2 * pitch);
    const __m128i inner0 = load16(p - pitch), inner1 = load16(p + pitch);
    const __m128i low = weighted(_mm_unpacklo_epi8(outer0, outer1), _mm_unpacklo_epi8(middle0, middle1),
                                 _mm_unpacklo_epi8(inner0, inner1), _mm_unpacklo_epi8(centre, zero));
    const __m128i high = weighted(_mm_unpackhi_epi8(outer0, outer1), _mm_unpackhi_epi8(middle0, middle1),
                                  _mm_unpackhi_epi8(inner0, inner1), _mm_unpackhi_epi8(centre, zero));
    return _mm_packus_epi16(low, high);
}

// Means along a row, in blocks of 8 from the margin on, the first always and each while it starts before width - margin. The 8
// pixels behind the last block become 0, and the vertical pass takes them in: callers rely on it. Single blocks read 8 bytes a
// tap, so that nothing behind the padded row is touched.
void meansAlongRow(uint8_t* t, const uint8_t* s, kelValue_s32 width) {
    kelValue_s32 x = kMargin;
    for (; x + 8 < width - kMargin; x += 16)
        store16(t + x, means16(s + x, kDistance));
    if (x < width - kMargin) {
        store16(t + x, _mm_packus_epi16(means8(s + x, kDistance), _mm_setzero_si128()));
    } else {
        store8(t + x, _mm_setzero_si128());
    }
}

// Row y of the destination against the means down the columns of tmp.
void compareRow(kelImage_t* dst, const kelImage_t* src, const kelImage_t* tmp, kelValue_s32 y) {
    uint8_t* const d = row<uint8_t>(dst, y);
    const uint8_t *const s = row<uint8_t>(src, y), *const t = row<uint8_t>(tmp, y);
    for (kelValue_s32 x = kMargin; x < dst->width - kMargin; x += 16)
        store16(d + x, atLeast(load16(s + x), means16(t + x, kDistance * tmp->step)));
}

} // namespace

extern "C" {

void binalizeKelImageSSE_U8G(kelImage_t* dst, const kelImage_t* src, kelValue_s32 threshold) {
    const __m128i t = _mm_set1_epi8(static_cast<char>(threshold)); // the low 8 bits only: callers rely on 256 being 0
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        kel::walkRow(row<uint8_t>(dst, y), row<uint8_t>(src, y), dst->width,
                     [t](uint8_t* d, const uint8_t* s) { store16(d, atLeast(load16(s), t)); });
}

// Both passes row by row: the destination's row y follows as soon as the means of row y + 12 are there, while they are cached.
void binalizeKelImageAdaptiveSSE_U8G(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp) {
    constexpr kelValue_s32 lag = 3 * kDistance;
    const bool horizontal = tmp->width > 2 * kMargin, vertical = dst->width > 2 * kMargin && dst->height > 2 * kMargin;
    const kelValue_s32 lastRow = vertical ? dst->height - kMargin - 1 : -1;
    const kelValue_s32 rows = std::max(horizontal ? tmp->height : 0, lastRow + lag + 1);
    for (kelValue_s32 y = 0; y < rows; ++y) {
        if (horizontal && y < tmp->height)
            meansAlongRow(row<uint8_t>(tmp, y), row<uint8_t>(src, y), tmp->width);
        if (y - lag >= kMargin && y - lag <= lastRow)
            compareRow(dst, src, tmp, y - lag);
    }
}

} // extern "C"
