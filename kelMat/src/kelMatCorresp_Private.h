// What the two kinds of correspondence sets share: appending under the cap, and the normalisation of one point cloud.
#ifndef KEL_MAT_CORRESP_PRIVATE_H
#define KEL_MAT_CORRESP_PRIVATE_H

#include <algorithm>
#include <cmath>
#include <vector>

#include "kelMat.h"

namespace kel {

// Throws the sequence's out-of-range error where it holds fewer than n values.
inline void requireValues(const std::vector<float>& values, int n) {
    if (n > 0 && values.size() < static_cast<size_t>(n))
        (void)values.at(values.size());
}

// The sum of distances so far, rounded back to single precision after every step; the root and the addition are in double.
inline float plusDistance(float sum, float squares) {
    return static_cast<float>(static_cast<double>(sum) + std::sqrt(static_cast<double>(squares)));
}

// sqrt 2 over the mean distance, for points of any dimension.
inline float scaleOf(int n, float distances) {
    return static_cast<float>(static_cast<double>(n) * 1.4142135623730951 / static_cast<double>(distances));
}

// Appends values[i] - centre for i below n, as long as there is room for `room` of them.
inline void appendCentred(std::vector<float>& out, const std::vector<float>& values, float centre, int room) {
    const size_t before = out.size();
    out.resize(before + static_cast<size_t>(room));
    for (int i = 0; i < room; ++i)
        out[before + i] = values[i] - centre;
}

// Scales entries 0 .. n-1, also where there were some before normalisation appended its own.
inline void scaleValues(std::vector<float>& values, float scale, int n) {
    requireValues(values, n);
    for (int i = 0; i < n; ++i)
        values[i] *= scale;
}

// How many of n more pairs a set takes.
inline int roomFor(int n, int held) {
    return std::max(0, std::min(n, KEL_CORRESP_MAX - held));
}

// [1/s 0 cx; 0 1/s cy; 0 0 1]: takes normalised points back.
inline void fillInverseNormaliser(kelMat& T, float s, float cx, float cy) {
    T.create(3, 3, true);
    T[0][0] = 1.0f / s;
    T[0][2] = cx;
    T[1][1] = 1.0f / s;
    T[1][2] = cy;
    T[2][2] = 1.0f;
}

} // namespace kel

#endif
