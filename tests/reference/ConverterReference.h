// Plain references of the converters, a pixel or a pair at a time over bytes.
#ifndef KEL_TESTS_CONVERTER_REFERENCE_H
#define KEL_TESTS_CONVERTER_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <kel/kelImage.h>

namespace kel_ref {

// ---- Portable converters: body(d, s) for each pixel of the destination, rows by step. A pixel of the source is taken out first.

template <int D, int S, class Body> void perPixel(kelImage_t* dst, const kelImage_t* src, Body body) {
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; ++x) {
            uint8_t s[S];
            std::memcpy(s, src->data + (static_cast<ptrdiff_t>(y) * src->step + x) * S, S);
            body(dst->data + (static_cast<ptrdiff_t>(y) * dst->step + x) * D, s);
        }
}

inline void putShort(uint8_t* d, int value) {
    const int16_t v = static_cast<int16_t>(value);
    std::memcpy(d, &v, 2);
}
inline uint8_t magnitude(const uint8_t* s) {
    int16_t v;
    std::memcpy(&v, s, 2);
    return static_cast<uint8_t>(std::abs(static_cast<int>(v)) >> 7);
}
inline int mean(const uint8_t* s) {
    return (s[0] + s[1] + s[2]) / 3;
}

inline void S16G_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    perPixel<1, 2>(dst, src, [](uint8_t* d, const uint8_t* s) { d[0] = magnitude(s); });
}
inline void S16G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    perPixel<3, 2>(dst, src, [](uint8_t* d, const uint8_t* s) { d[0] = d[1] = d[2] = magnitude(s); });
}
inline void S16G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    perPixel<4, 2>(dst, src, [](uint8_t* d, const uint8_t* s) { d[0] = d[1] = d[2] = magnitude(s), d[3] = 0; });
}
inline void U8XYZ_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    perPixel<1, 3>(dst, src, [](uint8_t* d, const uint8_t* s) { d[0] = static_cast<uint8_t>(mean(s)); });
}
inline void U8XYZ_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    perPixel<2, 3>(dst, src, [](uint8_t* d, const uint8_t* s) { putShort(d, mean(s)); });
}
// Bytes `from` of each pixel of S, -1 for 0.
template <int S, int... from> void picked(kelImage_t* dst, const kelImage_t* src) {
    perPixel<sizeof...(from), S>(dst, src, [](uint8_t* d, const uint8_t* s) { ((*d++ = from < 0 ? 0 : s[from]), ...); });
}
constexpr auto U8XYZ_to_U8ZYX = picked<3, 2, 1, 0>;
constexpr auto U8XYZ_to_U8XYZA = picked<3, 0, 1, 2, -1>;
constexpr auto U8XYZ_to_U8ZYXA = picked<3, 2, 1, 0, -1>;
constexpr auto U8XYZA_to_U8XYZ = picked<4, 0, 1, 2>;
constexpr auto U8XYZA_to_U8ZYX = picked<4, 2, 1, 0>;
constexpr auto U8XYZA_to_U8ZYXA = picked<4, 2, 1, 0, 3>;
// Misplaced: as if the grey destination had three channels.
inline void U8XYZA_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    perPixel<3, 4>(dst, src, [](uint8_t* d, const uint8_t* s) { d[0] = static_cast<uint8_t>(mean(s)); });
}
inline void U8XYZA_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    perPixel<6, 4>(dst, src, [](uint8_t* d, const uint8_t* s) { putShort(d, mean(s)); });
}

// ---- YUV to colour.

struct Rgb {
    uint8_t r, g, b;
};

inline uint8_t truncatedByte(float v) {
    return v < 0 ? 0 : v > 255 ? 255 : static_cast<uint8_t>(v);
}
inline Rgb yuvTruncated(int y, int u, int v) {
    const float c = static_cast<float>(y - 16) * 1.164f, u1 = static_cast<float>(u - 128), v1 = static_cast<float>(v - 128);
    return {truncatedByte(c + 1.793f * v1), truncatedByte((c + -0.213f * u1) + -0.534f * v1), truncatedByte(c + 2.115f * u1)};
}

inline uint8_t roundedByte(float v) {
    return static_cast<uint8_t>(std::min(255l, std::max(0l, std::lrint(v)))); // by the thread's rounding mode
}
inline Rgb yuvRounded(int y, int u, int v) {
    const float c = static_cast<float>(y - 16) * 1.164f, u1 = static_cast<float>(u - 128), v1 = static_cast<float>(v - 128);
    return {roundedByte(c + 1.793f * v1), roundedByte(c + (-0.213f * u1 + -0.534f * v1)), roundedByte(c + 2.115f * u1)};
}

template <bool blueFirst> void yuvToThree(kelImage_t* dst, const kelImage_t* src) {
    for (int y = 0; y < dst->height; ++y)
        for (int p = 0; 2 * p < dst->width; ++p) {
            const uint8_t* s = src->data + 2 * static_cast<ptrdiff_t>(y) * src->step + 4 * p;
            uint8_t* d = dst->data + 3 * static_cast<ptrdiff_t>(y) * dst->step + 6 * p;
            for (int i = 0; i < 2; ++i) {
                const Rgb c = yuvTruncated(s[1 + 2 * i], s[0], s[2]);
                d[3 * i] = blueFirst ? c.b : c.r;
                d[3 * i + 1] = c.g;
                d[3 * i + 2] = blueFirst ? c.r : c.b;
            }
        }
}
constexpr auto U8YUV_to_U8RGB = yuvToThree<false>;
constexpr auto U8YUV_to_U8BGR = yuvToThree<true>;

// ---- Vector converters: blocks of N pixels in one run through both areas; body(d, s) for each pair of pixels.

template <int N, int D, int S, class Body> void perPairOfRun(kelImage_t* dst, const kelImage_t* src, Body body) {
    const uint8_t* s = src->data;
    uint8_t* d = dst->data;
    for (int y = 0; y < dst->height; ++y)
        for (int x = 0; x < dst->width; x += N)
            for (int i = 0; i < N; i += 2, s += 2 * S, d += 2 * D)
                body(d, s);
}

inline void U8G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    perPairOfRun<16, 3, 1>(dst, src,
                           [](uint8_t* d, const uint8_t* s) { d[0] = d[1] = d[2] = s[0], d[3] = d[4] = d[5] = s[1]; });
}
inline void U8G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    perPairOfRun<16, 4, 1>(dst, src, [](uint8_t* d, const uint8_t* s) {
        d[0] = d[1] = d[2] = s[0], d[4] = d[5] = d[6] = s[1];
        d[3] = d[7] = 0;
    });
}
inline void U8G_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    perPairOfRun<16, 2, 1>(dst, src, [](uint8_t* d, const uint8_t* s) { putShort(d, s[0]), putShort(d + 2, s[1]); });
}
inline void U8YUV_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    perPairOfRun<16, 1, 2>(dst, src, [](uint8_t* d, const uint8_t* s) { d[0] = s[1], d[1] = s[3]; });
}
template <bool blueFirst> void yuvToFour(kelImage_t* dst, const kelImage_t* src) {
    perPairOfRun<4, 4, 2>(dst, src, [](uint8_t* d, const uint8_t* s) {
        for (int i = 0; i < 2; ++i) {
            const Rgb c = yuvRounded(s[1 + 2 * i], s[0], s[2]);
            d[4 * i] = blueFirst ? c.b : c.r;
            d[4 * i + 1] = c.g;
            d[4 * i + 2] = blueFirst ? c.r : c.b;
            d[4 * i + 3] = 0;
        }
    });
}
constexpr auto U8YUV_to_U8RGBA = yuvToFour<false>;
constexpr auto U8YUV_to_U8BGRA = yuvToFour<true>;

inline void nothing(kelImage_t*, const kelImage_t*) {}

// ---- The dispatcher.

inline void convert(kelImage_t* dst, const kelImage_t* src) {
    using Converter = void (*)(kelImage_t*, const kelImage_t*);
    const auto copy = [](kelImage_t* to, const kelImage_t* from) { std::memmove(to->data, from->data, from->size); };
    struct Route {
        int from, to;
        Converter converter;
    };
    static const Route routes[] = {
        {0, 3, U8G_to_S16G},        {0, 8, U8G_to_U8XYZ},      {0, 16, U8G_to_U8XYZA},    {0, 24, U8G_to_U8XYZ},
        {0, 32, U8G_to_U8XYZA},     {3, 0, S16G_to_U8G},       {3, 8, S16G_to_U8XYZ},     {3, 16, S16G_to_U8XYZA},
        {3, 24, S16G_to_U8XYZ},     {3, 32, S16G_to_U8XYZA},   {8, 0, U8XYZ_to_U8G},      {8, 3, U8XYZ_to_S16G},
        {8, 16, U8XYZ_to_U8XYZA},   {8, 24, U8XYZ_to_U8ZYX},   {8, 32, U8XYZ_to_U8XYZA},  {16, 0, U8XYZA_to_U8G},
        {16, 3, U8XYZA_to_S16G},    {16, 8, U8XYZA_to_U8XYZ},  {16, 24, U8XYZA_to_U8ZYX}, {16, 32, U8XYZA_to_U8ZYXA},
        {24, 0, U8XYZ_to_U8G},      {24, 3, U8XYZ_to_S16G},    {24, 8, U8XYZ_to_U8ZYX},   {24, 16, U8XYZ_to_U8XYZA},
        {24, 32, U8XYZ_to_U8XYZA},  {32, 0, U8XYZA_to_U8G},    {32, 3, U8XYZA_to_S16G},   {32, 8, U8XYZA_to_U8ZYX},
        {32, 16, U8XYZA_to_U8ZYXA}, {32, 24, U8XYZA_to_U8XYZ}, {40, 0, U8YUV_to_U8G},     {40, 8, U8YUV_to_U8BGR},
        {40, 16, U8YUV_to_U8BGRA},  {40, 24, U8YUV_to_U8RGB},  {40, 32, U8YUV_to_U8RGBA}};
    for (int type : {0, 3, 8, 16, 24, 32, 40})
        if (src->type == type && dst->type == type)
            copy(dst, src);
    for (const Route& route : routes)
        if (src->type == route.from && dst->type == route.to)
            route.converter(dst, src);
}

} // namespace kel_ref

#endif
