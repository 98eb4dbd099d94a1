// Image operations stop on images whose types, sizes or data do not go together, and name the worker that does so.
#include <functional>
#include <string>

#include "GuardedImage.h"
#include "Stops.h"

namespace {

using kel_test::Image;

constexpr int kGrey = KEL_PIXEL_TYPE_U8G, kWords = KEL_PIXEL_TYPE_S16G, kUnprocessed = KEL_PIXEL_TYPE_F64G;

const char* const kPair = "(kelImage_t*, const kelImage_t*)";
const char* const kPairAndNumber = "(kelImage_t*, const kelImage_t*, kelValue_s32)";
const char* const kPairAndScratch = "(kelImage_t*, const kelImage_t*, kelImage_t*)";
const char* const kPairAndFloats =
    "(kelImage_t*, const kelImage_t*, float, float, float, float, float, float, float, float, float)";
const char* const kImages = "(kelImage_t*, kelImage_t*)";
const char* const kImagesAndNumber = "(kelImage_t*, kelImage_t*, kelValue_s32)";
const char* const kFourImages = "(kelImage_t*, kelImage_t*, kelImage_t*, kelImage_t*)";

const char* const kType = "dst->type == src->type";
const char* const kTypeOfWords = "dst->type == KEL_PIXEL_TYPE_S16G";
const char* const kSize = "dst->width == src->width && dst->height == src->height";
const char* const kShape = "dst->step == src->step && dst->width == src->width && dst->height == src->height";
const char* const kTypeAndSize = "dst->type == src->type && src->width == dst->width && dst->height == src->height";
const char* const kLarger = "dst->width == src->width +2*size && dst->height == src->height + 2*size";
const char* const kSmaller = "dst->width == src->width - 2*size && dst->height == src->height - 2*size";

std::string sourceOf(const char* file) {
    return std::string("kelImage/src/kelImage_") + file + ".cpp";
}
std::string signatureOf(const char* worker, const char* arguments) {
    return std::string("void ") + worker + arguments;
}

} // namespace

TEST(Stops, OnOtherTypesAndSizes) {
    const Image words(40, 20, kWords), grey(40, 20, kGrey);
    const struct {
        const char *worker, *arguments, *file;
        std::function<void(kelImage_t*, kelImage_t*)> call;
        const char *types, *sizes; // what it demands of them; null for nothing
        int to = kGrey;
    } operations[] = {
        {"convertKelImage", kPair, "Converter_c_legacy", convertKelImage, nullptr, kSize},
        {"adjustKelImage", kPair, "Adjuster_c_leagcy", adjustKelImage, kType, kSize},
        {"binalizeKelImage", kPairAndNumber, "Binalizer_c_legacy", [](auto* d, auto* s) { binalizeKelImage(d, s, 1); }, kType,
         kSize},
        {"binalizeKelImageAdaptive", kPairAndScratch, "Binalizer_c_legacy",
         [](auto* d, auto* s) { binalizeKelImageAdaptive(d, s, nullptr); }, kType, kSize},
        {"applyKelFilterGaussian5X5_downsampling", kFourImages, "Gaussian_c_legacy",
         [&](auto* d, auto* s) { applyKelFilterGaussian5X5(d, s, words.get()); }, kTypeAndSize, kTypeAndSize},
        {"applyKelFilterGaussianSSE7X7_downsampling", kFourImages, "Gaussian_c_sse_legacy",
         [&](auto* d, auto* s) { applyKelFilterGaussian7X7(d, s, grey.get()); }, kTypeAndSize, kTypeAndSize},
        {"applyKelFilterLaplacianSSE3X3", kImages, "Laplacian_c_sse_legacy", applyKelFilterLaplacian3X3, kTypeOfWords, kShape,
         kWords},
        {"applyKelFilterSobelSSE3X3", kImages, "Sobel_c_sse_legacy", applyKelFilterSobel3X3, kTypeOfWords, kShape, kWords},
        {"applyKelFilterMedianNXN", kImagesAndNumber, "Median_c_legacy",
         [](auto* d, auto* s) { applyKelFilterMedianNXN(d, s, 1); }, nullptr, kShape},
        {"applyKelFilterNoise", kImagesAndNumber, "Noise_c_legacy", [](auto* d, auto* s) { applyKelFilterNoise(d, s, 1); },
         kType, kShape},
        {"resizeKelImage", kPair, "Resizer_c_legacy", resizeKelImage, kType, nullptr},
        {"resizeKelImageNearest", kPair, "Resizer_c_legacy", resizeKelImageNearest, kType, nullptr},
        {"resizeKelImageBilinear", kPair, "Resizer_c_legacy", resizeKelImageBilinear, kType, nullptr},
        {"resizeKelImageHalf", kPair, "Resizer_c_legacy", resizeKelImageHalf, kType, "dst->width == src->width / 2"},
        {"resizeKelImageEnborder", kPairAndNumber, "Resizer_c_legacy",
         [](auto* d, auto* s) { resizeKelImageEnborder(d, s, 0); }, kType, kLarger},
        {"resizeKelImageDeborder", kPairAndNumber, "Resizer_c_legacy",
         [](auto* d, auto* s) { resizeKelImageDeborder(d, s, 0); }, kType, kSmaller},
        {"rotateKelImageH", kPair, "Rotater_c_legacy", rotateKelImageH, kType, kSize},
        {"rotateKelImageV", kPair, "Rotater_c_legacy", rotateKelImageV, kType, kSize},
        {"rotateKelImageVH", kPair, "Rotater_c_legacy", rotateKelImageVH, kType, kSize},
        {"rotateKelImageHomography", kPairAndFloats, "Rotater_c_legacy",
         [](auto* d, auto* s) { rotateKelImageHomography(d, s, 1, 0, 0, 0, 1, 0, 0, 0, 1); }, kType, nullptr},
    };
    for (const auto& o : operations) {
        const std::string file = sourceOf(o.file), signature = signatureOf(o.worker, o.arguments);
        const Image other(40, 20, o.to == kGrey ? kWords : kGrey);
        if (o.types) {
            EXPECT_STOPS(o.call(other.get(), grey.get()), o.types, file, signature);
        }
        for (const int type : {kGrey, kUnprocessed}) {
            const int to = type == kGrey ? o.to : type;
            const Image src(40, 20, type), wide(41, 20, to), high(40, 21, to);
            for (const Image* dst : {&wide, &high})
                if (o.sizes) {
                    EXPECT_STOPS(o.call(dst->get(), src.get()), o.sizes, file, signature);
                }
        }
    }
    const Image half(20, 11, kGrey);
    EXPECT_STOPS(resizeKelImageHalf(half.get(), grey.get()), "dst->height == src->height / 2", sourceOf("Resizer_c_legacy"),
                 signatureOf("resizeKelImageHalf", kPair));
}

TEST(Stops, SmoothingWithoutDataOrScratchOfItsType) {
    const Image grey(40, 20, kGrey), words(40, 20, kWords);
    kelImage_t *const u8 = grey.get(), *const s16 = words.get();
    kelImage_t empty = *u8;
    empty.data = nullptr;
    const struct {
        const char *worker, *file;
        void (*smooth)(kelImage_t*, kelImage_t*, kelImage_t*);
        kelImage_t *tmp, *other;
        const char* type;
    } filters[] = {
        {"applyKelFilterGaussian5X5_downsampling", "Gaussian_c_legacy", applyKelFilterGaussian5X5, s16, u8,
         "tmp->type == KEL_PIXEL_TYPE_S16G"},
        {"applyKelFilterGaussianSSE7X7_downsampling", "Gaussian_c_sse_legacy", applyKelFilterGaussian7X7, u8, s16,
         "tmp->type == KEL_PIXEL_TYPE_U8G"},
    };
    const char* const data = "src->data != __null && dst->data != __null && tmp->data != __null";
    for (const auto& f : filters) {
        const std::string file = sourceOf(f.file), signature = signatureOf(f.worker, kFourImages);
        EXPECT_STOPS(f.smooth(&empty, u8, f.tmp), data, file, signature);
        EXPECT_STOPS(f.smooth(u8, &empty, f.tmp), data, file, signature);
        EXPECT_STOPS(f.smooth(u8, u8, &empty), data, file, signature);
        EXPECT_STOPS(f.smooth(u8, u8, f.other), f.type, file, signature);
    }
}
