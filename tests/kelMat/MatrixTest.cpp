// Storage, element access and the text dump of a matrix.
#include <cstddef>
#include <type_traits>

#include "MatSupport.h"
#include "Memory.h"
#include "Stops.h"

using namespace kel_test;

namespace {
const char kFile[] = "kelMat/src/kelMat.cpp";
}

TEST(MatrixStorage, IsEmptyOrCreatedAndNothingElse) {
    EXPECT_TRUE(sameSize(kelMat(), 0, 0));
    for (const auto& size : {std::pair<int, int>{0, 5}, {5, 0}, {-1, 3}, {3, -1}, {-2, -2}})
        for (bool zero : {false, true}) {
            EXPECT_TRUE(sameSize(kelMat(size.first, size.second, zero), 0, 0));
            kelMat M(2, 2);
            EXPECT_EQ(M.create(size.first, size.second, zero), nullptr);
            EXPECT_TRUE(sameSize(M, 0, 0));
            kelMat N(2, 2);
            N.resize(size.first, size.second, zero);
            EXPECT_TRUE(sameSize(N, 0, 0));
        }
    kelMat M(3, 4, false);
    EXPECT_TRUE(sameSize(M, 3, 4));
    EXPECT_EQ(M.create(2, 5, true), M.m_Data);
    EXPECT_TRUE(same(M, Reference(2, 5)));
    M.release();
    EXPECT_TRUE(sameSize(M, 0, 0));
    M.release();
    EXPECT_TRUE(sameSize(M, 0, 0));
}

TEST(MatrixStorage, CopiesDeeplyAndAcceptsEmptySources) {
    kelMat A = mat({{1, 2, 3}, {4, 5, 6}});
    const Reference before = reference(A);
    kelMat B(A), C(7, 7);
    EXPECT_EQ(&(C = A), &C);
    A[0][0] = 9;
    EXPECT_TRUE(same(B, before));
    EXPECT_TRUE(same(C, before));
    EXPECT_TRUE(sameSize(kelMat(kelMat()), 0, 0));
    C = kelMat();
    EXPECT_TRUE(sameSize(C, 0, 0));
    for (kelMat* M : {&A, &C}) { // to its own size, which for an empty matrix is none
        kelMat& self = *M;
        const int rows = self.m_Height, columns = self.m_Width;
        *M = self;
        EXPECT_TRUE(sameSize(*M, rows, columns));
    }
}

TEST(MatrixStorage, FreesBeforeItAllocates) {
    if (!ownMalloc())
        GTEST_SKIP() << "another malloc is in use";
    kelMat A(3, 3);
    {
        const CountedMemory memory;
        A.create(3, 3, false);
        EXPECT_EQ(memory.allocated(), 1) << "also for the same size";
        EXPECT_EQ(memory.held(), 0);
        A.resize(4, 4, true);
        EXPECT_EQ(memory.held(), 0);
        A.release();
        A.release();
        EXPECT_EQ(memory.held(), -1);
        kelMat B(2, 2), C(B), D;
        D = C;
    }
}

TEST(MatrixStorage, ResizesKeepingTheCommonCorner) {
    const kelMat A = randomMatrix(5, 4, 1);
    for (int rows = 1; rows <= 8; ++rows)
        for (int columns = 1; columns <= 8; ++columns)
            for (bool zero : {false, true}) {
                kelMat M(A);
                M.resize(rows, columns, zero);
                ASSERT_TRUE(sameSize(M, rows, columns));
                for (int r = 0; r < rows; ++r)
                    for (int c = 0; c < columns; ++c) {
                        const bool kept = r < 5 && c < 4;
                        if (kept || zero) {
                            EXPECT_EQ(M[r][c], kept ? A[r][c] : 0);
                        }
                    }
            }
    kelMat grown;
    grown.resize(2, 3, true);
    EXPECT_TRUE(same(grown, Reference(2, 3)));
}

TEST(MatrixElements, SetOneOrStop) {
    kelMat M(2, 3);
    M.setData(1, 2, 7.0f);
    EXPECT_TRUE(same(M, mat({{0, 0, 0}, {0, 0, 7}})));
    const int outside[][2] = {{2, 1}, {1, 3}, {-1, 0}, {0, -1}};
    for (const auto& at : outside)
        EXPECT_STOPS(M.setData(at[0], at[1], 1.0f), "0<=x && x<this->m_Width && 0<=y && y<this->m_Height", kFile,
                     "void kelMat::setData(int, int, float)");
}

TEST(MatrixElements, SetAllFromArraysRowsAndMatrices) {
    float values[] = {1, 2, 3, 4, 5, 6};
    const kelMat expected = mat({{1, 2, 3}, {4, 5, 6}});
    kelMat M(2, 3);
    M.setData(values);
    EXPECT_TRUE(same(M, expected));
    float* rows[] = {values + 3, values};
    M.setData(rows);
    EXPECT_TRUE(same(M, mat({{4, 5, 6}, {1, 2, 3}})));

    for (int height = 1; height <= 4; ++height)
        for (int width = 1; width <= 4; ++width) {
            kelMat source = randomMatrix(height, width, 2), target(expected);
            Reference after = reference(expected);
            for (int r = 0; r < std::min(height, 2); ++r)
                for (int c = 0; c < std::min(width, 3); ++c)
                    after[r][c] = source[r][c];
            target.setData(source);
            EXPECT_TRUE(same(target, after));
        }
    kelMat none;
    M = expected;
    M.setData(none);
    EXPECT_TRUE(same(M, expected));
    M.setData(M);
    EXPECT_TRUE(same(M, expected));
}

TEST(MatrixElements, BecomeZeroIdentityOrUnitized) {
    kelMat M = randomMatrix(2, 3, 3);
    M.setDataIdentity(2.5f);
    EXPECT_TRUE(same(M, mat({{2.5f, 0, 0}, {0, 2.5f, 0}})));
    M = randomMatrix(3, 2, 3);
    M.setDataIdentity(1.0f);
    EXPECT_TRUE(same(M, mat({{1, 0}, {0, 1}, {0, 0}})));
    M.setDataZero();
    EXPECT_TRUE(same(M, Reference(3, 2)));

    M = mat({{1, -7, 0.1f}, {3, 2, 6}, {5, 9, 4}});
    Reference quarters = reference(M);
    for (float& x : quarters.data)
        x *= 0.25f;
    M.setDataUnitize();
    EXPECT_TRUE(same(M, quarters));
    M = mat({{5, 10, 41}});
    M.setDataUnitize();
    const float s = 1.0f / 41.0f;
    EXPECT_TRUE(same(M, mat({{5 * s, 10 * s, 41 * s}}))) << "by the reciprocal, so the last element need not be 1";
    EXPECT_NE(M[0][2], 1.0f);
    M = mat({{1, -1, 0}});
    M.setDataUnitize();
    EXPECT_TRUE(same(M, mat({{kInfinity, -kInfinity, kNan}})));

    kelMat none;
    none.setDataZero();
    none.setDataIdentity(1);
    EXPECT_TRUE(sameSize(none, 0, 0));
}

TEST(MatrixPrint, WritesTheDump) {
    const auto printed = [](kelMat M, const char* name) {
        testing::internal::CaptureStdout();
        M.print(name);
        fflush(stdout);
        return testing::internal::GetCapturedStdout();
    };
    EXPECT_EQ(printed(mat({{1, 0}, {0, 1}}), "H"), "<mat name=\"H\">\n   1.000    0.000 \n   0.000    1.000 \n</mat>\n");
    EXPECT_EQ(printed(mat({{1.5f}}), nullptr), "<mat>\n   1.500 \n</mat>\n");
    EXPECT_EQ(printed(mat({{-12345.6789f, -0.0f, 1e9f}}), "%d %s"),
              "<mat name=\"%d %s\">\n-12345.679   -0.000 1000000000.000 \n</mat>\n");
    EXPECT_EQ(printed(kelMat(), ""), "<mat name=\"\">\n</mat>\n");
}
