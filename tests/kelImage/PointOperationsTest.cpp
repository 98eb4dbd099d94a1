// Contrast stretching and binarization, byte for byte beside plain references, in guarded images.
#include <cfenv>
#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <vector>

#include "GuardedImage.h"
#include "PointReference.h"
#include "Stops.h"
#include "Sweep.h"

using kel_test::Bytes;
using kel_test::Guard;
using kel_test::Image;
using kel_test::kRoundingModes;

namespace {

// Bytes that reference() leaves in an image, which itself stays as it is.
template <class Reference> Bytes expectedOf(const Image& image, Reference reference) {
    const Bytes before = image.bytes();
    reference();
    const Bytes expected = image.bytes();
    image.set(before);
    return expected;
}

} // namespace

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

namespace {

void expectAdaptive(void (*binalize)(kelImage_t*, const kelImage_t*, kelImage_t*), const Image& dst, const Image& src,
                    const Image& tmp) {
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
    expectAdaptive(binalizeKelImageAdaptive, dst, src, dst);                           // the destination as scratch
    binalizeKelImageAdaptive(Image(64, 64, 3).get(), Image(64, 64, 3).get(), nullptr); // not even looked at
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
