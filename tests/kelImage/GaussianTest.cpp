// Gaussian 5x5 and 7x7: every byte of destination, half and scratch image beside the plain passes.
#include <gtest/gtest.h>

#include "FilterReference.h"
#include "GuardedImage.h"
#include "Stops.h"

using kel_test::Bytes;
using kel_test::Fill;
using kel_test::Guard;
using kel_test::Image;

namespace {

using Smooth = void (*)(kelImage_t*, kelImage_t*, kelImage_t*, kelImage_t*);

struct Filter {
    const char* name;
    Smooth smooth, reference;
    int tmpType;
};
const Filter kFilters[] = {
    {"5x5", applyKelFilterGaussian5X5_downsampling, kel_ref::gaussian5x5, KEL_PIXEL_TYPE_S16G},
    {"7x7", applyKelFilterGaussianSSE7X7_downsampling, kel_ref::gaussian7x7, KEL_PIXEL_TYPE_U8G},
};

enum class Half { None, Tight, Padded };

// Where an image and its scratch image lie, and what else is asked of a call.
struct Setting {
    int width, height;
    Guard guard = Guard::Behind;
    Fill fill = Fill::Random;
    Half half = Half::None;
    bool inPlace = false;
    int tmpWidth = 0, tmpHeight = 0; // more than the source's
    size_t sourceExtra = 0;          // bytes that a larger scratch image makes the filter read
};

// Both filters on images of one setting, and what the plain passes leave in images of the same contents.
class Scene {
public:
    Scene(const Setting& s, int tmpType)
        : m_inPlace(s.inPlace), m_src(s.width, s.height, KEL_PIXEL_TYPE_U8G, s.guard, s.sourceExtra),
          m_dst(s.width, s.height, KEL_PIXEL_TYPE_U8G, s.guard),
          m_half((s.width + 1) / 2 + (s.half == Half::Padded ? 16 : 0), (s.height + 1) / 2, KEL_PIXEL_TYPE_U8G, s.guard),
          m_tmp(s.width + s.tmpWidth, s.height + s.tmpHeight, tmpType, s.guard), m_withHalf(s.half != Half::None) {
        m_src.fill(s.fill, 5);
    }
    void apply(Smooth smooth) const {
        smooth(m_inPlace ? m_src.get() : m_dst.get(), m_withHalf ? m_half.get() : nullptr, m_src.get(), m_tmp.get());
    }
    testing::AssertionResult equals(const Scene& other) const {
        for (const Image Scene::*image : {&Scene::m_src, &Scene::m_dst, &Scene::m_half, &Scene::m_tmp}) {
            testing::AssertionResult result = holds(this->*image, (other.*image).bytes());
            if (!result)
                return result << (image == &Scene::m_tmp    ? " (scratch)"
                                  : image == &Scene::m_half ? " (half)"
                                                            : "")
                              << (m_inPlace ? " in place" : "");
        }
        return testing::AssertionSuccess();
    }

private:
    bool m_inPlace;
    Image m_src, m_dst, m_half, m_tmp;
    bool m_withHalf;
};

bool check(const Setting& setting) {
    for (const Filter& filter : kFilters) {
        const Scene actual(setting, filter.tmpType), expected(setting, filter.tmpType);
        actual.apply(filter.smooth);
        expected.apply(filter.reference);
        const testing::AssertionResult same = actual.equals(expected);
        EXPECT_TRUE(same) << filter.name << ", fill " << static_cast<int>(setting.fill);
        if (!same)
            return false;
    }
    return true;
}

} // namespace

// 7x7 goes by the scratch image's extent and reads the source's memory as far as that makes it.
TEST(Gaussian, TakesALargerScratchImage) {
    for (int width : {10, 16, 17, 24, 25, 32, 40})
        for (int height : {3, 6, 7, 12})
            for (int wider : {0, 1, 7, 8, 16, 23})
                for (int higher : {0, 1, 5})
                    for (bool inPlace : {false, true}) {
                        Setting setting{width, height, Guard::Behind, Fill::Random, Half::Padded, inPlace, wider, higher};
                        setting.sourceExtra = 6 * 64 + 64;
                        ASSERT_TRUE(check(setting));
                    }
}

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
