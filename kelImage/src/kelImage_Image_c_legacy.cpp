// Life cycle of an image, and the way of pixels in and out of it through the caller's memory.
#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "kelImage_Private.h"

namespace {

// 32-bit arithmetic that wraps: absurd sizes come out as absurd numbers, not as undefined behaviour.
kelValue_s32 wrappingAdd(kelValue_s32 a, kelValue_s32 b) {
    return static_cast<kelValue_s32>(static_cast<uint32_t>(a) + static_cast<uint32_t>(b));
}
kelValue_s32 wrappingMultiply(kelValue_s32 a, kelValue_s32 b) {
    return static_cast<kelValue_s32>(static_cast<uint32_t>(a) * static_cast<uint32_t>(b));
}

constexpr kelValue_s32 kAlignment = 16; // bytes of a vector, and pixels that `step` is a multiple of
constexpr size_t kCacheLine = 64; // what blocks start with, so that wide vectors do not straddle lines; nobody relies on it

void copyRows(unsigned char* dst, ptrdiff_t dstPitch, const unsigned char* src, ptrdiff_t srcPitch, size_t bytes,
              kelValue_s32 rows) {
    if (rows < 1)
        return;
    const size_t all = bytes * rows;
    const bool apart = dst + all <= src || src + all <= dst; // else a row may be copied on as the row behind it
    if (apart && dstPitch == srcPitch && dstPitch == static_cast<ptrdiff_t>(bytes)) { // one run
        bytes = all;
        rows = 1;
    }
    for (kelValue_s32 y = 0; y < rows; ++y, dst += dstPitch, src += srcPitch)
        memcpy(dst, src, bytes);
}

// The rows of the corner that an image and an area of these extents share, one way or the other; pitches in pixels.
void copyCorner(const kelImage_t* image, kelValue_s32 width, kelValue_s32 height, void* dst, ptrdiff_t dstPitch,
                const void* src, ptrdiff_t srcPitch) {
    const kelValue_s32 w = std::min(width, image->width), h = std::min(height, image->height);
    if (w < 1)
        return;
    kel::withPixel(image->type, [=](auto pixel) {
        const ptrdiff_t bytes = sizeof(pixel);
        copyRows(static_cast<unsigned char*>(dst), dstPitch * bytes, static_cast<const unsigned char*>(src), srcPitch * bytes,
                 w * bytes, h);
    });
}

} // namespace

extern "C" {

kelImage_t* createKelImageHeader(kelValue_s32 width, kelValue_s32 height, kelValue_s32 type) {
    kelImage_t* const image = static_cast<kelImage_t*>(malloc(sizeof(kelImage_t)));
    image->type = type;
    image->width = width;
    image->height = height;
    image->channels = kel::channelsOfType(type);
    image->depth = kel::depthOfType(type);
    image->step = wrappingMultiply(wrappingAdd(width, kAlignment - 1) / kAlignment, kAlignment);
    image->size = wrappingMultiply(wrappingMultiply(image->channels * image->depth, height), image->step);
    return image;
}

kelImage_t* createKelImage(kelValue_s32 width, kelValue_s32 height, kelValue_s32 type) {
    kelImage_t* const image = createKelImageHeader(width, height, type);
    // Widened with its sign: a negative sum asks for more than there is, malloc refuses, and data stays null.
    const ptrdiff_t bytes = wrappingAdd(image->size, kAlignment - 1);
    if (posix_memalign(&image->buffer, kCacheLine, static_cast<size_t>(bytes)) != 0)
        image->buffer = nullptr;
    const uintptr_t block = reinterpret_cast<uintptr_t>(image->buffer);
    image->data = reinterpret_cast<unsigned char*>((block + kAlignment - 1) & ~uintptr_t(kAlignment - 1));
    return image;
}

void releaseKelImageHeader(kelImage_t** image) {
    free(*image);
    *image = nullptr;
}

void releaseKelImage(kelImage_t** image) {
    if (*image)
        free((*image)->buffer);
    releaseKelImageHeader(image);
}

kelImage_t* cloneKelImage(const kelImage_t* src) {
    kelImage_t* const image = createKelImage(src->width, src->height, src->type);
    copyKelImage(image, src);
    return image;
}

void copyKelImage(kelImage_t* dst, const kelImage_t* src) {
    std::copy_n(src->data, src->size, dst->data);
}

void clearKelImage(kelImage_t* image) {
    std::fill_n(image->data, image->size, static_cast<unsigned char>(0));
}

void loadKelImageData(kelImage_t* image, const void* src, kelValue_s32 width, kelValue_s32 height, kelValue_s32 pitch) {
    copyCorner(image, width, height, image->data, image->step, src, pitch);
}

void storeKelImageData(void* dst, kelValue_s32 width, kelValue_s32 height, kelValue_s32 pitch, const kelImage_t* image) {
    copyCorner(image, width, height, dst, pitch, image->data, image->step);
}

kelImage_t* loadKelImage(const char*) {
    return nullptr;
}

void storeKelImage(const char*, const kelImage_t*) {}

} // extern "C"
