// YUV to four channels, 8 pixels at a time, for any processor.
#include "kelImage_YuvFourChannels.h"

namespace {

struct Lanes128 {
    using Bytes = __m128i;
    using Floats = __m128;
    static constexpr int kPixels = 8;
    static Bytes load(const uint8_t* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
    static Bytes zero() { return _mm_setzero_si128(); }
    static Floats all(float f) { return _mm_set1_ps(f); }
    static Bytes shuffle(Bytes v, __m128i index) { return _mm_shuffle_epi8(v, index); }
    static Floats toFloats(Bytes v) { return _mm_cvtepi32_ps(v); }
    static Bytes rounded(Floats f) { return _mm_cvtps_epi32(f); }
    static Bytes packWords(Bytes a, Bytes b) { return _mm_packs_epi32(a, b); }
    static Bytes packBytes(Bytes a, Bytes b) { return _mm_packus_epi16(a, b); }
    static Bytes unpackLow(Bytes a, Bytes b) { return _mm_unpacklo_epi16(a, b); }
    static Bytes unpackHigh(Bytes a, Bytes b) { return _mm_unpackhi_epi16(a, b); }
    static void store(uint8_t* p, Bytes low, Bytes high) {
        _mm_storeu_si128(reinterpret_cast<__m128i*>(p), low);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(p + 16), high);
    }
};

} // namespace

ptrdiff_t kel::yuvToFourChannels128(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels, bool blueFirst) {
    return blueFirst ? yuvBlocks<Lanes128, true>(d, s, pixels) : yuvBlocks<Lanes128, false>(d, s, pixels);
}
