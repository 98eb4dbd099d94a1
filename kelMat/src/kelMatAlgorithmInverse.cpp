// Inverses: adjugate over determinant for 2x2 and 3x3, LU beyond, and the left pseudo-inverse. A singular matrix leaves the
// output as it was.
#include <algorithm>

#include "kelMat_Private.h"

bool kel_getInversedMatrix_2x2(const kelMat& A, kelMat& R) {
    const float det = A.getDeterminant();
    if (det == 0.0f)
        return false;
    const float *const a = A[0], *const b = A[1];
    const float inverse[] = {b[1] / det, -a[1] / det, -b[0] / det, a[0] / det};
    R.create(2, 2, false);
    std::copy_n(inverse, 4, R.m_Data);
    return true;
}

bool kel_getInversedMatrix_3x3(const kelMat& A, kelMat& R) {
    const float det = A.getDeterminant();
    if (det == 0.0f)
        return false;
    const float *const a = A[0], *const b = A[1], *const c = A[2];
    const float inverse[] = {
        (b[1] * c[2] - b[2] * c[1]) / det, (c[1] * a[2] - c[2] * a[1]) / det, (a[1] * b[2] - a[2] * b[1]) / det,
        (b[2] * c[0] - b[0] * c[2]) / det, (c[2] * a[0] - c[0] * a[2]) / det, (a[2] * b[0] - a[0] * b[2]) / det,
        (b[0] * c[1] - b[1] * c[0]) / det, (c[0] * a[1] - c[1] * a[0]) / det, (a[0] * b[1] - a[1] * b[0]) / det,
    };
    R.create(3, 3, false);
    std::copy_n(inverse, 9, R.m_Data);
    return true;
}

namespace {

// Solves LU X = P for all columns of the identity at once; `indx` holds the row swaps P.
void solveIdentity(const float* LU, const int* indx, ptrdiff_t n, float* X) {
    std::fill_n(X, n * n, 0.0f);
    for (ptrdiff_t i = 0; i < n; ++i)
        X[i * n + i] = 1.0f;
    for (ptrdiff_t i = 0; i < n; ++i) {
        if (indx[i] != i)
            std::swap_ranges(X + indx[i] * n, X + (indx[i] + 1) * n, X + i * n);
        for (ptrdiff_t k = 0; k < i; ++k)
            kel::subtractMultiple(X + i * n, LU[i * n + k], X + k * n, n);
    }
    for (ptrdiff_t i = n - 1; i >= 0; --i) {
        for (ptrdiff_t k = i + 1; k < n; ++k)
            kel::subtractMultiple(X + i * n, LU[i * n + k], X + k * n, n);
        for (ptrdiff_t j = 0; j < n; ++j)
            X[i * n + j] /= LU[i * n + i];
    }
}

bool isFinite(const kelMat& A) {
    return std::all_of(A.m_Data, A.m_Data + static_cast<ptrdiff_t>(A.m_Height) * A.m_Width,
                       [](float x) { return std::isfinite(x); });
}

// Whether no row was swapped with one above it, as a column without a candidate (all NaN) may have it.
bool swapsDownward(const int* indx, int n) {
    for (int i = 0; i < n; ++i)
        if (indx[i] < i)
            return false;
    return true;
}

} // namespace

bool kel_getInversedMatrix_NxN(const kelMat& A, kelMat& R) {
    const int n = A.m_Width;
    kel::Scratch<int, kel::kSmallOrder> indx(n);
    kel::SmallMat LU(A);
    float parity;
    if (!nr_ludcmp(LU, indx.data(), &parity))
        return false;
    R.create(n, n, false);
    if (isFinite(LU) && swapsDownward(indx.data(), n)) {
        solveIdentity(LU.m_Data, indx.data(), n, R.m_Data);
        return true;
    }
    // One by one: nr_lubksb() skips the leading zeros of each column, which matters to infinities and to swaps upward.
    kel::Scratch<float, kel::kSmallOrder> column(n);
    for (int j = 0; j < n; ++j) {
        std::fill_n(column.data(), n, 0.0f);
        column[j] = 1.0f;
        nr_lubksb(LU, indx.data(), column.data());
        for (ptrdiff_t i = 0; i < n; ++i)
            R.m_Data[i * n + j] = column[i];
    }
    return true;
}

bool kel_getInversedMatrix_NxM(const kelMat& A, kelMat& R) {
    const int m = A.m_Height, n = A.m_Width;
    const kelMat T = A.getTransposedMatrix();
    kel::SmallMat P(n, n);
    kel::multiply(P.m_Data, T.m_Data, A.m_Data, n, m, n);
    kelMat Q;
    if (!P.getInversedMatrix(Q))
        return false;
    R.create(n, m, false);
    kel::multiply(R.m_Data, Q.m_Data, T.m_Data, n, n, m);
    return true;
}
