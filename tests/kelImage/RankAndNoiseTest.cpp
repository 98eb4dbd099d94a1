// Rank filter beside a selection in each window, noise beside the runtime's generator drawn by hand.
#include <algorithm>
#include <cstdlib>
#include <gtest/gtest.h>

#include "FilterReference.h"
#include "GuardedImage.h"
#include "Stops.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Guard;
using kel_test::Image;

TEST(Rank, TakesTheSixthOfNine) {
    Image src(3, 3, KEL_PIXEL_TYPE_U8G), dst(3, 3, KEL_PIXEL_TYPE_U8G);
    int order[] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    for (int round = 0; round < 50; ++round) {
        for (int i = 0; i < 9; ++i)
            src.at(i % 3, i / 3) = static_cast<uint8_t>(order[i]);
        applyKelFilterMedianNXN(dst.get(), src.get(), 1);
        EXPECT_EQ(dst.at(1, 1), 6);
        std::shuffle(order, order + 9, *std::make_unique<std::mt19937>(kel_test::generator(round)));
    }
}

TEST(Rank, LeavesAloneWhatItDoesNotHandle) {
    for (int type = 0; type < 48; ++type) {
        Image src(20, 9, type), dst(20, 9, type);
        const Bytes before = dst.bytes();
        applyKelFilterMedian3X3(dst.get(), src.get());
        applyKelFilterMedianNXN(dst.get(), src.get(), type == 0 ? 0 : 1); // radius 0 is none
        EXPECT_TRUE(holds(dst, before)) << type;
    }
    applyKelFilterMedian3X3(nullptr, nullptr);
}

TEST(Noise, StaysWithinItsAmplitudeAndReachesIt) {
    Image src(100, 100, KEL_PIXEL_TYPE_U8G), dst(100, 100, KEL_PIXEL_TYPE_U8G);
    src.set(Bytes(src.size(), 128));
    std::srand(1);
    applyKelFilterNoise(dst.get(), src.get(), 10);
    int counts[21] = {};
    for (int y = 0; y < 100; ++y)
        for (int x = 0; x < 100; ++x) {
            const int noise = dst.at(x, y) - 128;
            ASSERT_LE(std::abs(noise), 10);
            ++counts[noise + 10];
        }
    EXPECT_GT(*std::min_element(counts, counts + 21), 300) << "each of 21 values comes about 476 times";
}

TEST(Noise, OfNoAmplitudeCopiesPixelsAndDrawsNothing) {
    Image src(21, 5, KEL_PIXEL_TYPE_U8G), dst(21, 5, KEL_PIXEL_TYPE_U8G);
    src.fill(Fill::Ramp, 0);
    Bytes expected = dst.bytes();
    for (int y = 0; y < 5; ++y)
        std::copy_n(&src.at(0, y), 21, expected.begin() + y * dst->step);
    std::srand(7);
    const int next = std::rand();
    std::srand(7);
    applyKelFilterNoise(dst.get(), src.get(), 0);
    EXPECT_TRUE(holds(dst, expected));
    for (int type = 1; type < 48; ++type) {
        Image other(9, 3, type), result(9, 3, type);
        const Bytes before = result.bytes();
        applyKelFilterNoise(result.get(), other.get(), 5);
        EXPECT_TRUE(holds(result, before)) << type;
    }
    EXPECT_EQ(std::rand(), next);
}

TEST(RankAndNoiseDeath, StopOnShapesAndTypes) {
    Image image(20, 9, KEL_PIXEL_TYPE_U8G), wide(21, 9, KEL_PIXEL_TYPE_U8G), response(20, 9, KEL_PIXEL_TYPE_S16G);
    const char* const shape = "dst->step == src->step && dst->width == src->width && dst->height == src->height";
    const char* const noise = "void applyKelFilterNoise(kelImage_t*, kelImage_t*, kelValue_s32)";
    EXPECT_STOPS(applyKelFilterMedianNXN(wide.get(), image.get(), 1), shape, "kelImage/src/kelImage_Median_c_legacy.cpp",
                 "void applyKelFilterMedianNXN(kelImage_t*, kelImage_t*, kelValue_s32)");
    EXPECT_STOPS(applyKelFilterNoise(wide.get(), image.get(), 1), shape, "kelImage/src/kelImage_Noise_c_legacy.cpp", noise);
    EXPECT_STOPS(applyKelFilterNoise(response.get(), image.get(), 1), "dst->type == src->type",
                 "kelImage/src/kelImage_Noise_c_legacy.cpp", noise);
}
