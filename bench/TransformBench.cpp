// Resizing, borders, flips and warp beside OpenCV and libyuv.
#include "Bench.h"

#if KEL_BENCH_OPENCV
#include <opencv2/imgproc.hpp>
#endif
#if KEL_BENCH_LIBYUV
#include <libyuv.h>
#endif

namespace {

using namespace kel_bench;

struct Pair {
    ImagePointer dst, src;
};

using Call = std::function<void(kelImage_t* dst, const kelImage_t* src)>;

struct Case {
    std::string operation;
    int type;
    // Destination size from source size.
    std::function<ImageSize(const ImageSize&)> sized;
    Call kel;
    Call opencv;
    std::string opencvDiffers;
    Call libyuv;
    std::string libyuvDiffers;
};

ImageSize same(const ImageSize& s) {
    return s;
}
ImageSize halved(const ImageSize& s) {
    return {s.width / 2, s.height / 2, ""};
}
ImageSize third(const ImageSize& s) {
    return {s.width / 3, s.height / 3, ""};
}
ImageSize doubled(const ImageSize& s) {
    return {s.width * 2, s.height * 2, ""};
}
ImageSize twoThirds(const ImageSize& s) {
    return {s.width * 2 / 3, s.height * 2 / 3, ""};
}
ImageSize threeHalves(const ImageSize& s) {
    return {s.width * 3 / 2, s.height * 3 / 2, ""};
}
ImageSize bordered(const ImageSize& s) {
    return {s.width + 32, s.height + 32, ""};
}

ImageSize cropSize(const ImageSize& s) {
    return {s.width - 32, s.height - 32, ""};
}

const float kWarp[9] = {0.95f, 0.05f, 12.f, -0.04f, 0.97f, 25.f, 1e-5f, -2e-5f, 1.f};

#if KEL_BENCH_OPENCV
cv::Mat mat(const kelImage_t* image) {
    const int bytes = image->channels * image->depth;
    const int type = image->depth == 2 ? CV_16SC1 : CV_8UC(image->channels);
    return cv::Mat(image->height, image->width, type, image->data, static_cast<size_t>(image->step) * bytes);
}
Call flipCv(int code) {
    return [code](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::flip(mat(s), to, code);
    };
}
Call resizeCv(int method) {
    return [method](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::resize(mat(s), to, to.size(), 0, 0, method);
    };
}
#define OPENCV(...) Call(__VA_ARGS__)
#else
#define OPENCV(...) Call()
#endif
#if KEL_BENCH_LIBYUV
#define LIBYUV(...) Call(__VA_ARGS__)
template <bool mirrored> void turned4(kelImage_t* d, const kelImage_t* s) {
    (mirrored ? libyuv::ARGBMirror : libyuv::ARGBCopy)(s->data, 4 * s->step, d->data, 4 * d->step, s->width, -s->height);
}
template <libyuv::FilterMode filter> void scaled4(kelImage_t* d, const kelImage_t* s) {
    libyuv::ARGBScale(s->data, 4 * s->step, s->width, s->height, d->data, 4 * d->step, d->width, d->height, filter);
}
template <int bytes> void cropped(kelImage_t* d, const kelImage_t* s) {
    libyuv::CopyPlane(s->data + 16 * bytes * (s->step + 1), bytes * s->step, d->data, bytes * d->step, bytes * d->width,
                      d->height);
}
#else
#define LIBYUV(...) Call()
#endif

std::vector<Case> cases() {
    const Call warpKel = [](kelImage_t* d, const kelImage_t* s) {
        rotateKelImageHomography(d, s, kWarp[0], kWarp[1], kWarp[2], kWarp[3], kWarp[4], kWarp[5], kWarp[6], kWarp[7],
                                 kWarp[8]);
    };
    const Call warpCv = OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::warpPerspective(mat(s), to, cv::Mat(3, 3, CV_32F, const_cast<float*>(kWarp)), to.size(),
                            cv::INTER_NEAREST | cv::WARP_INVERSE_MAP);
    });
    const std::string fixedPoint = "rounds coordinates to 1/32 pixel";
    const Call borderKel = [](kelImage_t* d, const kelImage_t* s) { resizeKelImageEnborder(d, s, 16); };
    const Call borderCv = OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::copyMakeBorder(mat(s), to, 16, 16, 16, 16, cv::BORDER_REPLICATE);
    });
    const Call cropKel = [](kelImage_t* d, const kelImage_t* s) { resizeKelImageDeborder(d, s, 16); };
    const Call cropCv = OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        mat(s)(cv::Rect(16, 16, d->width, d->height)).copyTo(to);
    });
    return {
        {"rotateKelImageH, 1 byte", 0, same, rotateKelImageH, OPENCV(flipCv(1)), "",
         LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::MirrorPlane(s->data, s->step, d->data, d->step, s->width, s->height);
         }),
         ""},
        {"rotateKelImageH, 2 bytes", 3, same, rotateKelImageH, OPENCV(flipCv(1)), "", {}, ""},
        {"rotateKelImageH, 3 bytes", 8, same, rotateKelImageH, OPENCV(flipCv(1)), "",
         LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::RGB24Mirror(s->data, 3 * s->step, d->data, 3 * d->step, s->width, s->height);
         }),
         ""},
        {"rotateKelImageH, 4 bytes", 16, same, rotateKelImageH, OPENCV(flipCv(1)), "",
         LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::ARGBMirror(s->data, 4 * s->step, d->data, 4 * d->step, s->width, s->height);
         }),
         ""},
        {"rotateKelImageV, 1 byte", 0, same, rotateKelImageV, OPENCV(flipCv(0)), "",
         LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::CopyPlane(s->data, s->step, d->data, d->step, s->width, -s->height);
         }),
         ""},
        {"rotateKelImageV, 3 bytes", 8, same, rotateKelImageV, OPENCV(flipCv(0)), "", {}, ""},
        {"rotateKelImageV, 4 bytes", 16, same, rotateKelImageV, OPENCV(flipCv(0)), "", LIBYUV(turned4<false>), ""},
        {"rotateKelImageVH, 1 byte", 0, same, rotateKelImageVH, OPENCV(flipCv(-1)), "",
         LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::MirrorPlane(s->data, s->step, d->data, d->step, s->width, -s->height);
         }),
         ""},
        {"rotateKelImageVH, 2 bytes", 3, same, rotateKelImageVH, OPENCV(flipCv(-1)), "", {}, ""},
        {"rotateKelImageVH, 3 bytes", 8, same, rotateKelImageVH, OPENCV(flipCv(-1)), "",
         LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::RGB24Mirror(s->data, 3 * s->step, d->data, 3 * d->step, s->width, -s->height);
         }),
         ""},
        {"rotateKelImageVH, 4 bytes", 16, same, rotateKelImageVH, OPENCV(flipCv(-1)), "", LIBYUV(turned4<true>), ""},
        {"rotateKelImageHomography, 1 byte", 0, same, warpKel, warpCv, fixedPoint, {}, ""},
        {"rotateKelImageHomography, 2 bytes", 3, same, warpKel, warpCv, fixedPoint, {}, ""},
        {"rotateKelImageHomography, 3 bytes", 8, same, warpKel, warpCv, fixedPoint, {}, ""},
        {"rotateKelImageHomography, 4 bytes", 16, same, warpKel, warpCv, fixedPoint, {}, ""},
        {"resizeKelImageHalf, 1 byte", 0, halved, resizeKelImageHalf, OPENCV(resizeCv(cv::INTER_NEAREST)), "",
         LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::ScalePlane(s->data, s->step, s->width, s->height, d->data, d->step, d->width, d->height,
                                libyuv::kFilterNone);
         }),
         "keeps the odd pixels"},
        {"resizeKelImageHalf, 2 bytes", 3, halved, resizeKelImageHalf, OPENCV(resizeCv(cv::INTER_NEAREST)), "", {}, ""},
        {"resizeKelImageHalf, 3 bytes", 8, halved, resizeKelImageHalf, OPENCV(resizeCv(cv::INTER_NEAREST)), "", {}, ""},
        {"resizeKelImageHalf, 4 bytes", 16, halved, resizeKelImageHalf, OPENCV(resizeCv(cv::INTER_NEAREST)), "",
         LIBYUV(scaled4<libyuv::kFilterNone>), "keeps the odd pixels"},
        {"resizeKelImageNearest, 1 byte, 1/2", 0, halved, resizeKelImageNearest, OPENCV(resizeCv(cv::INTER_NEAREST)),
         "keeps the even pixels", LIBYUV([](kelImage_t* d, const kelImage_t* s) {
             libyuv::ScalePlane(s->data, s->step, s->width, s->height, d->data, d->step, d->width, d->height,
                                libyuv::kFilterNone);
         }),
         ""},
        {"resizeKelImageNearest, 1 byte, 1/3",
         0,
         third,
         resizeKelImageNearest,
         OPENCV(resizeCv(cv::INTER_NEAREST)),
         "rounds down",
         {},
         ""},
        {"resizeKelImageNearest, 3 bytes, 1/2",
         8,
         halved,
         resizeKelImageNearest,
         OPENCV(resizeCv(cv::INTER_NEAREST)),
         "keeps the even pixels",
         {},
         ""},
        {"resizeKelImageBilinear, 1/2",
         0,
         halved,
         resizeKelImageBilinear,
         OPENCV(resizeCv(cv::INTER_LINEAR)),
         "samples between four pixels",
         {},
         ""},
        {"resizeLinerInterpolation, x2", 16, doubled, resizeLinerInterpolation, OPENCV(resizeCv(cv::INTER_LINEAR)),
         "fourth channel, pixel centres", LIBYUV(scaled4<libyuv::kFilterBilinear>), "fourth channel, coarser weights"},
        {"resizeLinerInterpolation, 3/2", 16, threeHalves, resizeLinerInterpolation, OPENCV(resizeCv(cv::INTER_LINEAR)),
         "fourth channel, pixel centres", LIBYUV(scaled4<libyuv::kFilterBilinear>), "fourth channel, coarser weights"},
        {"zero_order_hold_plus_ave, 1/2", 16, halved, zero_order_hold_plus_ave, OPENCV(resizeCv(cv::INTER_AREA)),
         "rounds once, to nearest", LIBYUV(scaled4<libyuv::kFilterBox>), "rounds once, to nearest"},
        {"zero_order_hold_plus_ave, 2/3", 16, twoThirds, zero_order_hold_plus_ave, OPENCV(resizeCv(cv::INTER_AREA)),
         "rounds once, to nearest", LIBYUV(scaled4<libyuv::kFilterBox>), "whole pixels in a box"},
        {"resizeKelImageEnborder 16, 1 byte", 0, bordered, borderKel, borderCv, "", {}, ""},
        {"resizeKelImageEnborder 16, 3 bytes", 8, bordered, borderKel, borderCv, "", {}, ""},
        {"resizeKelImageDeborder 16, 1 byte", 0, cropSize, cropKel, cropCv, "", LIBYUV(cropped<1>), ""},
        {"resizeKelImageDeborder 16, 3 bytes", 8, cropSize, cropKel, cropCv, "", LIBYUV(cropped<3>), ""},
    };
}

void addLines() {
    for (const Case& c : cases())
        for (const ImageSize& size : kImageSizes) {
            const ImageSize to = c.sized(size);
            const auto run = [=](const std::string& who, const Call& call, const std::string& differs) {
                return Run{who,
                           [=] {
                               const Pair pair = {image(to.width, to.height, c.type), image(size.width, size.height, c.type)};
                               return Body([=] { call(pair.dst.get(), pair.src.get()); });
                           },
                           differs};
            };
            std::vector<Run> runs = {run("kel", c.kel, "")};
            if (c.opencv)
                runs.push_back(run("OpenCV", c.opencv, c.opencvDiffers));
            if (c.libyuv)
                runs.push_back(run("libyuv", c.libyuv, c.libyuvDiffers));
            const int bytes = c.type == 0 ? 1 : c.type == 3 ? 2 : c.type == 8 ? 3 : 4;
            const double written = static_cast<double>(bytes) * to.width * to.height;
            const double read = static_cast<double>(bytes) * size.width * size.height;
            add(c.operation, size.name, {std::min(read, 2 * written), written}, runs);
        }
}

const Lines lines(addLines);

} // namespace
