// Pictures of what was found.
#ifndef KEL_EXAMPLES_DRAW_H
#define KEL_EXAMPLES_DRAW_H

#include <kel/kelRegister.h>

#include "Picture.h"

namespace kel_examples {

struct Colour {
    uint8_t r, g, b;
};

// On U8ZYX pictures; parts that fall outside are left out.
void drawLine(Image& picture, float x0, float y0, float x1, float y1, Colour colour);
void drawCircle(Image& picture, float x, float y, float radius, Colour colour);

// Capitals, as far as the programs' legends need them, 10 x 14 pixels each; what else there is leaves a blank.
void drawText(Image& picture, int x, int y, const std::string& text, Colour colour);

// Both pictures side by side with their keypoints.
Image drawKeypoints(const Image& first, const Image& second, const kelRegister::Result& result);

// Both pictures side by side; a sample of the inliers joined, in colours by their place, over a sample of the other matches in
// grey.
Image drawMatches(const Image& first, const Image& second, const kelRegister::Result& result);

// Both on one canvas in the second's frame. Where they overlap the first takes on the second's exposure, and each fades out
// towards its own edge, so that misregistration shows as ghosts and nothing else as a seam.
Image drawMosaic(const Image& first, const Image& second, const kelMat& H);

} // namespace kel_examples

#endif
