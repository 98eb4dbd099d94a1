// Matrices that the operations of the list are called with. They rest on exact functions alone, and are the same everywhere.
#ifndef KEL_TESTS_MAT_INPUTS_H
#define KEL_TESTS_MAT_INPUTS_H

#include "MatSupport.h"

namespace kel_test {

// Matrices that hurt: what a decomposition of m rows and n columns should bear.
struct Input {
    std::string name;
    kelMat a;
    bool outOfRange = false; // squares leave the range of float, and no accuracy is left
};

inline std::vector<Input> inputs(int m, int n, uint32_t salt) {
    std::vector<Input> result;
    result.push_back({"random", randomMatrix(m, n, salt)});
    result.push_back({"zero", kelMat(m, n)});
    result.push_back({"ones", kelMat(m, n) + 1.0f});
    kelMat diagonal(m, n);
    diagonal.setDataIdentity(-3);
    result.push_back({"diagonal", diagonal});
    if (n > 1)
        result.push_back({"deficient", randomMatrix(m, n / 2, salt + 1) * randomMatrix(n / 2, n, salt + 2)});
    kelMat graded = randomMatrix(m, n, salt + 3), tiny = graded, sparse = graded, integer = graded;
    for (int r = 0; r < m; ++r)
        for (int c = 0; c < n; ++c) {
            graded[r][c] = std::ldexp(graded[r][c], -66 * c / n);
            tiny[r][c] *= 1e-30f;
            if ((r * 7 + c * 3) % 4)
                sparse[r][c] = 0;
            integer[r][c] = std::round(integer[r][c] * 3);
        }
    result.push_back({"graded", graded});
    result.push_back({"tiny", tiny, true});
    result.push_back({"huge", tiny * 1e36f * 1e18f, true});
    result.push_back({"small", tiny * 1e18f});
    result.push_back({"large", tiny * 1e36f * 1e6f});
    result.push_back({"sparse", sparse});
    result.push_back({"integer", integer});
    kelMat scattered = randomMatrix(m, n, salt + 5), exponents = randomMatrix(m, n, salt + 6);
    for (int i = 0; i < m * n; ++i)
        scattered.m_Data[i] = std::ldexp(scattered.m_Data[i], static_cast<int>(66 * (exponents.m_Data[i] - 1)));
    result.push_back({"scattered", scattered, true});
    result.push_back({"scattered to subnormal", scattered * 1e-8f, true});
    kelMat zeroColumn = randomMatrix(m, n, salt + 4), zeroRow = zeroColumn, doubled = zeroColumn;
    for (int r = 0; r < m; ++r) {
        zeroColumn[r][n / 2] = 0;
        doubled[r][n - 1] = doubled[r][0];
    }
    std::fill_n(zeroRow[m / 2], n, 0.0f);
    result.push_back({"zero column", zeroColumn});
    result.push_back({"zero row", zeroRow});
    result.push_back({"equal columns", doubled});
    return result;
}

inline std::vector<Input> poisoned(int m, int n, uint32_t salt) {
    std::vector<Input> result;
    for (float value : {kNan, kInfinity, -kInfinity, 3e38f})
        for (int place : {0, m * n / 2, m * n - 1}) {
            Input input{std::to_string(value) + " at " + std::to_string(place), randomMatrix(m, n, salt)};
            input.a.m_Data[place] = value;
            result.push_back(input);
        }
    kelMat all(m, n), twoRows = randomMatrix(m, n, salt + 1), column = twoRows;
    for (int r = 0; r < m; ++r)
        column[r][n / 2] = kNan;
    result.push_back({"a column of NaN", column});
    for (int r = std::max(0, m - 2); r < m; ++r)
        twoRows[r][0] = kNan;
    result.push_back({"NaN in the last two rows", twoRows});
    result.push_back({"all NaN", all + kNan});
    return result;
}

template <class F> void forAllInputs(int m, int n, F check) {
    for (const Input& input : inputs(m, n, 1000 + m * 31 + n)) {
        SCOPED_TRACE(input.name + ", " + std::to_string(m) + " x " + std::to_string(n));
        check(input.a);
    }
    for (const Input& input : poisoned(m, n, 2000 + m * 31 + n)) {
        SCOPED_TRACE(input.name + ", " + std::to_string(m) + " x " + std::to_string(n));
        check(input.a);
    }
}

// Calls check(A, B) for all sizes and inputs of an operation.
template <class F> void forAllCalls(const MatOperation& o, F check) {
    for (int n : {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 16, 17, 24, 32, 33, 64, 70}) {
        const int rows = o.form == MatOperation::Any ? 1 + n * 7 % 41 : n; // more than columns, and fewer
        const kelMat factor = randomMatrix(n, n + 3, 51), definite = factor * factor.getTransposedMatrix();
        if (n >= o.least && (n <= 24 || o.form == MatOperation::Square))
            forAllInputs(rows, n, [&](const kelMat& A) {
                if (o.form == MatOperation::Symmetric)
                    check(A + A.getTransposedMatrix(), definite);
                else
                    check(A, A + 1.0f);
            });
    }
}

} // namespace kel_test

#endif
