// Converters and their dispatcher where the sweep over the list does not go.
#include <cfenv>
#include <cmath>
#include <gtest/gtest.h>
#include <string>
#include <vector>

#include "ConverterReference.h"
#include "ImageScene.h"

using namespace kel_test;

// Areas that end with the run of 4-pixel blocks, which is shorter than the rows by step: a block takes 8 bytes, not more.
TEST(Converter, ColourBlocksStayInsideTheirRun) {
    for (bool blueFirst : {false, true})
        for (int width = 1; width < 40; ++width)
            for (int height = 1; height < 4; ++height) {
                const int missing = ((width + 15) / 16 * 16 - (width + 3) / 4 * 4) * height; // pixels
                const Image src(width, height, 40, Guard::Behind, size_t(0) - 2 * missing);
                const Image dst(width, height, 32, Guard::Behind, size_t(0) - 4 * missing);
                const Image expected(width, height, 32, Guard::Behind, size_t(0) - 4 * missing);
                (blueFirst ? kel_ref::U8YUV_to_U8BGRA : kel_ref::U8YUV_to_U8RGBA)(expected.get(), src.get());
                (blueFirst ? convertKelImageSSE_U8YUV_to_U8BGRA : convertKelImageSSE_U8YUV_to_U8RGBA)(dst.get(), src.get());
                ASSERT_TRUE(holds(dst, expected.bytes()));
            }
}

namespace {

// The first bytes of a 2x1 destination after convertKelImage().
Bytes converted(int from, int to, const Bytes& pixels, size_t count) {
    const Image src(2, 1, from), dst(2, 1, to, Guard::Behind, 1024);
    std::copy(pixels.begin(), pixels.end(), src.data());
    convertKelImage(dst.get(), src.get());
    return Bytes(dst.data(), dst.data() + count);
}

} // namespace

// Values worked out by hand, so that library and references cannot err together.
TEST(Converter, GivesKnownValues) {
    const Bytes shorts = {0xff, 0x7f, 0x00, 0xff}, more = {0x7f, 0x00, 0x00, 0x80}; // 32767, -256; 127, -32768
    EXPECT_EQ(converted(3, 0, shorts, 2), (Bytes{255, 2}));
    EXPECT_EQ(converted(3, 0, more, 2), (Bytes{0, 0}));
    EXPECT_EQ(converted(3, 32, shorts, 8), (Bytes{255, 255, 255, 0, 2, 2, 2, 0}));
    EXPECT_EQ(converted(8, 0, {10, 20, 31, 255, 255, 254}, 2), (Bytes{20, 254}));
    EXPECT_EQ(converted(24, 3, {10, 20, 31, 255, 255, 255}, 4), (Bytes{20, 0, 255, 0}));
    EXPECT_EQ(converted(0, 3, {200, 1}, 4), (Bytes{200, 0, 1, 0}));
    EXPECT_EQ(converted(0, 16, {7, 9}, 8), (Bytes{7, 7, 7, 0, 9, 9, 9, 0}));
    EXPECT_EQ(converted(24, 16, {1, 2, 3, 4, 5, 6}, 8), (Bytes{1, 2, 3, 0, 4, 5, 6, 0})) << "the order is kept";
    EXPECT_EQ(converted(8, 24, {1, 2, 3, 4, 5, 6}, 6), (Bytes{3, 2, 1, 6, 5, 4}));
    EXPECT_EQ(converted(16, 32, {1, 2, 3, 4, 5, 6, 7, 8}, 8), (Bytes{3, 2, 1, 4, 7, 6, 5, 8}));
    EXPECT_EQ(converted(40, 0, {90, 16, 240, 235}, 2), (Bytes{16, 235}));
    EXPECT_EQ(converted(40, 24, {128, 16, 128, 235}, 6), (Bytes{0, 0, 0, 254, 254, 254})) << "254.916 truncated";
    EXPECT_EQ(converted(40, 32, {128, 16, 128, 235}, 8), (Bytes{0, 0, 0, 0, 255, 255, 255, 0})) << "254.916 rounded";
    EXPECT_EQ(converted(40, 8, {255, 128, 0, 128}, 6), (Bytes{255, 171, 0, 255, 171, 0})) << "171.669 truncated";
    EXPECT_EQ(converted(40, 16, {255, 128, 0, 128}, 8), (Bytes{255, 172, 0, 0, 255, 172, 0, 0})) << "171.669 rounded";
}

// All 16.7 million of (Y, U, V), for both arithmetics: a 256x256 image for each U, Y along the rows and V down.
TEST(Converter, TurnsEveryYuvIntoColour) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    const Image yuv(256, 256, 40), rgb(256, 256, 24), bgr(256, 256, 8), rgba(256, 256, 32), bgra(256, 256, 16);
    for (int u = 0; u < 256; ++u) {
        for (int v = 0; v < 256; ++v)
            for (int y = 0; y < 256; ++y) {
                yuv.at(y, v, 0) = static_cast<uint8_t>(y % 2 ? v : u);
                yuv.at(y, v, 1) = static_cast<uint8_t>(y);
            }
        convertKelImage(rgb.get(), yuv.get());
        convertKelImage(bgr.get(), yuv.get());
        convertKelImage(rgba.get(), yuv.get());
        convertKelImage(bgra.get(), yuv.get());
        for (int v = 0; v < 256; ++v)
            for (int y = 0; y < 256; ++y) {
                const kel_ref::Rgb t = kel_ref::yuvTruncated(y, u, v), r = kel_ref::yuvRounded(y, u, v);
                const uint8_t *a = &rgb.at(y, v), *b = &bgr.at(y, v), *c = &rgba.at(y, v), *d = &bgra.at(y, v);
                const bool same = a[0] == t.r && a[1] == t.g && a[2] == t.b && b[0] == t.b && b[1] == t.g && b[2] == t.r &&
                                  c[0] == r.r && c[1] == r.g && c[2] == r.b && c[3] == 0 && d[0] == r.b && d[1] == r.g &&
                                  d[2] == r.r && d[3] == 0;
                ASSERT_TRUE(same) << "Y " << y << ", U " << u << ", V " << v;
            }
    }
}

TEST(Dispatcher, RoutesEveryPairOfTypes) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    ImageOperation o = imageOperation("convertKelImage 16 to 0"); // which has most room behind its destination
    for (o.from = -1; o.from < 50; ++o.from)
        for (o.to = -1; o.to < 50; ++o.to)
            for (int width : {6, 20, 32}) {
                ASSERT_TRUE(agrees(o, {{width, 3}})) << o.from << " to " << o.to;
            }
}
