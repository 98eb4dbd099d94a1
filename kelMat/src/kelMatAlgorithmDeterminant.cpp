// Determinants: closed forms for 2x2 and 3x3, LU beyond.
#include "kelMat_Private.h"

float kel_getDeterminant_2x2(const kelMat& A) {
    const float *const a = A[0], *const b = A[1];
    return a[0] * b[1] - a[1] * b[0];
}

// Along the last column, summed from its top.
float kel_getDeterminant_3x3(const kelMat& A) {
    const float *const a = A[0], *const b = A[1], *const c = A[2];
    const float top = (b[0] * c[1] - b[1] * c[0]) * a[2];
    const float middle = (c[0] * a[1] - c[1] * a[0]) * b[2] + top;
    return (a[0] * b[1] - a[1] * b[0]) * c[2] + middle;
}

// A row of zeros leaves LU undone, with a zero on the diagonal all the same: no need to ask how it went.
float kel_getDeterminant_NxN(const kelMat& A) {
    const int n = A.m_Width;
    kel::Scratch<int, kel::kSmallOrder> indx(n);
    kel::SmallMat LU(A);
    float det;
    nr_ludcmp(LU, indx.data(), &det);
    for (ptrdiff_t i = 0; i < n; ++i)
        det = LU.m_Data[i * n + i] * det;
    return det;
}
