// From matched features to a homography that can be relied on, or to the reason why there is none.
#ifndef KEL_EXAMPLES_REGISTRATION_H
#define KEL_EXAMPLES_REGISTRATION_H

#include <array>
#include <kel/kelMat.h>
#include <string>
#include <vector>

#include "Features.h"

namespace kel_examples {

struct Size {
    int width, height;
};

struct Registration {
    kelMat H;                 // first to second, pixel (0, 0) being the centre of the first pixel; empty where there is none
    std::vector<bool> inlier; // of the matches
    int inliers = 0;
    std::string refusal; // why there is none
};

// Fits robustly with `threshold` in pixels of the second picture. Draws from rand(): seed it before.
Registration fitHomography(const std::vector<Feature>& first, const std::vector<Feature>& second,
                           const std::vector<Match>& matches, Size firstSize, Size secondSize, float threshold);

// Warps `picture` (U8G or U8ZYX) by H, which takes its pixels to those of the result, into a new picture. Zero outside.
Image warpPicture(const Image& picture, const kelMat& H, Size size);

} // namespace kel_examples

#endif
