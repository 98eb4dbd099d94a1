// Vector building blocks that the portable and the vector converters share: grey spread over channels, and the products of YUV
// to colour, up to where the two forms part.
#ifndef KEL_IMAGE_CONVERTER_LANES_H
#define KEL_IMAGE_CONVERTER_LANES_H

#include "kelImage_Blocks.h"
#include "kelImage_YuvWide.h"

namespace kel {

// Writes 16 grey values as 16 pixels of N channels, the fourth being 0. Index -1 of a shuffle gives 0.
template <int N> inline void storeGrey(uint8_t* dst, __m128i grey) {
    static_assert(N == 1 || N == 3 || N == 4, "");
    if (N == 1) {
        store16(dst, grey);
    } else if (N == 3) {
        store16(dst, _mm_shuffle_epi8(grey, _mm_setr_epi8(0, 0, 0, 1, 1, 1, 2, 2, 2, 3, 3, 3, 4, 4, 4, 5)));
        store16(dst + 16, _mm_shuffle_epi8(grey, _mm_setr_epi8(5, 5, 6, 6, 6, 7, 7, 7, 8, 8, 8, 9, 9, 9, 10, 10)));
        store16(dst + 32,
                _mm_shuffle_epi8(grey, _mm_setr_epi8(10, 11, 11, 11, 12, 12, 12, 13, 13, 13, 14, 14, 14, 15, 15, 15)));
    } else {
        store16(dst, _mm_shuffle_epi8(grey, _mm_setr_epi8(0, 0, 0, -1, 1, 1, 1, -1, 2, 2, 2, -1, 3, 3, 3, -1)));
        store16(dst + 16, _mm_shuffle_epi8(grey, _mm_setr_epi8(4, 4, 4, -1, 5, 5, 5, -1, 6, 6, 6, -1, 7, 7, 7, -1)));
        store16(dst + 32, _mm_shuffle_epi8(grey, _mm_setr_epi8(8, 8, 8, -1, 9, 9, 9, -1, 10, 10, 10, -1, 11, 11, 11, -1)));
        store16(dst + 48,
                _mm_shuffle_epi8(grey, _mm_setr_epi8(12, 12, 12, -1, 13, 13, 13, -1, 14, 14, 14, -1, 15, 15, 15, -1)));
    }
}

// The products of four pairs of pixels, one pair in a lane. C[0] belongs to the first pixels of the pairs, C[1] to the second.
struct YuvProducts {
    __m128 C[2], redV, greenU, greenV, blueU;
};

// `pairs` holds U, Y0, V, Y1 four times.
inline YuvProducts yuvProducts(__m128i pairs) {
    const auto lanes = [pairs](int byte, int bias) { // one byte of each pair, less the bias
        const int select = byte | ~0xff;             // zero bytes above it
        const __m128i bytes = _mm_shuffle_epi8(pairs, _mm_setr_epi32(select, select + 4, select + 8, select + 12));
        return _mm_cvtepi32_ps(_mm_sub_epi32(bytes, _mm_set1_epi32(bias)));
    };
    const __m128 u = lanes(0, 128), v = lanes(2, 128);
    YuvProducts p;
    p.C[0] = _mm_mul_ps(lanes(1, 16), _mm_set1_ps(kLuma));
    p.C[1] = _mm_mul_ps(lanes(3, 16), _mm_set1_ps(kLuma));
    p.redV = _mm_mul_ps(v, _mm_set1_ps(kRedV));
    p.greenU = _mm_mul_ps(u, _mm_set1_ps(kGreenU));
    p.greenV = _mm_mul_ps(v, _mm_set1_ps(kGreenV));
    p.blueU = _mm_mul_ps(u, _mm_set1_ps(kBlueU));
    return p;
}

} // namespace kel

#endif
