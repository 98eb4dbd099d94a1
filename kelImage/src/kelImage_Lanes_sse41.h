// The vocabulary of kernels for SSE4.1: one lane of 128 bits, and what kernels do with lanes. Kernels know these names alone.
// Wider vocabularies hold several such lanes and offer the same names. Everything works within a lane, save loads, stores and
// what is said to keep the order of memory. Whatever includes this compiles it for its own instruction set: hence the unnamed
// namespace, and no header that defines functions elsewhere.
#ifndef KEL_IMAGE_LANES_SSE41_H
#define KEL_IMAGE_LANES_SSE41_H

#include <cstddef>
#include <cstdint>
#include <immintrin.h>

namespace {

// Sixteen bytes that every lane gets: shuffles, weights, masks. In a shuffle, -1 gives 0.
struct alignas(16) Sixteen {
    int8_t byte[16];
};

struct Floats1 {
    __m128 f;
};

// 16 bytes, 8 words of 16 bits, or 4 longs of 32 bits, whichever an operation takes them for.
struct Lanes1 {
    using Floats = Floats1;
    static constexpr int kLanes = 1, kBytes = 16, kThrees = 5;
    __m128i v;

    static Lanes1 load(const void* p) { return {_mm_loadu_si128(static_cast<const __m128i*>(p))}; }
    static Lanes1 loadHalf(const void* p) { return {_mm_loadl_epi64(static_cast<const __m128i*>(p))}; } // then zeros
    // Lane k from p + k * stride.
    static Lanes1 loadLanes(const uint8_t* p, ptrdiff_t) { return load(p); }
    // Half as many bytes as words, a quarter as many as longs.
    static Lanes1 loadBytesAsWords(const uint8_t* p) {
        return {_mm_cvtepu8_epi16(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)))};
    }
    static Lanes1 loadBytesAsLongs(const uint8_t* p) {
        int four;
        __builtin_memcpy(&four, p, sizeof four);
        return {_mm_cvtepu8_epi32(_mm_cvtsi32_si128(four))};
    }
    // Eight bytes from addresses p + 4 * index, two to a lane; the indices of two neighbouring lanes are `apart`.
    static Lanes1 loadEights(const void* p, const int32_t* index, ptrdiff_t) {
        const auto* const base = static_cast<const uint8_t*>(p);
        const __m128i first = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(base + 4 * ptrdiff_t(index[0])));
        const __m128i second = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(base + 4 * ptrdiff_t(index[1])));
        return {_mm_unpacklo_epi64(first, second)};
    }
    // Lane k from p + 4 * index[k * apart].
    static Lanes1 loadSixteens(const uint32_t* p, const int32_t* index) { return load(p + index[0]); }
    static Lanes1 zero() { return {_mm_setzero_si128()}; }
    static Lanes1 bytes(int value) { return {_mm_set1_epi8(static_cast<char>(value))}; }
    static Lanes1 words(int value) { return {_mm_set1_epi16(static_cast<short>(value))}; }
    static Lanes1 longs(int value) { return {_mm_set1_epi32(value)}; }
    static Lanes1 every(const Sixteen& lane) { return {_mm_load_si128(reinterpret_cast<const __m128i*>(lane.byte))}; }
    static Lanes1 ascendingLongs() { return {_mm_setr_epi32(0, 1, 2, 3)}; }
    static Floats1 floats(float value) { return {_mm_set1_ps(value)}; }
};

inline void store(void* p, Lanes1 a) {
    _mm_storeu_si128(static_cast<__m128i*>(p), a.v);
}
// The lower half of the bytes.
inline void storeHalf(void* p, Lanes1 a) {
    _mm_storel_epi64(static_cast<__m128i*>(p), a.v);
}
// Bytes or words to every third place; what lies between is not written.
inline void storeThirds(uint8_t* p, Lanes1 a) {
    uint64_t low = static_cast<uint64_t>(_mm_cvtsi128_si64(a.v)), high = static_cast<uint64_t>(_mm_extract_epi64(a.v, 1));
    for (int i = 0; i < 8; ++i, low >>= 8, high >>= 8) {
        p[3 * i] = static_cast<uint8_t>(low);
        p[3 * i + 24] = static_cast<uint8_t>(high);
    }
}
inline void storeThirds(int16_t* p, Lanes1 a) {
    uint64_t low = static_cast<uint64_t>(_mm_cvtsi128_si64(a.v)), high = static_cast<uint64_t>(_mm_extract_epi64(a.v, 1));
    for (int i = 0; i < 4; ++i, low >>= 16, high >>= 16) {
        p[3 * i] = static_cast<int16_t>(low);
        p[3 * i + 12] = static_cast<int16_t>(high);
    }
}
// kThrees pixels of three bytes in the opposite order, from p on; one byte before and one behind them are touched, too.
inline void storeThreesReversed(uint8_t* d, const uint8_t* p, Lanes1) {
    const __m128i reverse = _mm_setr_epi8(13, 14, 15, 10, 11, 12, 7, 8, 9, 4, 5, 6, 1, 2, 3, 0);
    store(d, Lanes1{_mm_shuffle_epi8(Lanes1::load(p - 1).v, reverse)});
}

inline Lanes1 operator&(Lanes1 a, Lanes1 b) {
    return {_mm_and_si128(a.v, b.v)};
}
inline Lanes1 operator|(Lanes1 a, Lanes1 b) {
    return {_mm_or_si128(a.v, b.v)};
}
inline Lanes1 operator^(Lanes1 a, Lanes1 b) {
    return {_mm_xor_si128(a.v, b.v)};
}
// Byte by byte `a` where the mask is set, else `b`; a mask's bytes are all ones or all zeros.
inline Lanes1 select(Lanes1 mask, Lanes1 a, Lanes1 b) {
    return {_mm_blendv_epi8(b.v, a.v, mask.v)};
}
inline Lanes1 shuffle(Lanes1 a, Lanes1 index) {
    return {_mm_shuffle_epi8(a.v, index.v)};
}
// Bytes n .. n+15 of a lane of `low` with that of `high` behind it.
template <int n> Lanes1 joined(Lanes1 low, Lanes1 high) {
    return {_mm_alignr_epi8(high.v, low.v, n)};
}
inline Lanes1 lowBytes(Lanes1 a, Lanes1 b) { // a0 b0 a1 b1 .. of the lower halves
    return {_mm_unpacklo_epi8(a.v, b.v)};
}
inline Lanes1 highBytes(Lanes1 a, Lanes1 b) {
    return {_mm_unpackhi_epi8(a.v, b.v)};
}
inline Lanes1 lowWords(Lanes1 a, Lanes1 b) {
    return {_mm_unpacklo_epi16(a.v, b.v)};
}
inline Lanes1 highWords(Lanes1 a, Lanes1 b) {
    return {_mm_unpackhi_epi16(a.v, b.v)};
}

// Unsigned bytes; additions and subtractions wrap, here and below.
inline Lanes1 addBytes(Lanes1 a, Lanes1 b) {
    return {_mm_add_epi8(a.v, b.v)};
}
inline Lanes1 subBytes(Lanes1 a, Lanes1 b) {
    return {_mm_sub_epi8(a.v, b.v)};
}
inline Lanes1 minBytes(Lanes1 a, Lanes1 b) {
    return {_mm_min_epu8(a.v, b.v)};
}
inline Lanes1 maxBytes(Lanes1 a, Lanes1 b) {
    return {_mm_max_epu8(a.v, b.v)};
}
inline Lanes1 averageBytes(Lanes1 a, Lanes1 b) { // (a + b + 1) / 2
    return {_mm_avg_epu8(a.v, b.v)};
}
inline Lanes1 atLeastBytes(Lanes1 a, Lanes1 b) { // 255 where a >= b, else 0
    return {_mm_cmpeq_epi8(_mm_max_epu8(a.v, b.v), a.v)};
}

inline Lanes1 addWords(Lanes1 a, Lanes1 b) {
    return {_mm_add_epi16(a.v, b.v)};
}
inline Lanes1 subWords(Lanes1 a, Lanes1 b) {
    return {_mm_sub_epi16(a.v, b.v)};
}
inline Lanes1 minWords(Lanes1 a, Lanes1 b) { // signed
    return {_mm_min_epi16(a.v, b.v)};
}
inline Lanes1 maxWords(Lanes1 a, Lanes1 b) {
    return {_mm_max_epi16(a.v, b.v)};
}
inline Lanes1 minUnsignedWords(Lanes1 a, Lanes1 b) {
    return {_mm_min_epu16(a.v, b.v)};
}
inline Lanes1 greaterWords(Lanes1 a, Lanes1 b) { // all ones where a > b, signed, else 0
    return {_mm_cmpgt_epi16(a.v, b.v)};
}
// The uppermost bits of the words of a, then of b, in the order of memory.
inline uint64_t signsOfWords(Lanes1 a, Lanes1 b) {
    return static_cast<unsigned>(_mm_movemask_epi8(_mm_packs_epi16(a.v, b.v)));
}
inline Lanes1 absWords(Lanes1 a) {
    return {_mm_abs_epi16(a.v)};
}
inline Lanes1 mulWords(Lanes1 a, Lanes1 b) { // the lower 16 bits
    return {_mm_mullo_epi16(a.v, b.v)};
}
inline Lanes1 mulHighWords(Lanes1 a, Lanes1 b) { // the upper 16 bits, unsigned
    return {_mm_mulhi_epu16(a.v, b.v)};
}
inline Lanes1 mulRoundedWords(Lanes1 a, Lanes1 b) { // (a * b + 2^14) >> 15, signed
    return {_mm_mulhrs_epi16(a.v, b.v)};
}
template <int n> Lanes1 shiftLeftWords(Lanes1 a) {
    return {_mm_slli_epi16(a.v, n)};
}
template <int n> Lanes1 shiftRightWords(Lanes1 a) { // zeros come in
    return {_mm_srli_epi16(a.v, n)};
}
// a0 * w0 + a1 * w1 of pairs of unsigned bytes and signed weights, in words; the sum must fit one.
inline Lanes1 weighBytes(Lanes1 a, Lanes1 weights) {
    return {_mm_maddubs_epi16(a.v, weights.v)};
}
// The same of pairs of signed words, in longs.
inline Lanes1 weighWords(Lanes1 a, Lanes1 weights) {
    return {_mm_madd_epi16(a.v, weights.v)};
}

inline Lanes1 addLongs(Lanes1 a, Lanes1 b) {
    return {_mm_add_epi32(a.v, b.v)};
}
inline Lanes1 subLongs(Lanes1 a, Lanes1 b) {
    return {_mm_sub_epi32(a.v, b.v)};
}
inline Lanes1 minLongs(Lanes1 a, Lanes1 b) { // signed
    return {_mm_min_epi32(a.v, b.v)};
}
inline Lanes1 mulLongs(Lanes1 a, Lanes1 b) {
    return {_mm_mullo_epi32(a.v, b.v)};
}
inline Lanes1 greaterLongs(Lanes1 a, Lanes1 b) {
    return {_mm_cmpgt_epi32(a.v, b.v)};
}
inline uint64_t signsOfLongs(Lanes1 a) {
    return static_cast<unsigned>(_mm_movemask_ps(_mm_castsi128_ps(a.v)));
}
template <int n> Lanes1 shiftRightLongs(Lanes1 a) { // zeros come in
    return {_mm_srli_epi32(a.v, n)};
}

// The upper words of the longs of a and of b, in turn: a0 b0 a1 b1 ..
inline Lanes1 upperWords(Lanes1 a, Lanes1 b) {
    return {_mm_blend_epi16(_mm_srli_epi32(a.v, 16), b.v, 0xaa)};
}

// Signed words as bytes 0..255 and signed longs as signed words, saturating: a lane of a, then one of b.
inline Lanes1 packWords(Lanes1 a, Lanes1 b) {
    return {_mm_packus_epi16(a.v, b.v)};
}
inline Lanes1 packLongs(Lanes1 a, Lanes1 b) {
    return {_mm_packs_epi32(a.v, b.v)};
}
// Every second long of a lane of a, then of b, from the first or from the second.
inline Lanes1 evenLongs(Lanes1 a, Lanes1 b) {
    return {_mm_castps_si128(_mm_shuffle_ps(_mm_castsi128_ps(a.v), _mm_castsi128_ps(b.v), _MM_SHUFFLE(2, 0, 2, 0)))};
}
inline Lanes1 oddLongs(Lanes1 a, Lanes1 b) {
    return {_mm_castps_si128(_mm_shuffle_ps(_mm_castsi128_ps(a.v), _mm_castsi128_ps(b.v), _MM_SHUFFLE(3, 1, 3, 1)))};
}
// Longs that are not negative, as words in the order of memory.
inline Lanes1 narrowedLongs(Lanes1 a, Lanes1 b) {
    return {_mm_packus_epi32(a.v, b.v)};
}

inline Floats1 operator+(Floats1 a, Floats1 b) {
    return {_mm_add_ps(a.f, b.f)};
}
inline Floats1 operator-(Floats1 a, Floats1 b) {
    return {_mm_sub_ps(a.f, b.f)};
}
inline Floats1 operator*(Floats1 a, Floats1 b) {
    return {_mm_mul_ps(a.f, b.f)};
}
inline Floats1 operator/(Floats1 a, Floats1 b) {
    return {_mm_div_ps(a.f, b.f)};
}
inline Floats1 rootOf(Floats1 a) {
    return {_mm_sqrt_ps(a.f)};
}
inline Floats1 floatsOf(Lanes1 longs) {
    return {_mm_cvtepi32_ps(longs.v)};
}
// (a - b) * factor of longs 0 .. 2^23 - 1, rounded once; both a - b and b * factor have to be exact in single precision.
inline Floats1 timesDifference(Lanes1 a, int b, float factor) {
    const __m128 base = _mm_set1_ps(8388608.0f + static_cast<float>(b)); // what 2^23 with a as its last bits is more than a - b
    return {_mm_mul_ps(_mm_sub_ps(_mm_castsi128_ps(_mm_or_si128(a.v, _mm_set1_epi32(0x4b000000))), base), _mm_set1_ps(factor))};
}
// Longs by the thread's rounding mode, and toward zero. What no long holds, and NaN, becomes the least long.
inline Lanes1 rounded(Floats1 a) {
    return {_mm_cvtps_epi32(a.f)};
}
inline Lanes1 truncated(Floats1 a) {
    return {_mm_cvttps_epi32(a.f)};
}

} // namespace

#include "kelImage_Lanes_one.h"

#endif
