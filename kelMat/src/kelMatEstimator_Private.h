// What the two estimators share: fits of a coefficient vector to design rows, the way back from normalised coordinates, the
// counting of inliers, and the number of draws that RANSAC needs.
#ifndef KEL_MAT_ESTIMATOR_PRIVATE_H
#define KEL_MAT_ESTIMATOR_PRIVATE_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "kelMatInliers.h"
#include "kelMat_Private.h"

namespace kel {

// theta = the right singular vector of the smallest singular value of A (rows x N); of equal ones the first. A is left with nothing
// of use.
template <int N> void smallestSingularVector(float* A, int rows, float* theta) {
    float w[N];
    alignas(16) float v[N * N];
    decomposeSV(A, rows, N, A, false, w, v);
    int k = 0;
    for (int i = 1; i < N; ++i)
        if (w[i] < w[k])
            k = i;
    for (int i = 0; i < N; ++i)
        theta[i] = v[N * i + k];
}

// A^T A of a design matrix that is given row by row and never formed: every element sums over the rows in their order.
template <int N> class Moments {
public:
    Moments() { std::fill_n(m_sum[0], N * kPadded, 0.0f); }

    void addRow(const float (&row)[N]) {
        alignas(16) float padded[kPadded] = {};
        std::copy_n(row, N, padded);
        for (int r = 0; r < N; ++r) {
            const Floats factor = all(row[r]);
            for (int c = 0; c < kPadded; c += kLanes)
                storeAligned(m_sum[r] + c, factor * loadAligned(padded + c) + loadAligned(m_sum[r] + c));
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
    static constexpr int kPadded = (N + kLanes - 1) / kLanes * kLanes;
    alignas(16) float m_sum[N][kPadded];
};

// An estimator's matrix is what its user made of it, at least 3 rows of `Columns`: elements are addressed by its own width.
template <int Columns> void assign(kelMat& M, const float* theta) {
    for (int r = 0; r < 3; ++r)
        std::copy_n(theta + Columns * r, Columns, M[r]);
}

// M = column k of X, scaled so that the last element is 1, or NaN where the eigenproblem had no solution (X is not N x N).
template <int Columns> void assignEigenvector(kelMat& M, const kelMat& X, int k) {
    constexpr int N = 3 * Columns;
    const bool solved = X.m_Width == N && X.m_Height == N;
    float theta[N];
    for (int i = 0; i < N; ++i)
        theta[i] = solved ? X[i][k] : std::numeric_limits<float>::quiet_NaN();
    assign<Columns>(M, theta);
    M.setDataUnitize();
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
    if (M.m_Height != 3 || M.m_Width != Columns)
        (void)(T2 * M * T1); // stops the process on the size
    float product[3 * Columns];
    multiplySmall<3, 3, Columns>(product, T2.m_Data, M.m_Data);
    multiplySmall<3, Columns, Columns>(M.m_Data, product, T1.m_Data);
    M.setDataUnitize();
}

// Inlier marks, a byte each.
class Marks {
public:
    explicit Marks(int n) : m_bytes(static_cast<size_t>(n)) {}
    uint8_t* bytes() { return m_bytes.data(); }
    bool operator[](int i) const { return m_bytes[static_cast<size_t>(i)]; }

private:
    std::vector<uint8_t> m_bytes;
};

constexpr int kCountAll = -1;    // a `best` that every count exceeds
constexpr int kMostDraws = 1500; // of a robust fit

// Draws for 99 % confidence of one sample of four inliers, where `count` of n pairs are inliers. The six-point fit uses the same
// exponent; callers rely on its number of draws.
inline double drawsNeeded(int count, int n) {
    constexpr double kLogOfDoubt = -4.605170185988091; // ln 0.01
    const double outliers = 1.0 - static_cast<double>(count) / static_cast<double>(n);
    return kLogOfDoubt / std::log(1.0 - std::pow(1.0 - outliers, 4.0));
}

// ---- what both estimators do ------------------------------------------------------------------------------------------------
//
// A Model tells them apart:
//   Set                                    the kind of pairs, with m_Num and normalize()
//   kColumns                               of the matrix, which has 3 rows
//   kLeastPairs                            of a least-squares fit
//   fillRows(row, set, i)                  the two design rows of pair i, of 3 kColumns floats each
// and, for a robust fit:
//   kSample, kEnoughInliers                pairs of a sample; inliers that end the search at once
//   fitSample(M, set)                      fits M exactly to kSample pairs, which it draws
//   isPlausible(M)                         whether a candidate or a refit is taken at all
//   count(M, set, threshold, best, marks)  as CountInliers does
//   fewerDraws(draws, needed)              the limit of draws after a better candidate, `needed` from drawsNeeded()

// M = the least-squares solution of the design rows of `count` pairs, scaled so that its last element is 1. The rows are left with
// nothing of use.
template <class Model> void solveRows(kelMat& M, float* rows, int count) {
    constexpr int kUnknowns = 3 * Model::kColumns;
    float theta[kUnknowns];
    smallestSingularVector<kUnknowns>(rows, 2 * count, theta);
    assign<Model::kColumns>(M, theta);
    M.setDataUnitize();
}

// The same of all pairs, or of the marked ones, of which there are `count`.
template <class Model> void solve(kelMat& M, const typename Model::Set& pairs, int count, const Marks* chosen = nullptr) {
    constexpr int kUnknowns = 3 * Model::kColumns;
    Scratch<float, 2 * Model::kSample * kUnknowns> rows(static_cast<size_t>(count) * 2 * kUnknowns);
    float* next = rows.data();
    for (int i = 0; i < pairs.m_Num; ++i)
        if (!chosen || (*chosen)[i]) {
            Model::fillRows(next, pairs, i);
            next += 2 * kUnknowns;
        }
    solveRows<Model>(M, rows.data(), count);
}

template <class Model> bool leastSquares(kelMat& M, const typename Model::Set& pairs) {
    if (pairs.m_Num < Model::kLeastPairs)
        return false;
    solve<Model>(M, pairs, pairs.m_Num);
    return true;
}

// Pairs with their normalised form and the matrices that take a fit between that back.
template <class Model> struct Normalized {
    typename Model::Set set;
    kelMat T1, T2;
    explicit Normalized(typename Model::Set& pairs) { pairs.normalize(set, T1, T2); }
    void takeBack(kelMat& M) const { denormalize<Model::kColumns>(M, T2, T1); }
};

template <class Model> bool leastSquaresFine(kelMat& M, typename Model::Set& pairs) {
    if (pairs.m_Num < Model::kLeastPairs)
        return false;
    const Normalized<Model> normalized(pairs);
    solve<Model>(M, normalized.set, pairs.m_Num);
    normalized.takeBack(M);
    return true;
}

// The end of a robust fit: least squares on the chosen pairs, of which there are `best`, and again as long as their number grows. The
// final fit's number of inliers, or -1 where too few are left or a fit is not plausible.
template <class Model>
int refit(kelMat& M, const typename Model::Set& pairs, const Normalized<Model>& normalized, float threshold, Marks& chosen,
          int best) {
    for (;;) {
        if (best < Model::kLeastPairs)
            return -1;
        solve<Model>(M, normalized.set, best, &chosen);
        normalized.takeBack(M);
        if (!Model::isPlausible(M))
            return -1;
        const int count = Model::count(M, pairs, threshold, kCountAll, chosen.bytes());
        if (count <= best)
            return count;
        best = count;
    }
}

// RANSAC: candidates through random samples of the normalised pairs, each judged by its inliers among the pairs as they are, then
// least squares on the best one's inliers. Returns as refit() does, and -1 for fewer pairs than a sample has.
template <class Model> int robustFit(kelMat& M, typename Model::Set& pairs, float threshold) {
    const int n = pairs.m_Num;
    if (n < Model::kSample)
        return -1;
    const Normalized<Model> normalized(pairs);
    Marks current(n), chosen(n);
    int best = 0, draws = kMostDraws, draw = 0;
    do {
        Model::fitSample(M, normalized.set);
        normalized.takeBack(M);
        if (!Model::isPlausible(M))
            continue;
        const int count = Model::count(M, pairs, threshold, best, current.bytes());
        if (count > best) {
            draws = Model::fewerDraws(draws, drawsNeeded(count, n));
            std::swap(current, chosen);
            best = count;
        }
    } while (best < Model::kEnoughInliers && ++draw < draws);
    return refit<Model>(M, pairs, normalized, threshold, chosen, best);
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
