// Binarization of 8-bit grey: against one threshold over whole padded rows, and against a local mean in blocks of 16 columns.
#include <algorithm>

#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

constexpr kelValue_s32 kMargin = 16; // pixels at either end that have no mean: 12 of the kernel, rounded up to a block
constexpr kelValue_s32 kReach = 12;  // rows between a mean and the last of its taps

} // namespace

extern "C" {

// The low 8 bits of the threshold only: callers rely on 256 being 0.
void binalizeKelImageSSE_U8G(kelImage_t* dst, const kelImage_t* src, kelValue_s32 threshold) {
    const kel::Kernels& kernels = kel::kernels();
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        kernels.binarize(kel::row<uint8_t>(dst, y), kel::row<uint8_t>(src, y), kel::paddedWidth(dst), threshold);
}

// Both passes row by row: the destination's row y follows as soon as the means of row y + 12 are there, while they are cached.
// The 8 pixels behind the means of a row become 0, and the vertical pass takes them in: callers rely on it.
void binalizeKelImageAdaptiveSSE_U8G(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp) {
    const kel::Kernels& kernels = kel::kernels();
    const kelValue_s32 endAcross = kel::blocksEnd(tmp->width, kMargin, 8), end = kel::blocksEnd(dst->width, kMargin, 16);
    const kelValue_s32 lastRow = end > kMargin && dst->height > 2 * kMargin ? dst->height - kMargin - 1 : -1;
    const kelValue_s32 rowsAcross = endAcross > kMargin ? tmp->height : 0;
    for (kelValue_s32 y = 0; y < std::max(rowsAcross, lastRow + kReach + 1); ++y) {
        if (y < rowsAcross)
            kernels.localMeansAcross(kel::row<uint8_t>(tmp, y), kel::row<uint8_t>(src, y), kMargin, endAcross);
        const kelValue_s32 ready = y - kReach;
        if (ready >= kMargin && ready <= lastRow)
            kernels.binarizeByMeans(kel::row<uint8_t>(dst, ready), kel::row<uint8_t>(src, ready), kel::row<uint8_t>(tmp, ready),
                                    tmp->step, kMargin, end);
    }
}

} // extern "C"
