// Filters and the keypoint detector beside OpenCV's nearest, and the whole way from a camera frame to keypoints.
#include "Bench.h"

#include <algorithm>
#include <memory>
#include <vector>
#if KEL_BENCH_OPENCV
#include <opencv2/features2d.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace {

using namespace kel_bench;

// Squares of many sizes and greys on top of each other: edges and corners, as photographs have them.
ImagePointer scene(int width, int height, int type) {
    const ImagePointer made = image(width, height, type);
    uint32_t state = 7;
    const auto next = [&](int range) {
        state = state * 1664525u + 1013904223u;
        return static_cast<int>((state >> 8) % static_cast<uint32_t>(range));
    };
    for (int i = 0; i < width * height / 400; ++i) {
        const int side = 3 + next(next(60) + 1), x0 = next(width), y0 = next(height), grey = next(240), bytes = made->channels;
        for (int y = y0; y < std::min(y0 + side, height); ++y)
            for (int x = x0 * bytes; x < std::min(x0 + side, width) * bytes; ++x)
                made->data[y * made->step * bytes + x] = static_cast<unsigned char>(grey + x % 7 + y % 5);
    }
    return made;
}

// An image and room for every result; `smooth` and `response` hold what the detector takes.
struct Desk {
    explicit Desk(const ImageSize& size)
        : frame(scene(size.width, size.height, KEL_PIXEL_TYPE_U8YUV)), src(scene(size.width, size.height, KEL_PIXEL_TYPE_U8G)),
          dst(image(size.width, size.height, KEL_PIXEL_TYPE_U8G)), tmp(image(size.width, size.height, KEL_PIXEL_TYPE_U8G)),
          half(image((size.width + 1) / 2, (size.height + 1) / 2, KEL_PIXEL_TYPE_U8G)),
          smooth(image(size.width, size.height, KEL_PIXEL_TYPE_U8G)), sums(image(size.width, size.height, KEL_PIXEL_TYPE_S16G)),
          response(image(size.width, size.height, KEL_PIXEL_TYPE_S16G)), keypoints(100000) {
        applyKelFilterGaussian7X7(smooth.get(), src.get(), tmp.get());
        applyKelFilterLaplacian3X3(response.get(), smooth.get());
    }
    ImagePointer frame, src, dst, tmp, half, smooth, sums, response;
    std::vector<kelKeypoint2DF32_t> keypoints;
    int detect() {
        return applyKelDetectorKeypointYape(keypoints.data(), static_cast<int>(keypoints.size()), smooth.get(), response.get());
    }
#if KEL_BENCH_OPENCV
    cv::Mat dx, dy, squares;
    std::vector<cv::KeyPoint> corners;
    static cv::Mat mat(const ImagePointer& image, int type) {
        return cv::Mat(image->height, image->width, type, image->data,
                       static_cast<size_t>(image->step * image->channels * image->depth));
    }
    // Results go into kel's own images: the peers allocate nothing either.
    cv::Mat in() const {
        return mat(src, CV_8UC1);
    }
    cv::Mat out() const {
        return mat(dst, CV_8UC1);
    }
    cv::Mat halfOut() const {
        return mat(half, CV_8UC1);
    }
    cv::Mat outS16() const {
        return mat(response, CV_16SC1);
    }
#endif
};

using Work = void (*)(Desk&);

struct Operation {
    const char* name;
    double read, written; // bytes a pixel
    Work kel;
    std::vector<std::pair<Work, const char*>> peers; // with what they compute differently
};

#if KEL_BENCH_OPENCV
void halve(Desk& d) {
    cv::Mat half = d.halfOut();
    cv::resize(d.out(), half, half.size(), 0, 0, cv::INTER_NEAREST);
}
template <int side> void blur(Desk& d) {
    cv::Mat out = d.out();
    cv::GaussianBlur(d.in(), out, {side, side}, 0);
}
template <int side> void blurAndHalve(Desk& d) {
    blur<side>(d);
    halve(d);
}
void laplace(Desk& d) {
    cv::Mat out = d.outS16();
    cv::Laplacian(d.in(), out, CV_16S, 1);
}
void magnitude(Desk& d) {
    cv::Mat out = d.outS16();
    cv::magnitude(d.dx, d.dy, d.squares);
    d.squares.convertTo(out, CV_16S);
}
void sobelMagnitude(Desk& d) {
    cv::Sobel(d.in(), d.dx, CV_32F, 1, 0);
    cv::Sobel(d.in(), d.dy, CV_32F, 0, 1);
    magnitude(d);
}
void median(Desk& d) {
    cv::Mat out = d.out();
    cv::medianBlur(d.in(), out, 3);
}
void noise(Desk& d) {
    cv::Mat added = d.outS16(), out = d.out();
    cv::randu(added, -10, 11);
    cv::add(d.in(), added, out, cv::noArray(), CV_8U);
}
void fast(Desk& d) {
    cv::FAST(Desk::mat(d.smooth, CV_8UC1), d.corners, 20);
}
void frontEnd(Desk& d) {
    cv::Mat in = d.in(), out = d.out(), response = d.outS16();
    cv::cvtColor(Desk::mat(d.frame, CV_8UC2), in, cv::COLOR_YUV2GRAY_UYVY);
    cv::GaussianBlur(in, out, {7, 7}, 0);
    cv::Laplacian(out, response, CV_16S, 1);
    cv::FAST(out, d.corners, 20);
}
#define KEL_PEERS(...)                                                                                                         \
    { __VA_ARGS__ }
#else
#define KEL_PEERS(...)                                                                                                         \
    {}
#endif

// clang-format off
const Operation kOperations[] = {
    {"Gaussian 5x5", 1, 3,
     [](Desk& d) { applyKelFilterGaussian5X5(d.dst.get(), d.src.get(), d.sums.get()); },
     KEL_PEERS({blur<5>, "no scratch image left behind"})},
    {"Gaussian 5x5 and half", 1, 3.25,
     [](Desk& d) { applyKelFilterGaussian5X5_downsampling(d.dst.get(), d.half.get(), d.src.get(), d.sums.get()); },
     KEL_PEERS({blurAndHalve<5>, "no scratch image left behind"})},
    {"Gaussian 7x7", 1, 2,
     [](Desk& d) { applyKelFilterGaussian7X7(d.dst.get(), d.src.get(), d.tmp.get()); },
     KEL_PEERS({blur<7>, "rounds once, no scratch image left behind"})},
    {"Gaussian 7x7 and half", 1, 2.25,
     [](Desk& d) { applyKelFilterGaussian7X7_downsampling(d.dst.get(), d.half.get(), d.src.get(), d.tmp.get()); },
     KEL_PEERS({blurAndHalve<7>, "rounds once, no scratch image left behind"})},
    {"Cross operator", 1, 2,
     [](Desk& d) { applyKelFilterLaplacian3X3(d.response.get(), d.src.get()); },
     KEL_PEERS({laplace, "neighbours at distance 1"})},
    {"Sobel magnitude", 1, 2,
     [](Desk& d) { applyKelFilterSobel3X3(d.response.get(), d.src.get()); },
     KEL_PEERS({sobelMagnitude, ""})},
    {"Noise", 1, 1,
     [](Desk& d) { applyKelFilterNoise(d.dst.get(), d.src.get(), 10); },
     KEL_PEERS({noise, "a generator of its own"})},
    {"YAPE keypoints", 2, 0,
     [](Desk& d) { d.detect(); },
     KEL_PEERS({fast, "FAST corners"})},
    {"Front end: grey, 7x7 and half, cross, keypoints", 2, 5.25,
     [](Desk& d) {
         convertKelImage(d.src.get(), d.frame.get());
         applyKelFilterGaussian7X7_downsampling(d.smooth.get(), d.half.get(), d.src.get(), d.tmp.get());
         applyKelFilterLaplacian3X3(d.response.get(), d.smooth.get());
         d.detect();
     },
     KEL_PEERS({frontEnd, "no half, Laplacian at distance 1, FAST corners"})},
};

const Operation kRank =
    {"Rank filter 3x3", 1, 1,
     [](Desk& d) { applyKelFilterMedianNXN(d.dst.get(), d.src.get(), 1); },
     KEL_PEERS({median, "the true median"})};
// clang-format on

Run run(const char* who, Work work, const ImageSize& size, const char* differs) {
    return {who,
            [=] {
                const auto desk = std::make_shared<Desk>(size);
                return Body([=] { work(*desk); });
            },
            differs};
}

void addLine(const Operation& operation, const ImageSize& size) {
    const double pixels = static_cast<double>(size.width) * size.height;
    std::vector<Run> runs = {run("kel", operation.kel, size, "")};
    for (const auto& peer : operation.peers)
        runs.push_back(run("OpenCV", peer.first, size, peer.second));
    add(operation.name, size.name, {operation.read * pixels, operation.written * pixels}, runs);
}

void addLines() {
    for (const ImageSize& size : kImageSizes)
        for (const Operation& operation : kOperations)
            addLine(operation, size);
    addLine(kRank, kImageSizes[0]); // one sort a pixel, by design: once is enough
}

const Lines lines(addLines);

} // namespace
