// Contrast stretching and binarization beside OpenCV.
#include "ImagePeers.h"

namespace {

using namespace kel_bench;

void addLines() {
    const int g = KEL_PIXEL_TYPE_U8G;
    const Call normalize = KEL_OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::normalize(mat(s), to, 0, 255, cv::NORM_MINMAX);
    });
    const Call scaled = KEL_OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        double least, greatest;
        cv::minMaxLoc(mat(s), &least, &greatest);
        const double scale = 255 / (greatest - least);
        mat(s).convertTo(to, CV_8U, scale, -least * scale);
    });
    const Call threshold = KEL_OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::threshold(mat(s), to, 127, 255, cv::THRESH_BINARY);
    });
    const Call adaptive = KEL_OPENCV([](kelImage_t* d, const kelImage_t* s) {
        cv::Mat to = mat(d);
        cv::adaptiveThreshold(mat(s), to, 255, cv::ADAPTIVE_THRESH_MEAN_C, cv::THRESH_BINARY, 25, 0);
    });
    addPixelLines("adjustKelImage", g, g, adjustKelImage, {normalize, "double-precision scale and shift"},
                  {scaled, "single-precision scale and shift"}, "OpenCV convertTo");
    addPixelLines("binalizeKelImage", g, g, [](kelImage_t* d, const kelImage_t* s) { binalizeKelImage(d, s, 128); },
                  {threshold}, {});
    addPixelLines("binalizeKelImageAdaptive", g, g,
                  [tmp = ImagePointer()](kelImage_t* d, const kelImage_t* s) mutable {
                      if (!tmp)
                          tmp = image(d->width, d->height, KEL_PIXEL_TYPE_U8G);
                      binalizeKelImageAdaptive(d, s, tmp.get());
                  },
                  {adaptive, "mean of a 25x25 box"}, {});
}

const Lines lines(addLines);

} // namespace
