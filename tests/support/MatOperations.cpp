// The list of operations on matrices.
#include "MatOperations.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace kel_test {

namespace {

// What is a member of kelMat, under the name that the reference has for it.
kelMat transposed(const kelMat& A) {
    return A.getTransposedMatrix();
}
float determinant(const kelMat& A) {
    return A.getDeterminant();
}
bool inverse(const kelMat& A, kelMat& R) {
    return A.getInversedMatrix(R);
}
bool pseudoInverse(const kelMat& A, kelMat& R) {
    return A.getInversedMatrix_Pseudo(R);
}
void generalizedEigen(kelMat& A, kelMat& B, kelMat& d, kelMat& X) {
    A.getGeneralizedEigenValue(B, d, X);
}

// Decomposition, then a solution for a right side whose second element is 0 and another with leading zeros.
template <class T> Floats systems(T A) {
    const int n = reference(A).columns;
    std::vector<int> indx(n, -7);
    float parity = 0;
    const bool solved = nr_ludcmp(A, indx.data(), &parity);
    Floats all = results(solved, parity, A, indx);
    for (int zeros : {0, n / 2}) {
        Floats b(n);
        for (int i = zeros; i < n; ++i)
            b[i] = static_cast<float>(i - 1);
        if (solved)
            nr_lubksb(A, indx.data(), b.data());
        append(all, b);
    }
    return all;
}

// `call` takes matrices of the library and of the reference alike.
template <class F> MatOperation operation(const char* name, MatOperation::Form form, int least, F call) {
    return {name, call, call, form, least};
}

} // namespace

void append(Floats& all, double value) {
    all.push_back(static_cast<float>(value));
}
void append(Floats& all, const Reference& M) {
    append(all, M.rows);
    append(all, M.columns);
    append(all, M.data);
}
void append(Floats& all, const kelMat& M) {
    append(all, reference(M));
}

Reference reference(const kelMat& M) {
    Reference R(M.m_Height, M.m_Width);
    std::copy_n(M.m_Data, R.data.size(), R.data.begin());
    return R;
}

const std::vector<MatOperation>& matOperations() {
    constexpr auto any = MatOperation::Any, square = MatOperation::Square, symmetric = MatOperation::Symmetric;
    static const std::vector<MatOperation> list = {
        operation("product", any, 1, [](auto A, auto B) { return results(A * transposed(B)); }),
        operation("nr_ludcmp, nr_lubksb", square, 1, [](auto A, auto) { return systems(A); }),
        operation("getDeterminant", square, 2, [](auto A, auto) { return results(determinant(A)); }),
        // R holds something, which stays where A is singular.
        operation("getInversedMatrix", square, 2, [](auto A, auto R) { return results(inverse(A, R), R); }),
        operation("getInversedMatrix_Pseudo", any, 2, [](auto A, auto R) { return results(pseudoInverse(A, R), R); }),
        operation("nr_choldc", square, 1, [](auto A, auto) { return results(nr_choldc(A), A); }),
        operation("nr_svdcmp", any, 1,
                  [](auto A, auto) {
                      decltype(A) u, w, v;
                      return results(nr_svdcmp(A, u, w, v), w, v, u, A);
                  }),
        operation("nr_jacobi", square, 1,
                  [](auto A, auto) {
                      decltype(A) d, v;
                      int rotations = -1;
                      return results(nr_jacobi(A, d, v, &rotations), rotations, A, d, v); // the lower triangle of A stays
                  }),
        operation("getGeneralizedEigenValue", symmetric, 2,
                  [](auto A, auto B) {
                      decltype(A) d(1, 1), X(1, 1);
                      generalizedEigen(A, B, d, X);
                      return results(d, X, A, B);
                  }),
    };
    return list;
}

bool sameFloat(float a, float b) {
    return std::memcmp(&a, &b, sizeof a) == 0 || (std::isnan(a) && std::isnan(b));
}

bool sameFloats(const Floats& a, const Floats& b) {
    return a.size() == b.size() && std::equal(a.begin(), a.end(), b.begin(), sameFloat);
}

} // namespace kel_test
