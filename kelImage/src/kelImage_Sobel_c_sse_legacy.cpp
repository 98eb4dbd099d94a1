// Sobel gradient magnitude in single precision, by the thread's rounding mode.
// Rests on the row helpers and on gradients that are exact in 16 bits, their squares in 32.
#include "kelImage_Private.h"
#include "kelImage_Vector.h"

namespace {

using kel::load8;
using kel::store16;
using kel::store8;
using kel::weigh;
using kel::weights;

constexpr kelValue_s32 kReach = 1;
constexpr kelValue_s32 kMargin = 16;
constexpr kelValue_s32 kBlock = 4; // columns are written in fours; two blocks are computed at a time

// Down the rows, eight columns each: above + 2 * middle + below (0..1020), and above - below (-255..255).
struct Columns {
    __m128i smooth, difference;
};

inline Columns columns(const uint8_t* middle, ptrdiff_t step) {
    const __m128i m = load8(middle), outer = _mm_unpacklo_epi8(load8(middle - step), load8(middle + step));
    return {_mm_add_epi16(weigh(outer, weights(1, 1)), weigh(_mm_unpacklo_epi8(m, m), weights(1, 1))),
            weigh(outer, weights(1, -1))};
}

// Four roots of gx^2 + gy^2: the sum is at most 2080800, which single precision holds exactly.
inline __m128i roots(__m128i gxgy) {
    const __m128 squares = _mm_cvtepi32_ps(_mm_madd_epi16(gxgy, gxgy));
    return _mm_cvtps_epi32(_mm_sqrt_ps(squares));
}

// Eight magnitudes; `a` holds the columns from one left of the first, `b` the eight after those.
inline __m128i magnitudes(const Columns& a, const Columns& b) {
    const __m128i middle = _mm_alignr_epi8(b.difference, a.difference, 2);
    const __m128i right = _mm_alignr_epi8(b.difference, a.difference, 4);
    const __m128i gx = _mm_sub_epi16(a.smooth, _mm_alignr_epi8(b.smooth, a.smooth, 4));
    const __m128i gy = _mm_add_epi16(_mm_add_epi16(a.difference, right), _mm_add_epi16(middle, middle));
    return _mm_packs_epi32(roots(_mm_unpacklo_epi16(gx, gy)), roots(_mm_unpackhi_epi16(gx, gy)));
}

// Columns kMargin .. end-1 and, after them, four zeros: callers rely on that tail.
void sobelRow(int16_t* dst, const uint8_t* src, ptrdiff_t step, kelValue_s32 end) {
    Columns a = columns(src + kMargin - kReach, step);
    for (kelValue_s32 x = kMargin; x < end; x += 2 * kBlock) {
        const Columns b = columns(src + x - kReach + 8, step);
        store16(dst + x, magnitudes(a, b)); // may run over the tail, which comes after
        a = b;
    }
    store8(dst + end, _mm_setzero_si128());
}

} // namespace

extern "C" void applyKelFilterSobelSSE3X3(kelImage_t* dst, kelImage_t* src) {
    KEL_ASSERT(dst->step == src->step && dst->width == src->width && dst->height == src->height);
    if (src->type != KEL_PIXEL_TYPE_U8G)
        return;
    KEL_ASSERT(dst->type == KEL_PIXEL_TYPE_S16G);
    const kelValue_s32 end = kel::blocksEnd(src->width, kMargin, kBlock);
    if (end == kMargin)
        return;
    for (kelValue_s32 y = kReach; y < src->height - kReach; ++y)
        sobelRow(kel::row<int16_t>(dst, y), kel::row<uint8_t>(src, y), src->step, end);
}
