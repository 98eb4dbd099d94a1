// Operators, measures and points through a matrix.
#include <climits>
#include <functional>

#include "MatSupport.h"
#include "Memory.h"
#include "Stops.h"

using namespace kel_test;

namespace {
const char kFile[] = "kelMat/src/kelMat.cpp";
const char kSameSize[] = "this->m_Width == M.m_Width && this->m_Height == M.m_Height";
} // namespace

TEST(MatrixScalars, WorkOnEveryElement) {
    const kelMat A = mat({{1, -2, 0.1f}, {-0.0f, 1e30f, 7}});
    const float v = 3.0f, r = 1.0f / v;
    const struct {
        kelMat result;
        std::function<float(float)> f;
    } cases[] = {{A + v, [=](float x) { return x + v; }},
                 {A - v, [=](float x) { return x - v; }},
                 {A * v, [=](float x) { return x * v; }},
                 {A / v, [=](float x) { return x * r; }}};
    for (const auto& each : cases) {
        Reference expected = reference(A);
        for (float& x : expected.data)
            x = each.f(x);
        EXPECT_TRUE(same(each.result, expected));
    }
    EXPECT_NE((A / v)[1][2], 7.0f / 3.0f) << "the reciprocal's last bit";
    EXPECT_TRUE(same(mat({{1, -1, 0}}) / 0.0f, mat({{kInfinity, -kInfinity, kNan}})));
    const kelMat none;
    for (const kelMat& result : {none + v, none - v, none * v, none / v})
        EXPECT_TRUE(sameSize(result, 0, 0));
}

TEST(MatrixSums, AddSubtractAndJoin) {
    const kelMat A = mat({{1, 2}, {3, 4}, {5, 6}}), B = mat({{10, 20}, {30, 40}, {50, 60}}), column = mat({{7}, {8}, {9}});
    EXPECT_TRUE(same(A + B, mat({{11, 22}, {33, 44}, {55, 66}})));
    EXPECT_TRUE(same(A - B, mat({{-9, -18}, {-27, -36}, {-45, -54}})));
    EXPECT_TRUE(same(A | column, mat({{1, 2, 7}, {3, 4, 8}, {5, 6, 9}})));
    EXPECT_TRUE(same(column | A, mat({{7, 1, 2}, {8, 3, 4}, {9, 5, 6}})));
}

TEST(MatrixSums, GuardEmptyOperandsBeforeTheSizes) {
    const kelMat A = mat({{1, 2}}), none;
    for (const kelMat& result : {A + none, none + A, A - none, none - A, A * none, none * A, A | none, none | A, none * none})
        EXPECT_TRUE(sameSize(result, 0, 0));
    EXPECT_EQ((none, none), 0.0f);
    EXPECT_STOPS((A, none), kSameSize, kFile, "float kelMat::operator,(const kelMat&) const");
}

TEST(MatrixSums, StopOnSizesThatDoNotFit) {
    const kelMat A(2, 3), wide(2, 4), tall(3, 3);
    for (const kelMat* B : {&wide, &tall}) {
        EXPECT_STOPS(A + *B, kSameSize, kFile, "kelMat kelMat::operator+(const kelMat&) const");
        EXPECT_STOPS(A - *B, kSameSize, kFile, "kelMat kelMat::operator-(const kelMat&) const");
        EXPECT_STOPS((A, *B), kSameSize, kFile, "float kelMat::operator,(const kelMat&) const");
    }
    EXPECT_STOPS(A * A, "this->m_Width == M.m_Height", kFile, "kelMat kelMat::operator*(const kelMat&) const");
    EXPECT_STOPS(A | tall, "this->m_Height == M.m_Height", kFile, "kelMat kelMat::operator|(const kelMat&) const");
}

TEST(MatrixProduct, SumsInTheOrderOfThePlainLoop) {
    uint32_t salt = 100;
    for (int rows = 1; rows <= 14; ++rows)
        for (int inner = 1; inner <= 14; ++inner)
            for (int columns = 1; columns <= 14; ++columns) {
                const kelMat A = randomMatrix(rows, inner, ++salt), B = randomMatrix(inner, columns, ++salt);
                ASSERT_TRUE(same(A * B, reference(A) * reference(B)));
            }
    for (const auto& size : {std::array<int, 3>{9, 200, 9}, {12, 500, 12}, {67, 33, 41}, {3, 3, 1000}, {1, 64, 64}}) {
        const kelMat A = randomMatrix(size[0], size[1], ++salt), B = randomMatrix(size[1], size[2], ++salt);
        ASSERT_TRUE(same(A * B, reference(A) * reference(B)));
    }
    EXPECT_TRUE(same(mat({{-0.0f}}) * mat({{1}}), mat({{0}}))) << "sums start from +0";
    EXPECT_TRUE(same(mat({{0, 1}}) * mat({{kInfinity}, {1}}), mat({{kNan}})));
}

TEST(MatrixDot, AddsInStorageOrder) {
    // 2^24 + 1 - 2^24 - ... : another order of the sum gives another result.
    const kelMat A = mat({{16777216, 1, 1}, {-16777216, 1, 0.5f}}), ones = mat({{1, 1, 1}, {1, 1, 1}});
    EXPECT_EQ((A, ones), 1.5f);
    EXPECT_EQ((ones, A), 1.5f);
}

TEST(MatrixMeasures, AreLengths) {
    EXPECT_EQ(mat({{3, 9}, {9, -4}}).getTrace(), 5.0f) << "the length of the diagonal, not its sum";
    EXPECT_EQ(kelMat().getTrace(), 0.0f);
    EXPECT_EQ(mat({{1, 1}, {1, 1}}).getNorm(), 2.0f);
    EXPECT_EQ(mat({{4096, 1, 1, 1}}).getNorm(), 4096.0f) << "accumulated in float";
    EXPECT_EQ(mat({{1, 1, 1, 4096}}).getNorm(), std::sqrt(16777220.0f)) << "in storage order";
    EXPECT_EQ(kelMat().getNorm(), 0.0f);
    EXPECT_STOPS(kelMat(2, 3).getTrace(), "this->m_Height == this->m_Width", kFile, "float kelMat::getTrace() const");
}

TEST(MatrixTranspose, SwapsRowsAndColumns) {
    for (int rows = 1; rows <= 10; ++rows)
        for (int columns = 1; columns <= 10; ++columns) {
            const kelMat A = randomMatrix(rows, columns, 7);
            const Reference expected = kel_ref::transposed(reference(A));
            kelMat T(1, 1);
            EXPECT_TRUE(A.getTransposedMatrix(T));
            EXPECT_TRUE(same(T, expected));
            EXPECT_TRUE(same(A.getTransposedMatrix(), expected));
        }
    EXPECT_TRUE(sameSize(kelMat().getTransposedMatrix(), 0, 0));
}

TEST(MatrixMemory, IsOneBlockAResultAndNothingBesideIsTouched) {
    for (Protect side : {Protect::Behind, Protect::Before})
        for (int n = 1; n <= 20; ++n) {
            const ProtectedMemory protection(side);
            const kelMat A = randomMatrix(n, n, 8), B = randomMatrix(n, n, 9);
            EXPECT_GE((A, A) + A.getNorm() + A.getTrace(), 0.0f);
            const std::function<kelMat()> operations[] = {[&] { return A + 1.0f; },  [&] { return A / 2.0f; },
                                                          [&] { return A + B; },     [&] { return A - B; },
                                                          [&] { return A * B; },     [&] { return A | B; },
                                                          [&] { return kelMat(A); }, [&] { return A.getTransposedMatrix(); }};
            for (const auto& operation : operations) {
                const CountedMemory memory;
                {
                    const kelMat result = operation();
                    EXPECT_TRUE(memory.allocated() == 1 || !ownMalloc());
                }
                EXPECT_EQ(memory.held(), 0);
            }
        }
}

// ---- points ----------------------------------------------------------------------------------------------------------------

TEST(MatrixPoints, GoThroughAHomography) {
    kelMat pole = mat({{1, 0, 0}, {0, 1, 0}, {0, 0, 0}});
    float u, v;
    pole.cvtPoint(2.0f, 0.0f, &u, &v);
    EXPECT_EQ(u, kInfinity);
    EXPECT_TRUE(std::isnan(v));

    kelMat M = randomMatrix(3, 3, 10);
    std::mt19937 random = generator(11);
    std::uniform_real_distribution<float> uniform(-100, 100);
    for (int i = 0; i < 1000; ++i) {
        const float x = uniform(random), y = uniform(random);
        const auto row = [&](int k) { return (x * M[k][0] + y * M[k][1]) + M[k][2]; };
        const float s = 1.0f / row(2);
        M.cvtPoint(x, y, &u, &v);
        ASSERT_EQ(u, row(0) * s);
        ASSERT_EQ(v, row(1) * s);
    }
}

TEST(MatrixPoints, GoThroughProjectionsAndSpaceTransforms) {
    kelMat P = randomMatrix(3, 4, 12), T = randomMatrix(4, 4, 13);
    std::mt19937 random = generator(14);
    std::uniform_real_distribution<float> uniform(-100, 100);
    for (int i = 0; i < 1000; ++i) {
        const float x = uniform(random), y = uniform(random), z = uniform(random);
        const auto row = [&](const kelMat& M, int k) { return ((x * M[k][0] + y * M[k][1]) + z * M[k][2]) + M[k][3]; };
        float u, v, X, Y, Z;
        P.cvtPoint(x, y, z, &u, &v);
        const float s = 1.0f / row(P, 2), S = 1.0f / row(T, 3);
        ASSERT_EQ(u, row(P, 0) * s);
        ASSERT_EQ(v, row(P, 1) * s);
        T.cvtPoint(x, y, z, &X, &Y, &Z);
        ASSERT_EQ(X, row(T, 0) * S);
        ASSERT_EQ(Y, row(T, 1) * S);
        ASSERT_EQ(Z, row(T, 2) * S);
    }
}

TEST(MatrixPoints, RoundIntegersTowardZeroFromHalfUp) {
    const struct {
        float f;
        int rounded;
    } cases[] = {{2.5f, 3},
                 {-2.5f, -2},
                 {-1.2f, 0},
                 {-1.7f, -1},
                 {-1.5f, -1},
                 {0.49999997f, 0},
                 {0.5f, 1},
                 {16777217.0f, 16777216},
                 {8388607.5f, 8388608},
                 {3e9f, INT_MIN},
                 {-3e9f, INT_MIN},
                 {kNan, INT_MIN}};
    for (const auto& each : cases) {
        // Translation by f of the origin, in all three shapes.
        kelMat H = mat({{1, 0, each.f}, {0, 1, -7}, {0, 0, 1}}), P = mat({{1, 0, 0, -7}, {0, 1, 0, each.f}, {0, 0, 0, 1}});
        kelMat T = mat({{1, 0, 0, 1}, {0, 1, 0, 2}, {0, 0, 1, each.f}, {0, 0, 0, 1}});
        int u, v, X, Y, Z;
        H.cvtPoint(0, 9, &u, &v);
        EXPECT_EQ(u, each.rounded) << each.f;
        EXPECT_EQ(v, 2);
        P.cvtPoint(9, 0, 5, &u, &v);
        EXPECT_EQ(u, 2);
        EXPECT_EQ(v, each.rounded) << each.f;
        T.cvtPoint(1, 2, 0, &X, &Y, &Z);
        EXPECT_EQ(X, 2);
        EXPECT_EQ(Y, 4);
        EXPECT_EQ(Z, each.rounded) << each.f;
    }
}

TEST(MatrixPoints, StopOnOtherSizes) {
    kelMat M3(3, 3), M34(3, 4), M4(4, 4);
    float f;
    int i;
    const char *const s33 = "this->m_Width == 3 && this->m_Height == 3",
                      *const s34 = "this->m_Width == 4 && this->m_Height == 3",
                      *const s44 = "this->m_Width == 4 && this->m_Height == 4";
    const char *const f33 = "void kelMat::cvtPoint(float, float, float*, float*)",
                      *const f34 = "void kelMat::cvtPoint(float, float, float, float*, float*)",
                      *const f44 = "void kelMat::cvtPoint(float, float, float, float*, float*, float*)";
    EXPECT_STOPS(M34.cvtPoint(0.0f, 0.0f, &f, &f), s33, kFile, f33);
    EXPECT_STOPS(M34.cvtPoint(0, 0, &i, &i), s33, kFile, f33);
    EXPECT_STOPS(M4.cvtPoint(0.0f, 0.0f, 0.0f, &f, &f), s34, kFile, f34);
    EXPECT_STOPS(M3.cvtPoint(0, 0, 0, &i, &i), s34, kFile, f34);
    EXPECT_STOPS(M34.cvtPoint(0.0f, 0.0f, 0.0f, &f, &f, &f), s44, kFile, f44);
    EXPECT_STOPS(M3.cvtPoint(0, 0, 0, &i, &i, &i), s44, kFile, f44);
}
