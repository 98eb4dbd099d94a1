// The conversion dispatcher with its route table, and the portable converters: rows by step, padding untouched. Six of them
// forward to the vector converters; the others may use vectors inside, byte for byte equal to their formulas.
#include <string.h>

#include "kelImage_ConverterLanes.h"
#include "kelImage_Private.h"

using kel::load16;
using kel::row;
using kel::store16;
using kel::store8;

namespace {

// One pixel at a time: body(d, s) with D elements of T and S bytes for each pixel of the destination.
template <class T, int D, int S, class Body> void forEachPixel(kelImage_t* dst, const kelImage_t* src, Body body) {
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        T* d = row<T>(dst, y, D);
        const uint8_t* s = row<uint8_t>(src, y, S);
        for (kelValue_s32 x = 0; x < dst->width; ++x, d += D, s += S)
            body(d, s);
    }
}

// Whole blocks: body(d, s) turns N units of S bytes into as many of D bytes. What is left of a row goes through a buffer, so
// that nothing beside the row's own units is read or written.
template <int N, int D, int S, class Body> void alongRow(uint8_t* d, const uint8_t* s, kelValue_s32 units, Body body) {
    for (; units >= N; units -= N, d += N * D, s += N * S)
        body(d, s);
    if (units > 0) {
        uint8_t in[N * S] = {}, out[N * D];
        memcpy(in, s, static_cast<size_t>(units) * S);
        body(out, in);
        memcpy(d, out, static_cast<size_t>(units) * D);
    }
}

// The same over an image, a unit being a pixel.
template <int N, int D, int S, class Body> void forEachBlock(kelImage_t* dst, const kelImage_t* src, Body body) {
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        alongRow<N, D, S>(row<uint8_t>(dst, y, D), row<uint8_t>(src, y, S), dst->width, body);
}

// Low 8 bits of abs(s) >> 7 for 16 signed values: bits 7 to 14, so that -32768 gives 0.
__m128i magnitude16(const uint8_t* s) {
    const auto half = [](const uint8_t* p) { return _mm_srli_epi16(_mm_slli_epi16(_mm_abs_epi16(load16(p)), 1), 8); };
    return _mm_packus_epi16(half(s), half(s + 16));
}

template <int Channels> void magnitudeTo(kelImage_t* dst, const kelImage_t* src) {
    forEachBlock<16, Channels, 2>(dst, src, [](uint8_t* d, const uint8_t* s) { kel::storeGrey<Channels>(d, magnitude16(s)); });
}

// Sums of the four pixels of three bytes that start at byte `first` of a vector.
template <int first> __m128i sums4(__m128i v) {
    const __m128i ones = _mm_set1_epi16(1), byteOnes = _mm_set1_epi8(1);
    const __m128i start = _mm_setr_epi8(0, 1, 2, -1, 3, 4, 5, -1, 6, 7, 8, -1, 9, 10, 11, -1);
    const __m128i shifted = _mm_setr_epi8(4, 5, 6, -1, 7, 8, 9, -1, 10, 11, 12, -1, 13, 14, 15, -1);
    return _mm_madd_epi16(_mm_maddubs_epi16(_mm_shuffle_epi8(v, first ? shifted : start), byteOnes), ones);
}

// Words (s0 + s1 + s2) / 3 of eight pixels of three bytes. A sum is at most 765; there sum * 21846 >> 16 is sum / 3.
__m128i means8(const uint8_t* s) {
    const __m128i sums = _mm_packs_epi32(sums4<0>(load16(s)), sums4<4>(load16(s + 8)));
    return _mm_mulhi_epu16(sums, _mm_set1_epi16(21846));
}

int mean(const uint8_t* s) {
    return (s[0] + s[1] + s[2]) / 3;
}

// Which source channel each destination channel takes; -1 gives 0.
using Order = int[4];
constexpr Order kKeep = {0, 1, 2, -1}, kReverse = {2, 1, 0, -1}, kReverseWithAlpha = {2, 1, 0, 3};

// Pixels of S bytes into pixels of D bytes, with as many pixels a step as 16 bytes hold. The bytes that a step stores beyond
// them belong to the row's next pixels: the next step writes those, and what lies in place there is kept until then.
template <int D, int S> void reorder(kelImage_t* dst, const kelImage_t* src, const Order& order) {
    constexpr int pixels = 16 / (D > S ? D : S), least = D < S ? D : S;
    uint8_t index[16];
    for (int i = 0; i < 16; ++i)
        index[i] = static_cast<uint8_t>(i / D >= pixels ? i : order[i % D] < 0 ? -1 : i / D * S + order[i % D]);
    const __m128i shuffle = load16(index);
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        uint8_t* d = row<uint8_t>(dst, y, D);
        const uint8_t* s = row<uint8_t>(src, y, S);
        ptrdiff_t rest = dst->width;
        for (; rest * least >= 16; rest -= pixels, d += pixels * D, s += pixels * S)
            store16(d, _mm_shuffle_epi8(load16(s), shuffle));
        for (; rest > 0; --rest, d += D, s += S) {
            uint8_t pixel[S];
            memcpy(pixel, s, S);
            for (int c = 0; c < D; ++c)
                d[c] = order[c] < 0 ? 0 : pixel[order[c]];
        }
    }
}

// C + a + b of the eight pixels of four pairs, truncated.
__m128i truncatedSum(const kel::YuvProducts& p, __m128 a, __m128 b) {
    const __m128i first = _mm_cvttps_epi32(_mm_add_ps(_mm_add_ps(p.C[0], a), b));
    const __m128i second = _mm_cvttps_epi32(_mm_add_ps(_mm_add_ps(p.C[1], a), b));
    return _mm_packs_epi32(first, second);
}
__m128i truncatedSum(const kel::YuvProducts& p, __m128 a) {
    const __m128i first = _mm_cvttps_epi32(_mm_add_ps(p.C[0], a)), second = _mm_cvttps_epi32(_mm_add_ps(p.C[1], a));
    return _mm_packs_epi32(first, second);
}

// Stores eight pixels of three channels from the words of each, the first pixels of four pairs before the second ones.
void store3(uint8_t* d, __m128i c0, __m128i c1, __m128i c2) {
    const __m128i c01 = _mm_packus_epi16(c0, c1), c2_ = _mm_packus_epi16(c2, c2);
    const __m128i from01 = _mm_setr_epi8(0, 8, -1, 4, 12, -1, 1, 9, -1, 5, 13, -1, 2, 10, -1, 6);
    const __m128i from2 = _mm_setr_epi8(-1, -1, 0, -1, -1, 4, -1, -1, 1, -1, -1, 5, -1, -1, 2, -1);
    const __m128i end01 = _mm_setr_epi8(14, -1, 3, 11, -1, 7, 15, -1, -1, -1, -1, -1, -1, -1, -1, -1);
    const __m128i end2 = _mm_setr_epi8(-1, 6, -1, -1, 3, -1, -1, 7, -1, -1, -1, -1, -1, -1, -1, -1);
    store16(d, _mm_or_si128(_mm_shuffle_epi8(c01, from01), _mm_shuffle_epi8(c2_, from2)));
    store8(d + 16, _mm_or_si128(_mm_shuffle_epi8(c01, end01), _mm_shuffle_epi8(c2_, end2)));
}

// Pairs of pixels; at odd widths the second pixel of the last pair lands in the padding.
template <bool blueFirst> void yuvToThreeChannels(kelImage_t* dst, const kelImage_t* src) {
    for (kelValue_s32 y = 0; y < dst->height; ++y)
        alongRow<4, 6, 4>(row<uint8_t>(dst, y, 3), row<uint8_t>(src, y, 2), dst->width / 2 + dst->width % 2,
                          [](uint8_t* d, const uint8_t* s) {
                              const kel::YuvProducts p = kel::yuvProducts(load16(s));
                              const __m128i red = truncatedSum(p, p.redV), green = truncatedSum(p, p.greenU, p.greenV),
                                            blue = truncatedSum(p, p.blueU);
                              store3(d, blueFirst ? blue : red, green, blueFirst ? red : blue);
                          });
}

constexpr int kTypes = 7;

// Index of a processed type in the route table; -1 for any other.
int indexOf(kelValue_s32 type) {
    const kelValue_s32 types[kTypes] = {KEL_PIXEL_TYPE_U8G,    KEL_PIXEL_TYPE_S16G,  KEL_PIXEL_TYPE_U8XYZ,
                                        KEL_PIXEL_TYPE_U8XYZA, KEL_PIXEL_TYPE_U8ZYX, KEL_PIXEL_TYPE_U8ZYXA,
                                        KEL_PIXEL_TYPE_U8YUV};
    for (int i = 0; i < kTypes; ++i)
        if (types[i] == type)
            return i;
    return -1;
}

using Converter = void (*)(kelImage_t*, const kelImage_t*);

// Row: source, column: destination, both in the order of indexOf().
// clang-format off
constexpr Converter kRoutes[kTypes][kTypes] = {
    // from U8G
    {copyKelImage, convertKelImage_U8G_to_S16G,
     convertKelImage_U8G_to_U8XYZ, convertKelImage_U8G_to_U8XYZA,
     convertKelImage_U8G_to_U8XYZ, convertKelImage_U8G_to_U8XYZA, nullptr},
    // from S16G
    {convertKelImage_S16G_to_U8G, copyKelImage,
     convertKelImage_S16G_to_U8XYZ, convertKelImage_S16G_to_U8XYZA,
     convertKelImage_S16G_to_U8XYZ, convertKelImage_S16G_to_U8XYZA, nullptr},
    // from U8XYZ; callers rely on the order being kept on the way to U8ZYXA
    {convertKelImage_U8XYZ_to_U8G, convertKelImage_U8XYZ_to_S16G,
     copyKelImage, convertKelImage_U8XYZ_to_U8XYZA,
     convertKelImage_U8XYZ_to_U8ZYX, convertKelImage_U8XYZ_to_U8XYZA, nullptr},
    // from U8XYZA
    {convertKelImage_U8XYZA_to_U8G, convertKelImage_U8XYZA_to_S16G,
     convertKelImage_U8XYZA_to_U8XYZ, copyKelImage,
     convertKelImage_U8XYZA_to_U8ZYX, convertKelImage_U8XYZA_to_U8ZYXA, nullptr},
    // from U8ZYX; and here on the way to U8XYZA
    {convertKelImage_U8XYZ_to_U8G, convertKelImage_U8XYZ_to_S16G,
     convertKelImage_U8XYZ_to_U8ZYX, convertKelImage_U8XYZ_to_U8XYZA,
     copyKelImage, convertKelImage_U8XYZ_to_U8XYZA, nullptr},
    // from U8ZYXA
    {convertKelImage_U8XYZA_to_U8G, convertKelImage_U8XYZA_to_S16G,
     convertKelImage_U8XYZA_to_U8ZYX, convertKelImage_U8XYZA_to_U8ZYXA,
     convertKelImage_U8XYZA_to_U8XYZ, copyKelImage, nullptr},
    // from U8YUV
    {convertKelImage_U8YUV_to_U8G, nullptr,
     convertKelImage_U8YUV_to_U8BGR, convertKelImage_U8YUV_to_U8BGRA,
     convertKelImage_U8YUV_to_U8RGB, convertKelImage_U8YUV_to_U8RGBA, copyKelImage},
};
// clang-format on

} // namespace

extern "C" {

void convertKelImage(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    const int from = indexOf(src->type), to = indexOf(dst->type);
    if (from < 0 || to < 0)
        return;
    if (const Converter convert = kRoutes[from][to])
        convert(dst, src);
}

void convertKelImage_S16G_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    magnitudeTo<1>(dst, src);
}

void convertKelImage_S16G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    magnitudeTo<3>(dst, src);
}

void convertKelImage_S16G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    magnitudeTo<4>(dst, src);
}

void convertKelImage_U8XYZ_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    forEachBlock<16, 1, 3>(dst, src,
                           [](uint8_t* d, const uint8_t* s) { store16(d, _mm_packus_epi16(means8(s), means8(s + 24))); });
}

void convertKelImage_U8XYZ_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    forEachBlock<8, 2, 3>(dst, src, [](uint8_t* d, const uint8_t* s) { store16(d, means8(s)); });
}

void convertKelImage_U8XYZ_to_U8ZYX(kelImage_t* dst, const kelImage_t* src) {
    reorder<3, 3>(dst, src, kReverse);
}

void convertKelImage_U8XYZ_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    reorder<4, 3>(dst, src, kKeep);
}

// Four channels to grey: pixel (x, y) lands at element 3 * (y * step + x), where a three-channel destination would have it,
// and what lies between is left alone. Callers rely on it.
void convertKelImage_U8XYZA_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    forEachPixel<uint8_t, 3, 4>(dst, src, [](uint8_t* d, const uint8_t* s) { *d = static_cast<uint8_t>(mean(s)); });
}

void convertKelImage_U8XYZA_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    forEachPixel<int16_t, 3, 4>(dst, src, [](int16_t* d, const uint8_t* s) { *d = static_cast<int16_t>(mean(s)); });
}

void convertKelImage_U8XYZA_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    reorder<3, 4>(dst, src, kKeep);
}

void convertKelImage_U8XYZA_to_U8ZYX(kelImage_t* dst, const kelImage_t* src) {
    reorder<3, 4>(dst, src, kReverse);
}

void convertKelImage_U8XYZA_to_U8ZYXA(kelImage_t* dst, const kelImage_t* src) {
    reorder<4, 4>(dst, src, kReverseWithAlpha);
}

void convertKelImage_U8YUV_to_U8RGB(kelImage_t* dst, const kelImage_t* src) {
    yuvToThreeChannels<false>(dst, src);
}

void convertKelImage_U8YUV_to_U8BGR(kelImage_t* dst, const kelImage_t* src) {
    yuvToThreeChannels<true>(dst, src);
}

void convertKelImage_U8YUV_to_U8BGRA(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8YUV_to_U8BGRA(dst, src);
}

void convertKelImage_U8YUV_to_U8RGBA(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8YUV_to_U8RGBA(dst, src);
}

void convertKelImage_U8YUV_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8YUV_to_U8G(dst, src);
}

void convertKelImage_U8G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8G_to_U8XYZA(dst, src);
}

void convertKelImage_U8G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8G_to_U8XYZ(dst, src);
}

void convertKelImage_U8G_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    convertKelImageSSE_U8G_to_S16G(dst, src);
}

} // extern "C"

void convertKelImage_U8XYZ_to_U8ZYXA(kelImage_t* dst, const kelImage_t* src) {
    reorder<4, 3>(dst, src, kReverse);
}
