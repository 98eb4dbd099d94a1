// Contrast stretching and binarization, byte for byte beside plain references, in guarded images.
#include <cfenv>
#include <climits>
#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <vector>

#include "GuardedImage.h"
#include "PointReference.h"
#include "Stops.h"
#include "Sweep.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Guard;
using kel_test::Image;
using kel_test::kRoundingModes;
using kel_test::widths;

namespace {

// Bytes that reference() leaves in an image, which itself stays as it is.
template <class Reference> Bytes expectedOf(const Image& image, Reference reference) {
    const Bytes before = image.bytes();
    reference();
    const Bytes expected = image.bytes();
    image.set(before);
    return expected;
}

using Operation = void (*)(kelImage_t*, const kelImage_t*);
const Operation kAdjust[] = {adjustKelImage, adjustKelImage_U8G, adjustKelImageSSE_U8G};

using Threshold = void (*)(kelImage_t*, const kelImage_t*, kelValue_s32);
const Threshold kBinalize[] = {binalizeKelImage, binalizeKelImage_U8G, binalizeKelImageSSE_U8G};

using Adaptive = void (*)(kelImage_t*, const kelImage_t*, kelImage_t*);
const Adaptive kAdaptive[] = {binalizeKelImageAdaptive, binalizeKelImageAdaptive_U8G, binalizeKelImageAdaptiveSSE_U8G};

void expectAdjusted(Operation adjust, const Image& dst, const Image& src) {
    const Bytes source = src.bytes(), expected = expectedOf(dst, [&] { kel_ref::adjust(dst.get(), src.get()); });
    adjust(dst.get(), src.get());
    EXPECT_TRUE(holds(dst, expected));
    if (src.data() != dst.data()) {
        EXPECT_TRUE(holds(src, source));
    }
}

} // namespace

TEST(Contrast, AgreesWithItsReferenceAtEverySizeAndFill) {
    for (Operation adjust : kAdjust)
        for (int width : widths())
            for (int height : {0, 1, 4})
                for (Guard guard : {Guard::Behind, Guard::Before}) {
                    const Image src(width, height, 0, guard), dst(width, height, 0, guard);
                    src.fill(kel_test::kFills[(width + 3 + height) % 7], 5);
                    expectAdjusted(adjust, dst, src);
                    expectAdjusted(adjust, src, src); // in place
                }
    const Image larger(70, 9, 0, Guard::Behind, 5), dst(20, 4, 0, Guard::Behind, 3); // at odd addresses, too
    expectAdjusted(adjustKelImageSSE_U8G, dst, larger);
}

// Every extent of values, at both ends and in the middle, under every rounding mode.
TEST(Contrast, StretchesEveryRange) {
    const Image src(16, 16, 0), dst(16, 16, 0);
    for (const auto& mode : kRoundingModes)
        for (int extent = 0; extent < 256; ++extent)
            for (int least : {0, (255 - extent) / 2, 255 - extent}) {
                for (int i = 0; i < 256; ++i)
                    src.data()[i] = static_cast<uint8_t>(least + i % (extent + 1));
                std::fesetround(mode.mode);
                const Bytes expected = expectedOf(dst, [&] { kel_ref::adjust(dst.get(), src.get()); });
                adjustKelImage(dst.get(), src.get());
                std::fesetround(FE_TONEAREST);
                ASSERT_TRUE(holds(dst, expected)) << least << " to " << least + extent << ", rounding " << mode.name;
            }
}

// Values worked out by hand; `pad` fills what `pixels` leave of a row of 16.
TEST(Contrast, GivesKnownValues) {
    const auto adjusted = [](const Bytes& pixels, uint8_t pad) {
        const Image src(static_cast<int>(pixels.size()), 1, 0), dst(static_cast<int>(pixels.size()), 1, 0);
        src.set(Bytes(16, pad));
        src.set(pixels);
        adjustKelImage(dst.get(), src.get());
        return Bytes(dst.data(), dst.data() + pixels.size() + 1);
    };
    EXPECT_EQ(adjusted({50, 75, 100, 125, 150}, 50), (Bytes{0, 64, 128, 191, 255, 0}));
    EXPECT_EQ(adjusted({0, 1, 2}, 1), (Bytes{0, 128, 255, 128})) << "127.5 to even";
    EXPECT_EQ(adjusted({100, 100, 100}, 100), (Bytes{0, 0, 0, 0}));
    EXPECT_EQ(adjusted({100, 200}, 0), (Bytes{128, 255, 0})) << "the padding takes part";
}

TEST(Threshold, AgreesWithItsReferenceAtEverySizeAndThreshold) {
    const auto expectBinary = [](Threshold binalize, const Image& dst, const Image& src, int threshold) {
        const Bytes expected = expectedOf(dst, [&] { kel_ref::binalize(dst.get(), src.get(), threshold); });
        binalize(dst.get(), src.get(), threshold);
        EXPECT_TRUE(holds(dst, expected)) << "threshold " << threshold;
    };
    for (Threshold binalize : kBinalize)
        for (int width : widths())
            for (Guard guard : {Guard::Behind, Guard::Before}) {
                const Image src(width, 3, 0, guard), dst(width, 3, 0, guard);
                expectBinary(binalize, dst, src, 100);
                expectBinary(binalize, src, src, 100); // in place
            }
    const Image all(256, 1, 0), dst(256, 1, 0);
    const Image larger(70, 9, 0, Guard::Behind, 5), smaller(20, 4, 0, Guard::Behind, 3); // at odd addresses, too
    for (int i = 0; i < 256; ++i)
        all.data()[i] = static_cast<uint8_t>(i);
    for (int threshold = -300; threshold < 600; ++threshold)
        expectBinary(binalizeKelImage, dst, all, threshold);
    expectBinary(binalizeKelImage, dst, all, INT_MIN);
    expectBinary(binalizeKelImage, dst, all, INT_MAX);
    expectBinary(binalizeKelImageSSE_U8G, smaller, larger, 77);
}

namespace {

void expectAdaptive(Adaptive binalize, const Image& dst, const Image& src, const Image& tmp) {
    const Bytes target = dst.bytes(), scratch = tmp.bytes();
    kel_ref::binalizeAdaptive(dst.get(), src.get(), tmp.get());
    const Bytes expected = dst.bytes(), expectedScratch = tmp.bytes();
    dst.set(target);
    tmp.set(scratch);
    binalize(dst.get(), src.get(), tmp.get());
    EXPECT_TRUE(holds(dst, expected));
    EXPECT_TRUE(holds(tmp, expectedScratch));
}

} // namespace

TEST(AdaptiveThreshold, AgreesWithItsReferenceAtEverySize) {
    for (int width = 0; width <= 130; ++width)
        for (int height : {0, 1, 32, 33, 34, 50}) {
            const Guard guard = (width + height) % 2 ? Guard::Behind : Guard::Before;
            const Image src(width, height, 0, guard), dst(width, height, 0, guard), tmp(width, height, 0, guard);
            src.fill(kel_test::kFills[(width + height) % 7], 5);
            expectAdaptive(kAdaptive[width % 3], dst, src, tmp);
            src.fill(Fill::Random, 6);
            expectAdaptive(kAdaptive[height % 3], dst, src, tmp);
            expectAdaptive(binalizeKelImageAdaptive, src, src, tmp); // in place
            src.fill(Fill::Random, 7);
            expectAdaptive(binalizeKelImageAdaptive, dst, src, dst); // the destination as scratch
        }
}

TEST(AdaptiveThreshold, TakesScratchOfAnySize) {
    const Image src(80, 60, 0, Guard::Behind, 5), dst(80, 60, 0, Guard::Behind, 3); // at odd addresses, too
    for (int width : {20, 32, 33, 40, 65, 79, 80})
        for (int height : {20, 60})
            if (width > 64 || height == 60) {
                const Image tmp(width, height, 0, Guard::Behind, 8192); // the vertical pass reads on behind a low scratch
                expectAdaptive(binalizeKelImageAdaptive, dst, src, tmp);
            }
    const Image low(80, 20, 0), wide(100, 60, 0, Guard::Behind, 64), other(100, 60, 0);
    expectAdaptive(binalizeKelImageAdaptive, low, Image(80, 20, 0), Image(80, 20, 0)); // tmp is filled all the same
    expectAdaptive(binalizeKelImageAdaptiveSSE_U8G, Image(40, 60, 0), other, wide);
}

TEST(AdaptiveThreshold, WritesTheMiddleOnlyAndCallsEqualityWhite) {
    const Image src(64, 64, 0), dst(64, 64, 0), tmp(64, 64, 0);
    for (int grey : {0, 1, 100, 255}) {
        src.set(Bytes(64 * 64, static_cast<uint8_t>(grey)));
        dst.set(Bytes(64 * 64, 9));
        binalizeKelImageAdaptive(dst.get(), src.get(), tmp.get());
        for (int y = 0; y < 64; ++y)
            for (int x = 0; x < 64; ++x)
                ASSERT_EQ(dst.at(x, y), x >= 16 && x < 48 && y >= 16 && y < 48 ? 255 : 9) << x << ", " << y;
    }
}

TEST(PointOperations, IgnoreOtherTypes) {
    for (int type : {1, 3, 8, 16, 24, 32, 40, 47, 99}) {
        const Image src(64, 64, type), dst(64, 64, type);
        const Bytes before = dst.bytes();
        adjustKelImage(dst.get(), src.get());
        binalizeKelImage(dst.get(), src.get(), 100);
        binalizeKelImageAdaptive(dst.get(), src.get(), nullptr);
        EXPECT_TRUE(holds(dst, before)) << "type " << type;
    }
}

TEST(PointOperations, StopOnDifferentTypesOrSizes) {
    const Image src(20, 3, 0), wider(21, 3, 0), lower(20, 2, 0), signedGrey(20, 3, 3);
    struct Call {
        std::string file, signature;
        void (*call)(kelImage_t*, const kelImage_t*);
    };
    const Call calls[] = {
        {"kelImage/src/kelImage_Adjuster_c_leagcy.cpp", "void adjustKelImage(kelImage_t*, const kelImage_t*)", adjustKelImage},
        {"kelImage/src/kelImage_Binalizer_c_legacy.cpp", "void binalizeKelImage(kelImage_t*, const kelImage_t*, kelValue_s32)",
         [](kelImage_t* dst, const kelImage_t* src) { binalizeKelImage(dst, src, 1); }},
        {"kelImage/src/kelImage_Binalizer_c_legacy.cpp",
         "void binalizeKelImageAdaptive(kelImage_t*, const kelImage_t*, kelImage_t*)",
         [](kelImage_t* dst, const kelImage_t* src) { binalizeKelImageAdaptive(dst, src, nullptr); }},
    };
    for (const Call& c : calls) {
        const std::string sizes = "dst->width == src->width && dst->height == src->height";
        EXPECT_STOPS(c.call(signedGrey.get(), src.get()), "dst->type == src->type", c.file, c.signature);
        EXPECT_STOPS(c.call(wider.get(), src.get()), sizes, c.file, c.signature);
        EXPECT_STOPS(c.call(lower.get(), src.get()), sizes, c.file, c.signature);
    }
}
