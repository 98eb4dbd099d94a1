// YUV to four channels, 32 pixels at a time, for processors with AVX-512 F and BW.
#include "kelImage_YuvFourChannels.h"

namespace {

struct Lanes512 {
    using Bytes = __m512i;
    using Floats = __m512;
    static constexpr int kPixels = 32;
    static Bytes load(const uint8_t* p) { return _mm512_loadu_si512(p); }
    static Bytes zero() { return _mm512_setzero_si512(); }
    static Floats all(float f) { return _mm512_set1_ps(f); }
    static Bytes shuffle(Bytes v, __m128i index) { return _mm512_shuffle_epi8(v, _mm512_broadcast_i32x4(index)); }
    static Floats toFloats(Bytes v) { return _mm512_cvtepi32_ps(v); }
    static Bytes rounded(Floats f) { return _mm512_cvtps_epi32(f); }
    static Bytes packWords(Bytes a, Bytes b) { return _mm512_packs_epi32(a, b); }
    static Bytes packBytes(Bytes a, Bytes b) { return _mm512_packus_epi16(a, b); }
    static Bytes unpackLow(Bytes a, Bytes b) { return _mm512_unpacklo_epi16(a, b); }
    static Bytes unpackHigh(Bytes a, Bytes b) { return _mm512_unpackhi_epi16(a, b); }
    static void store(uint8_t* p, Bytes low, Bytes high) { // lane k of low and of high follow each other
        const __m512i first = _mm512_setr_epi64(0, 1, 8, 9, 2, 3, 10, 11),
                      second = _mm512_setr_epi64(4, 5, 12, 13, 6, 7, 14, 15);
        _mm512_storeu_si512(p, _mm512_permutex2var_epi64(low, first, high));
        _mm512_storeu_si512(p + 64, _mm512_permutex2var_epi64(low, second, high));
    }
};

} // namespace

ptrdiff_t kel::yuvToFourChannels512(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels, bool blueFirst) {
    return blueFirst ? yuvBlocks<Lanes512, true>(d, s, pixels) : yuvBlocks<Lanes512, false>(d, s, pixels);
}
