// Members that split a matrix: cameras, homographies, LU, determinants and inverses.
#include <functional>

#include "MatSupport.h"
#include "Memory.h"
#include "Stops.h"

using namespace kel_test;

namespace {

const char kFile[] = "kelMat/src/kelMat.cpp";

kelMat rotation(float x, float y, float z) {
    kelMat R;
    R.setDataRotationMatrix_XYZ_3x3(x, y, z);
    return R;
}

} // namespace

TEST(CameraDecomposition, FindsIntrinsicsRotationAndTranslation) {
    std::mt19937 random = generator(30);
    std::uniform_real_distribution<float> angle(-170, 170), shift(-3, 3);
    kelMat A0 = mat({{800, 0.5f, 320}, {0, 700, 240}, {0, 0, 1}}), A, R, T;
    for (int i = 0; i < 200; ++i) {
        const kelMat R0 = rotation(angle(random), angle(random), angle(random));
        const kelMat T0 = mat({{shift(random)}, {shift(random)}, {4 + shift(random)}});
        for (float factor : {1.0f, -1.0f, 0.01f, -37.0f}) {
            const kelMat P = A0 * (R0 | T0) * factor;
            ASSERT_TRUE(P.getDecomposedMatrix_ART_3x4(A, R, T));
            EXPECT_TRUE(near(A, A0, 3e-3));
            EXPECT_TRUE(near(R, R0, 1e-5));
            EXPECT_TRUE(near(T, T0, 1e-4));
            EXPECT_GE(T[2][0], 0.0f);
            EXPECT_EQ(A[1][0], 0.0f);
            EXPECT_EQ(A[2][0], 0.0f);
            EXPECT_EQ(A[2][1], 0.0f);
            EXPECT_NEAR(A[2][2], 1.0f, kEps);
        }
    }
}

TEST(CameraDecomposition, GivesTheSameBitsForBothSigns) {
    for (uint32_t salt = 0; salt < 50; ++salt) {
        kelMat P = randomMatrix(3, 4, salt);
        for (int i = 0; i < 3; ++i)
            P[i][i] += salt % 2 ? 3.0f : -3.0f; // away from singular
        kelMat A, R, T, a(3, 3), r(1, 1), t(2, 2);
        P.getDecomposedMatrix_ART_3x4(A, R, T);
        (P * -1.0f).getDecomposedMatrix_ART_3x4(a, r, t);
        EXPECT_TRUE(same(A, a));
        EXPECT_TRUE(same(R, r));
        EXPECT_TRUE(same(T, t));
        // A mirror is not corrected, and rows are orthonormal all the same.
        EXPECT_TRUE(near(R * R.getTransposedMatrix(), identity(3), 1e-5));
        EXPECT_GE(T[2][0], 0.0f);
    }
    kelMat A, R, T;
    kelMat P = randomMatrix(3, 4, 50);
    P[2][3] = 0; // neither sign puts the translation before the camera: the given one stays
    P.getDecomposedMatrix_ART_3x4(A, R, T);
    EXPECT_GT(R[2][0] * P[2][0], 0.0f);
    EXPECT_TRUE(kelMat(3, 4).getDecomposedMatrix_ART_3x4(A, R, T)) << "degenerate input is not reported";
    EXPECT_TRUE(std::isnan(R[0][0]));
    EXPECT_STOPS(kelMat(4, 4).getDecomposedMatrix_ART_3x4(A, R, T), "this->m_Width == 4 && this->m_Height == 3", kFile,
                 "bool kelMat::getDecomposedMatrix_ART_3x4(kelMat&, kelMat&, kelMat&) const");
}

TEST(HomographyDecomposition, FindsTheFocalLengthAndPose) {
    std::mt19937 random = generator(31);
    std::uniform_real_distribution<float> tilt(30, 50), turn(5, 10), shift(-3, 3);
    kelMat A, R, T;
    for (int i = 0; i < 100; ++i) {
        const float f = 500;
        const kelMat R0 = rotation(tilt(random), -turn(random), tilt(random));
        const kelMat T0 = mat({{shift(random)}, {shift(random)}, {4 + shift(random)}});
        kelMat H(3, 3), K = mat({{f, 0, 0}, {0, f, 0}, {0, 0, 1}});
        for (int r = 0; r < 3; ++r)
            for (int c = 0; c < 3; ++c)
                H[r][c] = c < 2 ? R0[r][c] : T0[r][0];
        ASSERT_TRUE((K * H).getDecomposedMatrix_ART_3x3(A, R, T));
        EXPECT_NEAR(A[0][0], f, 0.05);
        EXPECT_TRUE(same(A, mat({{A[0][0], 0, 0}, {0, A[0][0], 0}, {0, 0, 0}}))) << "the last element stays 0";
        EXPECT_TRUE(near(R, R0, 1e-3));
        EXPECT_TRUE(near(T, T0, 1e-3));
        // Another scale is not taken out: with s = 1 / lambda^2 in place of its root the pose shrinks by lambda.
        ASSERT_TRUE((K * H * 2.0f).getDecomposedMatrix_ART_3x3(A, R, T));
        EXPECT_TRUE(near(T * 2.0f, T0, 2e-3));
    }
    EXPECT_TRUE(identity(3).getDecomposedMatrix_ART_3x3(A, R, T));
    EXPECT_TRUE(std::isnan(A[0][0]) && std::isnan(T[0][0]));
    EXPECT_STOPS(kelMat(3, 4).getDecomposedMatrix_ART_3x3(A, R, T), "this->m_Width == 3 && this->m_Height == 3", kFile,
                 "bool kelMat::getDecomposedMatrix_ART_3x3(kelMat&, kelMat&, kelMat&) const");
}

TEST(LuDecomposition, SplitsTheKernelsResult) {
    kelMat L(1, 1), U;
    for (int n = 1; n <= 20; ++n) {
        const kelMat A = randomMatrix(n, n, 32);
        Reference a = reference(A), lower = kel_ref::identity<float>(n), upper(n, n);
        std::vector<int> indx(n);
        float d;
        const bool ok = kel_ref::nr_ludcmp(a, indx.data(), &d);
        for (int r = 0; r < n; ++r)
            for (int c = 0; c < n; ++c)
                (c < r ? lower : upper)[r][c] = a[r][c];
        EXPECT_EQ(A.getDecomposedMatrix_LU(L, U), ok);
        EXPECT_TRUE(same(L, lower));
        EXPECT_TRUE(same(U, upper));
    }
    EXPECT_FALSE(mat({{1, 2}, {0, 0}}).getDecomposedMatrix_LU(L, U));
    EXPECT_TRUE(same(L, identity(2)));
    EXPECT_TRUE(same(U, mat({{1, 2}, {0, 0}}))) << "filled from the input";
    EXPECT_TRUE(kelMat().getDecomposedMatrix_LU(L, U));
    EXPECT_TRUE(sameSize(L, 0, 0));
    EXPECT_STOPS(kelMat(2, 3).getDecomposedMatrix_LU(L, U), "this->m_Width == this->m_Height", kFile,
                 "bool kelMat::getDecomposedMatrix_LU(kelMat&, kelMat&) const");
}

TEST(QrDecomposition, IsInert) {
    kelMat Q = mat({{1, 2}}), R = mat({{3}});
    EXPECT_TRUE(randomMatrix(2, 3, 1).getDecomposedrixMat_QR(Q, R));
    EXPECT_TRUE(same(Q, mat({{1, 2}})));
    EXPECT_TRUE(same(R, mat({{3}})));
}

// Beside the list of operations.
TEST(Determinant, IsWorkedOutByHand) {
    EXPECT_EQ(mat({{1, 2}, {3, 4}}).getDeterminant(), -2.0f);
    EXPECT_EQ(mat({{0, 2, 0}, {3, 0, 0}, {0, 0, 5}}).getDeterminant(), -30.0f);
    EXPECT_EQ(mat({{0, 1, 0, 0}, {1, 0, 0, 0}, {0, 0, 3, 0}, {0, 0, 0, 4}}).getDeterminant(), -12.0f);
    EXPECT_EQ(mat({{1, 2, 3, 4}, {0, 0, 0, 0}, {5, 6, 7, 9}, {1, 0, 0, 1}}).getDeterminant(), 0.0f);
    // Grouping: with a13 = 0 and huge cofactors the expansion along the last column meets no infinity.
    EXPECT_EQ(mat({{1e30f, 1, 0}, {1e30f, 2, 0}, {1, 1, 0}}).getDeterminant(), 0.0f);
}

TEST(Inverse, TimesTheMatrixIsTheIdentity) {
    for (int n = 2; n <= 12; ++n)
        for (uint32_t salt = 0; salt < 20; ++salt) {
            const kelMat A = randomMatrix(n, n, 600 + salt), tall = randomMatrix(n + 20, n, 700 + salt);
            const Truth a = truth(A), inverse = truth(A.getInversedMatrix());
            EXPECT_LT(distance(inverse * a, kel_ref::identity<double>(n)), 2 * kEps * norm(a) * norm(inverse)) << n;
            EXPECT_TRUE(near(tall.getInversedMatrix_Pseudo() * tall, identity(n), 1e-5));
        }
}

TEST(Inverse, LeavesTheOutputOfSingularMatrices) {
    const kelMat singular[] = {mat({{1, 2}, {2, 4}}), mat({{1, 2, 3}, {0, 0, 0}, {4, 5, 6}}),
                               mat({{1, 2, 3, 4}, {0, 0, 0, 0}, {4, 5, 6, 7}, {9, 9, 9, 8}})};
    for (const kelMat& A : singular) {
        kelMat R = mat({{1, 2, 3}});
        EXPECT_FALSE(A.getInversedMatrix(R));
        EXPECT_TRUE(same(R, mat({{1, 2, 3}})));
        EXPECT_TRUE(sameSize(A.getInversedMatrix(), 0, 0));
    }
    kelMat R = mat({{1, 2, 3}});
    EXPECT_FALSE(kel_getInversedMatrix_NxM(mat({{1, 2}, {2, 4}, {3, 6}}), R));
    EXPECT_TRUE(same(R, mat({{1, 2, 3}})));
    EXPECT_TRUE(sameSize(mat({{1, 2}, {2, 4}}).getInversedMatrix_Pseudo(), 0, 0));
    EXPECT_TRUE(mat({{kNan, 1}, {1, 1}}).getInversedMatrix(R)) << "NaN is not zero";
}

TEST(Inverse, StopsOnSizesThatHaveNone) {
    kelMat R;
    const char *const square = "this->m_Width == this->m_Height", *const two = "2 <= this->m_Width",
                      *const determinant = "float kelMat::getDeterminant() const",
                      *const inverse = "bool kelMat::getInversedMatrix(kelMat&) const";
    EXPECT_STOPS(kelMat(2, 3).getDeterminant(), square, kFile, determinant);
    EXPECT_STOPS(kelMat(1, 1).getDeterminant(), two, kFile, determinant);
    EXPECT_STOPS(kelMat().getDeterminant(), two, kFile, determinant);
    EXPECT_STOPS(kelMat(2, 3).getInversedMatrix(R), square, kFile, inverse);
    EXPECT_STOPS(kelMat(2, 3).getInversedMatrix(), square, kFile, inverse);
    EXPECT_STOPS(kelMat(1, 1).getInversedMatrix(), two, kFile, inverse);
    EXPECT_STOPS(kelMat(5, 1).getInversedMatrix_Pseudo(R), two, kFile, inverse);
    EXPECT_STOPS(kelMat().getInversedMatrix_Pseudo(), two, kFile, inverse);
}

namespace {

// The members that write matrices, and the determinant.
const struct {
    int outputs, rows, columns, more; // without size: square of any order, or with so many rows more
    void (*call)(kelMat& M, kelMat& B, kelMat* out);
} kMembers[] = {
    {3, 3, 4, 0, [](kelMat& M, kelMat&, kelMat* out) { M.getDecomposedMatrix_ART_3x4(out[0], out[1], out[2]); }},
    {3, 3, 3, 0, [](kelMat& M, kelMat&, kelMat* out) { M.getDecomposedMatrix_ART_3x3(out[0], out[1], out[2]); }},
    {2, 0, 0, 0, [](kelMat& M, kelMat&, kelMat* out) { M.getDecomposedMatrix_LU(out[0], out[1]); }},
    {3, 0, 0, 13, [](kelMat& M, kelMat&, kelMat* out) { M.getDecomposedMatrix_SV(out[0], out[1], out[2]); }},
    {2, 0, 0, 0, [](kelMat& M, kelMat&, kelMat* out) { M.getEigenValue(out[0], out[1]); }},
    {2, 0, 0, 0, [](kelMat& M, kelMat& B, kelMat* out) { M.getGeneralizedEigenValue(B, out[0], out[1]); }},
    {1, 0, 0, 0, [](kelMat& M, kelMat&, kelMat* out) { M.getInversedMatrix(out[0]); }},
    {1, 0, 0, 13, [](kelMat& M, kelMat&, kelMat* out) { M.getInversedMatrix_Pseudo(out[0]); }},
    {0, 0, 0, 0, [](kelMat& M, kelMat&, kelMat*) { M.getDeterminant(); }},
};
constexpr int kOrders[] = {2, 3, 4, 9, 12, 20};

} // namespace

TEST(Decompositions, KeepSmallTemporariesOffTheHeap) {
    if (!ownMalloc())
        GTEST_SKIP() << "another malloc is in use";
    for (const auto& c : kMembers)
        for (int n : kOrders) {
            kelMat M = c.rows ? randomMatrix(c.rows, c.columns, 36) : randomSymmetric(n, 36), B = M * M.getTransposedMatrix();
            const CountedMemory memory;
            {
                kelMat out[3];
                c.call(M, B, out);
                EXPECT_TRUE(memory.allocated() == c.outputs || n > 12);
            }
            EXPECT_EQ(memory.held(), 0);
        }
}

// Every output in turn is the operation's own input; the results are those of outputs apart.
TEST(Decompositions, SurviveOutputsOverTheirInputs) {
    for (const auto& c : kMembers)
        for (int n : kOrders) {
            const int rows = c.rows ? c.rows : n + c.more, columns = c.rows ? c.columns : n;
            const kelMat factor = randomMatrix(rows, columns, 37), definite = factor * factor.getTransposedMatrix();
            const kelMat input = rows == columns && rows > 3 ? definite + identity(rows) : factor;
            kelMat apart[3], M(input), B(definite);
            c.call(M, B, apart);
            for (int over = 0; over < c.outputs; ++over)
                for (kelMat* const place : {&M, &B}) { // outputs are references: the call sees its input as output `over`
                    M = input;
                    B = definite;
                    kelMat own[3];
                    std::swap(own[over], *place);
                    c.call(place == &M ? own[over] : M, place == &B ? own[over] : B, own);
                    for (int i = 0; i < c.outputs; ++i)
                        EXPECT_TRUE(same(own[i], apart[i])) << rows << " x " << columns << ", output " << i << " over " << over;
                }
        }
}

// The kernels take the top-left block of wider matrices.
TEST(Inverse, KernelsReadRowsOfWiderMatrices) {
    kelMat A(3, 4, true), R;
    for (int i = 0; i < 12; ++i)
        A.m_Data[i] = static_cast<float>(i * i + 1);
    EXPECT_EQ(kel_getDeterminant_2x2(A), A[0][0] * A[1][1] - A[0][1] * A[1][0]);
    kelMat block(3, 3, true);
    block.setData(A);
    EXPECT_EQ(kel_getDeterminant_3x3(A), block.getDeterminant());
    ASSERT_TRUE(kel_getInversedMatrix_2x2(block, R)); // by the determinant of all of it
    EXPECT_EQ(R[0][0], block[1][1] / block.getDeterminant());
    EXPECT_EQ(R[1][0], -block[1][0] / block.getDeterminant());
}
