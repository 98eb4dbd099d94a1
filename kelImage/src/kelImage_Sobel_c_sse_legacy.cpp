// Sobel gradient magnitude in single precision, by the thread's rounding mode, in blocks of 4 columns.
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

constexpr kelValue_s32 kReach = 1;
constexpr kelValue_s32 kMargin = 16;
constexpr kelValue_s32 kBlock = 4;

} // namespace

// Behind the last block of a row come four zeros: callers rely on that tail.
extern "C" void applyKelFilterSobelSSE3X3(kelImage_t* dst, kelImage_t* src) {
    KEL_ASSERT(dst->step == src->step && dst->width == src->width && dst->height == src->height);
    if (src->type != KEL_PIXEL_TYPE_U8G)
        return;
    KEL_ASSERT(dst->type == KEL_PIXEL_TYPE_S16G);
    const kelValue_s32 end = kel::blocksEnd(src->width, kMargin, kBlock);
    if (end == kMargin)
        return;
    const kel::Kernels& kernels = kel::kernels();
    for (kelValue_s32 y = kReach; y < kel::lessReach(src->height, kReach); ++y)
        kernels.sobelRow(kel::row<int16_t>(dst, y), kel::row<uint8_t>(src, y), src->step, kMargin, end);
}
