// Pictures of what was found.
#ifndef KEL_EXAMPLES_DRAW_H
#define KEL_EXAMPLES_DRAW_H

#include <kel/kelMat.h>

#include "Features.h"

namespace kel_examples {

struct Colour {
    uint8_t r, g, b;
};

// On U8ZYX pictures; parts that fall outside are left out.
void drawLine(Image& picture, float x0, float y0, float x1, float y1, Colour colour);
void drawCircle(Image& picture, float x, float y, float radius, Colour colour);

// Capitals, as far as the programs' legends need them, 10 x 14 pixels each; what else there is leaves a blank.
void drawText(Image& picture, int x, int y, const std::string& text, Colour colour);

// Both pictures side by side with their features.
Image drawKeypoints(const Image& first, const Image& second, const std::vector<Feature>& ofFirst,
                    const std::vector<Feature>& ofSecond);

// Both pictures side by side; inliers are joined in green, other matches in red, a sample of 60 of either kind.
Image drawMatches(const Image& first, const Image& second, const std::vector<Feature>& ofFirst,
                  const std::vector<Feature>& ofSecond, const std::vector<Match>& matches, const std::vector<bool>& inlier);

// Both on one canvas in the second's frame; the average where they overlap, so that misregistration shows as ghosts.
Image drawMosaic(const Image& first, const Image& second, const kelMat& H);

} // namespace kel_examples

#endif
