// Cross operator: the four neighbours at distance 5 minus four times the centre, in blocks of 16 columns.
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

constexpr kelValue_s32 kReach = 5; // deliberately not 1, whatever the name says: the keypoint detector is tuned to it
constexpr kelValue_s32 kMargin = 8;
constexpr kelValue_s32 kBlock = 16;

} // namespace

extern "C" void applyKelFilterLaplacianSSE3X3(kelImage_t* dst, kelImage_t* src) {
    KEL_ASSERT(dst->step == src->step && dst->width == src->width && dst->height == src->height);
    if (src->type != KEL_PIXEL_TYPE_U8G)
        return;
    KEL_ASSERT(dst->type == KEL_PIXEL_TYPE_S16G);
    const kel::Kernels& kernels = kel::kernels();
    const kelValue_s32 end = kel::blocksEnd(src->width, kMargin, kBlock);
    for (kelValue_s32 y = kReach; y < kel::lessReach(src->height, kReach); ++y)
        kernels.crossRow(kel::row<int16_t>(dst, y), kel::row<uint8_t>(src, y), src->step, kReach, kMargin, end);
}
