// Inverses: adjugate over determinant for 2x2 and 3x3, LU beyond, and the left pseudo-inverse. A singular matrix leaves the
// output as it was.
#include <algorithm>

#include "kelMat_Private.h"

namespace {

using kel::all, kel::Floats, kel::store;

// The adjugate over the determinant, from the rows of the matrix.
void invert2x2(const float* a, const float* b, float det, float* R) {
    const float inverse[] = {b[1] / det, -a[1] / det, -b[0] / det, a[0] / det};
    std::copy_n(inverse, 4, R);
}

void invert3x3(const float* a, const float* b, const float* c, float det, float* R) {
    const float inverse[] = {
        (b[1] * c[2] - b[2] * c[1]) / det, (c[1] * a[2] - c[2] * a[1]) / det, (a[1] * b[2] - a[2] * b[1]) / det,
        (b[2] * c[0] - b[0] * c[2]) / det, (c[2] * a[0] - c[0] * a[2]) / det, (a[2] * b[0] - a[0] * b[2]) / det,
        (b[0] * c[1] - b[1] * c[0]) / det, (c[0] * a[1] - c[1] * a[0]) / det, (a[0] * b[1] - a[1] * b[0]) / det,
    };
    std::copy_n(inverse, 9, R);
}

// Solves LU X = P for all columns of the identity at once; `indx` holds the row swaps P.
void solveIdentity(const float* LU, const int* indx, ptrdiff_t n, float* X) {
    std::fill_n(X, n * n, 0.0f);
    for (ptrdiff_t i = 0; i < n; ++i)
        X[i * n + i] = 1.0f;
    for (ptrdiff_t i = 0; i < n; ++i) {
        if (indx[i] != i)
            std::swap_ranges(X + indx[i] * n, X + (indx[i] + 1) * n, X + i * n);
        kel::subtractMultiples(X + i * n, LU + i * n, X, n, i, n);
    }
    for (ptrdiff_t i = n - 1; i >= 0; --i) {
        kel::subtractMultiples(X + i * n, LU + i * n + i + 1, X + (i + 1) * n, n, n - i - 1, n);
        for (ptrdiff_t j = 0; j < n; ++j)
            X[i * n + j] /= LU[i * n + i];
    }
}

// The same for order 4, a row a vector.
void solveIdentity4(const float* LU, const int* indx, float* X) {
    Floats row[4] = {{1, 0, 0, 0}, {0, 1, 0, 0}, {0, 0, 1, 0}, {0, 0, 0, 1}};
    const auto less = [=](Floats r, int i, int k, Floats other) { return r - all(LU[4 * i + k]) * other; };
    for (int i = 0; i < 3; ++i)
        std::swap(row[i], row[indx[i]]);
    const Floats a = row[0], b = less(row[1], 1, 0, a), c = less(less(row[2], 2, 0, a), 2, 1, b),
                 d = less(less(less(row[3], 3, 0, a), 3, 1, b), 3, 2, c);
    const auto over = [=](Floats r, int i) { return r / all(LU[5 * i]); };
    const Floats z = over(d, 3), y = over(less(c, 2, 3, z), 2), x = over(less(less(b, 1, 2, y), 1, 3, z), 1),
                 w = over(less(less(less(a, 0, 1, x), 0, 2, y), 0, 3, z), 0);
    store(X, w);
    store(X + 4, x);
    store(X + 8, y);
    store(X + 12, z);
}

// Whether no row was swapped with one above it, as a column without a candidate (all NaN) may have it.
bool swapsDownward(const int* indx, int n) {
    for (int i = 0; i < n; ++i)
        if (indx[i] < i)
            return false;
    return true;
}

} // namespace

void kel::invertLU(const float* lu, int n, const int* indx, float* R) {
    const float* const end = lu + static_cast<ptrdiff_t>(n) * n;
    if (std::all_of(lu, end, [](float x) { return std::isfinite(x); }) && swapsDownward(indx, n))
        return n == 4 ? solveIdentity4(lu, indx, R) : solveIdentity(lu, indx, n, R);
    // One by one: the leading zeros of each column are skipped, which matters to infinities and to swaps upward.
    kel::Scratch<float, kel::kSmallOrder> column(n);
    for (int j = 0; j < n; ++j) {
        std::fill_n(column.data(), n, 0.0f);
        column[j] = 1.0f;
        substituteLU(lu, n, indx, column.data());
        for (ptrdiff_t i = 0; i < n; ++i)
            R[i * n + j] = column[i];
    }
}

bool kel::invert(float* a, int n, float* R) {
    if (n <= 3) {
        const float det = n == 2 ? determinant2x2(a, a + 2) : determinant3x3(a, a + 3, a + 6);
        if (det == 0.0f)
            return false;
        n == 2 ? invert2x2(a, a + 2, det, R) : invert3x3(a, a + 3, a + 6, det, R);
        return true;
    }
    Scratch<int, kSmallOrder> indx(n);
    float parity;
    if (!decomposeLU(a, n, indx.data(), &parity))
        return false;
    invertLU(a, n, indx.data(), R);
    return true;
}

bool kel_getInversedMatrix_2x2(const kelMat& A, kelMat& R) {
    const float det = A.getDeterminant();
    if (det == 0.0f)
        return false;
    float inverse[4];
    invert2x2(A[0], A[1], det, inverse);
    R.create(2, 2, false);
    std::copy_n(inverse, 4, R.m_Data);
    return true;
}

bool kel_getInversedMatrix_3x3(const kelMat& A, kelMat& R) {
    const float det = A.getDeterminant();
    if (det == 0.0f)
        return false;
    float inverse[9];
    invert3x3(A[0], A[1], A[2], det, inverse);
    R.create(3, 3, false);
    std::copy_n(inverse, 9, R.m_Data);
    return true;
}

bool kel_getInversedMatrix_NxN(const kelMat& A, kelMat& R) {
    const int n = A.m_Width;
    kel::LUCopy lu(A);
    if (!lu.ok)
        return false;
    R.create(n, n, false);
    kel::invertLU(lu.a.data(), n, lu.indx.data(), R.m_Data);
    return true;
}

bool kel_getInversedMatrix_NxM(const kelMat& A, kelMat& R) {
    const int m = A.m_Height, n = A.m_Width;
    if (n < 2)
        kelMat(n, n).getInversedMatrix(); // stops the process on the size
    const size_t square = static_cast<size_t>(n) * n;
    kel::SquareScratch T(static_cast<size_t>(n) * m), P(square), Q(square);
    kel::transpose(T.data(), A.m_Data, m, n);
    kel::multiply(P.data(), T.data(), A.m_Data, n, m, n);
    if (!kel::invert(P.data(), n, Q.data()))
        return false;
    R.create(n, m, false);
    kel::multiply(R.m_Data, Q.data(), T.data(), n, n, m);
    return true;
}
