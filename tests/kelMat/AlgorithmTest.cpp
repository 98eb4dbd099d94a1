// The numerical kernels: bit for bit beside the plain reference, and beside the truth in double precision.
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
        forAllCalls(o, [&](const kelMat& A, const kelMat& B) {
            const CountedMemory memory;
            EXPECT_TRUE(agrees(o, A, B));
            EXPECT_EQ(memory.held(), 0);
        });
        EXPECT_TRUE(o.least > 1 || agrees(o, kelMat())); // of order 0
    }
}

TEST(MatOperations, TouchNothingBeside) {
    for (const MatOperation& o : matOperations())
        for (Protect side : {Protect::Behind, Protect::Before})
            for (int n = o.least; n <= 33; ++n)
                for (bool spoilt : {false, true}) { // NaN takes the most steps
                    const ProtectedMemory memory(side);
                    const kelMat A = randomMatrix(o.form == MatOperation::Any ? 1 + n * 7 % 41 : n, n, 47);
                    if (spoilt)
                        A[0][n / 2] = kNan;
                    o.call(A, A);
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
    EXPECT_EQ(nr_pythag(0, 0), 0.0f);
    EXPECT_EQ(nr_pythag(0, -7), 7.0f);
    EXPECT_EQ(nr_pythag(kNan, 0), 0.0f);
    EXPECT_TRUE(std::isnan(nr_pythag(0, kNan)));
    std::mt19937 random = generator(40);
    std::uniform_real_distribution<float> exponent(-40, 37), mantissa(-10, 10); // to subnormal numbers
    for (int i = 0; i < 20000; ++i) {
        const float a = mantissa(random) * std::pow(10.0f, exponent(random)), b = a * mantissa(random);
        ASSERT_TRUE(sameFloat(nr_pythag(a, b), kel_ref::pythag(a, b))) << a << " " << b;
        ASSERT_TRUE(sameFloat(nr_pythag(b, a), kel_ref::pythag(b, a))) << b << " " << a;
        if (const double truth = std::hypot(double(a), double(b)); truth > 1e-37 && truth < 3e38) {
            EXPECT_NEAR(nr_pythag(a, b) / truth, 1, 2 * kEps);
        }
    }
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

TEST(NrCholdc, EqualsThePlainLoopsOnDefiniteMatrices) {
    for (int n = 1; n <= 20; ++n) {
        const kelMat R = randomMatrix(n, 2 * n, 41), A = R * R.getTransposedMatrix();
        EXPECT_TRUE(agrees(operation("nr_choldc"), A));
        for (int c = 1; c < n; ++c)
            A[0][c] = kNan; // above the diagonal
        EXPECT_TRUE(agrees(operation("nr_choldc"), A));
    }
}

// ---- singular values -------------------------------------------------------------------------------------------------------

namespace {

// Columns of v, and those of u that belong to a positive singular value, are orthonormal; u w v^T is the input.
void expectSvdNearTruth(const kelMat& A, double units) {
    kelMat U, W, V;
    ASSERT_TRUE(A.getDecomposedMatrix_SV(U, W, V));
    const Truth a = truth(A), u = truth(U), w = truth(W), v = truth(V);
    const int n = a.columns;
    const double size = norm(a), tolerance = units * kEps * n;
    EXPECT_LT(distance(transposed(v) * v, kel_ref::identity<double>(n)), tolerance);
    Truth gram = transposed(u) * u, expected = kel_ref::identity<double>(n);
    for (int i = 0; i < n; ++i) {
        EXPECT_GE(w[i][i], 0);
        if (i >= a.rows || w[i][i] < tolerance * size)
            for (int k = 0; k < n; ++k)
                gram[i][k] = gram[k][i] = expected[i][k] = expected[k][i] = 0;
    }
    EXPECT_LT(distance(gram, expected), tolerance);
    EXPECT_LE(distance(u * w * transposed(v), a), tolerance * size);
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

// ---- symmetric eigenvalues -------------------------------------------------------------------------------------------------

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

namespace {

// The columns of X solve A x = d B x, and are orthonormal where B measures.
void expectSolved(const kelMat& A, const kelMat& B, const kelMat& D, const kelMat& X, double tolerance) {
    const Truth a = truth(A), b = truth(B), x = truth(X);
    Truth d(a.rows, a.rows);
    for (int i = 0; i < a.rows; ++i)
        d[i][i] = D[i][0];
    EXPECT_LT(distance(transposed(x) * b * x, kel_ref::identity<double>(a.rows)), tolerance);
    EXPECT_LE(distance(a * x, b * x * d), tolerance * norm(a));
}

} // namespace

TEST(SymmetricEigen, IsNearTheTruth) {
    kelMat D, X;
    for (int n = 1; n <= 24; ++n)
        for (const Input& input : inputs(n, n, 49)) {
            if (input.outOfRange)
                continue;
            SCOPED_TRACE(input.name + ", " + std::to_string(n));
            kelMat A = input.a + input.a.getTransposedMatrix(), before(A);
            EXPECT_TRUE(A.getEigenValue(D, X));
            EXPECT_TRUE(same(A, before));
            expectSolved(A, identity(n), D, X, 4 * kEps * n);
        }
    for (int n = 2; n <= 12; ++n) {
        kelMat A = randomSymmetric(n, 52), R = randomMatrix(n, 3 * n, 53), B = R * R.getTransposedMatrix();
        EXPECT_TRUE(A.getGeneralizedEigenValue(B, D, X));
        expectSolved(A, B, D, X, 50 * kEps * n);
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

// Rows of subnormals have infinite scales: their column has no candidate and takes over an earlier row, a swap upward. A small pivot
// overflows the factor below it, which leading zeros of a right side must skip.
TEST(InverseByLu, EqualsThePlainLoopsWhereZerosMayNotBeMultiplied) {
    for (const kelMat& A : {mat({{1, 0, 0, 0}, {0, 1, 1, 0}, {0, 0, 0, 1e-39f}, {0, 0, 0, 1e-39f}}),
                            mat({{1, 0, 0, 0}, {0, 1, 0, 0}, {0, 0, 1e-9f, 1e-9f}, {0, 0, 1e30f, 1e38f}})})
        EXPECT_TRUE(agrees(operation("getInversedMatrix"), A));
}
