// What the image half's sources share: rows of an image, pixels as small types, and the turn from type code to pixel type.
// Rests on the public record alone.
#ifndef KEL_IMAGE_PRIVATE_H
#define KEL_IMAGE_PRIVATE_H

#include <cstddef>
#include <cstdint>

#include "kelAssert.h"
#include "kelImage.h"

namespace kel {

// A pixel of N bytes, copied as a whole whatever its channels mean.
template <int N> struct Pixel { uint8_t byte[N]; };
template <> struct Pixel<2> { uint16_t value; };
template <> struct Pixel<4> { uint32_t value; };
static_assert(sizeof(Pixel<1>) == 1 && sizeof(Pixel<2>) == 2 && sizeof(Pixel<3>) == 3 && sizeof(Pixel<4>) == 4, "");

// Calls body(Pixel<N>()) for the types that are moved around as whole pixels; any other type is ignored.
template <class Body> inline void withPixel(kelValue_s32 type, Body body) {
    switch (type) {
    case KEL_PIXEL_TYPE_U8G:
        return body(Pixel<1>());
    case KEL_PIXEL_TYPE_S16G:
        return body(Pixel<2>());
    case KEL_PIXEL_TYPE_U8XYZ:
    case KEL_PIXEL_TYPE_U8ZYX:
        return body(Pixel<3>());
    case KEL_PIXEL_TYPE_U8XYZA:
    case KEL_PIXEL_TYPE_U8ZYXA:
        return body(Pixel<4>());
    default:
        return;
    }
}

// Where rows or columns end that have `reach` others behind them; a negative size of any magnitude has none.
inline kelValue_s32 lessReach(kelValue_s32 size, kelValue_s32 reach) {
    return size > reach ? size - reach : 0;
}

// Pixel (0, y) in elements of T, rows `step` pixels apart; T is a whole pixel, or `perPixel` of them make one.
template <class T> inline T* row(kelImage_t* image, kelValue_s32 y, int perPixel = 1) {
    return reinterpret_cast<T*>(image->data) + static_cast<ptrdiff_t>(y) * image->step * perPixel;
}
template <class T> inline const T* row(const kelImage_t* image, kelValue_s32 y, int perPixel = 1) {
    return reinterpret_cast<const T*>(image->data) + static_cast<ptrdiff_t>(y) * image->step * perPixel;
}

// Pixel (0, y) of an image taken as densely packed: rows `width` pixels apart. Some operations address images so.
template <class T> inline T* rowByWidth(kelImage_t* image, kelValue_s32 y) {
    return reinterpret_cast<T*>(image->data) + static_cast<ptrdiff_t>(y) * image->width;
}
template <class T> inline const T* rowByWidth(const kelImage_t* image, kelValue_s32 y) {
    return reinterpret_cast<const T*>(image->data) + static_cast<ptrdiff_t>(y) * image->width;
}

// Pixels of a row with its padding.
inline ptrdiff_t paddedWidth(const kelImage_t* image) {
    return (static_cast<ptrdiff_t>(image->width) + 15) / 16 * 16;
}

// A filter does blocks of `block` columns from column `margin`: a block at x is done while x < width - margin. Returns the
// first column after the last block, `margin` where there is none; it is never beyond the row's step.
constexpr kelValue_s32 blocksEnd(kelValue_s32 width, kelValue_s32 margin, kelValue_s32 block) {
    return width > 2 * margin ? margin + (width - 2 * margin + block - 1) / block * block : margin;
}

// Channels and element bytes of a pixel-type code; 0 for what is none.
kelValue_s32 channelsOfType(kelValue_s32 type);
kelValue_s32 depthOfType(kelValue_s32 type);

} // namespace kel

#endif
