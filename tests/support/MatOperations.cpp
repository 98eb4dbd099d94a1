// The list of operations on matrices.
#include "MatOperations.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace kel_test {

namespace {

// Results one behind the other.
class Results {
public:
    Results& add(double value) {
        m_all.push_back(static_cast<float>(value));
        return *this;
    }
    Results& add(const Reference& M) {
        add(M.rows).add(M.columns);
        m_all.insert(m_all.end(), M.data.begin(), M.data.end());
        return *this;
    }
    Results& add(const kelMat& M) { return add(reference(M)); }
    template <class T> Results& add(const std::vector<T>& values) {
        m_all.insert(m_all.end(), values.begin(), values.end());
        return *this;
    }
    operator Floats() const { return m_all; }

private:
    Floats m_all;
};

// Decomposition, then a solution for a right side whose second element is 0 and another with leading zeros; T is kelMat or Reference.
template <class T, class Decompose, class Solve> Floats systems(T A, int n, Decompose decompose, Solve solve) {
    std::vector<int> indx(n, -7);
    float parity = 0;
    const bool solved = decompose(A, indx.data(), &parity);
    Results results;
    results.add(solved).add(parity).add(A).add(indx);
    for (int zeros : {0, n / 2}) {
        Floats b(n);
        for (int i = zeros; i < n; ++i)
            b[i] = static_cast<float>(i - 1);
        if (solved)
            solve(A, indx.data(), b.data());
        results.add(b);
    }
    return results;
}

template <class T> Floats jacobi(T A, bool (*solve)(T&, T&, T&, int*)) {
    T d, v;
    int rotations = -1;
    const bool solved = solve(A, d, v, &rotations);
    return Results().add(solved).add(rotations).add(A).add(d).add(v); // the lower triangle of A stays
}

} // namespace

Reference reference(const kelMat& M) {
    Reference R(M.m_Height, M.m_Width);
    std::copy_n(M.m_Data, R.data.size(), R.data.begin());
    return R;
}

const std::vector<MatOperation>& matOperations() {
    using M = kelMat;
    using R = Reference;
    static const std::vector<MatOperation> list = {
        {"product", [](M A, M B) -> Floats { return Results().add(A * B.getTransposedMatrix()); },
         [](R A, R B) -> Floats { return Results().add(kel_ref::product(A, kel_ref::transposed(B))); }, MatOperation::Any},
        {"nr_ludcmp, nr_lubksb", [](M A, M) { return systems(A, A.m_Width, nr_ludcmp, nr_lubksb); },
         [](R A, R) { return systems(A, A.columns, kel_ref::ludcmp<float>, kel_ref::lubksb<float>); }},
        {"getInversedMatrix",
         [](M A, M) -> Floats {
             M inverse;
             const bool regular = A.getInversedMatrix(inverse);
             return Results().add(regular).add(inverse);
         },
         [](R A, R) -> Floats {
             R inverse;
             const bool regular = kel_ref::inverse(A, inverse);
             return Results().add(regular).add(inverse);
         },
         MatOperation::Square, 4},
        {"nr_choldc",
         [](M A, M) -> Floats {
             const bool definite = nr_choldc(A);
             return Results().add(definite).add(A);
         },
         [](R A, R) -> Floats {
             const bool definite = kel_ref::choldc(A);
             return Results().add(definite).add(A);
         }},
        {"nr_svdcmp",
         [](M A, M) -> Floats {
             M u, w, v;
             const bool converged = A.getDecomposedMatrix_SV(u, w, v);
             return Results().add(converged).add(w).add(v).add(u).add(A);
         },
         [](R A, R) -> Floats {
             R u, w, v;
             const bool converged = kel_ref::svdcmp(A, u, w, v);
             return Results().add(converged).add(w).add(v).add(u).add(A);
         },
         MatOperation::Any},
        {"nr_jacobi", [](M A, M) { return jacobi<M>(A, nr_jacobi); },
         [](R A, R) { return jacobi<R>(A, kel_ref::jacobi<float>); }},
        {"getGeneralizedEigenValue",
         [](M A, M B) -> Floats {
             M d(1, 1), x(1, 1);
             A.getGeneralizedEigenValue(B, d, x);
             return Results().add(d).add(x).add(A).add(B);
         },
         [](R A, R B) -> Floats {
             R d, x;
             kel_ref::generalizedEigen(A, B, d, x);
             return Results().add(d).add(x).add(A).add(B);
         },
         MatOperation::Symmetric, 4},
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
