// Vector converters: grey to more channels and to 16 bits, YUV to luma and to four channels. They walk both data areas as one
// continuous run, which the padding of rows to 16 pixels makes possible.
#include "kelImage_ConverterLanes.h"
#include "kelImage_Private.h"

using kel::load16;
using kel::load8;
using kel::store16;

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

// Blocks of 4 pixels, as many of them at once as the processor can. A last one is done within a block of 8 of its own: it
// reads and writes nothing beyond its 8 and 16 bytes.
void yuvToFourChannels(kelImage_t* dst, const kelImage_t* src, bool blueFirst) {
    uint8_t* d = dst->data;
    const uint8_t* s = src->data;
    const ptrdiff_t rest =
        kel::yuvToFourChannels128(d, s, kel::widestYuvRun()(d, s, pixelsOfRun(dst, 4), blueFirst), blueFirst);
    if (rest > 0) {
        uint8_t from[16], to[32], *toEnd = to;
        const uint8_t* fromEnd = from;
        store16(from, load8(s));
        kel::yuvToFourChannels128(toEnd, fromEnd, 8, blueFirst);
        store16(d, load16(to));
    }
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
    yuvToFourChannels(dst, src, false);
}

void convertKelImageSSE_U8YUV_to_U8BGRA(kelImage_t* dst, const kelImage_t* src) {
    yuvToFourChannels(dst, src, true);
}

// The two to three channels are inert; the portable converters do these.
void convertKelImageSSE_U8YUV_to_U8BGR(kelImage_t*, const kelImage_t*) {}

void convertKelImageSSE_U8YUV_to_U8RGB(kelImage_t*, const kelImage_t*) {}

} // extern "C"
