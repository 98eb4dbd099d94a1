// Matrices of the tests: written down in braces, drawn at random, compared by bits.
#ifndef KEL_TESTS_MAT_SUPPORT_H
#define KEL_TESTS_MAT_SUPPORT_H

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <gtest/gtest.h>
#include <initializer_list>
#include <kel/kelMat.h>
#include <limits>

#include "MatOperations.h"
#include "Random.h"

namespace kel_test {

using Truth = kel_ref::Mat<double>;

constexpr double kEps = std::numeric_limits<float>::epsilon();
constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

inline kelMat mat(std::initializer_list<std::initializer_list<float>> rows) {
    kelMat M(static_cast<int>(rows.size()), static_cast<int>(rows.begin()->size()), false);
    float* out = M.m_Data;
    for (const auto& row : rows)
        out = std::copy(row.begin(), row.end(), out);
    return M;
}

inline Truth truth(const kelMat& M) {
    const Reference R = reference(M);
    Truth T(R.rows, R.columns);
    std::copy(R.data.begin(), R.data.end(), T.data.begin());
    return T;
}

inline kelMat identity(int n) {
    kelMat I(n, n);
    I.setDataIdentity(1);
    return I;
}

inline kelMat randomMatrix(int rows, int columns, uint32_t salt) {
    kelMat M(rows, columns, false);
    std::mt19937 random = generator(salt);
    std::uniform_real_distribution<float> uniform(-1, 1);
    std::generate_n(M.m_Data, static_cast<size_t>(M.m_Height) * M.m_Width, [&] { return uniform(random); });
    return M;
}

inline kelMat randomSymmetric(int n, uint32_t salt) {
    kelMat M = randomMatrix(n, n, salt);
    for (int r = 0; r < n; ++r)
        for (int c = 0; c < r; ++c)
            M[r][c] = M[c][r];
    return M;
}

inline testing::AssertionResult sameSize(const kelMat& M, int rows, int columns) {
    if (M.m_Height == rows && M.m_Width == columns && M.m_IsCreated == (rows > 0) && (M.m_Data != nullptr) == (rows > 0))
        return testing::AssertionSuccess();
    return testing::AssertionFailure() << "the matrix is " << M.m_Height << " x " << M.m_Width << ", created " << M.m_IsCreated
                                       << "; expected " << rows << " x " << columns;
}

inline testing::AssertionResult same(const kelMat& M, const Reference& expected) {
    if (const auto size = sameSize(M, expected.rows, expected.columns); !size)
        return size;
    for (int r = 0; r < expected.rows; ++r)
        for (int c = 0; c < expected.columns; ++c)
            if (!sameFloat(M[r][c], expected[r][c]))
                return testing::AssertionFailure()
                       << "element (" << r << ", " << c << ") of " << expected.rows << " x " << expected.columns << " is "
                       << testing::PrintToString(M[r][c]) << ", expected " << testing::PrintToString(expected[r][c]);
    return testing::AssertionSuccess();
}

inline testing::AssertionResult same(const kelMat& M, const kelMat& expected) {
    return same(M, reference(expected));
}

// Every element within `tolerance`.
inline testing::AssertionResult near(const kelMat& M, const kelMat& expected, double tolerance) {
    if (const auto size = sameSize(M, expected.m_Height, expected.m_Width); !size)
        return size;
    for (int r = 0; r < M.m_Height; ++r)
        for (int c = 0; c < M.m_Width; ++c)
            if (!(std::fabs(double(M[r][c]) - expected[r][c]) <= tolerance))
                return testing::AssertionFailure()
                       << "element (" << r << ", " << c << ") is " << M[r][c] << ", expected " << expected[r][c];
    return testing::AssertionSuccess();
}

inline double norm(const Truth& M) {
    double sum = 0;
    for (double x : M.data)
        sum += x * x;
    return std::sqrt(sum);
}

inline double distance(const Truth& A, const Truth& B) {
    Truth D = A;
    for (size_t i = 0; i < D.data.size(); ++i)
        D.data[i] -= B.data[i];
    return norm(D);
}

} // namespace kel_test

#endif
