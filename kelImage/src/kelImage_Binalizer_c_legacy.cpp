// Binarization, fixed and adaptive: checks, and the way to the vector workers.
#include "kelImage_Private.h"

extern "C" {

void binalizeKelImage(kelImage_t* dst, const kelImage_t* src, kelValue_s32 threshold) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    if (src->type == KEL_PIXEL_TYPE_U8G)
        binalizeKelImage_U8G(dst, src, threshold);
}

void binalizeKelImage_U8G(kelImage_t* dst, const kelImage_t* src, kelValue_s32 threshold) {
    binalizeKelImageSSE_U8G(dst, src, threshold);
}

void binalizeKelImageAdaptive(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    if (src->type == KEL_PIXEL_TYPE_U8G) // tmp is looked at for no other type and may be null there
        binalizeKelImageAdaptive_U8G(dst, src, tmp);
}

void binalizeKelImageAdaptive_U8G(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp) {
    binalizeKelImageAdaptiveSSE_U8G(dst, src, tmp);
}

} // extern "C"
