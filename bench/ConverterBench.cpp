// Converters beside OpenCV and libyuv.
#include "ImagePeers.h"

#include <algorithm>

namespace {

using namespace kel_bench;

#if KEL_BENCH_OPENCV
Call colour(int code) {
    return [code](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::cvtColor(mat(s), to, code);
    };
}
#define KEL_COLOUR(code) colour(cv::code)
#else
#define KEL_COLOUR(code) Call()
#endif
#if KEL_BENCH_LIBYUV
using Convert = int (*)(const uint8_t*, int, uint8_t*, int, int, int);
Call planes(Convert convert) {
    return [convert](kelImage_t* d, const kelImage_t* s) {
        convert(s->data, s->step * s->channels, d->data, d->step * d->channels, d->width, d->height);
    };
}
#define KEL_PLANES(name) planes(libyuv::name)
// Two steps, the first into an image of four channels, a row of pixels at a time as far as libyuv's own cache goes.
Call planesByFour(Convert first, Convert second) {
    return [=, four = ImagePointer()](kelImage_t* d, const kelImage_t* s) mutable {
        if (!four)
            four = image(d->width, 16, KEL_PIXEL_TYPE_U8XYZA);
        for (int y = 0; y < d->height; y += four->height) {
            const int rows = std::min(four->height, d->height - y), from = s->step * s->channels, to = d->step * d->channels;
            first(s->data + y * from, from, four->data, 4 * four->step, d->width, rows);
            second(four->data, 4 * four->step, d->data + y * to, to, d->width, rows);
        }
    };
}
#define KEL_PLANES_BY_FOUR(first, second) planesByFour(libyuv::first, libyuv::second)
#else
#define KEL_PLANES(name) Call()
#define KEL_PLANES_BY_FOUR(first, second) Call()
#endif

void addLines() {
    const int g = KEL_PIXEL_TYPE_U8G, s16 = KEL_PIXEL_TYPE_S16G, bgr = KEL_PIXEL_TYPE_U8XYZ, bgra = KEL_PIXEL_TYPE_U8XYZA,
              rgb = KEL_PIXEL_TYPE_U8ZYX, rgba = KEL_PIXEL_TYPE_U8ZYXA, yuv = KEL_PIXEL_TYPE_U8YUV;
    const std::string opaque = "alpha 255", weighted = "weighted grey", fixedPoint = "fixed-point colour",
                      rounds = "rounds to nearest";
    const Call magnitude = KEL_OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::convertScaleAbs(mat(s), to, 1 / 128.);
    });
    const Call toShort = KEL_OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        mat(s).convertTo(to, CV_16S);
    });

    addPixelLines("convert S16G to U8G", g, s16, convertKelImage_S16G_to_U8G, {magnitude, rounds}, {});
    addPixelLines("convert S16G to U8XYZ", bgr, s16, convertKelImage_S16G_to_U8XYZ, {}, {});
    addPixelLines("convert S16G to U8XYZA", bgra, s16, convertKelImage_S16G_to_U8XYZA, {}, {});
    addPixelLines("convert U8XYZ to U8G", g, bgr, convertKelImage_U8XYZ_to_U8G, {KEL_COLOUR(COLOR_BGR2GRAY), weighted},
                  {KEL_PLANES(RGB24ToJ400), weighted});
    addPixelLines("convert U8XYZ to S16G", s16, bgr, convertKelImage_U8XYZ_to_S16G, {}, {});
    addPixelLines("convert U8XYZ to U8ZYX", rgb, bgr, convertKelImage_U8XYZ_to_U8ZYX, {KEL_COLOUR(COLOR_BGR2RGB)},
                  {KEL_PLANES(RAWToRGB24)});
    addPixelLines("convert U8XYZ to U8XYZA", bgra, bgr, convertKelImage_U8XYZ_to_U8XYZA, {KEL_COLOUR(COLOR_BGR2BGRA), opaque},
                  {KEL_PLANES(RGB24ToARGB), opaque});
    addPixelLines("convert U8XYZ to U8ZYXA", rgba, bgr, convertKelImage_U8XYZ_to_U8ZYXA, {KEL_COLOUR(COLOR_BGR2RGBA), opaque},
                  {KEL_PLANES(RAWToARGB), opaque});
    addPixelLines("convert U8XYZA to U8XYZ", bgr, bgra, convertKelImage_U8XYZA_to_U8XYZ, {KEL_COLOUR(COLOR_BGRA2BGR)},
                  {KEL_PLANES(ARGBToRGB24)});
    addPixelLines("convert U8XYZA to U8ZYX", rgb, bgra, convertKelImage_U8XYZA_to_U8ZYX, {KEL_COLOUR(COLOR_BGRA2RGB)},
                  {KEL_PLANES(ARGBToRAW)});
    addPixelLines("convert U8XYZA to U8ZYXA", rgba, bgra, convertKelImage_U8XYZA_to_U8ZYXA, {KEL_COLOUR(COLOR_BGRA2RGBA)},
                  {KEL_PLANES(ARGBToABGR)});
    // The grey lands three pixels apart, so the destination gets the room of three channels.
    const std::string packed = "weighted grey, packed";
    addPixelLines("convert U8XYZA to U8G", bgr, bgra, convertKelImage_U8XYZA_to_U8G, {}, {KEL_PLANES(ARGBToJ400), packed});
    addPixelLines("convert U8YUV to U8G", g, yuv, convertKelImage_U8YUV_to_U8G, {KEL_COLOUR(COLOR_YUV2GRAY_UYVY)},
                  {KEL_PLANES(UYVYToY)});
    addPixelLines("convert U8YUV to U8BGR", bgr, yuv, convertKelImage_U8YUV_to_U8BGR,
                  {KEL_COLOUR(COLOR_YUV2BGR_UYVY), fixedPoint}, {KEL_PLANES_BY_FOUR(UYVYToARGB, ARGBToRGB24), fixedPoint});
    addPixelLines("convert U8YUV to U8RGB", rgb, yuv, convertKelImage_U8YUV_to_U8RGB,
                  {KEL_COLOUR(COLOR_YUV2RGB_UYVY), fixedPoint}, {KEL_PLANES_BY_FOUR(UYVYToARGB, ARGBToRAW), fixedPoint});
    addPixelLines("convert U8YUV to U8BGRA", bgra, yuv, convertKelImage_U8YUV_to_U8BGRA,
                  {KEL_COLOUR(COLOR_YUV2BGRA_UYVY), fixedPoint}, {KEL_PLANES(UYVYToARGB), fixedPoint});
    addPixelLines("convert U8YUV to U8RGBA", rgba, yuv, convertKelImage_U8YUV_to_U8RGBA,
                  {KEL_COLOUR(COLOR_YUV2RGBA_UYVY), fixedPoint}, {KEL_PLANES_BY_FOUR(UYVYToARGB, ARGBToABGR), fixedPoint});
    addPixelLines("convert U8G to U8XYZ", bgr, g, convertKelImage_U8G_to_U8XYZ, {KEL_COLOUR(COLOR_GRAY2BGR)},
                  {KEL_PLANES_BY_FOUR(J400ToARGB, ARGBToRGB24)});
    addPixelLines("convert U8G to U8XYZA", bgra, g, convertKelImage_U8G_to_U8XYZA, {KEL_COLOUR(COLOR_GRAY2BGRA), opaque},
                  {KEL_PLANES(J400ToARGB), opaque});
    addPixelLines("convert U8G to S16G", s16, g, convertKelImage_U8G_to_S16G, {toShort}, {});
}

const Lines lines(addLines);

} // namespace
