// The filters, pixel by pixel and pass after pass: what the vector code must equal byte for byte.
#ifndef KEL_TESTS_FILTER_REFERENCE_H
#define KEL_TESTS_FILTER_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <kel/kelImage.h>
#include <vector>

namespace kel_ref {

inline uint8_t& u8(kelImage_t* image, int x, int y) {
    return image->data[static_cast<ptrdiff_t>(y) * image->step + x];
}
inline int16_t& s16(kelImage_t* image, int x, int y) {
    return reinterpret_cast<int16_t*>(image->data)[static_cast<ptrdiff_t>(y) * image->step + x];
}

inline void gaussian5x5(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp) {
    const int w = dst->width, h = dst->height, weight[] = {1, 4, 6, 4, 1};
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
            int sum = 0;
            if (x >= 2 && x <= w - 3)
                for (int i = 0; i < 5; ++i)
                    sum += weight[i] * u8(src, x + i - 2, y);
            s16(tmp, x, y) = static_cast<int16_t>(sum);
        }
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
            int value = 0;
            if (x >= 2 && x <= w - 3 && y >= 2 && y <= h - 3) {
                for (int i = 0; i < 5; ++i)
                    value += weight[i] * s16(tmp, x, y + i - 2);
                value = (value + 128) >> 8;
            }
            u8(dst, x, y) = static_cast<uint8_t>(value);
            if (half && x % 2 == 0 && y % 2 == 0)
                u8(half, x / 2, y / 2) = static_cast<uint8_t>(value);
        }
}

inline void gaussian7x7(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp) {
    const int w = dst->width, h = dst->height, weight[] = {2, 7, 14, 18, 14, 7, 2};
    for (int y = 0; tmp->width > 16 && y < tmp->height; ++y)
        for (int i = 0; i == 0 || i + 16 < tmp->width; i += 8)
            for (int c = 8 + i; c < 16 + i; ++c) {
                int sum = 32;
                for (int k = 0; k < 7; ++k)
                    sum += weight[k] * u8(src, c + k - 3, y);
                u8(tmp, c, y) = static_cast<uint8_t>(sum >> 6);
                u8(tmp, c + 8, y) = 0;
            }
    for (int y = 3; w > 16 && y <= h - 4; ++y)
        for (int j = 0; j == 0 || j + 16 < w; j += 16) {
            for (int c = 8 + j; c < 24 + j; ++c) {
                int sum = 32;
                for (int k = 0; k < 7; ++k)
                    sum += weight[k] * u8(tmp, c, y + k - 3);
                u8(dst, c, y) = static_cast<uint8_t>(std::min(sum >> 6, 255));
            }
            for (int k = 0; half && y % 2 == 0 && k < 16; ++k)
                u8(half, (8 + j) / 2 + k, y / 2) = k < 8 ? u8(dst, 8 + j + 2 * k, y) : 0;
        }
}

inline void cross(kelImage_t* dst, kelImage_t* src) {
    for (int y = 5; src->width > 16 && y <= src->height - 6; ++y)
        for (int j = 0; j == 0 || j + 16 < src->width; j += 16)
            for (int x = 8 + j; x < 24 + j; ++x)
                s16(dst, x, y) = static_cast<int16_t>(u8(src, x - 5, y) + u8(src, x + 5, y) + u8(src, x, y - 5) +
                                                      u8(src, x, y + 5) - 4 * u8(src, x, y));
}

// Root and conversion follow the thread's rounding mode, as the filter's do.
inline void sobel(kelImage_t* dst, kelImage_t* src) {
    for (int y = 1; src->width > 32 && y <= src->height - 2; ++y)
        for (int j = 0; j == 0 || j + 32 < src->width; j += 4)
            for (int x = 16 + j; x < 24 + j; ++x) {
                const auto s = [&](int dx, int dy) { return static_cast<int>(u8(src, x + dx, y + dy)); };
                volatile float m = 0; // keeps the compiler from knowing, and rounding, anything beforehand
                if (x < 20 + j) {
                    const int gy = s(-1, -1) + 2 * s(0, -1) + s(1, -1) - (s(-1, 1) + 2 * s(0, 1) + s(1, 1));
                    const int gx = s(-1, -1) + 2 * s(-1, 0) + s(-1, 1) - (s(1, -1) + 2 * s(1, 0) + s(1, 1));
                    m = static_cast<float>(gx) * static_cast<float>(gx) + static_cast<float>(gy) * static_cast<float>(gy);
                    m = std::sqrt(m);
                }
                s16(dst, x, y) = static_cast<int16_t>(std::lrint(m));
            }
}

inline void rank(kelImage_t* dst, kelImage_t* src, int n) {
    for (int y = 0; n >= 1 && y < src->height; ++y)
        for (int x = 0; x < src->width; ++x) {
            u8(dst, x, y) = 0;
            if (x < n || x + n >= src->width || y < n || y + n >= src->height)
                continue;
            std::vector<uint8_t> window;
            for (int v = y - n; v <= y + n; ++v)
                for (int u = x - n; u <= x + n; ++u)
                    window.push_back(u8(src, u, v));
            std::nth_element(window.begin(), window.begin() + 2 * n * (n + 1) + 1, window.end());
            u8(dst, x, y) = window[2 * n * (n + 1) + 1];
        }
}

inline void noise(kelImage_t* dst, kelImage_t* src, int amplitude) {
    for (int y = 0; y < src->height; ++y)
        for (int x = 0; x < src->width; ++x) {
            int64_t v = u8(src, x, y);
            if (amplitude != 0)
                v += std::rand() % (2 * int64_t(amplitude) + 1) - amplitude;
            u8(dst, x, y) = static_cast<uint8_t>(v < 0 ? 0 : v > 255 ? 255 : v);
        }
}

} // namespace kel_ref

#endif
