// The list of image operations.
#include "ImageOperations.h"

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <iterator>
#include <type_traits>

#include "ConverterReference.h"
#include "FilterReference.h"
#include "PointReference.h"
#include "TransformReference.h"

namespace kel_test {

namespace {

using List = std::vector<ImageOperation>;
using Pair = void (*)(kelImage_t*, const kelImage_t*);

constexpr int kGrey = KEL_PIXEL_TYPE_U8G, kWords = KEL_PIXEL_TYPE_S16G;
constexpr int kProcessed[] = {0, 3, 8, 16, 24, 32, 40};
const std::vector<int> kAllHeights = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 16, 17, 41};

// A function of images, and a number where it takes one, as a call of operands.
template <class Function> ImageCall callOf(Function function) {
    return [=](const Operands& o) {
        if constexpr (std::is_invocable_v<Function, Operands>)
            function(o);
        else if constexpr (std::is_invocable_v<Function, kelImage_t*, kelImage_t*>)
            function(o.dst, o.src);
        else if constexpr (std::is_invocable_v<Function, kelImage_t*, kelImage_t*, int>)
            function(o.dst, o.src, o.parameter);
        else if constexpr (std::is_invocable_v<Function, kelImage_t*, kelImage_t*, kelImage_t*>)
            function(o.dst, o.src, o.tmp);
        else
            function(o.dst, o.half, o.src, o.tmp);
    };
}

template <class Call, class Reference>
ImageOperation operation(std::string name, int from, int to, Call call, Reference reference) {
    ImageOperation o = {};
    o.name = std::move(name);
    o.from = from;
    o.to = to;
    o.call = callOf(call);
    o.reference = callOf(reference);
    return o;
}

void addConverters(List& list) {
#define KEL_CONVERTER(prefix, name, from, to)                                                                                  \
    { #prefix "_" #name, prefix##_##name, kel_ref::name, from, to }
#define KEL_PORTABLE(name, from, to) KEL_CONVERTER(convertKelImage, name, from, to)
#define KEL_VECTOR(name, from, to) KEL_CONVERTER(convertKelImageSSE, name, from, to)
    const struct {
        const char* name;
        Pair call, reference;
        int from, to;
    } converters[] = {
        KEL_PORTABLE(S16G_to_U8G, 3, 0),
        KEL_PORTABLE(S16G_to_U8XYZ, 3, 8),
        KEL_PORTABLE(S16G_to_U8XYZA, 3, 16),
        KEL_PORTABLE(U8XYZ_to_U8G, 8, 0),
        KEL_PORTABLE(U8XYZ_to_S16G, 8, 3),
        KEL_PORTABLE(U8XYZ_to_U8ZYX, 8, 24),
        KEL_PORTABLE(U8XYZ_to_U8XYZA, 8, 16),
        KEL_PORTABLE(U8XYZ_to_U8ZYXA, 8, 32),
        KEL_PORTABLE(U8XYZA_to_U8G, 16, 0),
        KEL_PORTABLE(U8XYZA_to_S16G, 16, 3),
        KEL_PORTABLE(U8XYZA_to_U8XYZ, 16, 8),
        KEL_PORTABLE(U8XYZA_to_U8ZYX, 16, 24),
        KEL_PORTABLE(U8XYZA_to_U8ZYXA, 16, 32),
        KEL_PORTABLE(U8YUV_to_U8RGB, 40, 24),
        KEL_PORTABLE(U8YUV_to_U8BGR, 40, 8),
        KEL_PORTABLE(U8YUV_to_U8BGRA, 40, 16),
        KEL_PORTABLE(U8YUV_to_U8RGBA, 40, 32),
        KEL_PORTABLE(U8YUV_to_U8G, 40, 0),
        KEL_PORTABLE(U8G_to_U8XYZA, 0, 16),
        KEL_PORTABLE(U8G_to_U8XYZ, 0, 8),
        KEL_PORTABLE(U8G_to_S16G, 0, 3),
        KEL_VECTOR(U8YUV_to_U8RGBA, 40, 32),
        KEL_VECTOR(U8YUV_to_U8BGRA, 40, 16),
        KEL_VECTOR(U8YUV_to_U8G, 40, 0),
        KEL_VECTOR(U8G_to_U8XYZA, 0, 16),
        KEL_VECTOR(U8G_to_U8XYZ, 0, 8),
        KEL_VECTOR(U8G_to_S16G, 0, 3),
        {"convertKelImageSSE_U8YUV_to_U8BGR", convertKelImageSSE_U8YUV_to_U8BGR, kel_ref::nothing, 40, 8},
        {"convertKelImageSSE_U8YUV_to_U8RGB", convertKelImageSSE_U8YUV_to_U8RGB, kel_ref::nothing, 40, 24},
    };
    const auto misplaced = [](int from, int to) { return (from == 16 || from == 32) && (to == 0 || to == 3); };
    // At odd widths the last V is padding; to four channels rows drift unless they are whole blocks.
    const auto settledWidth = [](int from, int to) { return from != 40 ? 61 : to == 16 || to == 32 ? 64 : 62; };
    for (const auto& c : converters) {
        ImageOperation o = operation(c.name, c.from, c.to, c.call, c.reference);
        const bool usesPadding = c.from == 40 || c.from == 0;
        o.leastWidth = -3;
        o.room = misplaced(c.from, c.to) ? 3 : 1;
        o.rounds = c.from == 40;
        o.checked = false;
        o.withinPixels = o.room == 1 && !usesPadding;
        o.settledWidth = c.reference == kel_ref::nothing ? 0 : settledWidth(c.from, c.to);
        o.inPlace = !usesPadding && c.from - c.to == -16 && c.call != convertKelImage_U8XYZ_to_U8ZYXA;
        list.push_back(o);
    }
    for (int from : kProcessed)
        for (int to : kProcessed) {
            ImageOperation o = operation("convertKelImage " + std::to_string(from) + " to " + std::to_string(to), from, to,
                                         convertKelImage, kel_ref::convert);
            o.leastWidth = from == to ? 0 : -3;
            o.room = misplaced(from, to) ? 3 : 1;
            o.rounds = from == 40;
            o.stride = 23; // the converters have lines of their own
            const bool inert = (to == 40 && from != 40) || (from == 40 && to == 3);
            o.settledWidth = inert ? 0 : settledWidth(from, to);
            list.push_back(o);
        }
}

void addPointOperations(List& list) {
    ImageOperation adjust = operation("adjustKelImage", kGrey, kGrey, adjustKelImage, kel_ref::adjust);
    adjust.inPlace = adjust.rounds = adjust.byType = true;
    adjust.leastWidth = -3;
    adjust.settledWidth = 64;
    ImageOperation binalize = operation("binalizeKelImage", kGrey, kGrey, binalizeKelImage, kel_ref::binalize);
    binalize.inPlace = binalize.byType = true;
    binalize.leastWidth = -3;
    binalize.parameters = {100, 0, 1, 128, 255, 256, -1, INT_MIN, INT_MAX};
    ImageOperation adaptive =
        operation("binalizeKelImageAdaptive", kGrey, kGrey, binalizeKelImageAdaptive, kel_ref::binalizeAdaptive);
    adaptive.tmp = kGrey;
    adaptive.inPlace = adaptive.byType = true;
    adaptive.heights = {0, 1, 32, 33, 34, 50};
    adaptive.settled = {16, 16, 16, 16};
    for (const ImageOperation& o : {adjust, binalize, adaptive})
        list.push_back(o);

    adjust.byType = binalize.byType = adaptive.byType = false;
    const auto addAs = [&](ImageOperation o, const char* name, auto call) {
        o.name = name;
        o.checked = false;
        o.call = callOf(call);
        list.push_back(o);
    };
    addAs(adjust, "adjustKelImage_U8G", adjustKelImage_U8G);
    addAs(adjust, "adjustKelImageSSE_U8G", adjustKelImageSSE_U8G);
    addAs(binalize, "binalizeKelImage_U8G", binalizeKelImage_U8G);
    addAs(binalize, "binalizeKelImageSSE_U8G", binalizeKelImageSSE_U8G);
    addAs(adaptive, "binalizeKelImageAdaptive_U8G", binalizeKelImageAdaptive_U8G);
    addAs(adaptive, "binalizeKelImageAdaptiveSSE_U8G", binalizeKelImageAdaptiveSSE_U8G);
}

void addFilters(List& list) {
    const auto add = [&](const char* name, int to, auto call, auto reference) -> ImageOperation& {
        list.push_back(operation(name, kGrey, to, call, reference));
        list.back().heights = kAllHeights;
        list.back().byType = true;
        return list.back();
    };
    const auto addSmoothing = [&](const char* name, bool half, int tmp, auto call, auto reference) {
        ImageOperation& o = add(name, kGrey, call, reference);
        o.tmp = tmp;
        o.half = half;
        o.inPlace = true;
        if (tmp == kGrey)
            o.settled = {8, 8, 3, 3};
    };
#define KEL_SMOOTHING(name, half, tmp, reference) addSmoothing(#name, half, tmp, name, kel_ref::reference)
    KEL_SMOOTHING(applyKelFilterGaussian5X5, false, kWords, gaussian5x5);
    KEL_SMOOTHING(applyKelFilterGaussian5X5_downsampling, true, kWords, gaussian5x5);
    KEL_SMOOTHING(applyKelFilterGaussian7X7, false, kGrey, gaussian7x7);
    KEL_SMOOTHING(applyKelFilterGaussianSSE7X7, false, kGrey, gaussian7x7);
    KEL_SMOOTHING(applyKelFilterGaussian7X7_downsampling, true, kGrey, gaussian7x7);
    KEL_SMOOTHING(applyKelFilterGaussianSSE7X7_downsampling, true, kGrey, gaussian7x7);

    for (const bool sse : {false, true}) {
        add(sse ? "applyKelFilterLaplacianSSE3X3" : "applyKelFilterLaplacian3X3", kWords,
            sse ? applyKelFilterLaplacianSSE3X3 : applyKelFilterLaplacian3X3, kel_ref::cross)
            .settled = {8, 5, 5, 5};
        ImageOperation& sobel = add(sse ? "applyKelFilterSobelSSE3X3" : "applyKelFilterSobel3X3", kWords,
                                    sse ? applyKelFilterSobelSSE3X3 : applyKelFilterSobel3X3, kel_ref::sobel);
        sobel.settled = {16, 16, 1, 1};
        sobel.rounds = true;
    }
    ImageOperation& rank = add("applyKelFilterMedianNXN", kGrey, applyKelFilterMedianNXN,
                               [](const Operands& o) { kel_ref::rank(o.dst, o.src, std::min(o.parameter, 1 << 20)); });
    rank.parameters = {1, 2, 3, 40, 1 << 30, 0, -1};
    rank.heights = {0, 1, 3, 6, 7, 12};
    add("applyKelFilterMedian3X3", kGrey, applyKelFilterMedian3X3, kel_ref::nothing).settledWidth = 0;
    ImageOperation& noise = add("applyKelFilterNoise", kGrey, applyKelFilterNoise, kel_ref::noise);
    noise.parameters = {10, 0, 1, 255, 100000, -1, -7, INT_MAX, INT_MIN};
    noise.heights = {0, 1, 2, 9};
    noise.inPlace = noise.draws = true;
}

void addTransforms(List& list) {
    const auto add = [&](const char* name, int type, auto call, auto reference) -> ImageOperation& {
        list.push_back(operation(std::string(name) + " " + std::to_string(type), type, type, call, reference));
        list.back().byType = true;
        return list.back();
    };
    for (int type : {0, 3, 8, 16, 24, 32}) {
        add("resizeKelImage", type, resizeKelImage, kel_ref::nothing).settledWidth = 0;
        for (const bool linear : {false, true}) {
            ImageOperation& o =
                add(linear ? "resizeKelImageBilinear" : "resizeKelImageNearest", type,
                    linear ? resizeKelImageBilinear : resizeKelImageNearest, linear ? kel_ref::bilinear : kel_ref::nearest);
            o.rounds = true;
            o.leastWidth = 1; // ratios across: 0, an enlargement, to 7; down: another; the rest of a division stays unused
            o.heights = {1, 3, 8, 9};
            o.parameters = {1, 2, 3, 4, 5, 7, 0};
            o.size = [](Size src, int ratio) {
                const int down = (ratio + src.width) % 4;
                return Size{ratio ? std::max(1, src.width / ratio) : 2 * src.width, down ? std::max(1, src.height / down) : 20};
            };
            o.settledWidth = linear && type != 0 ? 0 : 64;
        }
        ImageOperation& half = add("resizeKelImageHalf", type, resizeKelImageHalf, kel_ref::half);
        half.size = [](Size src, int) { return Size{src.width / 2, src.height / 2}; };
        half.withinPixels = true;
        ImageOperation& larger = add("resizeKelImageEnborder", type, resizeKelImageEnborder, kel_ref::enborder);
        larger.size = [](Size src, int size) { return Size{src.width + 2 * size, src.height + 2 * size}; };
        ImageOperation& smaller = add("resizeKelImageDeborder", type, resizeKelImageDeborder, kel_ref::deborder);
        smaller.size = [](Size src, int size) { return Size{src.width - 2 * size, src.height - 2 * size}; };
        smaller.withinPixels = true;
        larger.parameters = smaller.parameters = {0, 1, 2, 7, 16, 19};
        larger.leastWidth = 1;
        larger.heights = {1, 2, 5};
        larger.settledWidth = 64; // rows by width in some types
        smaller.heights = {0, 2, 5, 40};
        const auto addFlip = [&](const char* name, Pair call, bool mirrored, bool upsideDown) {
            const auto reference = [=](const Operands& o) { kel_ref::flip(o.dst, o.src, mirrored, upsideDown); };
            add(name, type, call, reference).withinPixels = true;
        };
        addFlip("rotateKelImageH", rotateKelImageH, true, false);
        addFlip("rotateKelImageV", rotateKelImageV, false, true);
        addFlip("rotateKelImageVH", rotateKelImageVH, true, true);
        static const float kHomographies[][9] = {{0.9f, 0.1f, 2, -0.1f, 1.1f, 1, 0.001f, 0, 1},
                                                 {1, 0, -0.7f, 0, 1, -0.3f, 0, 0, 1},
                                                 {2, 0, 0, 0, 2, 0, 0.25f, 0, -1}};
        ImageOperation& warp = add(
            "rotateKelImageHomography", type,
            [](const Operands& o) {
                const float* const h = kHomographies[o.parameter];
                rotateKelImageHomography(o.dst, o.src, h[0], h[1], h[2], h[3], h[4], h[5], h[6], h[7], h[8]);
            },
            [](const Operands& o) { kel_ref::warp(o.dst, o.src, kHomographies[o.parameter]); });
        warp.parameters = {0, 1, 2};
        warp.withinPixels = warp.rounds = true;
        warp.size = [](Size src, int) { return Size{(src.width + 13) % 90, src.height + 3}; };
    }
    for (int type : {16, 32}) {
        ImageOperation& larger = add("resizeLinerInterpolation", type, resizeLinerInterpolation, kel_ref::linearInterpolation);
        larger.parameters = {10, 15, 20, 27, 31}; // tenths
        larger.size = [](Size src, int tenths) { return Size{src.width * tenths / 10, src.height * tenths / 10}; };
        larger.behind = 4;
        ImageOperation& smaller =
            add("zero_order_hold_plus_ave", type, zero_order_hold_plus_ave, kel_ref::zeroOrderHoldPlusAverage);
        smaller.parameters = {10, 15, 20, 27, 31, 1000000};
        smaller.size = [](Size src, int tenths) {
            return Size{std::max(1, src.width * 10 / tenths), std::max(1, src.height * 10 / tenths)};
        };
        for (ImageOperation* o : {&larger, &smaller}) {
            o->byType = false;
            o->leastWidth = 1;
            o->heights = {1, 3, 4, 17};
        }
        larger.settledWidth = 0; // the pixel behind the last one takes part
        smaller.settledWidth = 64;
    }
}

} // namespace

const std::vector<ImageOperation>& imageOperations() {
    static const List list = [] {
        List result;
        result.reserve(200);
        addConverters(result);
        addPointOperations(result);
        addFilters(result);
        addTransforms(result);
        return result;
    }();
    return list;
}

const ImageOperation& imageOperation(const std::string& name) {
    const List& all = imageOperations();
    return *std::find_if(all.begin(), all.end(), [&](const ImageOperation& o) { return o.name == name; });
}

size_t roomFor(const ImageOperation& operation, Size dst) {
    kelImage_t* header = createKelImageHeader(dst.width, dst.height, operation.to);
    const size_t bytes = static_cast<size_t>(header->size) * static_cast<size_t>(operation.room);
    releaseKelImageHeader(&header);
    return bytes;
}

kel::Image imageWithRoom(Size size, int type, size_t extra) {
    kel::Image image(createKelImageHeader(size.width, size.height, type));
    image->buffer = malloc(static_cast<size_t>(image->size) + extra); // owned by the record as the library's own block is
    image->data = static_cast<uint8_t*>(image->buffer);
    return image;
}

} // namespace kel_test
