// Mirror, flip, half turn, and projective warp, over pixels of 1 to 4 bytes.
#include <cstring>

#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

using kel::row;

// The common shape of the flips: row y of the source goes to row y or H-1-y, as it is or reversed. The source is read in one
// direction, which is what processors fetch ahead: from its end to its beginning where rows are reversed, as that reads them so.
template <bool upsideDown, bool mirrored> void flip(kelImage_t* dst, const kelImage_t* src) {
    if (dst->width < 1)
        return;
    kel::withPixel(dst->type, [=](auto pixel) {
        constexpr int bytes = sizeof(pixel);
        const kel::Run reversed = kel::kernels().reversed[bytes - 1];
        for (kelValue_s32 i = 0; i < dst->height; ++i) {
            const kelValue_s32 y = mirrored ? dst->height - 1 - i : i;
            uint8_t* const to = row<uint8_t>(dst, upsideDown ? dst->height - 1 - y : y, bytes);
            const uint8_t* const from = row<uint8_t>(src, y, bytes);
            if (mirrored)
                reversed(to, from, dst->width);
            else
                memcpy(to, from, static_cast<size_t>(dst->width) * bytes);
        }
    });
}

} // namespace

extern "C" {

void rotateKelImageH(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    flip<false, true>(dst, src);
}

void rotateKelImageV(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    flip<true, false>(dst, src);
}

void rotateKelImageVH(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    flip<true, true>(dst, src);
}

void rotateKelImageHomography(kelImage_t* dst, const kelImage_t* src, float h0, float h1, float h2, float h3, float h4,
                              float h5, float h6, float h7, float h8) {
    KEL_ASSERT(dst->type == src->type);
    const float homography[9] = {h0, h1, h2, h3, h4, h5, h6, h7, h8};
    const kel::WarpSource source = {src->data, src->width, src->height, src->step};
    kel::withPixel(dst->type, [&](auto pixel) {
        constexpr int bytes = sizeof(pixel);
        const kel::WarpRow warpRow = kel::kernels().warpRow[bytes - 1];
        for (kelValue_s32 y = 0; y < dst->height; ++y)
            warpRow(row<uint8_t>(dst, y, bytes), dst->width, static_cast<float>(y), homography, source);
    });
}

} // extern "C"
