// The vocabulary of kernels for AVX-512 (F, BW, VL and VBMI): four lanes of 128 bits, beside the two of AVX2 and
// the one for what is left of a row. What the names mean stands in the vocabulary for SSE4.1.
#ifndef KEL_IMAGE_LANES_AVX512_H
#define KEL_IMAGE_LANES_AVX512_H

#include "kelImage_Lanes_avx2.h"

namespace {

struct Floats4 {
    __m512 f;
};

struct Lanes4 {
    using Floats = Floats4;
    static constexpr int kLanes = 4, kBytes = 64, kThrees = 21;
    __m512i v;

    static Lanes4 load(const void* p) { return {_mm512_loadu_si512(p)}; }
    static Lanes4 of(Lanes1 a, Lanes1 b, Lanes1 c, Lanes1 d) {
        const __m256i low = _mm256_inserti128_si256(_mm256_castsi128_si256(a.v), b.v, 1);
        const __m256i high = _mm256_inserti128_si256(_mm256_castsi128_si256(c.v), d.v, 1);
        return {_mm512_inserti64x4(_mm512_castsi256_si512(low), high, 1)};
    }
    static Lanes4 loadLanes(const uint8_t* p, ptrdiff_t stride) {
        return of(Lanes1::load(p), Lanes1::load(p + stride), Lanes1::load(p + 2 * stride), Lanes1::load(p + 3 * stride));
    }
    static Lanes4 loadBytesAsWords(const uint8_t* p) {
        return {_mm512_cvtepu8_epi16(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)))};
    }
    static Lanes4 loadBytesAsLongs(const uint8_t* p) { return {_mm512_cvtepu8_epi32(Lanes1::load(p).v)}; }
    static Lanes4 loadEights(const void* p, const int32_t* index, ptrdiff_t apart) {
        return of(Lanes1::loadEights(p, index, 0), Lanes1::loadEights(p, index + apart, 0),
                  Lanes1::loadEights(p, index + 2 * apart, 0), Lanes1::loadEights(p, index + 3 * apart, 0));
    }
    static Lanes4 loadSixteens(const uint32_t* p, const int32_t* index) {
        return of(Lanes1::load(p + index[0]), Lanes1::load(p + index[1]), Lanes1::load(p + index[2]),
                  Lanes1::load(p + index[3]));
    }
    static Lanes4 zero() { return {_mm512_setzero_si512()}; }
    static Lanes4 bytes(int value) { return {_mm512_set1_epi8(static_cast<char>(value))}; }
    static Lanes4 words(int value) { return {_mm512_set1_epi16(static_cast<short>(value))}; }
    static Lanes4 longs(int value) { return {_mm512_set1_epi32(value)}; }
    static Lanes4 every(const Sixteen& lane) { return {_mm512_broadcast_i32x4(Lanes1::every(lane).v)}; }
    static Lanes4 ascendingLongs() { return {_mm512_setr_epi32(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15)}; }
    static Floats4 floats(float value) { return {_mm512_set1_ps(value)}; }
};

inline void store(void* p, Lanes4 a) {
    _mm512_storeu_si512(p, a.v);
}
inline void storeHalf(void* p, Lanes4 a) {
    _mm256_storeu_si256(static_cast<__m256i*>(p), _mm512_castsi512_si256(a.v));
}
inline void storeLanes(uint8_t* p, ptrdiff_t stride, Lanes4 a) {
    store(p, Lanes1{_mm512_castsi512_si128(a.v)});
    store(p + stride, Lanes1{_mm512_extracti32x4_epi32(a.v, 1)});
    store(p + 2 * stride, Lanes1{_mm512_extracti32x4_epi32(a.v, 2)});
    store(p + 3 * stride, Lanes1{_mm512_extracti32x4_epi32(a.v, 3)});
}
inline void storeInTurn(void* p, Lanes4 a, Lanes4 b) {
    const __m512i first = _mm512_setr_epi64(0, 1, 8, 9, 2, 3, 10, 11), second = _mm512_setr_epi64(4, 5, 12, 13, 6, 7, 14, 15);
    store(p, Lanes4{_mm512_permutex2var_epi64(a.v, first, b.v)});
    store(static_cast<uint8_t*>(p) + 64, Lanes4{_mm512_permutex2var_epi64(a.v, second, b.v)});
}
inline void storeInTurn(uint8_t* p, Lanes4 a, Lanes4 b, Lanes4 c) { // a0 b0 c0 a1, b1 c1 a2 b2, c2 a3 b3 c3
    const __m512i ab0 = _mm512_setr_epi64(0, 1, 8, 9, 0, 0, 2, 3), ab1 = _mm512_setr_epi64(10, 11, 0, 0, 4, 5, 12, 13),
                  ab2 = _mm512_setr_epi64(0, 0, 6, 7, 14, 15, 0, 0), c0 = _mm512_setr_epi64(0, 0, 0, 0, 0, 1, 0, 0),
                  c1 = _mm512_setr_epi64(0, 0, 2, 3, 0, 0, 0, 0), c2 = _mm512_setr_epi64(4, 5, 0, 0, 0, 0, 6, 7);
    store(p, Lanes4{_mm512_mask_permutexvar_epi64(_mm512_permutex2var_epi64(a.v, ab0, b.v), 0x30, c0, c.v)});
    store(p + 64, Lanes4{_mm512_mask_permutexvar_epi64(_mm512_permutex2var_epi64(a.v, ab1, b.v), 0x0c, c1, c.v)});
    store(p + 128, Lanes4{_mm512_mask_permutexvar_epi64(_mm512_permutex2var_epi64(a.v, ab2, b.v), 0xc3, c2, c.v)});
}
inline void loadInTurn(const uint8_t* p, Lanes4& a, Lanes4& b, Lanes4& c) {
    const __m512i first = Lanes4::load(p).v, second = Lanes4::load(p + 64).v, third = Lanes4::load(p + 128).v;
    const __m512i a01 = _mm512_setr_epi64(0, 1, 6, 7, 12, 13, 0, 0), b01 = _mm512_setr_epi64(2, 3, 8, 9, 14, 15, 0, 0),
                  c01 = _mm512_setr_epi64(4, 5, 10, 11, 0, 0, 0, 0), a2 = _mm512_setr_epi64(0, 0, 0, 0, 0, 0, 2, 3),
                  b2 = _mm512_setr_epi64(0, 0, 0, 0, 0, 0, 4, 5), c2 = _mm512_setr_epi64(0, 0, 0, 0, 0, 1, 6, 7);
    a = {_mm512_mask_permutexvar_epi64(_mm512_permutex2var_epi64(first, a01, second), 0xc0, a2, third)};
    b = {_mm512_mask_permutexvar_epi64(_mm512_permutex2var_epi64(first, b01, second), 0xc0, b2, third)};
    c = {_mm512_mask_permutexvar_epi64(_mm512_permutex2var_epi64(first, c01, second), 0xf0, c2, third)};
}
inline Lanes4 loadTwelves(const uint8_t* p, Lanes4) {
    const __m512i spread = _mm512_setr_epi32(0, 1, 2, 3, 3, 4, 5, 6, 6, 7, 8, 9, 9, 10, 11, 12);
    return {_mm512_permutexvar_epi32(spread, _mm512_loadu_si512(p))};
}
inline void storeTwelves(uint8_t* p, Lanes4 a) {
    const __m512i close = _mm512_setr_epi32(0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, 3, 7, 11, 15);
    store(p, Lanes4{_mm512_permutexvar_epi32(close, a.v)});
}
// Sixty-four indices, or several times as many, by a formula.
template <int count> struct alignas(64) Indices {
    uint8_t of[count][64];
    __m512i operator[](int i) const { return _mm512_load_si512(of[i]); }
};
template <int count, class Formula> constexpr Indices<count> indices(Formula formula) {
    Indices<count> made = {};
    for (int i = 0; i < 64 * count; ++i)
        made.of[i / 64][i % 64] = static_cast<uint8_t>(formula(i));
    return made;
}
inline void storeThirds(uint8_t* p, Lanes4 a) {
    static constexpr auto spread = indices<3>([](int i) { return i / 3; });
    constexpr uint64_t everyThird = 0x9249249249249249;
    _mm512_mask_storeu_epi8(p, everyThird, _mm512_permutexvar_epi8(spread[0], a.v));
    _mm512_mask_storeu_epi8(p + 64, everyThird << 2, _mm512_permutexvar_epi8(spread[1], a.v));
    _mm512_mask_storeu_epi8(p + 128, everyThird << 1, _mm512_permutexvar_epi8(spread[2], a.v));
}
inline void storeThirds(int16_t* p, Lanes4 a) {
    static constexpr auto spread = indices<3>([](int i) { return 2 * (i / 6) + i % 2; });
    constexpr uint32_t everyThird = 0x49249249;
    _mm512_mask_storeu_epi16(p, everyThird, _mm512_permutexvar_epi8(spread[0], a.v));
    _mm512_mask_storeu_epi16(p + 32, everyThird << 1, _mm512_permutexvar_epi8(spread[1], a.v));
    _mm512_mask_storeu_epi16(p + 64, everyThird << 2, _mm512_permutexvar_epi8(spread[2], a.v));
}
inline void storeThreesReversed(uint8_t* d, const uint8_t* p, Lanes4) {
    static constexpr auto reverse = indices<1>([](int i) { return 61 - i / 3 * 3 + i % 3; });
    store(d, Lanes4{_mm512_permutexvar_epi8(reverse[0], Lanes4::load(p - 1).v)});
}
inline Lanes4 reversedLanes(Lanes4 a) {
    return {_mm512_shuffle_i64x2(a.v, a.v, _MM_SHUFFLE(0, 1, 2, 3))};
}

inline Lanes4 operator&(Lanes4 a, Lanes4 b) {
    return {_mm512_and_si512(a.v, b.v)};
}
inline Lanes4 operator|(Lanes4 a, Lanes4 b) {
    return {_mm512_or_si512(a.v, b.v)};
}
inline Lanes4 operator^(Lanes4 a, Lanes4 b) {
    return {_mm512_xor_si512(a.v, b.v)};
}
inline Lanes4 select(Lanes4 mask, Lanes4 a, Lanes4 b) {
    return {_mm512_ternarylogic_epi64(mask.v, a.v, b.v, 0xca)};
}
inline Lanes4 shuffle(Lanes4 a, Lanes4 index) {
    return {_mm512_shuffle_epi8(a.v, index.v)};
}
template <int n> Lanes4 joined(Lanes4 low, Lanes4 high) {
    return {_mm512_alignr_epi8(high.v, low.v, n)};
}
inline Lanes4 lowBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_unpacklo_epi8(a.v, b.v)};
}
inline Lanes4 highBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_unpackhi_epi8(a.v, b.v)};
}
inline Lanes4 lowWords(Lanes4 a, Lanes4 b) {
    return {_mm512_unpacklo_epi16(a.v, b.v)};
}
inline Lanes4 highWords(Lanes4 a, Lanes4 b) {
    return {_mm512_unpackhi_epi16(a.v, b.v)};
}

inline Lanes4 addBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_add_epi8(a.v, b.v)};
}
inline Lanes4 subBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_sub_epi8(a.v, b.v)};
}
inline Lanes4 minBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_min_epu8(a.v, b.v)};
}
inline Lanes4 maxBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_max_epu8(a.v, b.v)};
}
inline Lanes4 averageBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_avg_epu8(a.v, b.v)};
}
inline Lanes4 atLeastBytes(Lanes4 a, Lanes4 b) {
    return {_mm512_movm_epi8(_mm512_cmpge_epu8_mask(a.v, b.v))};
}

inline Lanes4 addWords(Lanes4 a, Lanes4 b) {
    return {_mm512_add_epi16(a.v, b.v)};
}
inline Lanes4 subWords(Lanes4 a, Lanes4 b) {
    return {_mm512_sub_epi16(a.v, b.v)};
}
inline Lanes4 minWords(Lanes4 a, Lanes4 b) {
    return {_mm512_min_epi16(a.v, b.v)};
}
inline Lanes4 maxWords(Lanes4 a, Lanes4 b) {
    return {_mm512_max_epi16(a.v, b.v)};
}
inline Lanes4 minUnsignedWords(Lanes4 a, Lanes4 b) {
    return {_mm512_min_epu16(a.v, b.v)};
}
inline Lanes4 greaterWords(Lanes4 a, Lanes4 b) {
    return {_mm512_movm_epi16(_mm512_cmpgt_epi16_mask(a.v, b.v))};
}
inline uint64_t signsOfWords(Lanes4 a, Lanes4 b) {
    return _mm512_movepi16_mask(a.v) | uint64_t(_mm512_movepi16_mask(b.v)) << 32;
}
inline Lanes4 absWords(Lanes4 a) {
    return {_mm512_abs_epi16(a.v)};
}
inline Lanes4 mulWords(Lanes4 a, Lanes4 b) {
    return {_mm512_mullo_epi16(a.v, b.v)};
}
inline Lanes4 mulHighWords(Lanes4 a, Lanes4 b) {
    return {_mm512_mulhi_epu16(a.v, b.v)};
}
inline Lanes4 mulRoundedWords(Lanes4 a, Lanes4 b) {
    return {_mm512_mulhrs_epi16(a.v, b.v)};
}
template <int n> Lanes4 shiftLeftWords(Lanes4 a) {
    return {_mm512_slli_epi16(a.v, n)};
}
template <int n> Lanes4 shiftRightWords(Lanes4 a) {
    return {_mm512_srli_epi16(a.v, n)};
}
inline Lanes4 weighBytes(Lanes4 a, Lanes4 weights) {
    return {_mm512_maddubs_epi16(a.v, weights.v)};
}
inline Lanes4 weighWords(Lanes4 a, Lanes4 weights) {
    return {_mm512_madd_epi16(a.v, weights.v)};
}

inline Lanes4 addLongs(Lanes4 a, Lanes4 b) {
    return {_mm512_add_epi32(a.v, b.v)};
}
inline Lanes4 subLongs(Lanes4 a, Lanes4 b) {
    return {_mm512_sub_epi32(a.v, b.v)};
}
inline Lanes4 minLongs(Lanes4 a, Lanes4 b) {
    return {_mm512_min_epi32(a.v, b.v)};
}
inline Lanes4 mulLongs(Lanes4 a, Lanes4 b) {
    return {_mm512_mullo_epi32(a.v, b.v)};
}
inline Lanes4 greaterLongs(Lanes4 a, Lanes4 b) {
    return {_mm512_maskz_set1_epi32(_mm512_cmpgt_epi32_mask(a.v, b.v), -1)};
}
inline uint64_t signsOfLongs(Lanes4 a) {
    return _mm512_cmplt_epi32_mask(a.v, _mm512_setzero_si512());
}
template <int n> Lanes4 shiftRightLongs(Lanes4 a) {
    return {_mm512_srli_epi32(a.v, n)};
}

inline Lanes4 upperWords(Lanes4 a, Lanes4 b) {
    return {_mm512_mask_blend_epi16(0xaaaaaaaa, _mm512_srli_epi32(a.v, 16), b.v)};
}

inline Lanes4 packWords(Lanes4 a, Lanes4 b) {
    return {_mm512_packus_epi16(a.v, b.v)};
}
inline Lanes4 packLongs(Lanes4 a, Lanes4 b) {
    return {_mm512_packs_epi32(a.v, b.v)};
}
inline Lanes4 evenLongs(Lanes4 a, Lanes4 b) {
    return {
        _mm512_castps_si512(_mm512_shuffle_ps(_mm512_castsi512_ps(a.v), _mm512_castsi512_ps(b.v), _MM_SHUFFLE(2, 0, 2, 0)))};
}
inline Lanes4 oddLongs(Lanes4 a, Lanes4 b) {
    return {
        _mm512_castps_si512(_mm512_shuffle_ps(_mm512_castsi512_ps(a.v), _mm512_castsi512_ps(b.v), _MM_SHUFFLE(3, 1, 3, 1)))};
}
inline Lanes4 ordered(Lanes4 ab) {
    return {_mm512_permutexvar_epi64(_mm512_setr_epi64(0, 2, 4, 6, 1, 3, 5, 7), ab.v)};
}
inline Lanes4 longsInTurn(Lanes4 a) {
    return {_mm512_permutexvar_epi32(_mm512_setr_epi32(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15), a.v)};
}
inline Lanes4 narrowedWords(Lanes4 a, Lanes4 b) {
    return ordered(packWords(a, b));
}
inline Lanes4 narrowedLongs(Lanes4 a, Lanes4 b) {
    return ordered({_mm512_packus_epi32(a.v, b.v)});
}

inline Floats4 operator+(Floats4 a, Floats4 b) {
    return {_mm512_add_ps(a.f, b.f)};
}
inline Floats4 operator-(Floats4 a, Floats4 b) {
    return {_mm512_sub_ps(a.f, b.f)};
}
inline Floats4 operator*(Floats4 a, Floats4 b) {
    return {_mm512_mul_ps(a.f, b.f)};
}
inline Floats4 operator/(Floats4 a, Floats4 b) {
    return {_mm512_div_ps(a.f, b.f)};
}
inline Floats4 rootOf(Floats4 a) {
    return {_mm512_sqrt_ps(a.f)};
}
inline Floats4 floatsOf(Lanes4 longs) {
    return {_mm512_cvtepi32_ps(longs.v)};
}
inline Floats4 timesDifference(Lanes4 a, int b, float factor) {
    return {_mm512_fmsub_ps(_mm512_cvtepi32_ps(a.v), _mm512_set1_ps(factor), _mm512_set1_ps(static_cast<float>(b) * factor))};
}
inline Lanes4 rounded(Floats4 a) {
    return {_mm512_cvtps_epi32(a.f)};
}
inline Lanes4 truncated(Floats4 a) {
    return {_mm512_cvttps_epi32(a.f)};
}

} // namespace

#endif
