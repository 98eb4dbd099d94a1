// Vector converters: grey to more channels and to 16 bits, YUV to luma and to four channels. They walk both data areas as one
// continuous run, which the padding of rows to 16 pixels makes possible.
#include "kelImage_ConverterLanes.h"
#include "kelImage_Private.h"

using kel::load16;
using kel::load8;
using kel::store16;
using kel::YuvProducts;

namespace {

// Pixels of a run over all rows, each rounded up to whole blocks. The run knows no step: rows of 16-pixel blocks land where
// step puts them, rows of 4-pixel blocks only for widths with width % 16 in {0, 13, 14, 15}. Callers rely on this drift.
ptrdiff_t pixelsOfRun(const kelImage_t* dst, ptrdiff_t block) {
    if (dst->width <= 0 || dst->height <= 0)
        return 0;
    return (dst->width + block - 1) / block * block * dst->height;
}

// Calls body(dst, src) for each block of 16 pixels of D and S bytes.
template <int D, int S, class Body> void walk16(kelImage_t* dst, const kelImage_t* src, Body body) {
    uint8_t* d = dst->data;
    const uint8_t* s = src->data;
    kel::walkBlocks<16, D, S>(d, s, pixelsOfRun(dst, 16), body);
}

// Bytes of eight pixels from the words of their channels, the first pixels of four pairs before the second ones.
struct FourChannels8 {
    __m128i low, high;
};
FourChannels8 interleave(__m128i c0, __m128i c1, __m128i c2) {
    const __m128i inOrder = _mm_setr_epi8(0, 8, 4, 12, 1, 9, 5, 13, 2, 10, 6, 14, 3, 11, 7, 15);
    const __m128i c01 = _mm_shuffle_epi8(_mm_packus_epi16(c0, c1), inOrder);
    const __m128i c23 = _mm_shuffle_epi8(_mm_packus_epi16(c2, _mm_setzero_si128()), inOrder);
    return {_mm_unpacklo_epi16(c01, c23), _mm_unpackhi_epi16(c01, c23)};
}

// C + chroma of the eight pixels of four pairs, rounded by the thread's rounding mode.
__m128i roundedChannel(const YuvProducts& p, __m128 chroma) {
    return _mm_packs_epi32(_mm_cvtps_epi32(_mm_add_ps(p.C[0], chroma)), _mm_cvtps_epi32(_mm_add_ps(p.C[1], chroma)));
}

FourChannels8 colour(__m128i pairs, bool blueFirst) {
    const YuvProducts p = kel::yuvProducts(pairs);
    const __m128i red = roundedChannel(p, p.redV);
    const __m128i green = roundedChannel(p, _mm_add_ps(p.greenU, p.greenV));
    const __m128i blue = roundedChannel(p, p.blueU);
    return blueFirst ? interleave(blue, green, red) : interleave(red, green, blue);
}

// Blocks of 4 pixels, two of them at once where they last.
template <bool blueFirst> void yuvToFourChannels(kelImage_t* dst, const kelImage_t* src) {
    uint8_t* d = dst->data;
    const uint8_t* s = src->data;
    const ptrdiff_t rest = kel::walkBlocks<8, 4, 2>(d, s, pixelsOfRun(dst, 4), [](uint8_t* to, const uint8_t* from) {
        const FourChannels8 pixels = colour(load16(from), blueFirst);
        store16(to, pixels.low);
        store16(to + 16, pixels.high);
    });
    if (rest > 0)
        store16(d, colour(load8(s), blueFirst).low);
}

} // namespace

extern "C" {

void convertKelImageSSE_U8G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src) {
    walk16<3, 1>(dst, src, [](uint8_t* d, const uint8_t* s) { kel::storeGrey<3>(d, load16(s)); });
}

void convertKelImageSSE_U8G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src) {
    walk16<4, 1>(dst, src, [](uint8_t* d, const uint8_t* s) { kel::storeGrey<4>(d, load16(s)); });
}

void convertKelImageSSE_U8G_to_S16G(kelImage_t* dst, const kelImage_t* src) {
    walk16<2, 1>(dst, src, [](uint8_t* d, const uint8_t* s) {
        const __m128i grey = load16(s), zero = _mm_setzero_si128();
        store16(d, _mm_unpacklo_epi8(grey, zero));
        store16(d + 16, _mm_unpackhi_epi8(grey, zero));
    });
}

void convertKelImageSSE_U8YUV_to_U8G(kelImage_t* dst, const kelImage_t* src) {
    walk16<1, 2>(dst, src, [](uint8_t* d, const uint8_t* s) {
        store16(d, _mm_packus_epi16(_mm_srli_epi16(load16(s), 8), _mm_srli_epi16(load16(s + 16), 8)));
    });
}

void convertKelImageSSE_U8YUV_to_U8RGBA(kelImage_t* dst, const kelImage_t* src) {
    yuvToFourChannels<false>(dst, src);
}

void convertKelImageSSE_U8YUV_to_U8BGRA(kelImage_t* dst, const kelImage_t* src) {
    yuvToFourChannels<true>(dst, src);
}

// The two to three channels are inert; the portable converters do these.
void convertKelImageSSE_U8YUV_to_U8BGR(kelImage_t*, const kelImage_t*) {}

void convertKelImageSSE_U8YUV_to_U8RGB(kelImage_t*, const kelImage_t*) {}

} // extern "C"
