// Filters on pictures whose results are worked out by hand, so that library and references cannot err together.
#include <algorithm>
#include <cstdlib>

#include "GuardedImage.h"

using kel_test::Fill;
using kel_test::Image;

TEST(Gaussian, SpreadsAPointByItsWeights) {
    const int five[] = {1, 4, 6, 4, 1}, seven[] = {2, 7, 14, 18, 14, 7, 2};
    Image src(64, 24, KEL_PIXEL_TYPE_U8G), dst(64, 24, KEL_PIXEL_TYPE_U8G);
    Image tmp5(64, 24, KEL_PIXEL_TYPE_S16G), tmp7(64, 24, KEL_PIXEL_TYPE_U8G);
    src.fill(Fill::Zero, 0);
    src.at(30, 11) = 255;
    applyKelFilterGaussian5X5(dst.get(), src.get(), tmp5.get());
    for (int v = 0; v < 5; ++v)
        for (int u = 0; u < 5; ++u) {
            EXPECT_EQ(dst.at(28 + u, 9 + v), (255 * five[u] * five[v] + 128) / 256);
        }
    applyKelFilterGaussian7X7(dst.get(), src.get(), tmp7.get());
    for (int v = 0; v < 7; ++v)
        for (int u = 0; u < 7; ++u) {
            EXPECT_EQ(dst.at(27 + u, 8 + v), ((255 * seven[u] + 32) / 64 * seven[v] + 32) / 64);
        }
}

TEST(Derivative, CrossReachesFivePixels) {
    Image src(64, 32, KEL_PIXEL_TYPE_U8G), dst(64, 32, KEL_PIXEL_TYPE_S16G);
    src.fill(Fill::Zero, 0);
    dst.fill(Fill::Zero, 0);
    src.at(30, 16) = 255;
    applyKelFilterLaplacian3X3(dst.get(), src.get());
    for (int y = 0; y < 32; ++y)
        for (int x = 0; x < 64; ++x) {
            const int u = std::abs(x - 30), v = std::abs(y - 16);
            ASSERT_EQ(dst.at<int16_t>(x, y), u == 0 && v == 0 ? -1020 : u + v == 5 && u * v == 0 ? 255 : 0) << x << ", " << y;
        }
}

// A step edge has magnitude 1020 on both sides; then gx = gy = 765, 170 and 510.
TEST(Derivative, SobelOfEdges) {
    Image src(80, 20, KEL_PIXEL_TYPE_U8G), dst(80, 20, KEL_PIXEL_TYPE_S16G);
    const auto magnitude = [&](auto bright, int x, int y) {
        for (int v = 0; v < 20; ++v)
            for (int u = 0; u < 80; ++u)
                src.at(u, v) = bright(u, v);
        applyKelFilterSobel3X3(dst.get(), src.get());
        return dst.at<int16_t>(x, y);
    };
    for (int x = 38; x < 43; ++x)
        EXPECT_EQ(magnitude([](int u, int) { return u >= 41 ? 255 : 0; }, x, 9), x == 40 || x == 41 ? 1020 : 0);
    EXPECT_EQ(magnitude([](int u, int v) { return u + v > 50 ? 255 : u + v == 50 ? 128 : 0; }, 40, 10), 1082);
    EXPECT_EQ(magnitude([](int u, int v) { return u == 41 && v == 11 ? 170 : 0; }, 40, 10), 240);
    EXPECT_EQ(magnitude([](int u, int v) { return (u == 41) + (v == 11) > 0 ? 170 : 0; }, 40, 10), 721);
}

TEST(Rank, TakesTheSixthOfNine) {
    Image src(3, 3, KEL_PIXEL_TYPE_U8G), dst(3, 3, KEL_PIXEL_TYPE_U8G);
    int order[] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    std::mt19937 numbers = kel_test::generator(3);
    for (int round = 0; round < 50; ++round) {
        for (int i = 0; i < 9; ++i)
            src.at(i % 3, i / 3) = static_cast<uint8_t>(order[i]);
        applyKelFilterMedianNXN(dst.get(), src.get(), 1);
        EXPECT_EQ(dst.at(1, 1), 6);
        std::shuffle(order, order + 9, numbers);
    }
    applyKelFilterMedian3X3(nullptr, nullptr); // looks at nothing
}
