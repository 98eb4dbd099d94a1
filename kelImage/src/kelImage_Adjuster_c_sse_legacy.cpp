// Contrast stretching of 8-bit grey over whole padded rows: their range first, then every byte.
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

extern "C" {

// The padding takes part in the range: callers rely on that.
void adjustKelImageSSE_U8G(kelImage_t* dst, const kelImage_t* src) {
    const kel::Kernels& kernels = kel::kernels();
    const ptrdiff_t width = kel::paddedWidth(dst);
    const kel::Range range = kernels.rangeOf(src->data, src->step, width, dst->height);
    const int extent = range.greatest - range.least;
    const float scale = extent > 0 ? 255.0f / static_cast<float>(extent) : 1.0f;
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        kernels.stretch(kel::row<uint8_t>(dst, y), kel::row<uint8_t>(src, y), width, range.least, scale);
}

} // extern "C"
