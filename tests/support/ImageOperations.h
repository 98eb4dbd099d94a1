// Every image operation once, with its plain reference: what unit tests, valgrind, threads and fuzz targets go through. An
// operation that is added here is tested by all of them.
#ifndef KEL_TESTS_IMAGE_OPERATIONS_H
#define KEL_TESTS_IMAGE_OPERATIONS_H

#include <cstddef>
#include <functional>
#include <kel/kelImage.hpp>
#include <string>
#include <vector>

namespace kel_test {

struct Size {
    int width, height;
};

struct Operands {
    kelImage_t *dst, *src;
    kelImage_t* tmp = nullptr;  // scratch, for operations that have it
    kelImage_t* half = nullptr; // the same of a destination at half the size
    int parameter = 0;          // threshold, radius, amplitude, border or ratio
};
using ImageCall = std::function<void(const Operands&)>;

constexpr int kNoType = -2;

struct ImageOperation {
    std::string name; // the exported function's, and the types where it takes several
    int from, to;     // pixel types of source and destination
    ImageCall call, reference;

    int tmp = kNoType;                       // type of the scratch image, which has the source's size
    bool half = false;                       // takes a `half`, or null
    bool inPlace = false;                    // the destination may be the source
    bool checked = true;                     // stops on sizes that do not fit; else it goes by the destination's
    bool withinPixels = false;               // neither reads nor writes padding
    bool rounds = false;                     // by the thread's rounding mode
    bool draws = false;                      // from rand()
    bool byType = false;                     // looks at the types, and leaves images of others alone
    int leastWidth = 0;                      // of a source that it is defined for
    int stride = 1;                          // every so many of the sizes are enough
    std::vector<int> parameters = {0};       // that are worth a try
    std::vector<int> heights = {0, 1, 2, 5}; // of sources, likewise
    Size (*size)(Size src, int parameter) = [](Size src, int) { return src; }; // the destination's
    int room = 1;      // the destination's data area in multiples of its size
    size_t behind = 0; // bytes that it reads behind the source's data
    struct {
        int left = 0, right = 0, top = 0, bottom = 0;
    } settled;             // margins within which the destination is written from pixels alone, not from padding
    int settledWidth = 61; // of a source for that to hold

    std::string function() const { return name.substr(0, name.find(' ')); }
};

const std::vector<ImageOperation>& imageOperations();
const ImageOperation& imageOperation(const std::string& name);

// Bytes of the destination's data area.
size_t roomFor(const ImageOperation& operation, Size dst);

// An image whose data area is a heap block of just its size and `extra` bytes, so that a sanitizer sees every step beside it.
kel::Image imageWithRoom(Size size, int type, size_t extra = 0);

} // namespace kel_test

#endif
