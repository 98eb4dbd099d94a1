// Resizing, borders, flips and warp against plain references, byte for byte, padding and neighbours included.
#include <cfenv>
#include <cmath>
#include <functional>
#include <limits>

#include "GuardedImage.h"
#include "ImageOperations.h"
#include "Stops.h"
#include "TransformReference.h"
#include "Valgrind.h"

namespace {

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Guard;
using kel_test::Image;
using kel_test::Size;
using Operation = std::function<void(kelImage_t*, const kelImage_t*)>;

// Runs an operation and its reference on guarded images, and expects the same destination and an untouched source.
void compare(const Operation& operation, const Operation& reference, Size dstSize, Size srcSize, int type,
             Guard guard = Guard::Behind, Fill fill = Fill::Random, size_t extra = 0) {
    Image src(srcSize.width, srcSize.height, type, guard, extra), dst(dstSize.width, dstSize.height, type, guard),
        expected(dstSize.width, dstSize.height, type);
    src.fill(fill, 5);
    expected.set(dst.bytes());
    const Bytes source = src.bytes();
    reference(expected.get(), src.get());
    operation(dst.get(), src.get());
    EXPECT_TRUE(holds(dst, expected.bytes())) << "from " << srcSize.width << "x" << srcSize.height;
    EXPECT_TRUE(holds(src, source));
}

} // namespace

// Beyond the sizes where single precision is exact.
TEST(Resizing, RoundsThePositionsOfHugeImages) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    compare(resizeKelImageNearest, kel_ref::nearest, {4200000, 1}, {12600001, 1}, 0);
    compare(resizeKelImageNearest, kel_ref::nearest, {6000000, 1}, {18000001, 1}, 0);
    compare(resizeKelImageBilinear, kel_ref::bilinear, {4200000, 1}, {12600001, 1}, 0);
    compare(resizeKelImageBilinear, kel_ref::bilinear, {6000000, 1}, {18000001, 1}, 0);
    compare(resizeKelImageBilinear, kel_ref::bilinear, {1400001, 1}, {4200004, 3}, 0);
}

// The pixel behind the source's last one is read as it is before the destination is written, also where it is the destination's.
TEST(LinearInterpolation, EnlargesIntoMemoryRightBehindItsSource) {
    Image both(32, 10, 16); // 16x4 pixels of source, then 32x8 of destination
    const Bytes before = both.bytes();
    Image apart(16, 4, 16, Guard::Behind, 4), expected(32, 8, 16);
    apart.set(Bytes(before.begin(), before.begin() + static_cast<ptrdiff_t>(apart.size())));
    kel_ref::linearInterpolation(expected.get(), apart.get());
    kelImage_t *src = createKelImageHeader(16, 4, 16), *dst = createKelImageHeader(32, 8, 16);
    src->data = both.data();
    dst->data = both.data() + src->size;
    resizeLinerInterpolation(dst, src);
    EXPECT_EQ(Bytes(dst->data, dst->data + dst->size), expected.bytes());
    releaseKelImageHeader(&src);
    releaseKelImageHeader(&dst);
}

TEST(ZeroOrderHold, AveragesByAnyRatio) {
    for (Fill fill : {Fill::Random, Fill::Max})
        for (int from : {3, 17, 33, 64, 97})
            for (int to : {1, 2, 5, 16, 17, 33, 64})
                if (to <= from)
                    for (int toRows : {1, 3, 20}) // more rows, too
                        compare(zero_order_hold_plus_ave, kel_ref::zeroOrderHoldPlusAverage, {to, toRows}, {from, 6}, 16,
                                Guard::Behind, fill);
    // Boxes too large for the reciprocal.
    compare(zero_order_hold_plus_ave, kel_ref::zeroOrderHoldPlusAverage, {1, 1}, {4099, 2}, 32);
    compare(zero_order_hold_plus_ave, kel_ref::zeroOrderHoldPlusAverage, {3, 1}, {4106, 1}, 32);
    compare(zero_order_hold_plus_ave, kel_ref::zeroOrderHoldPlusAverage, {1, 2}, {2, 9001}, 32, Guard::Behind, Fill::Max);
}

// The sum of a box does not fit into 32 bits.
TEST(ZeroOrderHold, AveragesOverHugeBoxes) {
    const std::vector<uint32_t> white(16900000, 0xffffffffu);
    kelImage_t *src = createKelImageHeader(16900000, 1, 16), *dst = createKelImage(1, 1, 16);
    src->data = const_cast<unsigned char*>(reinterpret_cast<const unsigned char*>(white.data()));
    zero_order_hold_plus_ave(dst, src);
    EXPECT_EQ(Bytes(dst->data, dst->data + 4), Bytes(4, 255));
    releaseKelImageHeader(&src);
    releaseKelImage(&dst);
}

namespace {

void warpBy(kelImage_t* dst, const kelImage_t* src, const float* h) {
    rotateKelImageHomography(dst, src, h[0], h[1], h[2], h[3], h[4], h[5], h[6], h[7], h[8]);
}

} // namespace

TEST(Warp, SamplesAsTheReferenceDoesForAnyHomography) {
    const float inf = std::numeric_limits<float>::infinity(), nan = std::numeric_limits<float>::quiet_NaN();
    std::vector<std::array<float, 9>> homographies = {
        {1, 0, 0, 0, 1, 0, 0, 0, 1},
        {2, 0, 0, 0, 2, 0, 0, 0, 1},
        {1, 0, -0.7f, 0, 1, -0.3f, 0, 0, 1}, // quotients in (-1, 0)
        {1, 0, -5, 0, 1, 3, 0, 0, 1},
        {1, 0, 0.49999997f, 0, 1, 0.49999997f, 0, 0, 1}, // + 0.5 rounds up to 1
        {0, 0, 0.49999997f, 0, 0, 0.49999997f, 0, 0, 1},
        {1, 0, 0, 0, 1, 0, 0.25f, 0, -1}, // a denominator of 0 inside
        {1, 0, 0, 0, 1, 0, 0, 0, 0},
        {1e30f, 0, 0, 0, 1, 0, 0, 0, 1e-8f},
        {0, 0, 4294967296.0f + 512, 0, 0, 4294967296.0f, 0, 0, 1}, // 2^32 must not wrap to 0
        {0, 0, -4294967296.0f, 0, 0, 2147483648.0f, 0, 0, 1},
        {inf, 0, 0, 0, 1, 0, 0, 0, 1},
        {1, 0, nan, 0, 1, 0, 0, 0, 1},
        {1, 0, 0, 0, nan, 0, 0, 0, 1},
        {0, 0, 0, 0, 0, 0, 0, 0, 0}};
    std::mt19937 random = kel_test::generator(43);
    std::uniform_real_distribution<float> uniform(-1, 1);
    for (int i = 0; i < 60; ++i) {
        std::array<float, 9> h;
        for (float& value : h)
            value = uniform(random) * (i % 2 ? 1.5f : 0.2f);
        h[0] += 1;
        h[4] += 1;
        h[2] *= 20;
        h[5] *= 20;
        h[6] *= 0.02f;
        h[7] *= 0.02f;
        h[8] = 1;
        homographies.push_back(h);
    }
    homographies.push_back({1, 1e8f, -1e8f, 0, 1, 0, 0, 0, 1}); // (x + 1e8 y) - 1e8 is not x + (1e8 y - 1e8)
    for (int i = 3; i < 120; ++i) { // the true quotient is x + 0.5; one by a reciprocal falls short of it here and there
        const float w = static_cast<float>(i), reciprocal = 1 / w, at15 = w * 15 + w / 2;
        if (at15 * reciprocal < 15.5f)
            homographies.push_back({w, 0, w / 2, 0, w, w / 2, 0, 0, w});
    }
    for (const auto& h : homographies)
        for (int type : {0, 3, 8, 16})
            for (int width : {1, 3, 4, 7, 16, 19, 37})
                for (Guard guard : {Guard::Behind, Guard::Before})
                    compare([&](kelImage_t* dst, const kelImage_t* src) { warpBy(dst, src, h.data()); },
                            [&](kelImage_t* dst, const kelImage_t* src) { kel_ref::warp(dst, src, h.data()); }, {width, 9},
                            {40 - width, 17}, type, guard);
}

// An int holds no index of the last pixels. Nothing but the pixels touched is ever in memory.
TEST(Warp, SamplesSourcesOfMoreThanTwoGigapixels) {
    kelImage_t* const src = createKelImageHeader(65536, 40000, 0);
    const size_t bytes = size_t(65536) * 40000;
    void* const block = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    ASSERT_NE(block, MAP_FAILED);
    src->data = static_cast<unsigned char*>(block);
    std::fill_n(src->data + bytes - 9, 9, 77);
    Image dst(9, 1, 0);
    const float toTheLastRow[9] = {1, 0, 65536 - 9, 0, 1, 39999, 0, 0, 1};
    warpBy(dst.get(), src, toTheLastRow);
    EXPECT_EQ(Bytes(dst.data(), dst.data() + 9), Bytes(9, 77));
    munmap(block, bytes);
    kelImage_t* record = src;
    releaseKelImageHeader(&record);
}

// The denominator is 0 one column behind the last.
TEST(Warp, ComputesNoColumnBehindTheLast) {
    Image src(4, 1, 16), dst(1, 1, 16);
    const float pole[9] = {1, 0, 0, 0, 1, 0, 1, 0, -1};
    std::feclearexcept(FE_ALL_EXCEPT);
    warpBy(dst.get(), src.get(), pole);
    EXPECT_FALSE(std::fetestexcept(FE_DIVBYZERO));
}

TEST(Warp, FillsWithZeroFromAnEmptySource) {
    Image src(0, 0, 0), dst(20, 3, 0);
    const float identity[9] = {1, 0, 0, 0, 1, 0, 0, 0, 1};
    Bytes expected = dst.bytes();
    for (int y = 0; y < 3; ++y)
        std::fill_n(expected.begin() + 32 * y, 20, 0);
    warpBy(dst.get(), src.get(), identity);
    EXPECT_TRUE(holds(dst, expected));
}

// A destination of more than 2^31 bytes says a size that has wrapped.
TEST(Border, OfWordsReachesAsFarAsRowsAndStepSay) {
    Image src(16, 3, 3), dst(18, 5, 3), expected(18, 5, 3);
    expected.set(dst.bytes());
    kel_ref::enborder(expected.get(), src.get(), 1);
    dst->size = -dst->size;
    resizeKelImageEnborder(dst.get(), src.get(), 1);
    EXPECT_TRUE(holds(dst, expected.bytes()));
}

TEST(Transforms, WriteNothingForNegativeWidths) {
    for (int type : {0, 16}) {
        Image memory(16, 8, type);
        const Bytes before = memory.bytes();
        kelImage_t *src = createKelImageHeader(-5, 4, type), *dst = createKelImageHeader(-5, 4, type);
        src->data = dst->data = memory.data() + 64;
        for (auto resize : {resizeKelImageNearest, resizeKelImageBilinear, resizeLinerInterpolation, zero_order_hold_plus_ave})
            if (type == 16 || resize == resizeKelImageNearest || resize == resizeKelImageBilinear)
                resize(dst, src);
        EXPECT_TRUE(holds(memory, before));
        releaseKelImageHeader(&src);
        releaseKelImageHeader(&dst);
    }
}

TEST(Transforms, StopOnTypesAndSizesThatDoNotFit) {
    const char *const resizer = "kelImage/src/kelImage_Resizer_c_legacy.cpp",
                      *const rotater = "kelImage/src/kelImage_Rotater_c_legacy.cpp", *const sameType = "dst->type == src->type";
    Image grey(20, 10, 0), wide(21, 10, 0), tall(20, 11, 0), colour(20, 10, 8), odd(20, 10, 7), oddWide(21, 10, 7);
    const struct {
        const char *name, *file, *text;
        std::function<void(kelImage_t*, const kelImage_t*)> call;
        Image *dst, *src;
    } cases[] = {
        {"resizeKelImage(kelImage_t*, const kelImage_t*)", resizer, sameType, resizeKelImage, &grey, &colour},
        {"resizeKelImageNearest(kelImage_t*, const kelImage_t*)", resizer, sameType, resizeKelImageNearest, &grey, &colour},
        {"resizeKelImageBilinear(kelImage_t*, const kelImage_t*)", resizer, sameType, resizeKelImageBilinear, &colour, &grey},
        {"resizeKelImageHalf(kelImage_t*, const kelImage_t*)", resizer, sameType, resizeKelImageHalf, &grey, &colour},
        {"resizeKelImageHalf(kelImage_t*, const kelImage_t*)", resizer, "dst->width == src->width / 2", resizeKelImageHalf,
         &grey, &grey},
        {"resizeKelImageEnborder(kelImage_t*, const kelImage_t*, kelValue_s32)", resizer, sameType,
         [](kelImage_t* d, const kelImage_t* s) { resizeKelImageEnborder(d, s, 0); }, &grey, &colour},
        {"resizeKelImageEnborder(kelImage_t*, const kelImage_t*, kelValue_s32)", resizer,
         "dst->width == src->width +2*size && dst->height == src->height + 2*size",
         [](kelImage_t* d, const kelImage_t* s) { resizeKelImageEnborder(d, s, 0); }, &odd, &oddWide},
        {"resizeKelImageEnborder(kelImage_t*, const kelImage_t*, kelValue_s32)", resizer,
         "dst->width == src->width +2*size && dst->height == src->height + 2*size",
         [](kelImage_t* d, const kelImage_t* s) { resizeKelImageEnborder(d, s, 0); }, &grey, &tall},
        {"resizeKelImageDeborder(kelImage_t*, const kelImage_t*, kelValue_s32)", resizer, sameType,
         [](kelImage_t* d, const kelImage_t* s) { resizeKelImageDeborder(d, s, 0); }, &grey, &colour},
        {"resizeKelImageDeborder(kelImage_t*, const kelImage_t*, kelValue_s32)", resizer,
         "dst->width == src->width - 2*size && dst->height == src->height - 2*size",
         [](kelImage_t* d, const kelImage_t* s) { resizeKelImageDeborder(d, s, 1); }, &grey, &wide},
        {"rotateKelImageH(kelImage_t*, const kelImage_t*)", rotater, sameType, rotateKelImageH, &grey, &colour},
        {"rotateKelImageV(kelImage_t*, const kelImage_t*)", rotater, sameType, rotateKelImageV, &grey, &colour},
        {"rotateKelImageVH(kelImage_t*, const kelImage_t*)", rotater, sameType, rotateKelImageVH, &grey, &colour},
        {"rotateKelImageH(kelImage_t*, const kelImage_t*)", rotater, "dst->width == src->width && dst->height == src->height",
         rotateKelImageH, &grey, &wide},
        {"rotateKelImageV(kelImage_t*, const kelImage_t*)", rotater, "dst->width == src->width && dst->height == src->height",
         rotateKelImageV, &grey, &tall},
        {"rotateKelImageVH(kelImage_t*, const kelImage_t*)", rotater, "dst->width == src->width && dst->height == src->height",
         rotateKelImageVH, &odd, &oddWide},
        {"rotateKelImageHomography(kelImage_t*, const kelImage_t*, float, float, float, float, float, float, float, float, "
         "float)",
         rotater, sameType,
         [](kelImage_t* d, const kelImage_t* s) { rotateKelImageHomography(d, s, 1, 0, 0, 0, 1, 0, 0, 0, 1); }, &grey, &colour},
    };
    for (const auto& c : cases)
        EXPECT_STOPS(c.call(c.dst->get(), c.src->get()), c.text, c.file, std::string("void ") + c.name);
    Image half(10, 6, 0);
    EXPECT_STOPS(resizeKelImageHalf(half.get(), grey.get()), "dst->height == src->height / 2", resizer,
                 "void resizeKelImageHalf(kelImage_t*, const kelImage_t*)");
    // An empty destination divides by zero, whether the ratio is needed or not; in the bilinear form before the check.
    Image none(0, 4, 8), narrow(0, 4, 0), flat(20, 0, 0);
    EXPECT_DIVISION_BY_ZERO(resizeKelImageBilinear(none.get(), grey.get()));
    for (const Image* empty : {&narrow, &flat})
        for (auto resize : {resizeKelImageNearest, resizeKelImageBilinear})
            EXPECT_DIVISION_BY_ZERO(resize(empty->get(), grey.get()));
    Image four(8, 4, 16), fourNarrow(0, 4, 16), fourFlat(8, 0, 16);
    for (const Image* empty : {&fourNarrow, &fourFlat}) {
        EXPECT_DIVISION_BY_ZERO(resizeLinerInterpolation(empty->get(), four.get()));
        EXPECT_DIVISION_BY_ZERO(zero_order_hold_plus_ave(empty->get(), four.get()));
        EXPECT_DIVISION_BY_ZERO(zero_order_hold_plus_ave(four.get(), empty->get()));
    }
}
