// Under valgrind's memcheck: images come with indeterminate padding and destinations, only their source pixels are set. No
// operation decides anything by an indeterminate byte, and what it is documented to write comes out determined.
#include <functional>
#include <gtest/gtest.h>
#include <kel/kelImage.hpp>

#include "Random.h"
#include "Valgrind.h"

namespace {

using kel::Image;

constexpr int kHeight = 50;

// Nothing but the pixels is determined.
Image source(int type, int width) {
    Image image(width, kHeight, type);
    std::mt19937 random = kel_test::generator(90);
    const int bytes = image->channels * image->depth;
    for (int y = 0; y < kHeight; ++y)
        for (int i = 0; i < width * bytes; ++i)
            image->data[y * image->step * bytes + i] = static_cast<unsigned char>(random());
    return image;
}
Image scratch(int type, int width, int height = kHeight) {
    return Image(width, height, type);
}

// Columns left .. width - right - 1 of rows top .. height - bottom - 1.
struct Region {
    int left, right, top, bottom;
};

void expectDetermined(const Image& image, Region region, const char* what) {
    const int bytes = image->channels * image->depth;
    for (int y = region.top; y < image->height - region.bottom; ++y)
        ASSERT_EQ(VALGRIND_CHECK_MEM_IS_DEFINED(image->data + (y * image->step + region.left) * bytes,
                                                (image->width - region.left - region.right) * bytes),
                  0u)
            << what << ", row " << y;
}

} // namespace

TEST(Indeterminate, BytesDecideNothingAndGoNowhere) {
    if (!RUNNING_ON_VALGRIND)
        GTEST_SKIP() << "valgrind has something to say here";
    using Call = std::function<void(kelImage_t*, const kelImage_t*)>;
    Image bytes = scratch(0, 61), words = scratch(3, 61);
    const struct {
        const char* name;
        int from, to, width;
        Region region;
        Call call;
    } cases[] = {
        {"S16G to U8XYZA", 3, 16, 61, {}, convertKelImage},
        {"S16G to U8G", 3, 0, 61, {}, convertKelImage},
        {"U8XYZ to U8G", 8, 0, 61, {}, convertKelImage},
        {"U8XYZ to S16G", 8, 3, 61, {}, convertKelImage},
        {"U8XYZ to U8ZYX", 8, 24, 61, {}, convertKelImage},
        {"U8XYZ to U8XYZA", 8, 16, 61, {}, convertKelImage},
        {"U8XYZA to U8ZYX", 16, 24, 61, {}, convertKelImage},
        {"U8XYZA to U8ZYXA", 16, 32, 61, {}, convertKelImage},
        {"U8YUV to U8RGB", 40, 24, 62, {}, convertKelImage},
        {"U8YUV to U8RGBA", 40, 32, 64, {}, convertKelImage},
        {"U8YUV to U8G", 40, 0, 61, {}, convertKelImage},
        {"U8G to U8XYZ", 0, 8, 61, {}, convertKelImage},
        {"U8G to U8XYZA", 0, 16, 61, {}, convertKelImage},
        {"U8G to S16G", 0, 3, 61, {}, convertKelImage},
        {"contrast", 0, 0, 64, {}, adjustKelImage}, // reads padding where there is some
        {"threshold", 0, 0, 61, {}, [](kelImage_t* d, const kelImage_t* s) { binalizeKelImage(d, s, 99); }},
        {"adaptive threshold",
         0,
         0,
         61,
         {16, 16, 16, 16},
         [&](kelImage_t* d, const kelImage_t* s) { binalizeKelImageAdaptive(d, s, bytes.get()); }},
        {"Gaussian 5x5",
         0,
         0,
         61,
         {},
         [&](kelImage_t* d, const kelImage_t* s) { applyKelFilterGaussian5X5(d, const_cast<kelImage_t*>(s), words.get()); }},
        {"Gaussian 7x7",
         0,
         0,
         61,
         {8, 8, 3, 3},
         [&](kelImage_t* d, const kelImage_t* s) { applyKelFilterGaussian7X7(d, const_cast<kelImage_t*>(s), bytes.get()); }},
        {"cross",
         0,
         3,
         61,
         {8, 5, 5, 5},
         [](kelImage_t* d, const kelImage_t* s) { applyKelFilterLaplacian3X3(d, const_cast<kelImage_t*>(s)); }},
        {"Sobel",
         0,
         3,
         61,
         {16, 16, 1, 1},
         [](kelImage_t* d, const kelImage_t* s) { applyKelFilterSobel3X3(d, const_cast<kelImage_t*>(s)); }},
        {"rank",
         0,
         0,
         61,
         {},
         [](kelImage_t* d, const kelImage_t* s) { applyKelFilterMedianNXN(d, const_cast<kelImage_t*>(s), 2); }},
        {"noise",
         0,
         0,
         61,
         {},
         [](kelImage_t* d, const kelImage_t* s) { applyKelFilterNoise(d, const_cast<kelImage_t*>(s), 9); }},
        {"mirror", 8, 8, 61, {}, rotateKelImageH},
        {"half turn", 0, 0, 61, {}, rotateKelImageVH},
        {"warp",
         0,
         0,
         61,
         {},
         [](kelImage_t* d, const kelImage_t* s) { rotateKelImageHomography(d, s, 1, 0.2f, 3, -0.2f, 1, 5, 0, 0.001f, 1); }},
        {"crop", 16, 16, 61, {}, [](kelImage_t* d, const kelImage_t* s) { resizeKelImageDeborder(d, s, 0); }},
        {"border", 0, 0, 61, {}, [](kelImage_t* d, const kelImage_t* s) { resizeKelImageEnborder(d, s, 0); }},
        {"load and store",
         24,
         24,
         61,
         {},
         [](kelImage_t* d, const kelImage_t* s) { loadKelImageData(d, s->data, s->width, s->height, s->step); }},
    };
    for (const auto& c : cases) {
        Image src = source(c.from, c.width), dst = scratch(c.to, c.width);
        c.call(dst.get(), src.get());
        expectDetermined(dst, c.region, c.name);
    }
    Image src = source(0, 64), half = scratch(0, 32, kHeight / 2);
    for (auto resize : {resizeKelImageNearest, resizeKelImageBilinear, resizeKelImageHalf}) {
        VALGRIND_MAKE_MEM_UNDEFINED(half->data, half->size);
        resize(half.get(), src.get());
        expectDetermined(half, {}, "resizing");
    }
}

TEST(Indeterminate, PaddingHasNoPartInKeypoints) {
    if (!RUNNING_ON_VALGRIND)
        GTEST_SKIP() << "valgrind has something to say here";
    for (int width : {60, 61, 70}) {
        Image grey = source(0, width), response = source(3, width);
        kelKeypoint2DF32_t keypoints[500];
        const int count = applyKelDetectorKeypointYape(keypoints, 500, grey.get(), response.get());
        EXPECT_GT(count, 0);
        EXPECT_EQ(VALGRIND_CHECK_MEM_IS_DEFINED(keypoints, static_cast<size_t>(count) * sizeof keypoints[0]), 0u);
    }
}
