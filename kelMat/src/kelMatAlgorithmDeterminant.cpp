// Determinants: closed forms for 2x2 and 3x3, LU beyond.
#include "kelMat_Private.h"

float kel_getDeterminant_2x2(const kelMat& A) {
    return kel::determinant2x2(A[0], A[1]);
}

float kel_getDeterminant_3x3(const kelMat& A) {
    return kel::determinant3x3(A[0], A[1], A[2]);
}

// A row of zeros leaves LU undone, with a zero on the diagonal all the same: no need to ask how it went.
float kel_getDeterminant_NxN(const kelMat& A) {
    const int n = A.m_Width;
    kel::LUCopy lu(A);
    float det = lu.parity;
    for (ptrdiff_t i = 0; i < n; ++i)
        det = lu.a[i * n + i] * det;
    return det;
}
