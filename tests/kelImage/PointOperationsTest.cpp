// Contrast stretching and binarization where the sweep over the list does not go.
#include <cfenv>
#include <gtest/gtest.h>

#include "ImageScene.h"
#include "Sweep.h"

using namespace kel_test;

// Every extent of values, at both ends and in the middle, under every rounding mode.
TEST(Contrast, StretchesEveryRange) {
    const Image src(16, 16, 0), dst(16, 16, 0), expected(16, 16, 0);
    for (const auto& mode : kRoundingModes)
        for (int extent = 0; extent < 256; ++extent)
            for (int least : {0, (255 - extent) / 2, 255 - extent}) {
                for (int i = 0; i < 256; ++i)
                    src.data()[i] = static_cast<uint8_t>(least + i % (extent + 1));
                std::fesetround(mode.mode);
                kel_ref::adjust(expected.get(), src.get());
                adjustKelImage(dst.get(), src.get());
                std::fesetround(FE_TONEAREST);
                ASSERT_TRUE(holds(dst, expected.bytes())) << least << " to " << least + extent << ", rounding " << mode.name;
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

// The vertical pass reads on behind a low one.
TEST(AdaptiveThreshold, TakesScratchOfAnySize) {
    for (int width : {20, 32, 33, 40, 65, 79, 80})
        for (int height : {20, 60})
            if (width > 64 || height == 60) {
                Setting setting = {{80, 60}};
                setting.spare = 5; // at odd addresses, too
                setting.scratch = {width - 80, height - 60};
                setting.behindScratch = 8192;
                EXPECT_TRUE(agrees(imageOperation("binalizeKelImageAdaptive"), setting));
            }
    const Image src(80, 60, 0), dst(80, 60, 0), expected(80, 60, 0); // the destination as scratch
    kel_ref::binalizeAdaptive(expected.get(), src.get(), expected.get());
    binalizeKelImageAdaptive(dst.get(), src.get(), dst.get());
    EXPECT_TRUE(holds(dst, expected.bytes()));
    binalizeKelImageAdaptive(Image(64, 64, 3).get(), Image(64, 64, 3).get(), nullptr); // not even looked at
}
