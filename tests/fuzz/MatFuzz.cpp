// Matrix kernels beside the plain loops, bit for bit, also for numbers that are none.
#include <algorithm>
#include <kel/kelMat.h>

#include "Fuzz.h"
#include "MatReference.h"

using kel_fuzz::fail;
using kel_fuzz::Input;

namespace {

using Reference = kel_ref::Mat<float>;

kelMat someMatrix(Input& input, int rows, int columns) {
    kelMat M(rows, columns, false);
    const uint8_t kind = input.byte();
    std::mt19937 random(input.word());
    for (int i = 0; i < rows * columns; ++i)
        M.m_Data[i] = kind % 2 ? input.number() : static_cast<float>(random() % 65536) / 16384.0f - 2.0f;
    for (int i = 0; i < kind / 2 % 8; ++i) // and a few numbers of another kind
        M.m_Data[static_cast<int>(random() % static_cast<unsigned>(rows * columns))] = input.number();
    return M;
}

Reference reference(const kelMat& M) {
    Reference R(M.m_Height, M.m_Width);
    std::copy_n(M.m_Data, R.data.size(), R.data.begin());
    return R;
}

void expectSame(const kelMat& M, const Reference& R, const char* what) {
    if (M.m_Height != R.rows || M.m_Width != R.columns)
        fail(what);
    kel_fuzz::expectSame(M.m_Data, R.data.data(), R.data.size(), what);
}

void products(Input& input) {
    const int rows = input.between(1, 20), inner = input.between(1, 20), columns = input.between(1, 20);
    const kelMat A = someMatrix(input, rows, inner), B = someMatrix(input, inner, columns);
    expectSame(A * B, kel_ref::product(reference(A), reference(B)), "product");
    expectSame(A.getTransposedMatrix(), kel_ref::transposed(reference(A)), "transpose");
    const kelMat both = A | (A * 2.0f);
    for (int r = 0; r < rows; ++r)
        for (int c = 0; c < inner; ++c)
            if (!kel_fuzz::sameFloat(both[r][c], A[r][c]) || !kel_fuzz::sameFloat(both[r][inner + c], A[r][c] * 2.0f))
                fail("concatenation");
}

void systems(Input& input) {
    const int n = input.between(1, 16);
    kelMat A = someMatrix(input, n, n), b = someMatrix(input, n, 1);
    Reference a = reference(A), x = reference(b);
    std::vector<int> indexA(n), indexB(n);
    float parityA = 0, parityB = 0;
    const bool solved = nr_ludcmp(A, indexA.data(), &parityA);
    if (solved != kel_ref::ludcmp(a, indexB.data(), &parityB) || !kel_fuzz::sameFloat(parityA, parityB))
        fail("result of nr_ludcmp");
    expectSame(A, a, "nr_ludcmp");
    if (!solved)
        return;
    if (indexA != indexB)
        fail("permutation of nr_ludcmp");
    nr_lubksb(A, indexA.data(), b.m_Data);
    kel_ref::lubksb(a, indexB.data(), x.data.data());
    expectSame(b, x, "nr_lubksb");
}

void inverses(Input& input) {
    const int n = input.between(3, 16);
    const kelMat A = someMatrix(input, n, n);
    kelMat R;
    if (n == 3) {
        if (A.getInversedMatrix(R))
            expectSame(R, kel_ref::adjugateInverse3x3(reference(A)), "inverse of 3x3");
        return;
    }
    Reference r;
    const bool regular = A.getInversedMatrix(R);
    if (regular != kel_ref::inverse(reference(A), r))
        fail("result of an inverse");
    if (regular)
        expectSame(R, r, "inverse");
}

void cholesky(Input& input) {
    const int n = input.between(1, 14);
    kelMat A = someMatrix(input, n, n);
    if (input.byte() % 4)
        A = A * A.getTransposedMatrix();
    Reference a = reference(A);
    if (nr_choldc(A) != kel_ref::choldc(a))
        fail("result of nr_choldc");
    expectSame(A, a, "nr_choldc");
}

void singularValues(Input& input) {
    const kelMat A = someMatrix(input, input.between(1, 40), input.between(1, 15));
    kelMat U, W, V;
    Reference u, w, v;
    if (nr_svdcmp(A, U, W, V) != kel_ref::svdcmp(reference(A), u, w, v))
        fail("result of nr_svdcmp");
    expectSame(W, w, "singular values");
    expectSame(V, v, "right singular vectors");
    expectSame(U, u, "left singular vectors");
}

kelMat someSymmetric(Input& input, int n) {
    kelMat A = someMatrix(input, n, n);
    for (int r = 0; r < n; ++r)
        for (int c = 0; c < r; ++c)
            A[r][c] = A[c][r];
    return A;
}

void eigenvalues(Input& input) {
    const int n = input.between(1, 14);
    kelMat A = someSymmetric(input, n), D, V;
    Reference a = reference(A), d, v;
    int rotations = -1, expected = -1;
    if (nr_jacobi(A, D, V, &rotations) != kel_ref::jacobi(a, d, v, &expected) || rotations != expected)
        fail("result of nr_jacobi");
    expectSame(D, d, "eigenvalues");
    expectSame(V, v, "eigenvectors");
}

void generalizedEigenvalues(Input& input) {
    const int n = input.between(4, 12);
    kelMat A = someSymmetric(input, n), B = someMatrix(input, n, n), D, X;
    B = B * B.getTransposedMatrix();
    Reference d, x;
    A.getGeneralizedEigenValue(B, D, X);
    kel_ref::generalizedEigen(reference(A), reference(B), d, x);
    expectSame(D, d, "generalized eigenvalues");
    expectSame(X, x, "generalized eigenvectors");
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Input input(data, size);
    void (*const targets[])(Input&) = {
        products, systems, inverses, cholesky, singularValues, eigenvalues, generalizedEigenvalues};
    targets[input.byte() % (sizeof targets / sizeof *targets)](input);
    return 0;
}
