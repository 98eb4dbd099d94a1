// Plain references of contrast stretching and binarization, a byte at a time.
#ifndef KEL_TESTS_POINT_REFERENCE_H
#define KEL_TESTS_POINT_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <kel/kelImage.h>

namespace kel_ref {

inline uint8_t& grey(const kelImage_t* image, int x, int y) {
    return image->data[static_cast<ptrdiff_t>(y) * image->step + x];
}

inline int wholeBlocks(int width) {
    return width > 0 ? (width + 15) / 16 * 16 : 0;
}

inline void adjust(kelImage_t* dst, const kelImage_t* src) {
    int least = 255, greatest = 0;
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < wholeBlocks(dst->width); ++x) {
            least = std::min<int>(least, grey(src, x, y));
            greatest = std::max<int>(greatest, grey(src, x, y));
        }
    const float scale = greatest == least ? 1.0f : 255.0f / static_cast<float>(greatest - least);
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < wholeBlocks(dst->width); ++x) {
            const float v = (static_cast<float>(grey(src, x, y)) - static_cast<float>(least)) * scale;
            grey(dst, x, y) = static_cast<uint8_t>(std::min(255l, std::max(0l, std::lrint(v))));
        }
}

inline void binalize(kelImage_t* dst, const kelImage_t* src, int threshold) {
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < wholeBlocks(dst->width); ++x)
            grey(dst, x, y) = grey(src, x, y) >= (threshold & 0xff) ? 255 : 0;
}

// The mean at byte `at`, taps `pitch` bytes apart.
inline int wideMean(const uint8_t* at, ptrdiff_t pitch) {
    const int weights[] = {2, 7, 14, 18, 14, 7, 2};
    int sum = 0;
    for (int i = 0; i < 7; ++i)
        sum += weights[i] * at[(i - 3) * pitch];
    return sum >> 6;
}

inline void binalizeAdaptive(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp) {
    if (tmp->width > 32)
        for (int y = 0; y < tmp->height; ++y)
            for (int x = 16; x < tmp->width - 16; x += 8)
                for (int i = 0; i < 8; ++i) {
                    grey(tmp, x + i, y) = static_cast<uint8_t>(wideMean(&grey(src, x + i, y), 4));
                    grey(tmp, x + 8 + i, y) = 0;
                }
    if (dst->width > 32 && dst->height > 32)
        for (int y = 16; y <= dst->height - 17; ++y)
            for (int x = 16; x < dst->width - 16; x += 16)
                for (int i = x; i < x + 16; ++i)
                    grey(dst, i, y) =
                        grey(src, i, y) >= wideMean(&grey(tmp, i, y), 4 * static_cast<ptrdiff_t>(tmp->step)) ? 255 : 0;
}

} // namespace kel_ref

#endif
