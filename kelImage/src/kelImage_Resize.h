// The bodies of resizing behind their checks, each in a file of its own name: sampling, enlargement, reduction.
#ifndef KEL_IMAGE_RESIZE_H
#define KEL_IMAGE_RESIZE_H

#include <cstdlib>
#include <memory>

#include "kelImage.h"

namespace kel {

// Sampling at whole-number ratios, in any type that is moved as whole pixels; averages in U8G.
void sampleNearest(kelImage_t* dst, const kelImage_t* src);
void sampleBilinear(kelImage_t* dst, const kelImage_t* src, kelValue_s32 rx, kelValue_s32 ry);
void keepEverySecond(kelImage_t* dst, const kelImage_t* src);

// Four-byte pixels at any ratio.
void enlarge(kelImage_t* dst, const kelImage_t* src);
void reduce(kelImage_t* dst, const kelImage_t* src);

kelValue_s32 gcd(kelValue_s32 x, kelValue_s32 y);

struct Free {
    void operator()(void* block) const { free(block); }
};
template <class T> using Buffer = std::unique_ptr<T[], Free>;
template <class T> Buffer<T> allocate(size_t count) {
    return Buffer<T>(static_cast<T*>(malloc(count * sizeof(T))));
}

// Columns of a row that kernels fill by whole blocks of four.
inline ptrdiff_t wholeFours(kelValue_s32 width) {
    return (static_cast<ptrdiff_t>(width) + 3) / 4 * 4;
}

} // namespace kel

#endif
