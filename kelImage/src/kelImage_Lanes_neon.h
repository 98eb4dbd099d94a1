// The vocabulary of kernels for AArch64: one lane of 128 bits. What the names mean stands in the vocabulary for SSE4.1; the bits are
// the same. Where the two architectures differ, a comment says how.
#ifndef KEL_IMAGE_LANES_NEON_H
#define KEL_IMAGE_LANES_NEON_H

#include <arm_neon.h>
#include <cstddef>
#include <cstdint>

namespace {

struct alignas(16) Sixteen {
    int8_t byte[16];
};

struct Floats1 {
    float32x4_t f;
};

struct Lanes1 {
    using Floats = Floats1;
    static constexpr int kLanes = 1, kBytes = 16, kThrees = 5;
    uint8x16_t v;

    Lanes1() = default;
    Lanes1(uint8x16_t bytes) : v(bytes) {}
    Lanes1(int8x16_t bytes) : v(vreinterpretq_u8_s8(bytes)) {}
    Lanes1(uint16x8_t words) : v(vreinterpretq_u8_u16(words)) {}
    Lanes1(int16x8_t words) : v(vreinterpretq_u8_s16(words)) {}
    Lanes1(uint32x4_t longs) : v(vreinterpretq_u8_u32(longs)) {}
    Lanes1(int32x4_t longs) : v(vreinterpretq_u8_s32(longs)) {}
    uint16x8_t u16() const { return vreinterpretq_u16_u8(v); }
    int16x8_t s16() const { return vreinterpretq_s16_u8(v); }
    uint32x4_t u32() const { return vreinterpretq_u32_u8(v); }
    int32x4_t s32() const { return vreinterpretq_s32_u8(v); }

    static Lanes1 load(const void* p) { return vld1q_u8(static_cast<const uint8_t*>(p)); }
    static Lanes1 loadHalf(const void* p) { return vcombine_u8(vld1_u8(static_cast<const uint8_t*>(p)), vdup_n_u8(0)); }
    static Lanes1 loadLanes(const uint8_t* p, ptrdiff_t) { return load(p); }
    static Lanes1 loadBytesAsWords(const uint8_t* p) { return vmovl_u8(vld1_u8(p)); }
    static Lanes1 loadBytesAsLongs(const uint8_t* p) {
        uint32_t four;
        __builtin_memcpy(&four, p, sizeof four);
        return vmovl_u16(vget_low_u16(vmovl_u8(vcreate_u8(four))));
    }
    static Lanes1 loadEights(const void* p, const int32_t* index, ptrdiff_t) {
        const auto* const base = static_cast<const uint8_t*>(p);
        return vcombine_u8(vld1_u8(base + 4 * ptrdiff_t(index[0])), vld1_u8(base + 4 * ptrdiff_t(index[1])));
    }
    static Lanes1 loadSixteens(const uint32_t* p, const int32_t* index) { return load(p + index[0]); }
    static Lanes1 zero() { return vdupq_n_u8(0); }
    static Lanes1 bytes(int value) { return vdupq_n_u8(static_cast<uint8_t>(value)); }
    static Lanes1 words(int value) { return vdupq_n_u16(static_cast<uint16_t>(value)); }
    static Lanes1 longs(int value) { return vdupq_n_s32(value); }
    static Lanes1 every(const Sixteen& lane) { return vld1q_s8(lane.byte); }
    static Lanes1 ascendingLongs() { return int32x4_t{0, 1, 2, 3}; }
    static Floats1 floats(float value) { return {vdupq_n_f32(value)}; }
};

inline void store(void* p, Lanes1 a) {
    vst1q_u8(static_cast<uint8_t*>(p), a.v);
}
inline void storeHalf(void* p, Lanes1 a) {
    vst1_u8(static_cast<uint8_t*>(p), vget_low_u8(a.v));
}
// One store each: the architecture stores single elements out of a vector.
template <int i = 0> void storeThirds(uint8_t* p, Lanes1 a) {
    vst1q_lane_u8(p + 3 * i, a.v, i);
    if constexpr (i < 15)
        storeThirds<i + 1>(p, a);
}
template <int i = 0> void storeThirds(int16_t* p, Lanes1 a) {
    vst1q_lane_s16(p + 3 * i, a.s16(), i);
    if constexpr (i < 7)
        storeThirds<i + 1>(p, a);
}

inline Lanes1 operator&(Lanes1 a, Lanes1 b) {
    return vandq_u8(a.v, b.v);
}
inline Lanes1 operator|(Lanes1 a, Lanes1 b) {
    return vorrq_u8(a.v, b.v);
}
inline Lanes1 operator^(Lanes1 a, Lanes1 b) {
    return veorq_u8(a.v, b.v);
}
inline Lanes1 select(Lanes1 mask, Lanes1 a, Lanes1 b) {
    return vbslq_u8(mask.v, a.v, b.v);
}
// Here every index beyond 15 gives 0, on x86 every negative one, and others count from 0 again: kernels have -1 and 0 to 15 alone.
inline Lanes1 shuffle(Lanes1 a, Lanes1 index) {
    return vqtbl1q_u8(a.v, index.v);
}
inline void storeThreesReversed(uint8_t* d, const uint8_t* p, Lanes1) {
    static constexpr Sixteen reverse = {{13, 14, 15, 10, 11, 12, 7, 8, 9, 4, 5, 6, 1, 2, 3, 0}};
    store(d, shuffle(Lanes1::load(p - 1), Lanes1::every(reverse)));
}
template <int n> Lanes1 joined(Lanes1 low, Lanes1 high) {
    return vextq_u8(low.v, high.v, n);
}
inline Lanes1 lowBytes(Lanes1 a, Lanes1 b) {
    return vzip1q_u8(a.v, b.v);
}
inline Lanes1 highBytes(Lanes1 a, Lanes1 b) {
    return vzip2q_u8(a.v, b.v);
}
inline Lanes1 lowWords(Lanes1 a, Lanes1 b) {
    return vzip1q_u16(a.u16(), b.u16());
}
inline Lanes1 highWords(Lanes1 a, Lanes1 b) {
    return vzip2q_u16(a.u16(), b.u16());
}

inline Lanes1 addBytes(Lanes1 a, Lanes1 b) {
    return vaddq_u8(a.v, b.v);
}
inline Lanes1 subBytes(Lanes1 a, Lanes1 b) {
    return vsubq_u8(a.v, b.v);
}
inline Lanes1 minBytes(Lanes1 a, Lanes1 b) {
    return vminq_u8(a.v, b.v);
}
inline Lanes1 maxBytes(Lanes1 a, Lanes1 b) {
    return vmaxq_u8(a.v, b.v);
}
inline Lanes1 averageBytes(Lanes1 a, Lanes1 b) {
    return vrhaddq_u8(a.v, b.v);
}
inline Lanes1 atLeastBytes(Lanes1 a, Lanes1 b) {
    return vcgeq_u8(a.v, b.v);
}

inline Lanes1 addWords(Lanes1 a, Lanes1 b) {
    return vaddq_u16(a.u16(), b.u16());
}
inline Lanes1 subWords(Lanes1 a, Lanes1 b) {
    return vsubq_u16(a.u16(), b.u16());
}
inline Lanes1 minWords(Lanes1 a, Lanes1 b) {
    return vminq_s16(a.s16(), b.s16());
}
inline Lanes1 maxWords(Lanes1 a, Lanes1 b) {
    return vmaxq_s16(a.s16(), b.s16());
}
inline Lanes1 minUnsignedWords(Lanes1 a, Lanes1 b) {
    return vminq_u16(a.u16(), b.u16());
}
inline Lanes1 greaterWords(Lanes1 a, Lanes1 b) {
    return vcgtq_s16(a.s16(), b.s16());
}
// What one instruction of x86 collects is added up here: every byte brings the bit of its place.
inline uint64_t signsOfWords(Lanes1 a, Lanes1 b) {
    const int8x16_t upper = vreinterpretq_s8_u8(vuzp2q_u8(a.v, b.v));
    const uint8x16_t places = {1, 2, 4, 8, 16, 32, 64, 128, 1, 2, 4, 8, 16, 32, 64, 128};
    const uint8x16_t bits = vandq_u8(vcltzq_s8(upper), places);
    return vaddv_u8(vget_low_u8(bits)) | uint64_t(vaddv_u8(vget_high_u8(bits))) << 8;
}
inline Lanes1 absWords(Lanes1 a) {
    return vabsq_s16(a.s16());
}
inline Lanes1 mulWords(Lanes1 a, Lanes1 b) {
    return vmulq_u16(a.u16(), b.u16());
}
inline Lanes1 mulHighWords(Lanes1 a, Lanes1 b) {
    const uint32x4_t low = vmull_u16(vget_low_u16(a.u16()), vget_low_u16(b.u16())), high = vmull_high_u16(a.u16(), b.u16());
    return vuzp2q_u16(vreinterpretq_u16_u32(low), vreinterpretq_u16_u32(high));
}
inline Lanes1 mulRoundedWords(Lanes1 a, Lanes1 b) { // save that -32768 * -32768 saturates here and wraps on x86
    return vqrdmulhq_s16(a.s16(), b.s16());
}
template <int n> Lanes1 shiftLeftWords(Lanes1 a) {
    return vshlq_n_u16(a.u16(), n);
}
template <int n> Lanes1 shiftRightWords(Lanes1 a) {
    return vshrq_n_u16(a.u16(), n);
}
// There is no product of unsigned with signed bytes: the even and the odd ones become words. A sum beyond a word would wrap here, on
// x86 it saturates.
inline Lanes1 weighBytes(Lanes1 a, Lanes1 weights) {
    const int16x8_t even = (a & Lanes1::words(0x00ff)).s16(), odd = shiftRightWords<8>(a).s16();
    const int16x8_t evenWeights = vshrq_n_s16(vshlq_n_s16(weights.s16(), 8), 8), oddWeights = vshrq_n_s16(weights.s16(), 8);
    return vmlaq_s16(vmulq_s16(even, evenWeights), odd, oddWeights);
}
inline Lanes1 weighWords(Lanes1 a, Lanes1 weights) {
    return vpaddq_s32(vmull_s16(vget_low_s16(a.s16()), vget_low_s16(weights.s16())), vmull_high_s16(a.s16(), weights.s16()));
}

inline Lanes1 addLongs(Lanes1 a, Lanes1 b) {
    return vaddq_u32(a.u32(), b.u32());
}
inline Lanes1 subLongs(Lanes1 a, Lanes1 b) {
    return vsubq_u32(a.u32(), b.u32());
}
inline Lanes1 minLongs(Lanes1 a, Lanes1 b) {
    return vminq_s32(a.s32(), b.s32());
}
inline Lanes1 mulLongs(Lanes1 a, Lanes1 b) {
    return vmulq_u32(a.u32(), b.u32());
}
inline Lanes1 greaterLongs(Lanes1 a, Lanes1 b) {
    return vcgtq_s32(a.s32(), b.s32());
}
inline uint64_t signsOfLongs(Lanes1 a) {
    return vaddvq_u32(vshlq_u32(vshrq_n_u32(a.u32(), 31), int32x4_t{0, 1, 2, 3}));
}
template <int n> Lanes1 shiftRightLongs(Lanes1 a) {
    return vshrq_n_u32(a.u32(), n);
}

inline Lanes1 upperWords(Lanes1 a, Lanes1 b) {
    return vtrn2q_s16(a.s16(), b.s16());
}
inline Lanes1 packWords(Lanes1 a, Lanes1 b) {
    return vqmovun_high_s16(vqmovun_s16(a.s16()), b.s16());
}
inline Lanes1 packLongs(Lanes1 a, Lanes1 b) {
    return vqmovn_high_s32(vqmovn_s32(a.s32()), b.s32());
}
inline Lanes1 evenLongs(Lanes1 a, Lanes1 b) {
    return vuzp1q_u32(a.u32(), b.u32());
}
inline Lanes1 oddLongs(Lanes1 a, Lanes1 b) {
    return vuzp2q_u32(a.u32(), b.u32());
}
inline Lanes1 narrowedLongs(Lanes1 a, Lanes1 b) {
    return vqmovun_high_s32(vqmovun_s32(a.s32()), b.s32());
}

inline Floats1 operator+(Floats1 a, Floats1 b) {
    return {vaddq_f32(a.f, b.f)};
}
inline Floats1 operator-(Floats1 a, Floats1 b) {
    return {vsubq_f32(a.f, b.f)};
}
inline Floats1 operator*(Floats1 a, Floats1 b) {
    return {vmulq_f32(a.f, b.f)};
}
inline Floats1 operator/(Floats1 a, Floats1 b) {
    return {vdivq_f32(a.f, b.f)};
}
inline Floats1 rootOf(Floats1 a) {
    return {vsqrtq_f32(a.f)};
}
inline Floats1 floatsOf(Lanes1 longs) {
    return {vcvtq_f32_s32(longs.s32())};
}
inline Floats1 timesDifference(Lanes1 a, int b, float factor) {
    return {vfmaq_n_f32(vdupq_n_f32(-(static_cast<float>(b) * factor)), floatsOf(a).f, factor)};
}
// The instruction gives the nearest long of what no long holds, and 0 for NaN, where x86 gives the least long.
inline Lanes1 truncated(Floats1 a) {
    return vbslq_s32(vcltq_f32(a.f, vdupq_n_f32(2147483648.0f)), vcvtq_s32_f32(a.f), vdupq_n_s32(INT32_MIN));
}
// In two steps: no conversion of this architecture follows the thread's mode, rounding in place does.
inline Lanes1 rounded(Floats1 a) {
    return truncated({vrndiq_f32(a.f)});
}

} // namespace

#include "kelImage_Lanes_one.h"

#endif
