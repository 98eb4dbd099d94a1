// YUV to four channels, 16 pixels at a time, for processors with AVX2.
#include "kelImage_YuvFourChannels.h"

namespace {

struct Lanes256 {
    using Bytes = __m256i;
    using Floats = __m256;
    static constexpr int kPixels = 16;
    static Bytes load(const uint8_t* p) { return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)); }
    static Bytes zero() { return _mm256_setzero_si256(); }
    static Floats all(float f) { return _mm256_set1_ps(f); }
    static Bytes shuffle(Bytes v, __m128i index) { return _mm256_shuffle_epi8(v, _mm256_broadcastsi128_si256(index)); }
    static Floats toFloats(Bytes v) { return _mm256_cvtepi32_ps(v); }
    static Bytes rounded(Floats f) { return _mm256_cvtps_epi32(f); }
    static Bytes packWords(Bytes a, Bytes b) { return _mm256_packs_epi32(a, b); }
    static Bytes packBytes(Bytes a, Bytes b) { return _mm256_packus_epi16(a, b); }
    static Bytes unpackLow(Bytes a, Bytes b) { return _mm256_unpacklo_epi16(a, b); }
    static Bytes unpackHigh(Bytes a, Bytes b) { return _mm256_unpackhi_epi16(a, b); }
    static void store(uint8_t* p, Bytes low, Bytes high) { // lane k of low and of high follow each other
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(p), _mm256_permute2x128_si256(low, high, 0x20));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(p + 32), _mm256_permute2x128_si256(low, high, 0x31));
    }
};

} // namespace

ptrdiff_t kel::yuvToFourChannels256(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels, bool blueFirst) {
    return blueFirst ? yuvBlocks<Lanes256, true>(d, s, pixels) : yuvBlocks<Lanes256, false>(d, s, pixels);
}
