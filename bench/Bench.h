// The frame of the measurements: a line is one operation at one size, done by kel and by the peers a user would otherwise
// take, interleaved in one process. Each file of bench/ adds its lines from one object at namespace scope.
#ifndef KEL_BENCH_H
#define KEL_BENCH_H

#include <functional>
#include <kel/kelImage.hpp>
#include <memory>
#include <string>
#include <vector>

namespace kel_bench {

using Body = std::function<void()>;

// One contender of a line. `prepare` allocates and fills what the body needs; only the body is measured.
struct Run {
    std::string who; // "kel", "OpenCV", "libyuv", "Eigen", "LAPACK", ...
    std::function<Body()> prepare;
    std::string differs = ""; // what a peer computes differently; empty where it does the same
};

// Bytes that an operation must read and write at least: a plain pass over as many is the bound. {0, 0}: no bound.
struct Traffic {
    double read, written;
};

// Adds a line; `runs` starts with kel. Two lines differ in operation or size.
void add(const std::string& operation, const std::string& size, Traffic traffic, std::vector<Run> runs);

// `static const Lines lines(addLines);` at namespace scope makes the program call addLines.
struct Lines {
    explicit Lines(void (*addLines)());
};

// Images are measured at these sizes.
struct ImageSize {
    int width, height;
    std::string name;
};
extern const std::vector<ImageSize> kImageSizes; // 640x480, 1920x1080, 3840x2160

// An image with smooth, noisy content, the same at every call; released with its last user, for the calls are copied.
using ImagePointer = std::shared_ptr<kelImage_t>;
ImagePointer image(int width, int height, int type);

} // namespace kel_bench

#endif
