// The kernel that counts inliers, for the vector width (KEL_VECTOR_BYTES) and namespace (KEL_KERNELS_OF) of the file that includes it.
// Vectors are the compiler's own, so that nothing but the width differs.
#ifndef KEL_MAT_INLIER_KERNEL_H
#define KEL_MAT_INLIER_KERNEL_H

#include <cstring>

#include "kelMatInliers.h"

namespace {

constexpr int kLanes = KEL_VECTOR_BYTES / 4;
using Floats = float __attribute__((vector_size(KEL_VECTOR_BYTES)));
using Ints = int32_t __attribute__((vector_size(KEL_VECTOR_BYTES)));
using Bytes = int8_t __attribute__((vector_size(KEL_VECTOR_BYTES / 4)));

// Values i, i + 1, ... of n; beyond the end the last one again, so that nothing is computed but what a pair asks for.
inline Floats load(const float* values, int i, int n) {
    Floats v;
    if (i + kLanes <= n)
        memcpy(&v, values + i, sizeof v);
    else
        for (int k = 0; k < kLanes; ++k)
            v[k] = values[i + k < n ? i + k : n - 1];
    return v;
}

// A row of the matrix times (x, 1), summed from the left.
template <int D> inline Floats times(const float* row, const Floats (&x)[D]) {
    Floats sum = x[0] * row[0];
    for (int k = 1; k < D; ++k)
        sum = sum + x[k] * row[k];
    return sum + row[D];
}

template <int D> int count(const float* M, const kel::PairsView& pairs, float threshold, int best, uint8_t* marks) {
    constexpr int kBlock = 256; // pairs between two looks at what is left
    const int n = pairs.n;
    const float limit = threshold * threshold;
    int total = 0;
    for (int begin = 0; begin < n && total + (n - begin) > best; begin += kBlock) {
        const int end = begin + kBlock < n ? begin + kBlock : n;
        Ints counts = {};
        for (int i = begin; i < end; i += kLanes) {
            Floats x[D];
            for (int k = 0; k < D; ++k)
                x[k] = load(pairs.first[k], i, n);
            const Floats s = 1.0f / times<D>(M + 2 * (D + 1), x); // the one true division that cvtPoint() makes
            const Floats dx = load(pairs.second[0], i, n) - times<D>(M, x) * s,
                         dy = load(pairs.second[1], i, n) - times<D>(M + D + 1, x) * s;
            const Ints inside = limit > dx * dx + dy * dy; // -1 for an inlier
            const Bytes bytes = -__builtin_convertvector(inside, Bytes);
            if (i + kLanes <= end) {
                counts -= inside;
                memcpy(marks + i, &bytes, sizeof bytes);
            } else {
                for (int k = 0; i + k < end; ++k) {
                    total -= inside[k];
                    marks[i + k] = static_cast<uint8_t>(bytes[k]);
                }
            }
        }
        for (int k = 0; k < kLanes; ++k)
            total += counts[k];
    }
    return total;
}

} // namespace

const kel::InlierKernels kel::KEL_KERNELS_OF::inlierKernels = {count<2>, count<3>};

#endif
