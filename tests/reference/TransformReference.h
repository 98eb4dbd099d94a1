// Plain references of resizing, borders, flips and warp, a pixel at a time over bytes.
#ifndef KEL_TESTS_TRANSFORM_REFERENCE_H
#define KEL_TESTS_TRANSFORM_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <kel/kelImage.h>
#include <numeric>
#include <vector>

namespace kel_ref {

// Bytes of a pixel that is moved as a whole; 0 for the types that are ignored.
inline int wholePixelBytes(int type) {
    return type == 0 ? 1 : type == 3 ? 2 : type == 8 || type == 24 ? 3 : type == 16 || type == 32 ? 4 : 0;
}

inline void copyPixel(kelImage_t* dst, ptrdiff_t to, const kelImage_t* src, ptrdiff_t from) {
    const int bytes = wholePixelBytes(dst->type);
    std::memcpy(dst->data + to * bytes, src->data + from * bytes, bytes);
}

inline void nearest(kelImage_t* dst, const kelImage_t* src) {
    const float rx = static_cast<float>(src->width / dst->width), ry = static_cast<float>(src->height / dst->height);
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; ++x) {
            const int sx = static_cast<int>((x + 0.5f) * rx), sy = static_cast<int>((y + 0.5f) * ry);
            copyPixel(dst, y * dst->width + x, src, sy * src->width + sx);
        }
}

inline void bilinear(kelImage_t* dst, const kelImage_t* src) {
    const float rx = static_cast<float>(src->width / dst->width), ry = static_cast<float>(src->height / dst->height);
    if (dst->type != 0)
        return;
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; ++x) {
            const float fx = (x + 0.5f) * rx, fy = (y + 0.5f) * ry;
            const int ix = static_cast<int>(fx), iy = static_cast<int>(fy);
            const float wx = fx - ix, wy = fy - iy;
            const int ix1 = ix == src->width - 1 ? ix : ix + 1, iy1 = iy == src->height - 1 ? iy : iy + 1;
            const auto s = [&](int i, int j) { return static_cast<float>(src->data[j * src->width + i]); };
            const float v =
                (s(ix, iy) * (1 - wx) + s(ix1, iy) * wx) * (1 - wy) + (s(ix, iy1) * (1 - wx) + s(ix1, iy1) * wx) * wy;
            dst->data[y * dst->width + x] = static_cast<uint8_t>(static_cast<int>(v + 0.5f));
        }
}

inline void half(kelImage_t* dst, const kelImage_t* src) {
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; ++x)
            copyPixel(dst, y * dst->step + x, src, 2 * y * src->step + 2 * x);
}

inline int greatestCommonDivisor(int x, int y) {
    return y == 0 ? x : greatestCommonDivisor(y, x % y);
}

inline void linearInterpolation(kelImage_t* dst, const kelImage_t* src) {
    const int Dw = dst->width, Dh = dst->height, Sw = src->width, Sh = src->height;
    const auto tables = [](int D, int S, std::vector<int>& f, std::vector<int>& adv) {
        const int g = greatestCommonDivisor(D, S), a = D / g, b = S / g;
        int k = 0;
        for (int i = 0; i < D; ++i) {
            f.push_back(i * b % a * 256 / a);
            adv.push_back((k + 1) * a <= i * b);
            k += adv.back();
        }
    };
    std::vector<int> fx, advx, fy, advy;
    tables(Dw, Sw, fx, advx);
    tables(Dh, Sh, fy, advy);
    std::vector<int> B(static_cast<size_t>(Sh + 1) * Dw * 4);
    for (int r = 0; r < Sh; ++r)
        for (int i = 0, q = 0; i < Dw; ++i) {
            q += advx[i];
            const uint8_t* const p = src->data + (r * Sw + q) * 4;
            for (int c = 0; c < 3; ++c)
                B[(r * Dw + i) * 4 + c] = ((256 - fx[i]) * p[c] + fx[i] * p[4 + c]) >> 8;
        }
    std::copy(B.end() - 8 * Dw, B.end() - 4 * Dw, B.end() - 4 * Dw);
    for (int i = 0; i < Dw; ++i)
        for (int j = 0, q = 0; j < Dh; ++j) {
            q += advy[j];
            for (int c = 0; c < 4; ++c) {
                const int upper = B[(q * Dw + i) * 4 + c], lower = B[((q + 1) * Dw + i) * 4 + c];
                dst->data[(j * Dw + i) * 4 + c] = static_cast<uint8_t>((lower * fy[j] + upper * (256 - fy[j])) >> 8);
            }
        }
}

// Every input repeated, so many of them averaged.
inline std::vector<uint8_t> averages(const std::vector<uint8_t>& in, int outputs) {
    const int inputs = static_cast<int>(in.size()), g = greatestCommonDivisor(outputs, inputs), box = inputs / g;
    std::vector<uint8_t> held, out;
    for (uint8_t value : in)
        held.insert(held.end(), outputs / g, value);
    for (auto first = held.begin(); first != held.end(); first += box)
        out.push_back(static_cast<uint8_t>(std::accumulate(first, first + box, 0) / box));
    return out;
}

inline void zeroOrderHoldPlusAverage(kelImage_t* dst, const kelImage_t* src) {
    for (int channel = 0; channel < 4; ++channel) {
        std::vector<std::vector<uint8_t>> rows;
        for (int y = 0; y < src->height; ++y) {
            std::vector<uint8_t> row;
            for (int x = 0; x < src->width; ++x)
                row.push_back(src->data[(y * src->width + x) * 4 + channel]);
            rows.push_back(averages(row, dst->width));
        }
        for (int x = 0; x < dst->width; ++x) {
            std::vector<uint8_t> column;
            for (const auto& row : rows)
                column.push_back(row[x]);
            column = averages(column, dst->height);
            for (int y = 0; y < dst->height; ++y)
                dst->data[(y * dst->width + x) * 4 + channel] = column[y];
        }
    }
}

inline void enborder(kelImage_t* dst, const kelImage_t* src, int size) {
    const int bytes = wholePixelBytes(dst->type), Sw = src->width, Sh = src->height;
    if (bytes == 0)
        return;
    const ptrdiff_t ds = bytes <= 2 ? dst->step : dst->width, ss = bytes <= 2 ? src->step : src->width;
    for (int y = 0; y < Sh; ++y)
        for (int x = 0; x < Sw; ++x)
            copyPixel(dst, (y + size) * ds + x + size, src, y * ss + x);
    for (int r = 0; r < size; ++r)
        for (int x = 0; x < Sw; ++x) {
            copyPixel(dst, r * ds + x + size, src, x);
            copyPixel(dst, (Sh + size + r) * ds + x + size, src, (Sh - 1) * ss + x);
        }
    for (int r = 0; r < Sh + 2 * size; ++r)
        for (int x = 0; x < size; ++x)
            copyPixel(dst, r * ds + x, dst, r * ds + size);
    const ptrdiff_t base = bytes == 2 ? src->step : Sw;
    for (int r = 0; r < Sh + 2 * size; ++r)
        for (int x = 0; x < size; ++x) {
            const ptrdiff_t to = r * ds + base + size + x;
            if ((to + 1) * bytes <= dst->size)
                copyPixel(dst, to, dst, r * ds + base + size - 1);
        }
}

inline void deborder(kelImage_t* dst, const kelImage_t* src, int size) {
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; ++x)
            copyPixel(dst, y * dst->step + x, src, (y + size) * src->step + x + size);
}

inline void flip(kelImage_t* dst, const kelImage_t* src, bool mirrored, bool upsideDown) {
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; ++x)
            copyPixel(dst, y * dst->step + x, src,
                      (upsideDown ? dst->height - 1 - y : y) * src->step + (mirrored ? dst->width - 1 - x : x));
}

// Truncation toward zero; -1 where the value is no int.
inline int truncated(float value) {
    return value > -2147483648.0f && value < 2147483648.0f ? static_cast<int>(value) : -1;
}

inline void warp(kelImage_t* dst, const kelImage_t* src, const float* h) {
    const int bytes = wholePixelBytes(dst->type);
    if (bytes == 0)
        return;
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; ++x) {
            const bool centred = dst->type == 0;
            const float u = centred ? x + 0.5f : x, v = centred ? y + 0.5f : y;
            const float w = (h[6] * u + h[7] * v) + h[8];
            float qx = ((h[0] * u + h[1] * v) + h[2]) / w, qy = ((h[3] * u + h[4] * v) + h[5]) / w;
            if (!centred) {
                qx = qx + 0.5f;
                qy = qy + 0.5f;
            }
            const int sx = truncated(qx), sy = truncated(qy);
            const ptrdiff_t to = static_cast<ptrdiff_t>(y) * dst->step + x;
            if (sx >= 0 && sy >= 0 && sx < src->width && sy < src->height)
                copyPixel(dst, to, src, static_cast<ptrdiff_t>(sy) * src->step + sx);
            else
                std::memset(dst->data + to * bytes, 0, bytes);
        }
}

} // namespace kel_ref

#endif
