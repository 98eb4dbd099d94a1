// Counting the pairs that a matrix explains: the kernel over vectors of any width, and its choice. The same bits at every width.
#ifndef KEL_MAT_INLIERS_H
#define KEL_MAT_INLIERS_H

#include <cstdint>

namespace kel {

// Pairs as the sequences of their coordinates: first points of two or three coordinates, second points of two.
struct PairsView {
    int n;
    const float* first[3];
    const float* second[2];
};

// Counts the pairs whose squared error under a 3 x (D + 1) matrix, D coordinates of the first point, is below threshold squared, and
// marks each by 1 or 0. A NaN error is no inlier. Gives up where the count can no longer exceed `best`, and then returns what it
// has counted so far.
using CountInliers = int (*)(const float* M, const PairsView& pairs, float threshold, int best, uint8_t* marks);

struct InlierKernels {
    CountInliers plane, space; // D of 2, 3
};

namespace sse41 {
extern const InlierKernels inlierKernels;
}
namespace avx2 {
extern const InlierKernels inlierKernels;
}
namespace avx512 {
extern const InlierKernels inlierKernels;
}
namespace neon {
extern const InlierKernels inlierKernels;
}

// What this processor can do at its widest.
const InlierKernels& inlierKernels();

} // namespace kel

#endif
