// Cross operator and Sobel magnitude: values worked out by hand, types and stops.
#include <gtest/gtest.h>

#include "FilterReference.h"
#include "GuardedImage.h"
#include "Stops.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Image;

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

TEST(Derivative, LeavesBordersAndOtherTypesAlone) {
    for (int type = 1; type < 48; ++type)
        for (int dstType : {KEL_PIXEL_TYPE_U8G, KEL_PIXEL_TYPE_S16G}) {
            Image src(60, 20, type), dst(60, 20, dstType);
            const Bytes before = dst.bytes();
            for (auto derive : {applyKelFilterLaplacian3X3, applyKelFilterSobel3X3})
                derive(dst.get(), src.get());
            EXPECT_TRUE(holds(dst, before)) << type;
        }
}

TEST(DerivativeDeath, NamesTheWorkerThatStops) {
    Image src(40, 20, KEL_PIXEL_TYPE_U8G), grey(40, 20, KEL_PIXEL_TYPE_U8G), wide(41, 20, KEL_PIXEL_TYPE_S16G);
    Image high(40, 21, KEL_PIXEL_TYPE_S16G);
    const char* const shape = "dst->step == src->step && dst->width == src->width && dst->height == src->height";
    const char* const type = "dst->type == KEL_PIXEL_TYPE_S16G";
    const char* const cross = "void applyKelFilterLaplacianSSE3X3(kelImage_t*, kelImage_t*)";
    const char* const sobel = "void applyKelFilterSobelSSE3X3(kelImage_t*, kelImage_t*)";
    const char* const crossFile = "kelImage/src/kelImage_Laplacian_c_sse_legacy.cpp";
    const char* const sobelFile = "kelImage/src/kelImage_Sobel_c_sse_legacy.cpp";
    EXPECT_STOPS(applyKelFilterLaplacian3X3(wide.get(), src.get()), shape, crossFile, cross);
    EXPECT_STOPS(applyKelFilterLaplacian3X3(grey.get(), src.get()), type, crossFile, cross);
    EXPECT_STOPS(applyKelFilterSobel3X3(high.get(), src.get()), shape, sobelFile, sobel);
    EXPECT_STOPS(applyKelFilterSobel3X3(grey.get(), src.get()), type, sobelFile, sobel);
}
