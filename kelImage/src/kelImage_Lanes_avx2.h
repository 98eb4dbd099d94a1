// The vocabulary of kernels for AVX2 and FMA: two lanes of 128 bits, and one for what is left of a row. What the names mean stands in
// the vocabulary for SSE4.1.
#ifndef KEL_IMAGE_LANES_AVX2_H
#define KEL_IMAGE_LANES_AVX2_H

#include "kelImage_Lanes_sse41.h"

namespace {

struct Floats2 {
    __m256 f;
};

struct Lanes2 {
    using Floats = Floats2;
    static constexpr int kLanes = 2, kBytes = 32, kThrees = 10;
    __m256i v;

    static Lanes2 load(const void* p) { return {_mm256_loadu_si256(static_cast<const __m256i*>(p))}; }
    static Lanes2 of(Lanes1 low, Lanes1 high) { return {_mm256_inserti128_si256(_mm256_castsi128_si256(low.v), high.v, 1)}; }
    static Lanes2 loadLanes(const uint8_t* p, ptrdiff_t stride) { return of(Lanes1::load(p), Lanes1::load(p + stride)); }
    static Lanes2 loadBytesAsWords(const uint8_t* p) { return {_mm256_cvtepu8_epi16(Lanes1::load(p).v)}; }
    static Lanes2 loadBytesAsLongs(const uint8_t* p) {
        return {_mm256_cvtepu8_epi32(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)))};
    }
    static Lanes2 loadEights(const void* p, const int32_t* index, ptrdiff_t apart) {
        return of(Lanes1::loadEights(p, index, 0), Lanes1::loadEights(p, index + apart, 0));
    }
    static Lanes2 loadSixteens(const uint32_t* p, const int32_t* index) {
        return of(Lanes1::load(p + index[0]), Lanes1::load(p + index[1]));
    }
    static Lanes2 zero() { return {_mm256_setzero_si256()}; }
    static Lanes2 bytes(int value) { return {_mm256_set1_epi8(static_cast<char>(value))}; }
    static Lanes2 words(int value) { return {_mm256_set1_epi16(static_cast<short>(value))}; }
    static Lanes2 longs(int value) { return {_mm256_set1_epi32(value)}; }
    // Said in assembly, as GCC builds constants that repeat themselves anew in every turn of a loop that has more than registers.
    static Lanes2 every(const Sixteen& lane) {
        __m256i v;
        __asm__("vbroadcasti128 %1, %0" : "=x"(v) : "m"(lane));
        return {v};
    }
    static Lanes2 ascendingLongs() { return {_mm256_setr_epi32(0, 1, 2, 3, 4, 5, 6, 7)}; }
    static Floats2 floats(float value) { return {_mm256_set1_ps(value)}; }
};

inline void store(void* p, Lanes2 a) {
    _mm256_storeu_si256(static_cast<__m256i*>(p), a.v);
}
inline void storeHalf(void* p, Lanes2 a) {
    store(p, Lanes1{_mm256_castsi256_si128(a.v)});
}
inline void storeLanes(uint8_t* p, ptrdiff_t stride, Lanes2 a) {
    storeHalf(p, a);
    store(p + stride, Lanes1{_mm256_extracti128_si256(a.v, 1)});
}
inline void storeInTurn(void* p, Lanes2 a, Lanes2 b) {
    store(p, Lanes2{_mm256_permute2x128_si256(a.v, b.v, 0x20)});
    store(static_cast<uint8_t*>(p) + 32, Lanes2{_mm256_permute2x128_si256(a.v, b.v, 0x31)});
}
inline void storeInTurn(uint8_t* p, Lanes2 a, Lanes2 b, Lanes2 c) {
    store(p, Lanes2{_mm256_permute2x128_si256(a.v, b.v, 0x20)});
    store(p + 32, Lanes2{_mm256_blend_epi32(c.v, a.v, 0xf0)});
    store(p + 64, Lanes2{_mm256_permute2x128_si256(b.v, c.v, 0x31)});
}
inline void loadInTurn(const uint8_t* p, Lanes2& a, Lanes2& b, Lanes2& c) { // a0 b0, c0 a1, b1 c1
    const __m256i first = Lanes2::load(p).v, second = Lanes2::load(p + 32).v, third = Lanes2::load(p + 64).v;
    a = {_mm256_blend_epi32(first, second, 0xf0)};
    b = {_mm256_permute2x128_si256(first, third, 0x21)};
    c = {_mm256_blend_epi32(second, third, 0xf0)};
}
inline Lanes2 loadTwelves(const uint8_t* p, Lanes2) {
    return Lanes2::loadLanes(p, 12);
}
inline void storeTwelves(uint8_t* p, Lanes2 a) {
    store(p, Lanes2{_mm256_permutevar8x32_epi32(a.v, _mm256_setr_epi32(0, 1, 2, 4, 5, 6, 3, 7))});
}
template <class T> void storeThirds(T* p, Lanes2 a) {
    storeThirds(p, Lanes1{_mm256_castsi256_si128(a.v)});
    storeThirds(p + 48 / sizeof(T), Lanes1{_mm256_extracti128_si256(a.v, 1)});
}
inline void storeThreesReversed(uint8_t* d, const uint8_t* p, Lanes2) {
    storeThreesReversed(d, p + 15, Lanes1());
    storeThreesReversed(d + 15, p, Lanes1());
}
inline Lanes2 reversedLanes(Lanes2 a) {
    return {_mm256_permute2x128_si256(a.v, a.v, 0x01)};
}

inline Lanes2 operator&(Lanes2 a, Lanes2 b) {
    return {_mm256_and_si256(a.v, b.v)};
}
inline Lanes2 operator|(Lanes2 a, Lanes2 b) {
    return {_mm256_or_si256(a.v, b.v)};
}
inline Lanes2 operator^(Lanes2 a, Lanes2 b) {
    return {_mm256_xor_si256(a.v, b.v)};
}
inline Lanes2 select(Lanes2 mask, Lanes2 a, Lanes2 b) {
    return {_mm256_blendv_epi8(b.v, a.v, mask.v)};
}
inline Lanes2 shuffle(Lanes2 a, Lanes2 index) {
    return {_mm256_shuffle_epi8(a.v, index.v)};
}
template <int n> Lanes2 joined(Lanes2 low, Lanes2 high) {
    return {_mm256_alignr_epi8(high.v, low.v, n)};
}
inline Lanes2 lowBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_unpacklo_epi8(a.v, b.v)};
}
inline Lanes2 highBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_unpackhi_epi8(a.v, b.v)};
}
inline Lanes2 lowWords(Lanes2 a, Lanes2 b) {
    return {_mm256_unpacklo_epi16(a.v, b.v)};
}
inline Lanes2 highWords(Lanes2 a, Lanes2 b) {
    return {_mm256_unpackhi_epi16(a.v, b.v)};
}

inline Lanes2 addBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_add_epi8(a.v, b.v)};
}
inline Lanes2 subBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_sub_epi8(a.v, b.v)};
}
inline Lanes2 minBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_min_epu8(a.v, b.v)};
}
inline Lanes2 maxBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_max_epu8(a.v, b.v)};
}
inline Lanes2 averageBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_avg_epu8(a.v, b.v)};
}
inline Lanes2 atLeastBytes(Lanes2 a, Lanes2 b) {
    return {_mm256_cmpeq_epi8(_mm256_max_epu8(a.v, b.v), a.v)};
}

inline Lanes2 addWords(Lanes2 a, Lanes2 b) {
    return {_mm256_add_epi16(a.v, b.v)};
}
inline Lanes2 subWords(Lanes2 a, Lanes2 b) {
    return {_mm256_sub_epi16(a.v, b.v)};
}
inline Lanes2 minWords(Lanes2 a, Lanes2 b) {
    return {_mm256_min_epi16(a.v, b.v)};
}
inline Lanes2 maxWords(Lanes2 a, Lanes2 b) {
    return {_mm256_max_epi16(a.v, b.v)};
}
inline Lanes2 minUnsignedWords(Lanes2 a, Lanes2 b) {
    return {_mm256_min_epu16(a.v, b.v)};
}
inline Lanes2 greaterWords(Lanes2 a, Lanes2 b) {
    return {_mm256_cmpgt_epi16(a.v, b.v)};
}
inline uint64_t signsOfWords(Lanes2 a, Lanes2 b) {
    const __m256i bytes = _mm256_permute4x64_epi64(_mm256_packs_epi16(a.v, b.v), _MM_SHUFFLE(3, 1, 2, 0));
    return static_cast<unsigned>(_mm256_movemask_epi8(bytes));
}
inline Lanes2 absWords(Lanes2 a) {
    return {_mm256_abs_epi16(a.v)};
}
inline Lanes2 mulWords(Lanes2 a, Lanes2 b) {
    return {_mm256_mullo_epi16(a.v, b.v)};
}
inline Lanes2 mulHighWords(Lanes2 a, Lanes2 b) {
    return {_mm256_mulhi_epu16(a.v, b.v)};
}
inline Lanes2 mulRoundedWords(Lanes2 a, Lanes2 b) {
    return {_mm256_mulhrs_epi16(a.v, b.v)};
}
template <int n> Lanes2 shiftLeftWords(Lanes2 a) {
    return {_mm256_slli_epi16(a.v, n)};
}
template <int n> Lanes2 shiftRightWords(Lanes2 a) {
    return {_mm256_srli_epi16(a.v, n)};
}
inline Lanes2 weighBytes(Lanes2 a, Lanes2 weights) {
    return {_mm256_maddubs_epi16(a.v, weights.v)};
}
inline Lanes2 weighWords(Lanes2 a, Lanes2 weights) {
    return {_mm256_madd_epi16(a.v, weights.v)};
}

inline Lanes2 addLongs(Lanes2 a, Lanes2 b) {
    return {_mm256_add_epi32(a.v, b.v)};
}
inline Lanes2 subLongs(Lanes2 a, Lanes2 b) {
    return {_mm256_sub_epi32(a.v, b.v)};
}
inline Lanes2 minLongs(Lanes2 a, Lanes2 b) {
    return {_mm256_min_epi32(a.v, b.v)};
}
inline Lanes2 mulLongs(Lanes2 a, Lanes2 b) {
    return {_mm256_mullo_epi32(a.v, b.v)};
}
inline Lanes2 greaterLongs(Lanes2 a, Lanes2 b) {
    return {_mm256_cmpgt_epi32(a.v, b.v)};
}
inline uint64_t signsOfLongs(Lanes2 a) {
    return static_cast<unsigned>(_mm256_movemask_ps(_mm256_castsi256_ps(a.v)));
}
template <int n> Lanes2 shiftRightLongs(Lanes2 a) {
    return {_mm256_srli_epi32(a.v, n)};
}

inline Lanes2 upperWords(Lanes2 a, Lanes2 b) {
    return {_mm256_blend_epi16(_mm256_srli_epi32(a.v, 16), b.v, 0xaa)};
}

inline Lanes2 packWords(Lanes2 a, Lanes2 b) {
    return {_mm256_packus_epi16(a.v, b.v)};
}
inline Lanes2 packLongs(Lanes2 a, Lanes2 b) {
    return {_mm256_packs_epi32(a.v, b.v)};
}
inline Lanes2 evenLongs(Lanes2 a, Lanes2 b) {
    return {
        _mm256_castps_si256(_mm256_shuffle_ps(_mm256_castsi256_ps(a.v), _mm256_castsi256_ps(b.v), _MM_SHUFFLE(2, 0, 2, 0)))};
}
inline Lanes2 oddLongs(Lanes2 a, Lanes2 b) {
    return {
        _mm256_castps_si256(_mm256_shuffle_ps(_mm256_castsi256_ps(a.v), _mm256_castsi256_ps(b.v), _MM_SHUFFLE(3, 1, 3, 1)))};
}
inline Lanes2 ordered(Lanes2 ab) {
    return {_mm256_permute4x64_epi64(ab.v, _MM_SHUFFLE(3, 1, 2, 0))};
}
inline Lanes2 longsInTurn(Lanes2 a) {
    return {_mm256_permutevar8x32_epi32(a.v, _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7))};
}
inline Lanes2 narrowedWords(Lanes2 a, Lanes2 b) {
    return ordered(packWords(a, b));
}
inline Lanes2 narrowedLongs(Lanes2 a, Lanes2 b) {
    return ordered({_mm256_packus_epi32(a.v, b.v)});
}

inline Floats2 operator+(Floats2 a, Floats2 b) {
    return {_mm256_add_ps(a.f, b.f)};
}
inline Floats2 operator-(Floats2 a, Floats2 b) {
    return {_mm256_sub_ps(a.f, b.f)};
}
inline Floats2 operator*(Floats2 a, Floats2 b) {
    return {_mm256_mul_ps(a.f, b.f)};
}
inline Floats2 operator/(Floats2 a, Floats2 b) {
    return {_mm256_div_ps(a.f, b.f)};
}
inline Floats2 rootOf(Floats2 a) {
    return {_mm256_sqrt_ps(a.f)};
}
inline Floats2 floatsOf(Lanes2 longs) {
    return {_mm256_cvtepi32_ps(longs.v)};
}
inline Floats2 timesDifference(Lanes2 a, int b, float factor) {
    return {_mm256_fmsub_ps(_mm256_cvtepi32_ps(a.v), _mm256_set1_ps(factor), _mm256_set1_ps(static_cast<float>(b) * factor))};
}
inline Lanes2 rounded(Floats2 a) {
    return {_mm256_cvtps_epi32(a.f)};
}
inline Lanes2 truncated(Floats2 a) {
    return {_mm256_cvttps_epi32(a.f)};
}

} // namespace

#endif
