// The four loops that take the time, written once over the vocabulary of lanes, and the table by which they are called.
#ifndef KEL_REGISTER_KERNELS_H
#define KEL_REGISTER_KERNELS_H

#include <stddef.h>
#include <stdint.h>

namespace kelRegister {

constexpr int kPatch = 16;     // side of a patch, and of the grid of a description
constexpr int kCells = 4;      // of a description, either way
constexpr int kDirections = 8; // of a cell
constexpr int kDescription = kCells * kCells * kDirections;

struct Kernels {
    // out[x] = strength | direction << 8 of p's pixels 0 .. width-1, up to 7 more: strength min(255, 2 |g|) rounded, direction
    // in 1/256 of a turn from the x axis to the y axis, g being the differences p[1] - p[-1] and p[step] - p[-step].
    void (*gradients)(uint16_t* out, const uint8_t* p, ptrdiff_t step, int width);
    // cells[y][x][direction] += the grid's strengths, shared between the nearest cells and by `directions`, a row of shares for
    // each of the 256 directions.
    void (*describe)(float* cells, const float* strengths, const uint8_t* grid, const float (*directions)[kDirections]);
    // Sums of absolute differences between a description and `count` others, a multiple of 4: writes all, and to `found` the
    // indices of those below `limit` or their own limit. Returns how many.
    int (*differences)(int* found, int* sums, const uint8_t* description, const uint8_t* others, const int* limits, int limit,
                       int count);
    // Sum of the products of a patch with the pixels from `window` on.
    int (*correlate)(const int16_t* patch, const uint8_t* window, ptrdiff_t step);
};

extern const Kernels kKernelsSse, kKernelsAvx2, kKernelsNeon;

// Those that suit this processor.
const Kernels& kernels();

} // namespace kelRegister

#endif
