// Contrast stretching: checks, and the way to the vector worker. The file's name is spelt so in every assertion report.
#include "kelImage_Private.h"

extern "C" {

void adjustKelImage(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    if (src->type == KEL_PIXEL_TYPE_U8G)
        adjustKelImage_U8G(dst, src);
}

void adjustKelImage_U8G(kelImage_t* dst, const kelImage_t* src) {
    adjustKelImageSSE_U8G(dst, src);
}

} // extern "C"
