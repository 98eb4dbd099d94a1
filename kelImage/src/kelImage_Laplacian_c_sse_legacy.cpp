// Cross operator: the four neighbours at distance 5 minus four times the centre, in blocks of 16 columns.
// Rests on the row helpers and on the multiplication of unsigned bytes by signed ones (SSSE3).
#include "kelImage_Private.h"
#include "kelImage_Vector.h"

namespace {

using kel::load16;
using kel::store16;
using kel::weigh;
using kel::weights;

constexpr kelValue_s32 kReach = 5; // deliberately not 1, whatever the name says: the keypoint detector is tuned to it
constexpr kelValue_s32 kMargin = 8;
constexpr kelValue_s32 kBlock = 16;

// (left + right) + (up + down) - 2 * (centre + centre) of eight columns that come in as pairs: -1020..1020.
inline __m128i cross(__m128i leftRight, __m128i upDown, __m128i centreTwice) {
    const __m128i ends = _mm_add_epi16(weigh(leftRight, weights(1, 1)), weigh(upDown, weights(1, 1)));
    return _mm_add_epi16(ends, weigh(centreTwice, weights(-2, -2)));
}

void crossRow(int16_t* dst, const uint8_t* src, ptrdiff_t step, kelValue_s32 end) {
    const uint8_t* const above = src - kReach * step;
    const uint8_t* const below = src + kReach * step;
    for (kelValue_s32 x = kMargin; x < end; x += kBlock) {
        const __m128i left = load16(src + x - kReach), right = load16(src + x + kReach);
        const __m128i up = load16(above + x), down = load16(below + x), centre = load16(src + x);
        store16(dst + x, cross(_mm_unpacklo_epi8(left, right), _mm_unpacklo_epi8(up, down), _mm_unpacklo_epi8(centre, centre)));
        store16(dst + x + 8,
                cross(_mm_unpackhi_epi8(left, right), _mm_unpackhi_epi8(up, down), _mm_unpackhi_epi8(centre, centre)));
    }
}

} // namespace

extern "C" void applyKelFilterLaplacianSSE3X3(kelImage_t* dst, kelImage_t* src) {
    KEL_ASSERT(dst->step == src->step && dst->width == src->width && dst->height == src->height);
    if (src->type != KEL_PIXEL_TYPE_U8G)
        return;
    KEL_ASSERT(dst->type == KEL_PIXEL_TYPE_S16G);
    const kelValue_s32 end = kel::blocksEnd(src->width, kMargin, kBlock);
    for (kelValue_s32 y = kReach; y < src->height - kReach; ++y)
        crossRow(kel::row<int16_t>(dst, y), kel::row<uint8_t>(src, y), src->step, end);
}
