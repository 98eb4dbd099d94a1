// Image operations beside their references, within their preconditions.
#include <vector>

#include "ConverterReference.h"
#include "FilterReference.h"
#include "Fuzz.h"
#include "PointReference.h"
#include "TransformReference.h"
#include "YapeReference.h"

using kel_fuzz::Input;
using kel_fuzz::Twins;

namespace {

constexpr int kTypes[] = {0, 3, 8, 16, 24, 32, 40};

int someType(Input& input) {
    const int choice = input.byte();
    return choice < 240 ? kTypes[choice % 7] : choice % 48;
}
int someSize(Input& input) {
    const int choice = input.byte();
    return choice < 200 ? choice % 71 : choice - 100;
}

// Four channels to grey need three times the room.
size_t roomForMisplaced(int from, int to, int width, int height) {
    const bool misplaced = (from == 16 || from == 32) && (to == 0 || to == 3);
    return misplaced ? 2u * static_cast<size_t>((width + 15) / 16 * 16 * height) * (to == 3 ? 2 : 1) : 0;
}

void conversion(Input& input) {
    const int width = someSize(input), height = input.between(0, 9), from = someType(input), to = someType(input);
    Twins src(input, width, height, from), dst(input, width, height, to, roomForMisplaced(from, to, width, height));
    convertKelImage(dst.lib.get(), src.lib.get());
    kel_ref::convert(dst.ref.get(), src.ref.get());
    dst.expectEqual("convertKelImage");
    src.expectEqual("source of convertKelImage");
}

void reversal(Input& input) { // the converter that no route reaches
    const int width = someSize(input), height = input.between(0, 9);
    Twins src(input, width, height, 8), dst(input, width, height, 32);
    convertKelImage_U8XYZ_to_U8ZYXA(dst.lib.get(), src.lib.get());
    kel_ref::U8XYZ_to_U8ZYXA(dst.ref.get(), src.ref.get());
    dst.expectEqual("convertKelImage_U8XYZ_to_U8ZYXA");
}

void points(Input& input) {
    const int width = someSize(input), height = someSize(input), threshold = static_cast<int>(input.word());
    Twins src(input, width, height, 0), dst(input, width, height, 0), tmp(input, width, height, 0);
    const bool inPlace = input.byte() % 4 == 0;
    kelImage_t *const lib = inPlace ? src.lib.get() : dst.lib.get(), *const ref = inPlace ? src.ref.get() : dst.ref.get();
    switch (input.byte() % 3) {
    case 0:
        adjustKelImage(lib, src.lib.get());
        kel_ref::adjust(ref, src.ref.get());
        break;
    case 1:
        binalizeKelImage(lib, src.lib.get(), threshold);
        kel_ref::binalize(ref, src.ref.get(), threshold);
        break;
    default:
        binalizeKelImageAdaptive(dst.lib.get(), src.lib.get(), tmp.lib.get());
        kel_ref::binalizeAdaptive(dst.ref.get(), src.ref.get(), tmp.ref.get());
    }
    dst.expectEqual("point operation");
    src.expectEqual("source of a point operation");
    tmp.expectEqual("scratch of the adaptive threshold");
}

void gaussian(Input& input) {
    const bool wide = input.byte() % 2;
    const int width = someSize(input), height = someSize(input);
    Twins src(input, width, height, 0), dst(input, width, height, 0), tmp(input, width, height, wide ? 0 : 3),
        half(input, (width + 1) / 2, (height + 1) / 2, 0);
    const bool inPlace = input.byte() % 4 == 0, withHalf = input.byte() % 2;
    const auto call = [&](auto filter, kelImage_t* to, kelImage_t* from, kelImage_t* scratch, kelImage_t* halved) {
        filter(inPlace ? from : to, withHalf ? halved : nullptr, from, scratch);
    };
    call(wide ? applyKelFilterGaussian7X7_downsampling : applyKelFilterGaussian5X5_downsampling, dst.lib.get(), src.lib.get(),
         tmp.lib.get(), half.lib.get());
    call(wide ? kel_ref::gaussian7x7 : kel_ref::gaussian5x5, dst.ref.get(), src.ref.get(), tmp.ref.get(), half.ref.get());
    dst.expectEqual("Gaussian");
    src.expectEqual("source of a Gaussian");
    tmp.expectEqual("scratch of a Gaussian");
    half.expectEqual("half of a Gaussian");
}

void filters(Input& input) {
    const int width = someSize(input), height = someSize(input);
    Twins src(input, width, height, 0), wide(input, width, height, 3), dst(input, width, height, 0);
    switch (input.byte() % 4) {
    case 0:
        applyKelFilterLaplacian3X3(wide.lib.get(), src.lib.get());
        kel_ref::cross(wide.ref.get(), src.ref.get());
        break;
    case 1:
        applyKelFilterSobel3X3(wide.lib.get(), src.lib.get());
        kel_ref::sobel(wide.ref.get(), src.ref.get());
        break;
    case 2: {
        const int n = input.between(1, 3);
        applyKelFilterMedianNXN(dst.lib.get(), src.lib.get(), n);
        kel_ref::rank(dst.ref.get(), src.ref.get(), n);
        break;
    }
    default: {
        const unsigned seed = input.word();
        const int amplitude = input.byte() % 4 ? input.byte() : static_cast<int>(input.word());
        srand(seed);
        applyKelFilterNoise(dst.lib.get(), src.lib.get(), amplitude);
        const int next = rand();
        srand(seed);
        kel_ref::noise(dst.ref.get(), src.ref.get(), amplitude);
        if (rand() != next)
            kel_fuzz::fail("draws of the noise filter");
    }
    }
    dst.expectEqual("filter");
    wide.expectEqual("filter response");
}

void keypoints(Input& input) {
    const int width = input.between(0, 90), height = input.between(0, 60), max = input.between(0, 200);
    Twins grey(input, width, height, 0), response(input, width, height, 3);
    if (input.byte() % 2) // responses of the usual size
        for (int i = 0; i < response.lib->size / 2; ++i) {
            int16_t& value = reinterpret_cast<int16_t*>(response.lib->data)[i];
            value = static_cast<int16_t>(value % 256);
        }
    std::vector<kelKeypoint2DF32_t> lib(static_cast<size_t>(max)), ref(lib);
    kel_ref::YapeTally tally;
    const int count = applyKelDetectorKeypointYape(lib.data(), max, grey.lib.get(), response.lib.get());
    if (count != kel_ref::yape(ref.data(), max, grey.lib.get(), response.lib.get(), tally))
        kel_fuzz::fail("number of keypoints");
    for (int i = 0; i < count; ++i)
        if (std::memcmp(&lib[i], &ref[i], sizeof lib[i]) != 0)
            kel_fuzz::fail("keypoint");
}

void resizing(Input& input) {
    const int dw = input.between(1, 80), dh = input.between(1, 40);
    const uint8_t kind = input.byte() % 5;
    if (kind >= 3) { // four-byte pixels, rows by width; enlarging reads one pixel behind the last
        const int sw = input.between(1, 80), sh = input.between(1, 40);
        const bool larger = kind == 3;
        const int w = larger ? std::max(dw, sw) : std::min(dw, sw), h = larger ? std::max(dh, sh) : std::min(dh, sh);
        Twins src(input, sw, sh, 16, 4), dst(input, w, h, 16);
        (larger ? resizeLinerInterpolation : zero_order_hold_plus_ave)(dst.lib.get(), src.lib.get());
        (larger ? kel_ref::linearInterpolation : kel_ref::zeroOrderHoldPlusAverage)(dst.ref.get(), src.ref.get());
        dst.expectEqual(larger ? "resizeLinerInterpolation" : "zero_order_hold_plus_ave");
        return;
    }
    const int type = someType(input);
    if (kind == 2) {
        Twins src(input, 2 * dw + input.byte() % 2, 2 * dh + input.byte() % 2, type), dst(input, dw, dh, type);
        resizeKelImageHalf(dst.lib.get(), src.lib.get());
        kel_ref::half(dst.ref.get(), src.ref.get());
        dst.expectEqual("resizeKelImageHalf");
        return;
    }
    const int sw = input.byte() % 2 ? dw * input.between(1, 5) : input.between(1, 100), sh = input.between(1, 60);
    Twins src(input, sw, sh, type), dst(input, dw, dh, type);
    (kind ? resizeKelImageBilinear : resizeKelImageNearest)(dst.lib.get(), src.lib.get());
    (kind ? kel_ref::bilinear : kel_ref::nearest)(dst.ref.get(), src.ref.get());
    dst.expectEqual(kind ? "resizeKelImageBilinear" : "resizeKelImageNearest");
}

void borders(Input& input) {
    const int width = input.between(1, 80), height = input.between(1, 20), type = someType(input), size = input.between(0, 20);
    Twins inner(input, width, height, type), outer(input, width + 2 * size, height + 2 * size, type);
    resizeKelImageEnborder(outer.lib.get(), inner.lib.get(), size);
    kel_ref::enborder(outer.ref.get(), inner.ref.get(), size);
    outer.expectEqual("resizeKelImageEnborder");
    resizeKelImageDeborder(inner.lib.get(), outer.lib.get(), size);
    kel_ref::deborder(inner.ref.get(), outer.ref.get(), size);
    inner.expectEqual("resizeKelImageDeborder");
}

void flips(Input& input) {
    const int width = someSize(input), height = input.between(0, 9), type = someType(input);
    const bool mirrored = input.byte() % 2, upsideDown = input.byte() % 2 || !mirrored;
    Twins src(input, width, height, type), dst(input, width, height, type);
    (mirrored ? upsideDown ? rotateKelImageVH : rotateKelImageH : rotateKelImageV)(dst.lib.get(), src.lib.get());
    kel_ref::flip(dst.ref.get(), src.ref.get(), mirrored, upsideDown);
    dst.expectEqual("flip");
}

void warp(Input& input) {
    const int type = someType(input);
    Twins src(input, someSize(input), input.between(0, 40), type), dst(input, someSize(input), input.between(0, 40), type);
    float h[9];
    for (int i = 0; i < 9; ++i)
        h[i] = i < 8 || input.byte() % 2 ? input.number() / (i >= 6 ? 64 : 1) : 1;
    rotateKelImageHomography(dst.lib.get(), src.lib.get(), h[0], h[1], h[2], h[3], h[4], h[5], h[6], h[7], h[8]);
    kel_ref::warp(dst.ref.get(), src.ref.get(), h);
    dst.expectEqual("rotateKelImageHomography");
}

void transfer(Input& input) {
    const int width = someSize(input), height = input.between(0, 9), type = kTypes[input.byte() % 6]; // not YUV: copies nothing
    const int w = input.between(-1, 90), h = input.between(-1, 12), pitch = std::max(w, 0) + input.between(0, 5);
    const size_t bytes = static_cast<size_t>(kel_ref::wholePixelBytes(type));
    Twins image(input, width, height, type);
    std::vector<uint8_t> buffer(static_cast<size_t>(pitch * std::max(h, 0)) * bytes), before;
    input.fill(buffer.data(), buffer.size());
    before = buffer;
    const auto forEachPixel = [&](auto body) { // of those that both have
        for (int y = 0; y < std::min(h, height); ++y)
            for (int x = 0; x < std::min(w, width); ++x)
                body(before.data() + static_cast<size_t>(y * pitch + x) * bytes,
                     image.ref->data + static_cast<size_t>(y * image.ref->step + x) * bytes);
    };
    if (input.byte() % 2) {
        loadKelImageData(image.lib.get(), buffer.data(), w, h, pitch);
        forEachPixel([&](uint8_t* outside, uint8_t* inside) { std::memcpy(inside, outside, bytes); });
    } else {
        storeKelImageData(buffer.data(), w, h, pitch, image.lib.get());
        forEachPixel([&](uint8_t* outside, uint8_t* inside) { std::memcpy(outside, inside, bytes); });
    }
    image.expectEqual("loadKelImageData");
    if (buffer != before)
        kel_fuzz::fail("storeKelImageData");
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Input input(data, size);
    void (*const targets[])(Input&) = {conversion, reversal, points, gaussian, filters,  keypoints,
                                       resizing,   borders,  flips,  warp,     transfer, conversion};
    targets[input.byte() % (sizeof targets / sizeof *targets)](input);
    return 0;
}
