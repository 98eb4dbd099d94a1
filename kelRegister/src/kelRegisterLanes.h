// The vocabulary of vectors: those of the compiler, whose operators mean the same on every processor, and a name for what each
// instruction set does in its own way. Sums of integers may be taken in any order; those of floats are taken as written.
// Everything has internal linkage, and the standard library stays outside: files that include this are compiled for different
// processors, and nothing of theirs may serve the others.
#ifndef KEL_REGISTER_LANES_H
#define KEL_REGISTER_LANES_H

#include <stddef.h>
#include <stdint.h>
#include <string.h>

#ifdef __aarch64__
#include <arm_neon.h>
#else
#include <immintrin.h>
#endif

namespace {

#ifdef __AVX2__
constexpr int kVector = 32; // bytes
#else
constexpr int kVector = 16;
#endif
constexpr int kFloats = kVector / 4;

using Bytes = uint8_t __attribute__((vector_size(kVector)));
using Ints = int32_t __attribute__((vector_size(kVector)));
using Unsigned = uint32_t __attribute__((vector_size(kVector))); // whose sums the compiler may take in any order
using Floats = float __attribute__((vector_size(kVector)));
using FourInts = int32_t __attribute__((vector_size(16)));

template <class V> struct __attribute__((packed, may_alias)) InMemory { V vector; };
template <class V> inline V load(const void* p) {
    return static_cast<const InMemory<V>*>(p)->vector;
}
template <class V> inline void store(void* p, V v) {
    static_cast<InMemory<V>*>(p)->vector = v;
}

template <class V> inline V least(V a, V b) {
    return a < b ? a : b;
}
template <class V> inline V most(V a, V b) {
    return a > b ? a : b;
}
inline Floats magnitude(Floats a) {
    return (Floats)((Ints)a & INT32_MAX);
}
inline Floats toFloats(Ints v) {
    return __builtin_convertvector(v, Floats);
}
// Of values that an int holds: of others processors make different ints.
inline Ints truncated(Floats v) {
    return __builtin_convertvector(v, Ints);
}

// For each instruction set:
//   loadWide(p)                      bytes widened to ints
//   storeLowHalves(p, v)             the low halves of ints, which are all that is set
//   root(v)                          square roots
//   Sums, plusDifferences(s, a, b)   sums of absolute differences, kept apart in some way; of no more than 256 bytes
//   totals(a, b, c, d)               four such to one sum each
//   Products, plusProducts(p, values, bytes)
//                                    sums of products of sixteen 16-bit values with sixteen bytes, kept apart in some way
//   total(p)                         those to one sum
//   bitsOf(mask)                     bit i: whether the comparison held for value i
//   Eight                            floats

#if defined(__aarch64__)

inline Ints loadWide(const uint8_t* p) {
    uint32_t four;
    memcpy(&four, p, 4);
    return (Ints)vmovl_u16(vget_low_u16(vmovl_u8(vcreate_u8(four))));
}
inline void storeLowHalves(uint16_t* p, Ints v) {
    vst1_u16(p, vmovn_u32((uint32x4_t)v));
}
inline Floats root(Floats v) {
    return vsqrtq_f32(v);
}
using Sums = uint16x8_t;
inline Sums plusDifferences(Sums sums, Bytes a, Bytes b) {
    return vpadalq_u8(sums, vabdq_u8(a, b));
}
inline FourInts totals(Sums a, Sums b, Sums c, Sums d) {
    return (FourInts)vpaddlq_u16(vpaddq_u16(vpaddq_u16(a, b), vpaddq_u16(c, d)));
}
using Products = int32x4_t;
inline Products plusProducts(Products sums, const int16_t* values, const uint8_t* bytes) {
    const uint8x16_t v = vld1q_u8(bytes);
    const int16x8_t low = (int16x8_t)vmovl_u8(vget_low_u8(v)), high = (int16x8_t)vmovl_high_u8(v);
    const int16x8_t first = vld1q_s16(values), second = vld1q_s16(values + 8);
    const int32x4_t some = vmlal_high_s16(vmlal_s16(sums, vget_low_s16(first), vget_low_s16(low)), first, low);
    return vmlal_high_s16(vmlal_s16(some, vget_low_s16(second), vget_low_s16(high)), second, high);
}
inline int total(Products sums) {
    return vaddvq_s32(sums);
}
inline int bitsOf(FourInts mask) {
    const FourInts bits = {1, 2, 4, 8};
    return vaddvq_s32(mask & bits);
}

#elif defined(__AVX2__)

using Sums = Unsigned;
using Products = Unsigned;
inline Ints loadWide(const uint8_t* p) {
    return (Ints)_mm256_cvtepu8_epi32(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)));
}
inline void storeLowHalves(uint16_t* p, Ints v) {
    const __m256i all = (__m256i)v;
    store(p, _mm_packus_epi32(_mm256_castsi256_si128(all), _mm256_extracti128_si256(all, 1)));
}
inline Floats root(Floats v) {
    return _mm256_sqrt_ps(v);
}
inline Sums plusDifferences(Sums sums, Bytes a, Bytes b) {
    return sums + (Sums)_mm256_sad_epu8((__m256i)a, (__m256i)b);
}
inline FourInts totals(Sums a, Sums b, Sums c, Sums d) {
    const __m256i ab = (__m256i)(a + (Sums)_mm256_slli_epi64((__m256i)b, 32));
    const __m256i cd = (__m256i)(c + (Sums)_mm256_slli_epi64((__m256i)d, 32));
    const __m256i sums = _mm256_add_epi32(_mm256_unpacklo_epi64(ab, cd), _mm256_unpackhi_epi64(ab, cd));
    return (FourInts)_mm_add_epi32(_mm256_castsi256_si128(sums), _mm256_extracti128_si256(sums, 1));
}
inline Products plusProducts(Products sums, const int16_t* values, const uint8_t* bytes) {
    return sums + (Products)_mm256_madd_epi16(_mm256_cvtepu8_epi16(load<__m128i>(bytes)), load<__m256i>(values));
}

#else

using Sums = Unsigned;
using Products = Unsigned;
inline Ints loadWide(const uint8_t* p) {
    int four;
    memcpy(&four, p, 4);
    return (Ints)_mm_cvtepu8_epi32(_mm_cvtsi32_si128(four));
}
inline void storeLowHalves(uint16_t* p, Ints v) {
    _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packus_epi32((__m128i)v, (__m128i)v));
}
inline Floats root(Floats v) {
    return _mm_sqrt_ps(v);
}
inline Sums plusDifferences(Sums sums, Bytes a, Bytes b) {
    return sums + (Sums)_mm_sad_epu8((__m128i)a, (__m128i)b);
}
inline FourInts totals(Sums a, Sums b, Sums c, Sums d) {
    const __m128i ab = (__m128i)(a + (Sums)_mm_slli_epi64((__m128i)b, 32));
    const __m128i cd = (__m128i)(c + (Sums)_mm_slli_epi64((__m128i)d, 32));
    return (FourInts)_mm_add_epi32(_mm_unpacklo_epi64(ab, cd), _mm_unpackhi_epi64(ab, cd));
}
inline Products plusProducts(Products sums, const int16_t* values, const uint8_t* bytes) {
    const __m128i v = load<__m128i>(bytes), zero = _mm_setzero_si128();
    return sums + ((Products)_mm_madd_epi16(_mm_unpacklo_epi8(v, zero), load<__m128i>(values)) +
                   (Products)_mm_madd_epi16(_mm_unpackhi_epi8(v, zero), load<__m128i>(values + 8)));
}

#endif

#ifndef __aarch64__ // what x86 does alike in every width
inline int total(Products sums) {
#ifdef __AVX2__
    const FourInts four =
        (FourInts)_mm256_castsi256_si128((__m256i)sums) + (FourInts)_mm256_extracti128_si256((__m256i)sums, 1);
#else
    const FourInts four = (FourInts)sums;
#endif
    return (four[0] + four[2]) + (four[1] + four[3]);
}
inline int bitsOf(FourInts mask) {
    return _mm_movemask_ps((__m128)mask);
}
#endif

#ifdef __AVX2__
struct Eight {
    Floats v;
    static Eight load(const float* p) { return {::load<Floats>(p)}; }
    void store(float* p) const { ::store(p, v); }
};
inline Eight operator+(Eight a, Eight b) {
    return {a.v + b.v};
}
inline Eight operator*(Eight a, float b) {
    return {a.v * b};
}
#else
struct Eight {
    Floats low, high;
    static Eight load(const float* p) { return {::load<Floats>(p), ::load<Floats>(p + 4)}; }
    void store(float* p) const {
        ::store(p, low);
        ::store(p + 4, high);
    }
};
inline Eight operator+(Eight a, Eight b) {
    return {a.low + b.low, a.high + b.high};
}
inline Eight operator*(Eight a, float b) {
    return {a.low * b, a.high * b};
}
#endif

} // namespace

#endif
