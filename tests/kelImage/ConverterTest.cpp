// Converters and their dispatcher, byte for byte beside plain references, in guarded images.
#include <cfenv>
#include <cmath>
#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <vector>

#include "ConverterReference.h"
#include "GuardedImage.h"
#include "Stops.h"
#include "Sweep.h"
#include "Valgrind.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Guard;
using kel_test::Image;
using kel_test::kRoundingModes;
using kel_test::widths;

namespace {

using Converter = void (*)(kelImage_t*, const kelImage_t*);

struct Case {
    const char* name;
    Converter converter, reference;
    int from, to;
    int room = 1; // the destination's data area in multiples of `size`
};

#define KEL_CASE(name, from, to) #name, convertKelImage_##name, kel_ref::name, from, to
#define KEL_SSE_CASE(name, from, to) "SSE_" #name, convertKelImageSSE_##name, kel_ref::name, from, to

// What keeps inside the pixels of a row.
const Case kPortable[] = {
    {KEL_CASE(S16G_to_U8G, 3, 0)},        {KEL_CASE(S16G_to_U8XYZ, 3, 8)},    {KEL_CASE(S16G_to_U8XYZA, 3, 16)},
    {KEL_CASE(U8XYZ_to_U8G, 8, 0)},       {KEL_CASE(U8XYZ_to_S16G, 8, 3)},    {KEL_CASE(U8XYZ_to_U8ZYX, 8, 24)},
    {KEL_CASE(U8XYZ_to_U8XYZA, 8, 16)},   {KEL_CASE(U8XYZ_to_U8ZYXA, 8, 32)}, {KEL_CASE(U8XYZA_to_U8G, 16, 0), 3},
    {KEL_CASE(U8XYZA_to_S16G, 16, 3), 3}, {KEL_CASE(U8XYZA_to_U8XYZ, 16, 8)}, {KEL_CASE(U8XYZA_to_U8ZYX, 16, 24)},
    {KEL_CASE(U8XYZA_to_U8ZYXA, 16, 32)},
};

// What uses the padding.
const Case kPadded[] = {
    {KEL_CASE(U8YUV_to_U8RGB, 40, 24)},
    {KEL_CASE(U8YUV_to_U8BGR, 40, 8)},
    {KEL_CASE(U8YUV_to_U8BGRA, 40, 16)},
    {KEL_CASE(U8YUV_to_U8RGBA, 40, 32)},
    {KEL_CASE(U8YUV_to_U8G, 40, 0)},
    {KEL_CASE(U8G_to_U8XYZA, 0, 16)},
    {KEL_CASE(U8G_to_U8XYZ, 0, 8)},
    {KEL_CASE(U8G_to_S16G, 0, 3)},
    {KEL_SSE_CASE(U8YUV_to_U8RGBA, 40, 32)},
    {KEL_SSE_CASE(U8YUV_to_U8BGRA, 40, 16)},
    {KEL_SSE_CASE(U8YUV_to_U8G, 40, 0)},
    {KEL_SSE_CASE(U8G_to_U8XYZA, 0, 16)},
    {KEL_SSE_CASE(U8G_to_U8XYZ, 0, 8)},
    {KEL_SSE_CASE(U8G_to_S16G, 0, 3)},
    {"SSE_U8YUV_to_U8BGR", convertKelImageSSE_U8YUV_to_U8BGR, kel_ref::nothing, 40, 8},
    {"SSE_U8YUV_to_U8RGB", convertKelImageSSE_U8YUV_to_U8RGB, kel_ref::nothing, 40, 24},
};

std::vector<Case> allCases() {
    std::vector<Case> all(std::begin(kPortable), std::end(kPortable));
    all.insert(all.end(), std::begin(kPadded), std::end(kPadded));
    return all;
}

// Bytes that `reference` leaves in `dst`, which itself stays as it is.
Bytes expectedOf(Converter reference, const Image& dst, const Image& src) {
    const Bytes before = dst.bytes();
    reference(dst.get(), src.get());
    const Bytes expected = dst.bytes();
    dst.set(before);
    return expected;
}

// Runs the converter beside its reference: both areas must hold what they should, margins included.
testing::AssertionResult agrees(Converter converter, Converter reference, const Image& dst, const Image& src) {
    const Bytes expected = expectedOf(reference, dst, src), source = src.bytes();
    converter(dst.get(), src.get());
    if (!holds(src, source))
        return testing::AssertionFailure() << "the source was written";
    return holds(dst, expected);
}

size_t room(const Case& c, int width, int height) {
    kelImage_t* dst = createKelImageHeader(width, height, c.to);
    const size_t bytes = static_cast<size_t>(dst->size) * (c.room - 1);
    releaseKelImageHeader(&dst);
    return bytes;
}

} // namespace

TEST(Converter, AgreesWithItsReferenceAtEveryWidth) {
    for (const Case& c : allCases())
        for (int width : widths())
            for (int height : {0, 1, 2, 5}) {
                const Guard guard = (width + height) % 2 ? Guard::Behind : Guard::Before;
                const Image src(width, height, c.from, guard), dst(width, height, c.to, guard, room(c, width, height));
                src.fill(kel_test::kFills[(width + 3 + height) % 7], 5);
                ASSERT_TRUE(agrees(c.converter, c.reference, dst, src)) << c.name << " " << width << "x" << height;
            }
}

TEST(Converter, AgreesWithItsReferenceForEveryFillOnBothGuards) {
    for (const Case& c : allCases())
        for (Guard guard : {Guard::Behind, Guard::Before})
            for (Fill fill : kel_test::kFills) {
                const Image src(83, 7, c.from, guard), dst(83, 7, c.to, guard, room(c, 83, 7));
                src.fill(fill, 6);
                ASSERT_TRUE(agrees(c.converter, c.reference, dst, src)) << c.name << ", fill " << static_cast<int>(fill);
            }
}

// Called directly a converter takes the destination's width and height, whatever the source's are; and data need no more
// alignment than their elements.
TEST(Converter, FollowsTheDestinationsSizeWhateverTheAlignment) {
    for (const Case& c : allCases())
        for (int width : {1, 15, 20, 33, 70})
            for (size_t spare : {0, 6}) {
                const Image src(70, 9, c.from, Guard::Behind, spare),
                    dst(width, 4, c.to, Guard::Behind, room(c, width, 4) + spare);
                ASSERT_TRUE(agrees(c.converter, c.reference, dst, src)) << c.name << ", width " << width;
            }
}

// Data areas that end with the last row's last pixel instead of its padding.
TEST(Converter, PortableOnesNeedNoPaddingBehindTheLastPixel) {
    for (const Case& c : kPortable)
        for (int width : widths())
            if (width > 0) {
                const int missing = (width + 15) / 16 * 16 - width;
                const auto image = [&](int type, int perPixel) {
                    return std::make_unique<Image>(width, 2, type, Guard::Behind, size_t(0) - missing * perPixel);
                };
                const auto bytesOf = [](int type) { return type == 0 ? 1 : type == 3 ? 2 : type % 16 ? 3 : 4; };
                if (c.room > 1)
                    continue; // the destination is three times as large and has no such end
                const auto src = image(c.from, bytesOf(c.from)), dst = image(c.to, bytesOf(c.to));
                ASSERT_TRUE(agrees(c.converter, c.reference, *dst, *src)) << c.name << ", width " << width;
            }
}

// Areas that end with the run of 4-pixel blocks, which is shorter than the rows by step: a block takes 8 bytes, not more.
TEST(Converter, ColourBlocksStayInsideTheirRun) {
    for (const Case& c : {Case{KEL_SSE_CASE(U8YUV_to_U8RGBA, 40, 32)}, Case{KEL_SSE_CASE(U8YUV_to_U8BGRA, 40, 16)}})
        for (int width = 1; width < 40; ++width)
            for (int height = 1; height < 4; ++height) {
                const int missing = ((width + 15) / 16 * 16 - (width + 3) / 4 * 4) * height; // pixels
                const Image src(width, height, c.from, Guard::Behind, size_t(0) - 2 * missing);
                const Image dst(width, height, c.to, Guard::Behind, size_t(0) - 4 * missing);
                ASSERT_TRUE(agrees(c.converter, c.reference, dst, src)) << c.name << ", width " << width;
            }
}

TEST(Converter, ReordersInPlace) {
    for (const Case& c : {Case{KEL_CASE(U8XYZ_to_U8ZYX, 8, 24)}, Case{KEL_CASE(U8XYZA_to_U8ZYXA, 16, 32)}})
        for (int width : widths()) {
            const Image image(width, 3, c.from);
            kelImage_t* alias = createKelImageHeader(width, 3, c.to);
            alias->data = image.data();
            const Bytes before = image.bytes();
            c.reference(alias, image.get());
            const Bytes expected = image.bytes();
            image.set(before);
            c.converter(alias, image.get());
            EXPECT_TRUE(holds(image, expected)) << c.name;
            releaseKelImageHeader(&alias);
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

TEST(Converter, YuvFollowsTheThreadsRoundingMode) {
    const Image src(1024, 16, 40);
    for (const auto& mode : kRoundingModes)
        for (const Case& c : kPadded)
            if (c.from == 40) {
                const Image dst(1024, 16, c.to);
                std::fesetround(mode.mode);
                const Bytes expected = expectedOf(c.reference, dst, src);
                c.converter(dst.get(), src.get());
                std::fesetround(FE_TONEAREST);
                EXPECT_TRUE(holds(dst, expected)) << c.name << ", rounding " << mode.name;
            }
}

TEST(Dispatcher, RoutesEveryPairOfTypes) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    for (int from = -1; from < 50; ++from)
        for (int to = -1; to < 50; ++to)
            for (int width : {6, 20, 32}) {
                const Image src(width, 3, from), dst(width, 3, to, Guard::Behind, 8192);
                ASSERT_TRUE(agrees(convertKelImage, kel_ref::convert, dst, src)) << from << " to " << to;
            }
}

TEST(Dispatcher, StopsOnDifferentSizes) {
    const std::string text = "dst->width == src->width && dst->height == src->height";
    const std::string file = "kelImage/src/kelImage_Converter_c_legacy.cpp";
    const std::string signature = "void convertKelImage(kelImage_t*, const kelImage_t*)";
    const Image src(20, 3, 0), wider(21, 3, 0), lower(20, 2, 99);
    EXPECT_STOPS(convertKelImage(wider.get(), src.get()), text, file, signature);
    EXPECT_STOPS(convertKelImage(lower.get(), src.get()), text, file, signature);
}
