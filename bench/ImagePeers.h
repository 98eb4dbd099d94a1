// What the lines over a destination and a source image share: kel images as OpenCV matrices, and the calls of a line.
#ifndef KEL_BENCH_IMAGE_PEERS_H
#define KEL_BENCH_IMAGE_PEERS_H

#include "Bench.h"

#if KEL_BENCH_OPENCV
#include <opencv2/imgproc.hpp>
#endif
#if KEL_BENCH_LIBYUV
#include <libyuv.h>
#endif

namespace kel_bench {

using Call = std::function<void(kelImage_t* dst, const kelImage_t* src)>;

// A peer's call; empty where the peer is absent. `differs` as in Run.
struct Peer {
    Call call;
    std::string differs = "";
};

#if KEL_BENCH_OPENCV
#define KEL_OPENCV(...) Call(__VA_ARGS__)
// The pixels of an image as a matrix over the same memory.
inline cv::Mat mat(const kelImage_t* image) {
    const int type = image->depth == 2 ? CV_16SC1 : CV_8UC(image->channels);
    return cv::Mat(image->height, image->width, type, image->data,
                   static_cast<size_t>(image->step) * image->channels * image->depth);
}
#else
#define KEL_OPENCV(...) Call()
#endif
#if KEL_BENCH_LIBYUV
#define KEL_LIBYUV(...) Call(__VA_ARGS__)
#else
#define KEL_LIBYUV(...) Call()
#endif

// Adds a line at every size for an operation that reads each pixel of `src` and writes each pixel of `dst`, of equal sizes.
inline void addPixelLines(const std::string& operation, int dstType, int srcType, const Call& kel, const Peer& opencv,
                          const Peer& other, const char* otherName = "libyuv") {
    for (const ImageSize& size : kImageSizes) {
        std::vector<Run> runs;
        double bytesOf[2] = {};
        const auto addRun = [&](const std::string& who, const Call& call, const std::string& differs) {
            if (call)
                runs.push_back({who,
                                [=] {
                                    const ImagePointer dst = image(size.width, size.height, dstType),
                                                       src = image(size.width, size.height, srcType);
                                    return Body([=] { call(dst.get(), src.get()); });
                                },
                                differs});
        };
        addRun("kel", kel, "");
        addRun("OpenCV", opencv.call, opencv.differs);
        addRun(otherName, other.call, other.differs);
        for (int i = 0; i < 2; ++i) {
            kelImage_t* header = createKelImageHeader(size.width, size.height, i ? dstType : srcType);
            bytesOf[i] = header->size;
            releaseKelImageHeader(&header);
        }
        add(operation, size.name, {bytesOf[0], bytesOf[1]}, runs);
    }
}

} // namespace kel_bench

#endif
