// The conversion dispatcher with its route table, and the converters that walk rows by step and leave padding untouched. Six
// more names forward to the converters over whole areas. What is done to pixels is the kernels' business.
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

// Runs a kernel over every row, pixels of D and S bytes.
template <int D, int S> void eachRow(kelImage_t* dst, const kelImage_t* src, kelValue_s32 pixels, kel::Run run) {
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        run(kel::row<uint8_t>(dst, y, D), kel::row<uint8_t>(src, y, S), pixels);
}
template <int D, int S> void eachRow(kelImage_t* dst, const kelImage_t* src, kel::Run run) {
    eachRow<D, S>(dst, src, dst->width, run);
}

// Pairs of pixels; at odd widths the second pixel of the last pair lands in the padding.
void eachRowOfPairs(kelImage_t* dst, const kelImage_t* src, kel::Run run) {
    eachRow<3, 2>(dst, src, dst->width + (dst->width > 0 ? dst->width % 2 : 0), run);
}

constexpr int kTypes = 7;

// Index of a processed type in the route table; -1 for any other.
int indexOf(kelValue_s32 type) {
    const kelValue_s32 types[kTypes] = {KEL_PIXEL_TYPE_U8G,    KEL_PIXEL_TYPE_S16G,  KEL_PIXEL_TYPE_U8XYZ,
                                        KEL_PIXEL_TYPE_U8XYZA, KEL_PIXEL_TYPE_U8ZYX, KEL_PIXEL_TYPE_U8ZYXA,
                                        KEL_PIXEL_TYPE_U8YUV};
    for (int i = 0; i < kTypes; ++i)
        if (types[i] == type)
            return i;
    return -1;
}

using Converter = void (*)(kelImage_t*, const kelImage_t*);

// Row: source, column: destination, both in the order of indexOf().
// clang-format off
constexpr Converter kRoutes[kTypes][kTypes] = {
    // from U8G
    {copyKelImage, convertKelImage_U8G_to_S16G,
     convertKelImage_U8G_to_U8XYZ, convertKelImage_U8G_to_U8XYZA,
     convertKelImage_U8G_to_U8XYZ, convertKelImage_U8G_to_U8XYZA, nullptr},
    // from S16G
    {convertKelImage_S16G_to_U8G, copyKelImage,
     convertKelImage_S16G_to_U8XYZ, convertKelImage_S16G_to_U8XYZA,
     convertKelImage_S16G_to_U8XYZ, convertKelImage_S16G_to_U8XYZA, nullptr},
    // from U8XYZ; callers rely on the order being kept on the way to U8ZYXA
    {convertKelImage_U8XYZ_to_U8G, convertKelImage_U8XYZ_to_S16G,
     copyKelImage, convertKelImage_U8XYZ_to_U8XYZA,
     convertKelImage_U8XYZ_to_U8ZYX, convertKelImage_U8XYZ_to_U8XYZA, nullptr},
    // from U8XYZA
    {convertKelImage_U8XYZA_to_U8G, convertKelImage_U8XYZA_to_S16G,
     convertKelImage_U8XYZA_to_U8XYZ, copyKelImage,
     convertKelImage_U8XYZA_to_U8ZYX, convertKelImage_U8XYZA_to_U8ZYXA, nullptr},
    // from U8ZYX; and here on the way to U8XYZA
    {convertKelImage_U8XYZ_to_U8G, convertKelImage_U8XYZ_to_S16G,
     convertKelImage_U8XYZ_to_U8ZYX, convertKelImage_U8XYZ_to_U8XYZA,
     copyKelImage, convertKelImage_U8XYZ_to_U8XYZA, nullptr},
    // from U8ZYXA
    {convertKelImage_U8XYZA_to_U8G, convertKelImage_U8XYZA_to_S16G,
     convertKelImage_U8XYZA_to_U8ZYX, convertKelImage_U8XYZA_to_U8ZYXA,
     convertKelImage_U8XYZA_to_U8XYZ, copyKelImage, nullptr},
    // from U8YUV
    {convertKelImage_U8YUV_to_U8G, nullptr,
     convertKelImage_U8YUV_to_U8BGR, convertKelImage_U8YUV_to_U8BGRA,
     convertKelImage_U8YUV_to_U8RGB, convertKelImage_U8YUV_to_U8RGBA, copyKelImage},
};
// clang-format on

} // namespace

extern "C" {

void convertKelImage(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    const int from = indexOf(src->type), to = indexOf(dst->type);
    if (from < 0 || to < 0)
        return;
    if (const Converter convert = kRoutes[from][to])
        convert(dst, src);
}

void convertKelImage_S16G_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    eachRow<1, 2>(dst, src, kel::kernels().magnitudeToGrey);
}

void convertKelImage_S16G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    eachRow<3, 2>(dst, src, kel::kernels().magnitudeToThree);
}

void convertKelImage_S16G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    eachRow<4, 2>(dst, src, kel::kernels().magnitudeToFour);
}

void convertKelImage_U8XYZ_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    eachRow<1, 3>(dst, src, kel::kernels().meanOfThree);
}

void convertKelImage_U8XYZ_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    eachRow<2, 3>(dst, src, kel::kernels().wordMeanOfThree);
}

void convertKelImage_U8XYZ_to_U8ZYX(kelImage_t* dst, const kelImage_t* src) {
    eachRow<3, 3>(dst, src, kel::kernels().threeReversed);
}

void convertKelImage_U8XYZ_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    eachRow<4, 3>(dst, src, kel::kernels().threeToFour);
}

// The mean of pixel (x, y) lands at element 3 * (y * step + x), where a three-channel destination would have it, and what lies
// between is left alone. Callers rely on it.
void convertKelImage_U8XYZA_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    eachRow<3, 4>(dst, src, kel::kernels().meanOfFourSpread);
}

void convertKelImage_U8XYZA_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    eachRow<6, 4>(dst, src, kel::kernels().wordMeanOfFourSpread);
}

void convertKelImage_U8XYZA_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    eachRow<3, 4>(dst, src, kel::kernels().fourToThree);
}

void convertKelImage_U8XYZA_to_U8ZYX(kelImage_t* dst, const kelImage_t* src) {
    eachRow<3, 4>(dst, src, kel::kernels().fourToThreeReversed);
}

void convertKelImage_U8XYZA_to_U8ZYXA(kelImage_t* dst, const kelImage_t* src) {
    eachRow<4, 4>(dst, src, kel::kernels().fourReversed);
}

void convertKelImage_U8YUV_to_U8RGB(kelImage_t* dst, const kelImage_t* src) {
    eachRowOfPairs(dst, src, kel::kernels().yuvToRgb);
}

void convertKelImage_U8YUV_to_U8BGR(kelImage_t* dst, const kelImage_t* src) {
    eachRowOfPairs(dst, src, kel::kernels().yuvToBgr);
}

void convertKelImage_U8YUV_to_U8BGRA(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8YUV_to_U8BGRA(dst, src);
}

void convertKelImage_U8YUV_to_U8RGBA(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8YUV_to_U8RGBA(dst, src);
}

void convertKelImage_U8YUV_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8YUV_to_U8G(dst, src);
}

void convertKelImage_U8G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8G_to_U8XYZA(dst, src);
}

void convertKelImage_U8G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8G_to_U8XYZ(dst, src);
}

void convertKelImage_U8G_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8G_to_S16G(dst, src);
}

} // extern "C"

void convertKelImage_U8XYZ_to_U8ZYXA(kelImage_t* dst, const kelImage_t* src) {
    eachRow<4, 3>(dst, src, kel::kernels().threeToFourReversed);
}
