// Gaussian 5x5 and 7x7: values worked out by hand, and where they stop.
#include <gtest/gtest.h>

#include "GuardedImage.h"
#include "Stops.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Image;

namespace {

using Smooth = void (*)(kelImage_t*, kelImage_t*, kelImage_t*, kelImage_t*);

struct Filter {
    const char* name;
    Smooth smooth;
    int tmpType;
};
const Filter kFilters[] = {
    {"5x5", applyKelFilterGaussian5X5_downsampling, KEL_PIXEL_TYPE_S16G},
    {"7x7", applyKelFilterGaussianSSE7X7_downsampling, KEL_PIXEL_TYPE_U8G},
};

} // namespace

TEST(Gaussian, KeepsAConstantWhereItComputesAndItsOwnBorderElsewhere) {
    struct {
        Filter filter;
        int width, height, left, right, top, bottom; // the columns and rows that come out as the constant
        int outside;                                 // what the border holds afterwards
        int zerosFrom;                               // columns right of it that the scratch image's zero tail reaches
    } const cases[] = {
        {kFilters[0], 5, 5, 2, 2, 2, 2, 0, 99},     {kFilters[0], 56, 9, 2, 53, 2, 6, 0, 99},
        {kFilters[1], 17, 7, 8, 15, 3, 3, 1, 16},   {kFilters[1], 25, 7, 8, 23, 3, 3, 1, 99},
        {kFilters[1], 56, 12, 8, 47, 3, 8, 1, 48},  {kFilters[1], 64, 12, 8, 55, 3, 8, 1, 99},
        {kFilters[1], 16, 20, 99, 0, 99, 0, 1, 99}, {kFilters[1], 64, 6, 99, 0, 99, 0, 1, 99},
    };
    for (const auto& c : cases)
        for (int value : {0, 1, 77, 255}) {
            Image src(c.width, c.height, KEL_PIXEL_TYPE_U8G), dst(c.width, c.height, KEL_PIXEL_TYPE_U8G);
            Image tmp(c.width, c.height, c.filter.tmpType);
            src.set(Bytes(src.size(), static_cast<uint8_t>(value)));
            dst.set(Bytes(dst.size(), 1));
            c.filter.smooth(dst.get(), nullptr, src.get(), tmp.get());
            for (int y = 0; y < c.height; ++y)
                for (int x = 0; x < c.width; ++x) {
                    const bool row = y >= c.top && y <= c.bottom;
                    const int expected = row && x >= c.left && x <= c.right               ? value
                                         : row && x >= c.zerosFrom && x < c.zerosFrom + 8 ? 0
                                                                                          : c.outside;
                    ASSERT_EQ(dst.at(x, y), expected)
                        << c.filter.name << " " << c.width << "x" << c.height << " at " << x << ", " << y;
                }
        }
}

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

TEST(GaussianDeath, NamesTheWorkerThatStops) {
    Image image(20, 20, KEL_PIXEL_TYPE_U8G), wide(21, 20, KEL_PIXEL_TYPE_U8G), high(20, 21, KEL_PIXEL_TYPE_U8G);
    Image response(20, 20, KEL_PIXEL_TYPE_S16G), bare(20, 20, KEL_PIXEL_TYPE_U8G);
    kelImage_t empty = *bare.get();
    empty.data = nullptr;
    kelImage_t *const u8 = image.get(), *const s16 = response.get();
    const char* const data = "src->data != __null && dst->data != __null && tmp->data != __null";
    const char* const shape = "dst->type == src->type && src->width == dst->width && dst->height == src->height";
    const char* const file5 = "kelImage/src/kelImage_Gaussian_c_legacy.cpp";
    const char* const file7 = "kelImage/src/kelImage_Gaussian_c_sse_legacy.cpp";
    const char* const worker5 =
        "void applyKelFilterGaussian5X5_downsampling(kelImage_t*, kelImage_t*, kelImage_t*, kelImage_t*)";
    const char* const worker7 =
        "void applyKelFilterGaussianSSE7X7_downsampling(kelImage_t*, kelImage_t*, kelImage_t*, kelImage_t*)";
    EXPECT_STOPS(applyKelFilterGaussian5X5(&empty, u8, s16), data, file5, worker5);
    EXPECT_STOPS(applyKelFilterGaussian5X5(u8, &empty, s16), data, file5, worker5);
    EXPECT_STOPS(applyKelFilterGaussian7X7(u8, u8, &empty), data, file7, worker7);
    EXPECT_STOPS(applyKelFilterGaussian5X5(u8, wide.get(), s16), shape, file5, worker5);
    EXPECT_STOPS(applyKelFilterGaussian5X5(u8, s16, s16), shape, file5, worker5);
    EXPECT_STOPS(applyKelFilterGaussianSSE7X7(u8, high.get(), u8), shape, file7, worker7);
    EXPECT_STOPS(applyKelFilterGaussian5X5(u8, u8, u8), "tmp->type == KEL_PIXEL_TYPE_S16G", file5, worker5);
    EXPECT_STOPS(applyKelFilterGaussian7X7(u8, u8, s16), "tmp->type == KEL_PIXEL_TYPE_U8G", file7, worker7);
    EXPECT_STOPS(applyKelFilterGaussian7X7_downsampling(u8, nullptr, u8, s16), "tmp->type == KEL_PIXEL_TYPE_U8G", file7,
                 worker7);
}
