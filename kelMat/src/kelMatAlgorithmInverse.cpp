// Inverses: adjugate over determinant for 2x2 and 3x3, LU beyond, and the left pseudo-inverse. A singular matrix leaves the
// output as it was.
#include <algorithm>

#include "kelMat_Private.h"

bool kel_getInversedMatrix_2x2(const kelMat& A, kelMat& R) {
    const float det = A.getDeterminant();
    if (det == 0.0f)
        return false;
    const float inverse[] = {A[1][1] / det, -A[0][1] / det, -A[1][0] / det, A[0][0] / det};
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

bool kel_getInversedMatrix_NxN(const kelMat& A, kelMat& R) {
    const int n = A.m_Width;
    kel::Scratch<int, kel::kSmallOrder> indx(n);
    kel::SmallMat LU(A);
    float parity;
    if (!nr_ludcmp(LU, indx.data(), &parity))
        return false;
    R.create(n, n, false);
    kel::Scratch<float, kel::kSmallOrder> column(n);
    for (int j = 0; j < n; ++j) {
        std::fill_n(column.data(), n, 0.0f);
        column[j] = 1.0f;
        nr_lubksb(LU, indx.data(), column.data());
        for (int i = 0; i < n; ++i)
            R[i][j] = column[i];
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
