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

// A row in blocks; body(d, s) turns N units of S bytes into as many of D bytes. What is left of the row goes through a buffer,
// so that nothing beside the row's own units is read or written.
template <int N, int D, int S, class Body> void alongRow(uint8_t* d, const uint8_t* s, kelValue_s32 units, Body body) {
    const ptrdiff_t rest = kel::walkBlocks<N, D, S>(d, s, units, body);
    if (rest > 0) {
        uint8_t in[N * S] = {}, out[N * D];
        memcpy(in, s, static_cast<size_t>(rest) * S);
        body(out, in);
        memcpy(d, out, static_cast<size_t>(rest) * D);
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

// Sums of the first three bytes of four pixels of S bytes; the first of them starts at byte `first` of the vector.
template <int S, int first> __m128i sums4(__m128i v) {
    constexpr int a = first, b = a + S, c = b + S, d = c + S;
    const __m128i threes = _mm_setr_epi8(a, a + 1, a + 2, -1, b, b + 1, b + 2, -1, c, c + 1, c + 2, -1, d, d + 1, d + 2, -1);
    return _mm_madd_epi16(_mm_maddubs_epi16(_mm_shuffle_epi8(v, threes), _mm_set1_epi8(1)), _mm_set1_epi16(1));
}

// Words (s0 + s1 + s2) / 3 of eight pixels of S bytes. A sum is at most 765; there sum * 21846 >> 16 is sum / 3.
template <int S> __m128i means8(const uint8_t* s) {
    constexpr int second = 8 * S - 16; // of the last vector within the pixels' bytes: nothing behind them is read
    const __m128i sums = _mm_packs_epi32(sums4<S, 0>(load16(s)), sums4<S, 4 * S - second>(load16(s + second)));
    return _mm_mulhi_epu16(sums, _mm_set1_epi16(21846));
}

// Four channels to grey: pixel (x, y) lands at element 3 * (y * step + x), where a three-channel destination would have it,
// and what lies between is left alone. Callers rely on it.
template <class T> void misplacedMeans(kelImage_t* dst, const kelImage_t* src) {
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        T* const d = row<T>(dst, y, 3);
        const uint8_t* const s = row<uint8_t>(src, y, 4);
        ptrdiff_t x = 0;
        for (; x + 8 <= dst->width; x += 8) {
            uint16_t means[8];
            _mm_storeu_si128(reinterpret_cast<__m128i*>(means), means8<4>(s + 4 * x));
            for (int i = 0; i < 8; ++i)
                d[3 * (x + i)] = static_cast<T>(means[i]);
        }
        for (; x < dst->width; ++x)
            d[3 * x] = static_cast<T>((s[4 * x] + s[4 * x + 1] + s[4 * x + 2]) / 3);
    }
}

// Which source channel each destination channel takes; -1 gives 0.
using Order = int[4];
constexpr Order kKeep = {0, 1, 2, -1}, kReverse = {2, 1, 0, -1}, kReverseWithAlpha = {2, 1, 0, 3};

// The shuffle of a vector that starts at byte `srcStart` of pixels of S bytes into one that starts at byte `dstStart` of pixels
// of D bytes. Bytes that come from outside the source vector are 0.
template <int D, int S> __m128i shuffleOf(const Order& order, int dstStart, int srcStart) {
    uint8_t index[16];
    for (int i = 0; i < 16; ++i) {
        const int byte = dstStart + i, pixel = byte < 0 ? -1 : byte / D, channel = byte - pixel * D;
        const int from = pixel < 0 || order[channel] < 0 ? -1 : pixel * S + order[channel] - srcStart;
        index[i] = static_cast<uint8_t>(from < 0 || from > 15 ? -1 : from);
    }
    return load16(index);
}

void threeToThree(kelImage_t* dst, const kelImage_t* src, const Order& order) {
    const auto shuffle = [&order](int to, int from) { return shuffleOf<3, 3>(order, 16 * to, 16 * from); };
    const __m128i m00 = shuffle(0, 0), m01 = shuffle(0, 1), m10 = shuffle(1, 0), m11 = shuffle(1, 1), m12 = shuffle(1, 2),
                  m21 = shuffle(2, 1), m22 = shuffle(2, 2);
    forEachBlock<16, 3, 3>(dst, src, [=](uint8_t* d, const uint8_t* s) {
        const __m128i s0 = load16(s), s1 = load16(s + 16), s2 = load16(s + 32);
        store16(d, _mm_or_si128(_mm_shuffle_epi8(s0, m00), _mm_shuffle_epi8(s1, m01)));
        store16(d + 16,
                _mm_or_si128(_mm_or_si128(_mm_shuffle_epi8(s0, m10), _mm_shuffle_epi8(s2, m12)), _mm_shuffle_epi8(s1, m11)));
        store16(d + 32, _mm_or_si128(_mm_shuffle_epi8(s1, m21), _mm_shuffle_epi8(s2, m22)));
    });
}

void threeToFour(kelImage_t* dst, const kelImage_t* src, const Order& order) {
    const __m128i low = shuffleOf<4, 3>(order, 0, 0), high = shuffleOf<4, 3>(order, 48, 32);
    forEachBlock<16, 4, 3>(dst, src, [=](uint8_t* d, const uint8_t* s) {
        const __m128i s0 = load16(s), s1 = load16(s + 16), s2 = load16(s + 32);
        store16(d, _mm_shuffle_epi8(s0, low));
        store16(d + 16, _mm_shuffle_epi8(_mm_alignr_epi8(s1, s0, 12), low));
        store16(d + 32, _mm_shuffle_epi8(_mm_alignr_epi8(s2, s1, 8), low));
        store16(d + 48, _mm_shuffle_epi8(s2, high));
    });
}

void fourToThree(kelImage_t* dst, const kelImage_t* src, const Order& order) {
    const __m128i low = shuffleOf<3, 4>(order, 0, 0), high = shuffleOf<3, 4>(order, -4, 0); // 12 bytes at either end
    forEachBlock<16, 3, 4>(dst, src, [=](uint8_t* d, const uint8_t* s) {
        const __m128 q1 = _mm_castsi128_ps(_mm_shuffle_epi8(load16(s + 16), low));
        const __m128 q2 = _mm_castsi128_ps(_mm_shuffle_epi8(load16(s + 32), high));
        const __m128i q0 = _mm_shuffle_epi8(load16(s), high), q3 = _mm_shuffle_epi8(load16(s + 48), low);
        store16(d, _mm_alignr_epi8(_mm_castps_si128(q1), q0, 4));
        store16(d + 16, _mm_castps_si128(_mm_shuffle_ps(q1, q2, _MM_SHUFFLE(2, 1, 2, 1))));
        store16(d + 32, _mm_alignr_epi8(q3, _mm_castps_si128(q2), 12));
    });
}

void fourToFour(kelImage_t* dst, const kelImage_t* src, const Order& order) {
    const __m128i shuffle = shuffleOf<4, 4>(order, 0, 0);
    forEachBlock<4, 4, 4>(dst, src, [=](uint8_t* d, const uint8_t* s) { store16(d, _mm_shuffle_epi8(load16(s), shuffle)); });
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
    const __m128i c01 = _mm_packus_epi16(c0, c1), c22 = _mm_packus_epi16(c2, c2);
    const __m128i from01 = _mm_setr_epi8(0, 8, -1, 4, 12, -1, 1, 9, -1, 5, 13, -1, 2, 10, -1, 6);
    const __m128i from2 = _mm_setr_epi8(-1, -1, 0, -1, -1, 4, -1, -1, 1, -1, -1, 5, -1, -1, 2, -1);
    const __m128i end01 = _mm_setr_epi8(14, -1, 3, 11, -1, 7, 15, -1, -1, -1, -1, -1, -1, -1, -1, -1);
    const __m128i end2 = _mm_setr_epi8(-1, 6, -1, -1, 3, -1, -1, 7, -1, -1, -1, -1, -1, -1, -1, -1);
    store16(d, _mm_or_si128(_mm_shuffle_epi8(c01, from01), _mm_shuffle_epi8(c22, from2)));
    store8(d + 16, _mm_or_si128(_mm_shuffle_epi8(c01, end01), _mm_shuffle_epi8(c22, end2)));
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
                           [](uint8_t* d, const uint8_t* s) { store16(d, _mm_packus_epi16(means8<3>(s), means8<3>(s + 24))); });
}

void convertKelImage_U8XYZ_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    forEachBlock<8, 2, 3>(dst, src, [](uint8_t* d, const uint8_t* s) { store16(d, means8<3>(s)); });
}

void convertKelImage_U8XYZ_to_U8ZYX(kelImage_t* dst, const kelImage_t* src) {
    threeToThree(dst, src, kReverse);
}

void convertKelImage_U8XYZ_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    threeToFour(dst, src, kKeep);
}

void convertKelImage_U8XYZA_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    misplacedMeans<uint8_t>(dst, src);
}

void convertKelImage_U8XYZA_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    misplacedMeans<int16_t>(dst, src);
}

void convertKelImage_U8XYZA_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    fourToThree(dst, src, kKeep);
}

void convertKelImage_U8XYZA_to_U8ZYX(kelImage_t* dst, const kelImage_t* src) {
    fourToThree(dst, src, kReverse);
}

void convertKelImage_U8XYZA_to_U8ZYXA(kelImage_t* dst, const kelImage_t* src) {
    fourToFour(dst, src, kReverseWithAlpha);
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
    threeToFour(dst, src, kReverse);
}
