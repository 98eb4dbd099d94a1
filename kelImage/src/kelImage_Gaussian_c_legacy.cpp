// Gaussian 5x5: weights (1, 4, 6, 4, 1) / 16 both ways, rounded once; and the names that lead to the 7x7.
// Rests on the row helpers and on kernels that do a row, its zero ends included.
#include <cstring>

#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

constexpr kelValue_s32 kReach = 2; // rows on either side of the centre, and those at top and bottom that come out as zero

void smoothRow(const kel::Kernels& kernels, kelImage_t* dst, kelImage_t* half, const kelImage_t* tmp, kelValue_s32 y) {
    uint8_t* const out = kel::row<uint8_t>(dst, y);
    const auto t = [=](kelValue_s32 offset) { return kel::row<int16_t>(tmp, y + offset); };
    if (y >= kReach && y < dst->height - kReach) {
        const int16_t* const rows[] = {t(-2), t(-1), t(0), t(1), t(2)};
        kernels.fiveDown(out, rows, dst->width);
    } else {
        memset(out, 0, static_cast<size_t>(dst->width));
    }
    // Pairs of columns; the last of an odd number has no second.
    if (half && y % 2 == 0) {
        uint8_t* const halved = kel::row<uint8_t>(half, y / 2);
        kernels.evenPixels[0](halved, out, dst->width / 2);
        if (dst->width % 2 != 0)
            halved[dst->width / 2] = out[dst->width - 1];
    }
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
    const kel::Kernels& kernels = kel::kernels();
    for (int64_t y = 0; y < dst->height + int64_t(kReach); ++y) {
        const kelValue_s32 across = static_cast<kelValue_s32>(y), down = static_cast<kelValue_s32>(y - kReach);
        if (y < dst->height)
            kernels.fiveAcross(kel::row<int16_t>(tmp, across), kel::row<uint8_t>(src, across), dst->width);
        if (y >= kReach)
            smoothRow(kernels, dst, half, tmp, down);
    }
}

void applyKelFilterGaussian5X5(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussian5X5_downsampling(dst, nullptr, src, tmp);
}

void applyKelFilterGaussian7X7_downsampling(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussianSSE7X7_downsampling(dst, half, src, tmp);
}

void applyKelFilterGaussian7X7(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussian7X7_downsampling(dst, nullptr, src, tmp);
}

} // extern "C"
