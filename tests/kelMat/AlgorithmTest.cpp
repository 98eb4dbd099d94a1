// The numerical kernels: bit for bit beside the plain reference, and beside the truth in double precision.
#include <functional>
#include <numeric>

#include "MatInputs.h"
#include "Memory.h"
#include "Valgrind.h"

using namespace kel_test;

namespace {

bool agrees(const MatOperation& o, const kelMat& A, const kelMat& B = kelMat()) {
    return sameFloats(o.call(A, B), o.reference(reference(A), reference(B)));
}
const MatOperation& operation(const std::string& name) {
    return *std::find_if(matOperations().begin(), matOperations().end(), [&](const MatOperation& o) { return o.name == name; });
}

} // namespace

TEST(MatOperations, EqualThePlainLoops) {
    for (const MatOperation& o : matOperations()) {
        SCOPED_TRACE(o.name);
        forAllCalls(o, [&](const kelMat& A, const kelMat& B) { EXPECT_TRUE(agrees(o, A, B)); });
    }
}

TEST(NrSign, KnowsOnlyTwoAnswers) {
    EXPECT_EQ(nr_sign(0.0f), 1.0f);
    EXPECT_EQ(nr_sign(-0.0f), 1.0f);
    EXPECT_EQ(nr_sign(5.0f), 1.0f);
    EXPECT_EQ(nr_sign(-1e-30f), -1.0f);
    EXPECT_EQ(nr_sign(kNan), -1.0f);
}

TEST(NrPythag, IsTheHypotenuse) {
    EXPECT_EQ(nr_pythag(3, 4), 5.0f);
    EXPECT_EQ(nr_pythag(-4, 3), 5.0f);
    EXPECT_EQ(nr_pythag(0, 0), 0.0f);
    EXPECT_EQ(nr_pythag(0, -7), 7.0f);
    EXPECT_EQ(nr_pythag(kNan, 0), 0.0f);
    EXPECT_TRUE(std::isnan(nr_pythag(0, kNan)));
    EXPECT_NEAR(nr_pythag(1e30f, 1e30f) / 1.4142135e30f, 1, kEps);
    EXPECT_NEAR(nr_pythag(1e-40f, 1e-40f) / 1.4142e-40f, 1, 1e-4) << "subnormal numbers stay";
    std::mt19937 random = generator(40);
    std::uniform_real_distribution<float> exponent(-37, 37), mantissa(-10, 10);
    for (int i = 0; i < 20000; ++i) {
        const float a = mantissa(random) * std::pow(10.0f, exponent(random)), b = a * mantissa(random);
        ASSERT_TRUE(sameFloat(nr_pythag(a, b), kel_ref::pythag(a, b))) << a << " " << b;
        ASSERT_TRUE(sameFloat(nr_pythag(b, a), kel_ref::pythag(b, a))) << b << " " << a;
        if (const double truth = std::hypot(double(a), double(b)); truth > 1e-37 && truth < 3e38) {
            EXPECT_NEAR(nr_pythag(a, b) / truth, 1, 2 * kEps);
        }
    }
}

TEST(NrLudcmp, ReportsZeroRowsOnly) {
    int indx[2] = {-7, -7};
    float d = 0;
    kelMat a = mat({{0, 1}, {1, 0}});
    EXPECT_TRUE(nr_ludcmp(a, indx, &d));
    EXPECT_TRUE(same(a, mat({{1, 0}, {0, 1}})));
    EXPECT_TRUE(indx[0] == 1 && indx[1] == 1 && d == -1);

    a = mat({{1, 2}, {0, 0}});
    indx[0] = indx[1] = -7;
    d = 0;
    EXPECT_FALSE(nr_ludcmp(a, indx, &d));
    EXPECT_TRUE(same(a, mat({{1, 2}, {0, 0}})));
    EXPECT_TRUE(indx[0] == -7 && indx[1] == -7 && d == 1);

    a = mat({{1, 2}, {2, 4}});
    EXPECT_TRUE(nr_ludcmp(a, indx, &d));
    EXPECT_TRUE(same(a, mat({{2, 4}, {0.5f, 1.0e-40f}}))) << "the last of equal candidates, and the tiny pivot";
    a = mat({{0, 1}, {0, 2}});
    EXPECT_TRUE(nr_ludcmp(a, indx, &d));
    EXPECT_TRUE(indx[0] == 1 && d == -1) << "in a column of zeros the last row wins";
    EXPECT_TRUE(sameFloat(a[0][0], 1.0e-40f) && std::isnan(a[1][0])) << "0 times an infinite reciprocal";
    kelMat none;
    EXPECT_TRUE(nr_ludcmp(none, indx, &d));
}

TEST(NrLudcmp, TakesNoMemoryOfTheMatrixsSize) {
    if (!ownMalloc())
        GTEST_SKIP() << "another malloc is in use";
    constexpr int n = 300;
    kelMat a = randomMatrix(n, n, 42);
    std::vector<int> indx(n);
    float d;
    const CountedMemory memory;
    nr_ludcmp(a, indx.data(), &d);
    EXPECT_LT(memory.largest(), size_t(n) * n);
}

TEST(NrLubksb, SolvesAndSkipsLeadingZeros) {
    kelMat a = mat({{4, 3}, {6, 3}});
    int indx[2];
    float d, b[] = {10, 12};
    ASSERT_TRUE(nr_ludcmp(a, indx, &d));
    EXPECT_TRUE(nr_lubksb(a, indx, b));
    EXPECT_NEAR(b[0], 1, 1e-6);
    EXPECT_NEAR(b[1], 2, 1e-6);
    // An infinite element of L meets no zero of b, which would give NaN.
    kelMat infinite = mat({{1, 0}, {kInfinity, 1}});
    int straight[] = {0, 1};
    float c[] = {0, 5};
    nr_lubksb(infinite, straight, c);
    EXPECT_TRUE(c[0] == 0 && c[1] == 5);
}

TEST(NrCholdc, FactorsTheLowerTriangle) {
    kelMat a = mat({{4, kNan}, {2, 3}});
    EXPECT_TRUE(nr_choldc(a));
    EXPECT_TRUE(same(a, mat({{2, 0}, {1, std::sqrt(2.0f)}})));
    a = mat({{1, 2}, {2, 1}});
    EXPECT_FALSE(nr_choldc(a));
    a = mat({{1, 1}, {1, 1}});
    EXPECT_FALSE(nr_choldc(a)) << "a pivot of zero";
    a = mat({{kNan, 0}, {0, 1}});
    EXPECT_TRUE(nr_choldc(a)) << "NaN is neither zero nor negative";
    kelMat none;
    EXPECT_TRUE(nr_choldc(none));
    for (int n = 1; n <= 20; ++n) {
        const kelMat R = randomMatrix(n, 2 * n, 41);
        kelMat L = R * R.getTransposedMatrix();
        const Truth A = truth(L);
        ASSERT_TRUE(nr_choldc(L));
        const Truth l = truth(L);
        EXPECT_LT(distance(product(l, transposed(l)), A), 2 * kEps * norm(A));
    }
}

// ---- singular values -------------------------------------------------------------------------------------------------------

namespace {

std::vector<double> sortedDiagonal(const Truth& w) {
    std::vector<double> values(w.columns);
    for (int i = 0; i < w.columns; ++i)
        values[i] = w[i][i];
    std::sort(values.begin(), values.end(), std::greater<double>());
    return values;
}

// Columns of v, and those of u that belong to a positive singular value, are orthonormal; u w v^T is the input.
void expectSvdNearTruth(const kelMat& A, double units) {
    kelMat U, W, V;
    ASSERT_TRUE(nr_svdcmp(A, U, W, V));
    const Truth a = truth(A), u = truth(U), w = truth(W), v = truth(V);
    const int n = a.columns;
    const double size = norm(a), tolerance = units * kEps * n;
    EXPECT_LT(distance(product(transposed(v), v), kel_ref::identity<double>(n)), tolerance);
    Truth gram = product(transposed(u), u), expected = kel_ref::identity<double>(n);
    for (int i = 0; i < n; ++i)
        if (i >= a.rows || w[i][i] < tolerance * size)
            for (int k = 0; k < n; ++k)
                gram[i][k] = gram[k][i] = expected[i][k] = expected[k][i] = 0;
    EXPECT_LT(distance(gram, expected), tolerance);
    EXPECT_LE(distance(product(product(u, w), transposed(v)), a), tolerance * size);
    Truth tu, tw, tv;
    ASSERT_TRUE(kel_ref::svdcmp(a, tu, tw, tv));
    const std::vector<double> values = sortedDiagonal(w), truth = sortedDiagonal(tw);
    for (int i = 0; i < n; ++i) {
        EXPECT_GE(w[i][i], 0);
        EXPECT_NEAR(values[i], truth[i], tolerance * size) << "singular value " << i;
    }
}

const std::pair<int, int> kShapes[] = {{1, 1},   {2, 1},   {1, 2},   {3, 2},   {2, 3},   {4, 4},   {9, 9},   {8, 9},
                                       {10, 9},  {20, 9},  {12, 12}, {13, 12}, {33, 12}, {5, 13},  {40, 13}, {16, 16},
                                       {17, 16}, {30, 17}, {7, 30},  {64, 9},  {65, 8},  {127, 5}, {3, 64},  {60, 40}};

} // namespace

TEST(NrSvdcmp, EqualsThePlainLoops) {
    const MatOperation& svd = operation("nr_svdcmp");
    for (const auto& shape : kShapes)
        EXPECT_TRUE(agrees(svd, randomMatrix(shape.first, shape.second, 46)));
    for (int rows = 1; rows <= 40; ++rows)
        for (int columns = 1; columns <= 14; ++columns)
            EXPECT_TRUE(agrees(svd, randomMatrix(rows, columns, rows * 50 + columns))) << rows << " x " << columns;
    for (const auto& shape : {std::pair<int, int>{2000, 9}, {1999, 12}, {1025, 7}, {20000, 9}, {700, 20}, {513, 33}})
        EXPECT_TRUE(agrees(svd, randomMatrix(shape.first, shape.second, 43))) << shape.first << " x " << shape.second;
    EXPECT_TRUE(agrees(svd, kelMat()));
}

TEST(NrSvdcmp, IsNearTheTruth) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    for (const auto& shape : kShapes)
        for (const Input& input : inputs(shape.first, shape.second, 44)) {
            if (input.outOfRange || (input.name == "ones" && shape.second > 9)) // whose residue of rank 1 becomes subnormal
                continue;
            SCOPED_TRACE(input.name + ", " + std::to_string(shape.first) + " x " + std::to_string(shape.second));
            expectSvdNearTruth(input.a, 8);
        }
    for (const Input& input : inputs(20000, 9, 45)) {
        if (input.outOfRange)
            continue;
        SCOPED_TRACE(input.name);
        expectSvdNearTruth(input.a, input.name == "ones" ? 400 : 150); // equal terms all round the same way
    }
}

TEST(NrSvdcmp, NegatesTheColumnOfANegativeValue) {
    kelMat U, W, V;
    ASSERT_TRUE(nr_svdcmp(mat({{5, 0}, {0, 2}}), U, W, V));
    EXPECT_TRUE(same(W, mat({{5, 0}, {0, 2}})));
    EXPECT_TRUE(near(V, mat({{-1, 0}, {0, -1}}), 0)) << "the bidiagonal form has -5 and -2";
    EXPECT_TRUE(near(U, mat({{-1, 0}, {0, -1}}), 0));
}

TEST(NrSvdcmp, EndsOnNanAndTouchesNothingBeside) {
    for (Protect side : {Protect::Behind, Protect::Before})
        for (const auto& shape : kShapes) {
            for (const Input& input : poisoned(shape.first, shape.second, 46)) {
                kelMat A(input.a), U, W, V;
                {
                    const ProtectedMemory memory(side);
                    A = input.a;
                    A.getDecomposedMatrix_SV(U, W, V);
                    V.getEigenValue(U, W);
                }
                EXPECT_TRUE(sameSize(W, V.m_Width, V.m_Width));
            }
            const ProtectedMemory memory(side);
            const kelMat A = randomMatrix(shape.first, shape.second, 47);
            kelMat U, W, V, S = A.getTransposedMatrix() * A;
            A.getDecomposedMatrix_SV(U, W, V);
            S.getEigenValue(W, V);
            if (S.m_Width > 1)
                S.getGeneralizedEigenValue(S, W, V);
        }
    kelMat A = randomMatrix(20, 9, 48), U, W, V;
    A[7][3] = kNan;
    EXPECT_FALSE(nr_svdcmp(A, U, W, V));
}

// ---- symmetric eigenvalues -------------------------------------------------------------------------------------------------

TEST(NrJacobi, StopsAtOnceOnADiagonalMatrix) {
    kelMat a = mat({{3, 0, 0}, {0, -1, 0}, {0, 0, 2}}), d, v;
    int rotations = -1;
    EXPECT_TRUE(nr_jacobi(a, d, v, &rotations));
    EXPECT_EQ(rotations, 0);
    EXPECT_TRUE(same(d, mat({{3}, {-1}, {2}})));
    EXPECT_TRUE(same(v, mat({{1, 0, 0}, {0, 1, 0}, {0, 0, 1}})));
    kelMat none;
    EXPECT_TRUE(nr_jacobi(none, d, v, &rotations));
    EXPECT_TRUE(sameSize(d, 0, 0));
}

TEST(NrJacobi, KeepsTheOrderInWhichValuesArise) {
    kelMat d, v, A = mat({{2, 1}, {1, 2}});
    EXPECT_TRUE(A.getEigenValue(d, v));
    EXPECT_TRUE(same(A, mat({{2, 1}, {1, 2}})));
    EXPECT_TRUE(near(d, mat({{1}, {3}}), 1e-6));
    const float r = std::sqrt(0.5f);
    EXPECT_TRUE(near(v, mat({{r, r}, {-r, r}}), 1e-6));
}

TEST(NrJacobi, EqualsThePlainLoopsWhereRotationsAreSmall) {
    std::mt19937 random = generator(55);
    std::uniform_real_distribution<float> uniform(-1, 1);
    for (int i = 0; i < 3000; ++i) {
        const int n = 2 + i % 11;
        kelMat A(n, n);
        const float range = std::abs(uniform(random)) * 36;
        for (int k = 0; k < n * n; ++k)
            A.m_Data[k] = uniform(random) * std::pow(10.0f, -range * std::abs(uniform(random)));
        ASSERT_TRUE(agrees(operation("nr_jacobi"), A)) << i;
    }
}

TEST(NrJacobi, IsNearTheTruth) {
    for (int n = 1; n <= 24; ++n)
        for (const Input& input : inputs(n, n, 49)) {
            if (input.outOfRange)
                continue;
            SCOPED_TRACE(input.name + ", " + std::to_string(n));
            kelMat A(input.a), D, V;
            for (int r = 0; r < n; ++r)
                for (int c = 0; c < r; ++c)
                    A[r][c] = A[c][r];
            A.getEigenValue(D, V);
            const Truth a = truth(A), v = truth(V);
            Truth d(n, n);
            for (int i = 0; i < n; ++i)
                d[i][i] = D[i][0];
            EXPECT_LT(distance(product(transposed(v), v), kel_ref::identity<double>(n)), 4 * kEps * n);
            EXPECT_LE(distance(product(product(v, d), transposed(v)), a), 4 * kEps * n * norm(a));
        }
}

TEST(GeneralizedEigen, SolvesTheProblem) {
    for (int n = 2; n <= 12; ++n) {
        kelMat A = randomSymmetric(n, 52), R = randomMatrix(n, 3 * n, 53), B = R * R.getTransposedMatrix(), D, X;
        EXPECT_TRUE(A.getGeneralizedEigenValue(B, D, X));
        const Truth a = truth(A), b = truth(B), x = truth(X);
        Truth d(n, n);
        for (int i = 0; i < n; ++i)
            d[i][i] = D[i][0];
        EXPECT_LT(distance(product(product(transposed(x), b), x), kel_ref::identity<double>(n)), 50 * kEps * n);
        EXPECT_LT(distance(product(a, x), product(product(b, x), d)), 50 * kEps * n * norm(a));
        kelMat I(n, n), DI, XI;
        I.setDataIdentity(1);
        A.getEigenValue(D, X);
        A.getGeneralizedEigenValue(I, DI, XI);
        EXPECT_TRUE(near(DI, D, 0.0));
        EXPECT_TRUE(near(XI, X, 0.0));
    }
}

TEST(GeneralizedEigen, ComesOutEmptyWhereTheSecondMatrixHasNoInverse) {
    for (int n : {2, 3, 4, 9}) {
        kelMat A = randomSymmetric(n, 54), B(n, n), D(2, 2), X(2, 2);
        EXPECT_TRUE(A.getGeneralizedEigenValue(B, D, X));
        EXPECT_TRUE(sameSize(D, 0, 0));
        EXPECT_TRUE(sameSize(X, 0, 0));
        EXPECT_TRUE(randomSymmetric(n + 1, 54).getGeneralizedEigenValue(B, D, X)) << "before the sizes are compared";
    }
}

TEST(InverseByLu, EqualsThePlainLoopsWhereZerosMayNotBeMultiplied) {
    // Rows of subnormals have infinite scales: their column has no candidate and takes over an earlier row, a swap upward. A small
    // pivot overflows the factor below it, which leading zeros of a right side must skip.
    const struct {
        int n;
        std::vector<float> elements;
    } matrices[] = {{4, {1, 0, 0, 0, 0, 1, 1, 0, 0, 0, 0, 1e-39f, 0, 0, 0, 1e-39f}}, {2, {1e-9f, 1e-9f, 1e30f, 1e38f}}};
    for (const auto& [n, elements] : matrices) {
        kelMat A(n, n, false), R;
        std::copy(elements.begin(), elements.end(), A.m_Data);
        kelMat LU(A);
        int indx[4];
        float parity;
        ASSERT_TRUE(nr_ludcmp(LU, indx, &parity));
        ASSERT_TRUE(kel_getInversedMatrix_NxN(A, R));
        for (int j = 0; j < n; ++j) {
            float column[4] = {};
            column[j] = 1;
            nr_lubksb(LU, indx, column);
            for (int i = 0; i < n; ++i)
                EXPECT_TRUE(R[i][j] == column[i] || (std::isnan(R[i][j]) && std::isnan(column[i]))) << i << " " << j;
        }
    }
}
