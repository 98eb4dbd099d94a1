// Determinants: closed forms for 2x2 and 3x3, LU beyond.
#include "kelMat_Private.h"

float kel_getDeterminant_2x2(const kelMat& A) {
    return A[0][0] * A[1][1] - A[0][1] * A[1][0];
}

// Along the last column, summed from its top.
float kel_getDeterminant_3x3(const kelMat& A) {
    const float top = (A[1][0] * A[2][1] - A[1][1] * A[2][0]) * A[0][2];
    const float middle = (A[2][0] * A[0][1] - A[2][1] * A[0][0]) * A[1][2] + top;
    return (A[0][0] * A[1][1] - A[0][1] * A[1][0]) * A[2][2] + middle;
}

// A row of zeros leaves LU undone, with a zero on the diagonal all the same: no need to ask how it went.
float kel_getDeterminant_NxN(const kelMat& A) {
    const int n = A.m_Width;
    kel::Scratch<int, kel::kSmallOrder> indx(n);
    kel::SmallMat LU(A);
    float det;
    nr_ludcmp(LU, indx.data(), &det);
    for (int i = 0; i < n; ++i)
        det = LU[i][i] * det;
    return det;
}
