// Oriented keypoints over a pyramid, gradient descriptors, and their matching.
#ifndef KEL_EXAMPLES_FEATURES_H
#define KEL_EXAMPLES_FEATURES_H

#include <cstdint>
#include <utility>
#include <vector>

#include "Picture.h"

namespace kel_examples {

// A keypoint with its neighbourhood: position and size in pixels of the picture, pixel (0, 0) being the centre of the first.
struct Feature {
    static constexpr int kLength = 128; // 4 x 4 cells of 8 directions
    float x, y;
    float scale; // pixels of the picture per pixel of the level it was found on
    float angle; // of the prevailing gradient, radians
    int score;   // of the detector
    alignas(16) uint8_t descriptor[kLength];
};

// At most about `most` features of a grey picture (padding filled, as greyOf() gives it), the strongest of every region.
std::vector<Feature> findFeatures(const Image& grey, int most);

// Pairs (index into first, index into second) that are each other's best, and clearly better than the next place.
using Match = std::pair<int, int>;
std::vector<Match> matchFeatures(const std::vector<Feature>& first, const std::vector<Feature>& second);

} // namespace kel_examples

#endif
