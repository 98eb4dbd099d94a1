// Rectangles, colour tables, random helpers.
#include <algorithm>
#include <array>
#include <climits>
#include <cmath>
#include <cstdlib>
#include <gtest/gtest.h>
#include <kel/kelImage.h>

#include "Stops.h"

namespace {

using Ints = std::array<kelValue_s32, 4>;
using Floats = std::array<float, 4>;

Ints translated(void (*translate)(kelValue_s32*, const kelValue_s32*), Ints src) {
    Ints dst = {91, 92, 93, 94};
    translate(dst.data(), src.data());
    return dst;
}

Floats translated(void (*translate)(float*, const float*), Floats src) {
    Floats dst = {91, 92, 93, 94};
    translate(dst.data(), src.data());
    return dst;
}

} // namespace

TEST(Rectangle, TranslatesCornersSizesAndCentres) {
    EXPECT_EQ(translated(kel_rectangle_translate_pp1_to_ps1_s32, {2, 3, 12, 8}), (Ints{2, 3, 10, 5}));
    EXPECT_EQ(translated(kel_rectangle_translate_pp1_to_ps2_s32, {2, 3, 12, 8}), (Ints{7, 5, 10, 5}));
    EXPECT_EQ(translated(kel_rectangle_translate_pp1_to_ps2_s32, {-3, 0, 0, 1}), (Ints{-1, 0, 3, 1}));
    EXPECT_EQ(translated(kel_rectangle_translate_pp1_to_ps2_s32, {INT_MAX, INT_MIN, INT_MAX, INT_MIN}),
              (Ints{INT_MAX, INT_MIN, 0, 0}));
    EXPECT_EQ(translated(kel_rectangle_translate_ps1_to_pp1_s32, {2, 3, 10, 5}), (Ints{2, 3, 12, 8}));
    EXPECT_EQ(translated(kel_rectangle_translate_ps1_to_ps2_s32, {-3, 0, 3, 1}), (Ints{-2, 0, 3, 1}));
    EXPECT_EQ(translated(kel_rectangle_translate_ps1_to_ps2_s32, {0, 0, -3, -1}), (Ints{-1, 0, -3, -1}));
    EXPECT_EQ(translated(kel_rectangle_translate_pp1_to_ps1_f32, {2, 3, 12.5f, 8}), (Floats{2, 3, 10.5f, 5}));
    EXPECT_EQ(translated(kel_rectangle_translate_pp1_to_ps2_f32, {2, 3, 12, 8}), (Floats{7, 5.5f, 10, 5}));
    EXPECT_EQ(translated(kel_rectangle_translate_ps1_to_pp1_f32, {1, 1, 3, 5}), (Floats{1, 1, 4, 6}));
    EXPECT_EQ(translated(kel_rectangle_translate_ps1_to_ps2_f32, {1, 1, 3, 5}), (Floats{2.5f, 3.5f, 3, 5}));
}

TEST(Rectangle, LeavesTheDestinationAloneOutOfTheCentreForm) {
    for (auto translate : {kel_rectangle_translate_ps2_to_pp1_s32, kel_rectangle_translate_ps2_to_ps1_s32})
        EXPECT_EQ(translated(translate, Ints{1, 2, 3, 4}), (Ints{91, 92, 93, 94}));
    for (auto translate : {kel_rectangle_translate_ps2_to_pp1_f32, kel_rectangle_translate_ps2_to_ps1_f32})
        EXPECT_EQ(translated(translate, Floats{1, 2, 3, 4}), (Floats{91, 92, 93, 94}));
}

TEST(ColorTable, HoldsCubeAndRamp) {
    static_assert(sizeof(KEL_COLOR_TABLE_SAFE) == 648 && sizeof(KEL_COLOR_TABLE_PSEUDO) == 192, "");
    for (int i = 0; i < 216; ++i) {
        EXPECT_EQ(KEL_COLOR_TABLE_SAFE[i][0], 51 * (i / 36));
        EXPECT_EQ(KEL_COLOR_TABLE_SAFE[i][1], 51 * (i % 6));
        EXPECT_EQ(KEL_COLOR_TABLE_SAFE[i][2], 51 * (i / 6 % 6));
    }
    for (int i = 0; i < 64; ++i)
        for (int c = 0; c < 3; ++c) {
            // Rounds half up; a hair against the rounding of the quotient itself.
            const double level = std::min(1.0, std::max(0.0, 1.5 - std::fabs(4.0 * i / 63 - (3 - c))));
            EXPECT_EQ(KEL_COLOR_TABLE_PSEUDO[i][c], std::floor(255 * level + 0.5 + 1e-9)) << i << " " << c;
        }
    EXPECT_EQ(KEL_COLOR_TABLE_PSEUDO[24][0], 6);
    EXPECT_EQ(KEL_COLOR_TABLE_PSEUDO[24][2], 249);
}

TEST(Random, DrawsFromRandInOrder) {
    srand(5);
    const int first = rand(), second = rand();
    srand(5);
    EXPECT_EQ(KEL_RAND(1000), first % 1000);
    EXPECT_EQ(KEL_RAND(7), second % 7);
    EXPECT_EQ(KEL_RAND(1), 0);

    for (int x : {0, 1, 10, 1000, 357913941}) {
        srand(9);
        int64_t sum = -6 * int64_t(x);
        for (int i = 0; i < 12; ++i)
            sum += rand() % (int64_t(x) + 1);
        const int next = rand();
        srand(9);
        EXPECT_EQ(KEL_RAND_NORMAL(x), sum);
        EXPECT_EQ(rand(), next) << "always twelve draws";
    }
}

TEST(Random, RefusesAnEmptyRange) {
    for (int x : {0, -3})
        EXPECT_STOPS(KEL_RAND(x), "0<x", "kelImage/src/kelImage_Define_c.cpp", "int KEL_RAND(int)");
    EXPECT_DIVISION_BY_ZERO(KEL_RAND_NORMAL(-1));
}
