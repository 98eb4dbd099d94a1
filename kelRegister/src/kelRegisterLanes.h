// The vocabulary of vectors: lanes of 128 bits that repeat. Another instruction set is another struct of these names.
// Everything has internal linkage, and the standard library stays outside: files that include this are compiled for different
// processors, and nothing of theirs may serve the others.
#ifndef KEL_REGISTER_LANES_H
#define KEL_REGISTER_LANES_H

#include <stddef.h>
#include <stdint.h>
#include <string.h>

#include <immintrin.h>

namespace {

#if defined(__AVX2__)

struct Lanes {
    using Bytes = __m256i;
    using Ints = __m256i;
    using Floats = __m256;
    static constexpr int kBytes = 32, kFloats = 8;

    static Bytes load(const uint8_t* p) { return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)); }
    static Ints noInts() { return _mm256_setzero_si256(); }
    static Ints plus(Ints a, Ints b) { return _mm256_add_epi32(a, b); }
    static Ints minus(Ints a, Ints b) { return _mm256_sub_epi32(a, b); }
    static Ints allInts(int v) { return _mm256_set1_epi32(v); }
    static Ints least(Ints a, Ints b) { return _mm256_min_epi32(a, b); }
    static Ints both(Ints a, Ints b) { return _mm256_and_si256(a, b); }
    static Ints either(Ints a, Ints b) { return _mm256_or_si256(a, b); }
    static Ints shiftedUp8(Ints a) { return _mm256_slli_epi32(a, 8); }
    // Bytes widened to ints.
    static Ints loadWide(const uint8_t* p) {
        return _mm256_cvtepu8_epi32(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)));
    }
    // The low halves, which are all that is set.
    static void storeLowHalves(uint16_t* p, Ints v) {
        const __m128i packed = _mm_packus_epi32(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(p), packed);
    }
    static Floats toFloats(Ints v) { return _mm256_cvtepi32_ps(v); }
    static Ints truncated(Floats v) { return _mm256_cvttps_epi32(v); }
    static Floats all(float v) { return _mm256_set1_ps(v); }
    static Floats plus(Floats a, Floats b) { return _mm256_add_ps(a, b); }
    static Floats minus(Floats a, Floats b) { return _mm256_sub_ps(a, b); }
    static Floats times(Floats a, Floats b) { return _mm256_mul_ps(a, b); }
    static Floats over(Floats a, Floats b) { return _mm256_div_ps(a, b); }
    static Floats least(Floats a, Floats b) { return _mm256_min_ps(a, b); }
    static Floats most(Floats a, Floats b) { return _mm256_max_ps(a, b); }
    static Floats root(Floats a) { return _mm256_sqrt_ps(a); }
    static Floats magnitude(Floats a) { return _mm256_andnot_ps(_mm256_set1_ps(-0.0f), a); }
    static Floats whereLess(Floats a, Floats b, Floats yes, Floats no) {
        return _mm256_blendv_ps(no, yes, _mm256_cmp_ps(a, b, _CMP_LT_OQ));
    }
    // Sums of absolute differences, one for every eight bytes.
    static Ints differences(Bytes a, Bytes b) { return _mm256_sad_epu8(a, b); }
    // Four such vectors of sums to one sum each.
    static __m128i totals(Ints a, Ints b, Ints c, Ints d) {
        const __m256i ab = _mm256_add_epi32(a, _mm256_slli_epi64(b, 32)), cd = _mm256_add_epi32(c, _mm256_slli_epi64(d, 32));
        const __m256i sums = _mm256_add_epi32(_mm256_unpacklo_epi64(ab, cd), _mm256_unpackhi_epi64(ab, cd));
        return _mm_add_epi32(_mm256_castsi256_si128(sums), _mm256_extracti128_si256(sums, 1));
    }
    // Products of sixteen 16-bit values with sixteen bytes, added up in any way.
    static Ints products(const int16_t* values, const uint8_t* bytes) {
        const __m256i wide = _mm256_cvtepu8_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes)));
        return _mm256_madd_epi16(wide, _mm256_loadu_si256(reinterpret_cast<const __m256i*>(values)));
    }
    static int sum(Ints v) {
        __m128i s = _mm_add_epi32(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1));
        s = _mm_add_epi32(s, _mm_unpackhi_epi64(s, s));
        return _mm_cvtsi128_si32(s) + _mm_extract_epi32(s, 1);
    }
};

struct Eight { // floats
    __m256 v;
    static Eight load(const float* p) { return {_mm256_loadu_ps(p)}; }
    static Eight none() { return {_mm256_setzero_ps()}; }
    void store(float* p) const { _mm256_storeu_ps(p, v); }
};
inline Eight operator+(Eight a, Eight b) {
    return {_mm256_add_ps(a.v, b.v)};
}
inline Eight operator*(Eight a, float b) {
    return {_mm256_mul_ps(a.v, _mm256_set1_ps(b))};
}

#else

struct Lanes {
    using Bytes = __m128i;
    using Ints = __m128i;
    using Floats = __m128;
    static constexpr int kBytes = 16, kFloats = 4;

    static Bytes load(const uint8_t* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
    static Ints noInts() { return _mm_setzero_si128(); }
    static Ints plus(Ints a, Ints b) { return _mm_add_epi32(a, b); }
    static Ints minus(Ints a, Ints b) { return _mm_sub_epi32(a, b); }
    static Ints allInts(int v) { return _mm_set1_epi32(v); }
    static Ints least(Ints a, Ints b) { return _mm_min_epi32(a, b); }
    static Ints both(Ints a, Ints b) { return _mm_and_si128(a, b); }
    static Ints either(Ints a, Ints b) { return _mm_or_si128(a, b); }
    static Ints shiftedUp8(Ints a) { return _mm_slli_epi32(a, 8); }
    static Ints loadWide(const uint8_t* p) {
        int four;
        memcpy(&four, p, 4);
        return _mm_cvtepu8_epi32(_mm_cvtsi32_si128(four));
    }
    static void storeLowHalves(uint16_t* p, Ints v) { _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packus_epi32(v, v)); }
    static Floats toFloats(Ints v) { return _mm_cvtepi32_ps(v); }
    static Ints truncated(Floats v) { return _mm_cvttps_epi32(v); }
    static Floats all(float v) { return _mm_set1_ps(v); }
    static Floats plus(Floats a, Floats b) { return _mm_add_ps(a, b); }
    static Floats minus(Floats a, Floats b) { return _mm_sub_ps(a, b); }
    static Floats times(Floats a, Floats b) { return _mm_mul_ps(a, b); }
    static Floats over(Floats a, Floats b) { return _mm_div_ps(a, b); }
    static Floats least(Floats a, Floats b) { return _mm_min_ps(a, b); }
    static Floats most(Floats a, Floats b) { return _mm_max_ps(a, b); }
    static Floats root(Floats a) { return _mm_sqrt_ps(a); }
    static Floats magnitude(Floats a) { return _mm_andnot_ps(_mm_set1_ps(-0.0f), a); }
    static Floats whereLess(Floats a, Floats b, Floats yes, Floats no) { return _mm_blendv_ps(no, yes, _mm_cmplt_ps(a, b)); }
    static Ints differences(Bytes a, Bytes b) { return _mm_sad_epu8(a, b); }
    static __m128i totals(Ints a, Ints b, Ints c, Ints d) {
        const __m128i ab = _mm_add_epi32(a, _mm_slli_epi64(b, 32)), cd = _mm_add_epi32(c, _mm_slli_epi64(d, 32));
        return _mm_add_epi32(_mm_unpacklo_epi64(ab, cd), _mm_unpackhi_epi64(ab, cd));
    }
    static Ints products(const int16_t* values, const uint8_t* bytes) {
        const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes)), zero = _mm_setzero_si128();
        const __m128i* const factors = reinterpret_cast<const __m128i*>(values);
        return _mm_add_epi32(_mm_madd_epi16(_mm_unpacklo_epi8(v, zero), _mm_loadu_si128(factors)),
                             _mm_madd_epi16(_mm_unpackhi_epi8(v, zero), _mm_loadu_si128(factors + 1)));
    }
    static int sum(Ints v) {
        const __m128i s = _mm_add_epi32(v, _mm_unpackhi_epi64(v, v));
        return _mm_cvtsi128_si32(s) + _mm_extract_epi32(s, 1);
    }
};

struct Eight { // floats
    __m128 low, high;
    static Eight load(const float* p) { return {_mm_loadu_ps(p), _mm_loadu_ps(p + 4)}; }
    static Eight none() { return {_mm_setzero_ps(), _mm_setzero_ps()}; }
    void store(float* p) const {
        _mm_storeu_ps(p, low);
        _mm_storeu_ps(p + 4, high);
    }
};
inline Eight operator+(Eight a, Eight b) {
    return {_mm_add_ps(a.low, b.low), _mm_add_ps(a.high, b.high)};
}
inline Eight operator*(Eight a, float b) {
    const __m128 all = _mm_set1_ps(b);
    return {_mm_mul_ps(a.low, all), _mm_mul_ps(a.high, all)};
}

#endif

// Bit i: whether value i of the first is below either of the others.
inline int belowEither(__m128i values, const int* limits, int limit) {
    const __m128i other = _mm_loadu_si128(reinterpret_cast<const __m128i*>(limits));
    return _mm_movemask_ps(_mm_castsi128_ps(_mm_cmplt_epi32(values, _mm_max_epi32(other, _mm_set1_epi32(limit)))));
}
inline void storeFour(int* p, __m128i values) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(p), values);
}

} // namespace

#endif
