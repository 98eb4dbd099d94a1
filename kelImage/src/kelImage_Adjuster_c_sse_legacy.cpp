// Contrast stretching of 8-bit grey, 16 pixels at a time over whole padded rows. Rests on SSE4.1.
#include "kelImage_Blocks.h"
#include "kelImage_Private.h"

using kel::load16;
using kel::row;
using kel::store16;

namespace {

int leastByte(__m128i v) {
    v = _mm_min_epu8(v, _mm_srli_si128(v, 8));
    v = _mm_min_epu8(v, _mm_srli_si128(v, 4));
    v = _mm_min_epu8(v, _mm_srli_si128(v, 2));
    v = _mm_min_epu8(v, _mm_srli_si128(v, 1));
    return _mm_cvtsi128_si32(v) & 0xff;
}

struct Range {
    int least, greatest;
};

// Range of all bytes of the source's rows. The padding takes part in it: callers rely on that.
Range rangeOf(const kelImage_t* src, const kelImage_t* dst) {
    const __m128i ones = _mm_set1_epi8(-1);
    __m128i least = ones, greatest = _mm_setzero_si128();
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        const uint8_t* const s = row<uint8_t>(src, y);
        for (kelValue_s32 x = 0; x < dst->width; x += 16) {
            const __m128i v = load16(s + x);
            least = _mm_min_epu8(least, v);
            greatest = _mm_max_epu8(greatest, v);
        }
    }
    return {leastByte(least), 255 - leastByte(_mm_xor_si128(greatest, ones))};
}

// Four bytes, widened to lanes, times scale; rounded by the thread's rounding mode.
__m128i scaled(__m128i lanes, __m128 scale) {
    return _mm_cvtps_epi32(_mm_mul_ps(_mm_cvtepi32_ps(lanes), scale));
}

__m128i stretched(__m128i s, __m128i least, __m128 scale) {
    const __m128i zero = _mm_setzero_si128(), v = _mm_sub_epi8(s, least);
    const __m128i low = _mm_unpacklo_epi8(v, zero), high = _mm_unpackhi_epi8(v, zero);
    const __m128i a =
        _mm_packs_epi32(scaled(_mm_unpacklo_epi16(low, zero), scale), scaled(_mm_unpackhi_epi16(low, zero), scale));
    const __m128i b =
        _mm_packs_epi32(scaled(_mm_unpacklo_epi16(high, zero), scale), scaled(_mm_unpackhi_epi16(high, zero), scale));
    return _mm_packus_epi16(a, b);
}

} // namespace

extern "C" {

void adjustKelImageSSE_U8G(kelImage_t* dst, const kelImage_t* src) {
    const Range range = rangeOf(src, dst);
    const int extent = range.greatest - range.least;
    const __m128 scale = _mm_set1_ps(extent ? 255.0f / static_cast<float>(extent) : 1.0f);
    const __m128i least = _mm_set1_epi8(static_cast<char>(range.least));
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        kel::walkRow(row<uint8_t>(dst, y), row<uint8_t>(src, y), dst->width,
                     [=](uint8_t* d, const uint8_t* s) { store16(d, stretched(load16(s), least, scale)); });
}

} // extern "C"
