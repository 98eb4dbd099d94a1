// Rank filter over a square window, one sort a pixel. Rests on the runtime's qsort and the row helpers.
#include <cstdlib>
#include <cstring>

#include "kelImage_Private.h"

namespace {

int comparePixelValue(const void* a, const void* b) {
    const uint8_t first = *static_cast<const uint8_t*>(a), second = *static_cast<const uint8_t*>(b);
    return first < second ? -1 : first > second;
}

// Rank 2n(n+1) + 1, from 0: one above the true median. Callers rely on it.
uint8_t rankOfWindow(uint8_t* window, const kelImage_t* src, kelValue_s32 x, kelValue_s32 y, kelValue_s32 n) {
    const size_t side = 2 * static_cast<size_t>(n) + 1;
    for (size_t i = 0; i < side; ++i)
        memcpy(window + i * side, kel::row<uint8_t>(src, y - n + static_cast<kelValue_s32>(i)) + x - n, side);
    qsort(window, side * side, 1, comparePixelValue);
    return window[side * side / 2 + 1];
}

} // namespace

extern "C" {

void applyKelFilterMedianNXN(kelImage_t* dst, kelImage_t* src, kelValue_s32 n) {
    KEL_ASSERT(dst->step == src->step && dst->width == src->width && dst->height == src->height);
    if (src->type != KEL_PIXEL_TYPE_U8G || n < 1)
        return;
    const size_t side = 2 * static_cast<size_t>(n) + 1;
    const bool fits = src->width > 2 * int64_t(n) && src->height > 2 * int64_t(n); // else there is nothing to sort
    uint8_t* const window = fits ? static_cast<uint8_t*>(malloc(side * side)) : nullptr;
    for (kelValue_s32 y = 0; y < src->height; ++y)
        for (kelValue_s32 x = 0; x < src->width; ++x) {
            const bool inside = x >= n && x < src->width - n && y >= n && y < src->height - n;
            kel::row<uint8_t>(dst, y)[x] = inside ? rankOfWindow(window, src, x, y, n) : 0;
        }
    free(window);
}

void applyKelFilterMedian3X3(kelImage_t*, kelImage_t*) {}

} // extern "C"
