// What the two estimators share: fits of a coefficient vector to design rows, the way back from normalised coordinates, the
// counting of inliers, and the number of draws that RANSAC needs.
#ifndef KEL_MAT_ESTIMATOR_PRIVATE_H
#define KEL_MAT_ESTIMATOR_PRIVATE_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <smmintrin.h>
#include <vector>

#include "kelMat_Private.h"

namespace kel {

// theta = the right singular vector of A's smallest singular value; of equal ones the first. A is left with nothing of use.
template <int N> void smallestSingularVector(kelMat& A, float* theta) {
    kelMat W, V;
    decomposeWithoutU(A, W, V);
    int k = 0;
    for (int i = 1; i < N; ++i)
        if (W[i][i] < W[k][k])
            k = i;
    for (int i = 0; i < N; ++i)
        theta[i] = V[i][k];
}

// A^T A of a design matrix that is given row by row and never formed: every element sums over the rows in their order.
template <int N> class Moments {
public:
    Moments() { std::fill_n(m_sum[0], N * kPadded, 0.0f); }

    void addRow(const float (&row)[N]) {
        alignas(16) float padded[kPadded] = {};
        std::copy_n(row, N, padded);
        for (int r = 0; r < N; ++r) {
            const __m128 factor = _mm_set1_ps(row[r]);
            for (int c = 0; c < kPadded; c += 4)
                _mm_store_ps(m_sum[r] + c, _mm_add_ps(_mm_mul_ps(factor, _mm_load_ps(padded + c)), _mm_load_ps(m_sum[r] + c)));
        }
    }

    // The sums, each divided by `divisor`.
    void get(kelMat& M, float divisor) const {
        M.create(N, N, false);
        for (int r = 0; r < N; ++r)
            for (int c = 0; c < N; ++c)
                M[r][c] = m_sum[r][c] / divisor;
    }

private:
    static constexpr int kPadded = (N + 3) / 4 * 4;
    alignas(16) float m_sum[N][kPadded];
};

// Column k of X, or NaN throughout where the eigenproblem had no solution (X is not N x N).
template <int N> void eigenvectorOrNaN(const kelMat& X, int k, float* theta) {
    const bool solved = X.m_Width == N && X.m_Height == N;
    for (int i = 0; i < N; ++i)
        theta[i] = solved ? X[i][k] : std::numeric_limits<float>::quiet_NaN();
}

// multiply() for sizes known beforehand.
template <int Rows, int Inner, int Columns> void multiplySmall(float* R, const float* A, const float* B) {
    for (int i = 0; i < Rows; ++i)
        for (int j = 0; j < Columns; ++j) {
            float sum = 0;
            for (int k = 0; k < Inner; ++k)
                sum = A[i * Inner + k] * B[k * Columns + j] + sum;
            R[i * Columns + j] = sum;
        }
}

// (T2 M) T1 into M's own place, scaled so that the last element is 1. M is 3 x columns, T2 3 x 3, T1 columns x columns.
template <int Columns> void denormalize(kelMat& M, const kelMat& T2, const kelMat& T1) {
    float product[3 * Columns];
    multiplySmall<3, 3, Columns>(product, T2.m_Data, M.m_Data);
    multiplySmall<3, Columns, Columns>(M.m_Data, product, T1.m_Data);
    M.setDataUnitize();
}

// Inlier marks of up to KEL_CORRESP_MAX pairs and more, eight to a byte.
class Marks {
public:
    explicit Marks(int n) : m_bytes((static_cast<size_t>(n) + 7) / 8) {}
    uint8_t* bytes() { return m_bytes.data(); }
    bool operator[](int i) const { return m_bytes[static_cast<size_t>(i) / 8] >> (i % 8) & 1; }

private:
    std::vector<uint8_t> m_bytes;
};

// Values i .. i+3 of a sequence of n; zeros beyond its end.
inline __m128 fourValues(const std::vector<float>& values, int i, int n) {
    if (i + 4 <= n)
        return _mm_loadu_ps(values.data() + i);
    alignas(16) float some[4] = {};
    for (int k = i; k < n; ++k)
        some[k - i] = values[k];
    return _mm_load_ps(some);
}

constexpr uint8_t kBitsOfNibble[16] = {0, 1, 1, 2, 1, 2, 2, 3, 1, 2, 2, 3, 2, 3, 3, 4};

// Counts the pairs whose squared error is below threshold squared and marks them; squaredErrors(i) gives those of pairs i .. i+3.
// A NaN error is no inlier. Gives up where the count can no longer exceed `best`, and then returns what it has counted so far.
template <class SquaredErrors> int countInliers(int n, float threshold, int best, uint8_t* marks, SquaredErrors squaredErrors) {
    constexpr int kBlock = 256;
    const __m128 limit = _mm_set1_ps(threshold * threshold);
    int count = 0;
    for (int begin = 0; begin < n && count + (n - begin) > best; begin += kBlock) {
        const int end = std::min(n, begin + kBlock);
        for (int i = begin; i < end; i += 8) {
            const int low = _mm_movemask_ps(_mm_cmpgt_ps(limit, squaredErrors(i)));
            const int high = _mm_movemask_ps(_mm_cmpgt_ps(limit, squaredErrors(i + 4)));
            const unsigned valid = end - i >= 8 ? 0xffu : (1u << (end - i)) - 1;
            const unsigned bits = static_cast<unsigned>(high << 4 | low) & valid;
            marks[i / 8] = static_cast<uint8_t>(bits);
            count += kBitsOfNibble[bits & 15] + kBitsOfNibble[bits >> 4];
        }
    }
    return count;
}

constexpr int kCountAll = -1; // a `best` that every count exceeds

// The error between what a homogeneous point (x, y) / w is and what it should be, squared, with the one true division that
// cvtPoint() makes.
inline __m128 squaredDistances(__m128 x, __m128 y, __m128 w, __m128 toX, __m128 toY) {
    const __m128 s = _mm_div_ps(_mm_set1_ps(1.0f), w);
    const __m128 dx = _mm_sub_ps(toX, _mm_mul_ps(x, s)), dy = _mm_sub_ps(toY, _mm_mul_ps(y, s));
    return _mm_add_ps(_mm_mul_ps(dx, dx), _mm_mul_ps(dy, dy));
}

// Draws for 99 % confidence of one sample of four inliers, where `count` of n pairs are inliers. The six-point fit uses the same
// exponent; callers rely on its number of draws.
inline double drawsNeeded(int count, int n) {
    const double outliers = 1.0 - static_cast<double>(count) / static_cast<double>(n);
    return -4.605170185988091 / std::log(1.0 - std::pow(1.0 - outliers, 4.0));
}

// Truncates toward zero; INT_MIN where no int holds the value.
inline int truncated(double value) {
    return _mm_cvttsd_si32(_mm_set_sd(value));
}

// ---- what both estimators do ------------------------------------------------------------------------------------------------
//
// A Model tells them apart: Set, the kind of pairs; kColumns of the 3-row matrix; kLeastPairs of a fit; fillRows(row, set, i), the two
// design rows of a pair; count(M, set, threshold, best, marks), as countInliers(); isPlausible(M).

// The least-squares solution of design rows, scaled so that its last element is 1.
template <class Model> void solve(kelMat& M, kelMat& A) {
    smallestSingularVector<3 * Model::kColumns>(A, M.m_Data);
    M.setDataUnitize();
}

template <class Model> bool leastSquares(kelMat& M, const typename Model::Set& pairs) {
    if (pairs.m_Num < Model::kLeastPairs)
        return false;
    kelMat A(2 * pairs.m_Num, 3 * Model::kColumns, false);
    for (int i = 0; i < pairs.m_Num; ++i)
        Model::fillRows(A[2 * i], pairs, i);
    solve<Model>(M, A);
    return true;
}

template <class Model> bool leastSquaresFine(kelMat& M, typename Model::Set& pairs) {
    if (pairs.m_Num < Model::kLeastPairs)
        return false;
    typename Model::Set normalized;
    kelMat T1, T2;
    pairs.normalize(normalized, T1, T2);
    leastSquares<Model>(M, normalized);
    denormalize<Model::kColumns>(M, T2, T1);
    return true;
}

// The end of a robust fit: least squares on the chosen pairs, of which there are `best`, and again as long as their number grows. The
// final fit's number of inliers, or -1 where too few are left or a fit is not plausible.
template <class Model>
int refit(kelMat& M, const typename Model::Set& pairs, const typename Model::Set& normalized, const kelMat& T1,
          const kelMat& T2, float threshold, Marks& chosen, int best) {
    for (;;) {
        if (best < Model::kLeastPairs)
            return -1;
        kelMat A(2 * best, 3 * Model::kColumns, false);
        for (int i = 0, row = 0; i < pairs.m_Num; ++i)
            if (chosen[i]) {
                Model::fillRows(A[row], normalized, i);
                row += 2;
            }
        solve<Model>(M, A);
        denormalize<Model::kColumns>(M, T2, T1);
        if (!Model::isPlausible(M))
            return -1;
        const int count = Model::count(M, pairs, threshold, kCountAll, chosen.bytes());
        if (count <= best)
            return count;
        best = count;
    }
}

// Counts into the caller's mask.
template <class Model> int judge(const kelMat& M, const typename Model::Set& pairs, std::vector<bool>& mask, float threshold) {
    Marks marks(pairs.m_Num);
    const int count = Model::count(M, pairs, threshold, kCountAll, marks.bytes());
    for (int i = 0; i < pairs.m_Num; ++i)
        mask[i] = marks[i];
    return count;
}

} // namespace kel

#endif
