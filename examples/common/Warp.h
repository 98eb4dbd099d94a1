// Pictures through homographies, sampled between their pixels.
#ifndef KEL_EXAMPLES_WARP_H
#define KEL_EXAMPLES_WARP_H

#include <kel/kelMat.h>

#include "Picture.h"

namespace kel_examples {

struct Size {
    int width, height;
};

inline Size sizeOf(const Image& image) {
    return {image->width, image->height};
}

// Warps `picture` (U8G or U8ZYX) by H, which takes its pixels to those of the result, into a new picture: bilinear, zero
// outside. Pixel (0, 0) is the centre of the first one.
Image warpPicture(const Image& picture, const kelMat& H, Size size);

} // namespace kel_examples

#endif
