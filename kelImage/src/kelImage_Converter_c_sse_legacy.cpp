// The converters over whole areas: grey to more channels and to 16 bits, YUV to luma and to four channels. They walk both data
// areas as one continuous run, which the padding of rows to 16 pixels makes possible.
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

// Pixels of a run over all rows, each rounded up to whole blocks. The run knows no step: rows of 16-pixel blocks land where
// step puts them, rows of 4-pixel blocks only for widths with width % 16 in {0, 13, 14, 15}. Callers rely on this drift.
template <int block> ptrdiff_t pixelsOfRun(const kelImage_t* dst) {
    if (dst->width <= 0 || dst->height <= 0)
        return 0;
    return (static_cast<ptrdiff_t>(dst->width) + block - 1) / block * block * dst->height;
}

} // namespace

extern "C" {

void convertKelImageSSE_U8G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    kel::kernels().greyToThree(dst->data, src->data, pixelsOfRun<16>(dst));
}

void convertKelImageSSE_U8G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    kel::kernels().greyToFour(dst->data, src->data, pixelsOfRun<16>(dst));
}

void convertKelImageSSE_U8G_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    kel::kernels().greyToWords(dst->data, src->data, pixelsOfRun<16>(dst));
}

void convertKelImageSSE_U8YUV_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    kel::kernels().yuvToGrey(dst->data, src->data, pixelsOfRun<16>(dst));
}

void convertKelImageSSE_U8YUV_to_U8RGBA(kelImage_t* dst, const kelImage_t* src) {
    kel::kernels().yuvToRgba(dst->data, src->data, pixelsOfRun<4>(dst));
}

void convertKelImageSSE_U8YUV_to_U8BGRA(kelImage_t* dst, const kelImage_t* src) {
    kel::kernels().yuvToBgra(dst->data, src->data, pixelsOfRun<4>(dst));
}

// The two to three channels are inert; the converters that walk rows do these.
void convertKelImageSSE_U8YUV_to_U8BGR(kelImage_t*, const kelImage_t*) {}

void convertKelImageSSE_U8YUV_to_U8RGB(kelImage_t*, const kelImage_t*) {}

} // extern "C"
