// Resizing, borders, flips and warp where the sweep over the list does not go.
#include <cfenv>
#include <cmath>
#include <limits>

#include "ImageScene.h"
#include "Stops.h"

using namespace kel_test;

// Beyond the sizes where single precision is exact.
TEST(Resizing, RoundsThePositionsOfHugeImages) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    const auto resize = [](const char* name, Size dst, Size src) {
        Setting setting = {src};
        setting.dst = dst;
        EXPECT_TRUE(agrees(imageOperation(name), setting));
    };
    for (const char* name : {"resizeKelImageNearest 0", "resizeKelImageBilinear 0"}) {
        resize(name, {4200000, 1}, {12600001, 1});
        resize(name, {6000000, 1}, {18000001, 1});
    }
    resize("resizeKelImageBilinear 0", {1400001, 1}, {4200004, 3});
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
    const auto average = [](Size dst, Size src, Fill fill) {
        Setting setting = {src};
        setting.dst = dst;
        setting.fill = fill;
        EXPECT_TRUE(agrees(imageOperation("zero_order_hold_plus_ave 16"), setting));
    };
    for (Fill fill : {Fill::Random, Fill::Max}) {
        for (int from : {3, 17, 33, 64, 97})
            for (int to : {1, 2, 5, 16, 17, 33, 64})
                for (int toRows : {1, 3, 20}) // more rows, too
                    if (to <= from)
                        average({to, toRows}, {from, 6}, fill);
        // Boxes too large for the reciprocal.
        average({1, 1}, {4099, 2}, fill);
        average({3, 1}, {4106, 1}, fill);
        average({1, 2}, {2, 9001}, fill);
    }
}

// Fixed-point reciprocals fail for a few sums only.
TEST(ZeroOrderHold, AveragesBoxesOfEverySum) {
    for (int box : {2, 3, 15, 16, 17, 18, 33}) {
        const Image src(256 * box, box, 16), dst(256, box, 16), expected(256, box, 16);
        for (int y = 0; y < box; ++y)
            for (int i = 0; i < 4 * 256 * box; ++i)
                src.at(0, y, i) = static_cast<uint8_t>(std::min(255, i / 4 / box + (i / 4 % box < y)));
        kel_ref::zeroOrderHoldPlusAverage(expected.get(), src.get());
        zero_order_hold_plus_ave(dst.get(), src.get());
        EXPECT_TRUE(holds(dst, expected.bytes())) << box;
    }
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
    for (int type : {0, 3, 8, 16}) {
        ImageOperation warp = imageOperation("rotateKelImageHomography " + std::to_string(type));
        for (const auto& h : homographies) {
            warp.call = [&](const Operands& o) { warpBy(o.dst, o.src, h.data()); };
            warp.reference = [&](const Operands& o) { kel_ref::warp(o.dst, o.src, h.data()); };
            for (int width : {1, 3, 4, 7, 16, 19, 37})
                for (Guard guard : {Guard::Behind, Guard::Before}) {
                    Setting setting = {{40 - width, 17}, 0, guard};
                    setting.dst = {width, 9};
                    EXPECT_TRUE(agrees(warp, setting)) << &h - homographies.data();
                }
        }
    }
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

// Whether the ratio is needed or not; in the bilinear form before the check of types.
TEST(Transforms, DivideByZeroForEmptyDestinations) {
    Image grey(20, 10, 0), none(0, 4, 8), narrow(0, 4, 0), flat(20, 0, 0);
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
