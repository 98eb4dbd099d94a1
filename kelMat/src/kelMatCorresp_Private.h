// What the two kinds of correspondence sets share: appending under the cap, and the normalisation of one point cloud.
#ifndef KEL_MAT_CORRESP_PRIVATE_H
#define KEL_MAT_CORRESP_PRIVATE_H

#include <algorithm>
#include <array>
#include <cmath>
#include <vector>

#include "kelMat.h"

namespace kel {

// The sequences of a set in their order: the D coordinates of the first points, then x and y of the second.
template <int D> using Sequences = std::array<std::vector<float>*, D + 2>;

// Appends one pair, or nothing where memory runs out half-way.
template <size_t N> void append(const std::array<std::vector<float>*, N>& sequences, const float (&values)[N]) {
    size_t done = 0;
    try {
        for (; done < N; ++done)
            sequences[done]->push_back(values[done]);
    } catch (...) {
        while (done > 0)
            sequences[--done]->pop_back();
        throw;
    }
}

// Throws the sequence's out-of-range error where it holds fewer than n values.
inline void requireValues(const std::vector<float>& values, int n) {
    if (n > 0 && values.size() < static_cast<size_t>(n))
        (void)values.at(values.size());
}

// The sum of distances so far, rounded back to single precision after every step; the root and the addition are in double.
inline float plusDistance(float sum, float squares) {
    return static_cast<float>(static_cast<double>(sum) + std::sqrt(static_cast<double>(squares)));
}

// sqrt 2 over the mean distance, for points of any dimension: callers rely on object points, too, getting that and not sqrt 3.
inline float scaleOf(int n, float distances) {
    constexpr double kRootOf2 = 1.4142135623730951;
    return static_cast<float>(static_cast<double>(n) * kRootOf2 / static_cast<double>(distances));
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

// T1 = | s        -s c |, D + 1 rows: takes first points to their normalised places.
//      |    s     -s c |
//      |       ..      |
//      |             1 |
template <int D> void fillNormaliser(kelMat& T1, float s, const float* centre) {
    T1.create(D + 1, D + 1, true);
    for (int i = 0; i < D; ++i) {
        T1[i][i] = s;
        T1[i][D] = centre[i] * -s;
    }
    T1[D][D] = 1.0f;
}

// T2 = [1/s 0 cx; 0 1/s cy; 0 0 1]: takes normalised second points back.
inline void fillInverseNormaliser(kelMat& T2, float s, const float* centre) {
    T2.create(3, 3, true);
    for (int i = 0; i < 2; ++i) {
        T2[i][i] = 1.0f / s;
        T2[i][2] = centre[i];
    }
    T2[2][2] = 1.0f;
}

// Both point clouds of n pairs, centred and scaled each by itself, to the end of `out`, which holds `held` pairs and takes no more
// than it has room for. The sums over all sequences run in step, for each has to wait for its last addition.
template <int D> void normalize(const Sequences<D>& in, int n, const Sequences<D>& out, int& held, kelMat& T1, kelMat& T2) {
    const float* values[D + 2];
    for (int k = 0; k < D + 2; ++k) {
        requireValues(*in[k], n);
        values[k] = in[k]->data();
    }
    float centre[D + 2] = {};
    for (int i = 0; i < n; ++i)
        for (int k = 0; k < D + 2; ++k)
            centre[k] += values[k][i];
    for (float& c : centre)
        c /= static_cast<float>(n);

    const auto square = [&](int k, int i) {
        const float d = values[k][i] - centre[k];
        return d * d;
    };
    float firstDistances = 0.0f, secondDistances = 0.0f;
    for (int i = 0; i < n; ++i) {
        float first = square(0, i);
        for (int k = 1; k < D; ++k)
            first += square(k, i);
        firstDistances = plusDistance(firstDistances, first);
        secondDistances = plusDistance(secondDistances, square(D, i) + square(D + 1, i));
    }
    const float firstScale = scaleOf(n, firstDistances), secondScale = scaleOf(n, secondDistances);

    const int room = std::max(0, std::min(n, KEL_CORRESP_MAX - held));
    for (int k = 0; k < D + 2; ++k)
        appendCentred(*out[k], *in[k], centre[k], room);
    held += room;
    for (int k = 0; k < D + 2; ++k)
        scaleValues(*out[k], k < D ? firstScale : secondScale, n);
    fillNormaliser<D>(T1, firstScale, centre);
    fillInverseNormaliser(T2, secondScale, centre + D);
}

} // namespace kel

#endif
