// Gaussian 7x7: weights (2, 7, 14, 18, 14, 7, 2) / 64, rounded after each pass, in blocks of 16 columns.
// Rests on the row helpers and on kernels that do a row across, and one or two down.
#include <algorithm>

#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

constexpr kelValue_s32 kReach = 3;  // taps on either side of the centre, and rows left alone at top and bottom
constexpr kelValue_s32 kMargin = 8; // columns left alone on the left
constexpr kelValue_s32 kBlockAcross = 8, kBlockDown = 16;

// Rows y and y+1 of the destination, y odd; the second also into `half`, which takes rows of even number only. Zeros behind its
// last block stay, also where they run on into the next row: callers rely on them.
void twoRowsDown(const kel::Kernels& kernels, kelImage_t* dst, kelImage_t* half, const kelImage_t* tmp, kelValue_s32 y,
                 kelValue_s32 end) {
    kernels.sevenDownTwice(kel::row<uint8_t>(dst, y), kel::row<uint8_t>(dst, y + 1),
                           half ? kel::row<uint8_t>(half, (y + 1) / 2) : nullptr, kel::row<uint8_t>(tmp, y - kReach), tmp->step,
                           kMargin, end);
}

// The last row where their number is odd; y is odd, so `half` has no part in it.
void oneRowDown(const kel::Kernels& kernels, kelImage_t* dst, const kelImage_t* tmp, kelValue_s32 y, kelValue_s32 end) {
    kernels.sevenDown(kel::row<uint8_t>(dst, y), kel::row<uint8_t>(tmp, y - kReach), tmp->step, kMargin, end);
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
    const kel::Kernels& kernels = kel::kernels();
    kelValue_s32 across = 0;
    const auto acrossUpTo = [&](kelValue_s32 rows) {
        for (; across < std::min(rows, rowsAcross); ++across)
            kernels.sevenAcross(kel::row<uint8_t>(tmp, across), kel::row<uint8_t>(src, across), kMargin, endAcross);
    };
    // Two rows down as soon as their scratch rows are there, while these are still in the cache. A source row has been read
    // before the destination row of its number is written, so the two may be one image.
    const kelValue_s32 rowsEnd = kel::lessReach(dst->height, kReach);
    for (kelValue_s32 y = kReach; y < rowsEnd; y += 2) {
        const kelValue_s32 rows = std::min(rowsEnd - y, 2);
        acrossUpTo(y + rows + kReach);
        if (rows == 2)
            twoRowsDown(kernels, dst, half, tmp, y, endDown);
        else
            oneRowDown(kernels, dst, tmp, y, endDown);
    }
    acrossUpTo(rowsAcross);
}

void applyKelFilterGaussianSSE7X7(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp) {
    applyKelFilterGaussianSSE7X7_downsampling(dst, nullptr, src, tmp);
}

} // extern "C"
