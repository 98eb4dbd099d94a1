// Four floats side by side, for the loops of the geometry half: the compiler's own vectors, so that sums, products and comparisons
// are written as for one float and give its bytes on every processor. What processors do differently has a name below.
#ifndef KEL_FLOATS_H
#define KEL_FLOATS_H

#include <climits>
#include <cstdint>
#ifdef __SSE2__
#include <emmintrin.h>
#endif

namespace kel {

constexpr int kLanes = 4;
using Floats = float __attribute__((vector_size(4 * kLanes)));
using Mask = int32_t __attribute__((vector_size(4 * kLanes))); // of a comparison: -1 where it holds, else 0

using FloatsAt __attribute__((vector_size(4 * kLanes), aligned(4), may_alias)) = float; // among floats in memory
using AlignedAt __attribute__((vector_size(4 * kLanes), may_alias)) = float;            // at a multiple of 16
static_assert(alignof(FloatsAt) == 4, "not every compiler heeds it behind the name of the type");

inline Floats load(const float* p) {
    return *reinterpret_cast<const FloatsAt*>(p);
}
inline void store(float* p, Floats v) {
    *reinterpret_cast<FloatsAt*>(p) = v;
}
inline Floats loadAligned(const float* p) {
    return *reinterpret_cast<const AlignedAt*>(p);
}
inline void storeAligned(float* p, Floats v) {
    *reinterpret_cast<AlignedAt*>(p) = v;
}

inline Floats all(float x) {
    return Floats{x, x, x, x};
}
inline Floats magnitude(Floats v) {
    return (Floats)((Mask)v & INT_MAX);
}
// Zero where the mask holds.
inline Floats unless(Mask mask, Floats v) {
    return (Floats)(~mask & (Mask)v);
}

// a0 b0 a1 b1, and a2 b2 a3 b3.
inline Floats interleavedLow(Floats a, Floats b) {
    return __builtin_shufflevector(a, b, 0, 4, 1, 5);
}
inline Floats interleavedHigh(Floats a, Floats b) {
    return __builtin_shufflevector(a, b, 2, 6, 3, 7);
}

// Rows become columns.
inline void transpose(Floats& a, Floats& b, Floats& c, Floats& d) {
    const Floats acLow = interleavedLow(a, c), acHigh = interleavedHigh(a, c);
    const Floats bdLow = interleavedLow(b, d), bdHigh = interleavedHigh(b, d);
    a = interleavedLow(acLow, bdLow);
    b = interleavedHigh(acLow, bdLow);
    c = interleavedLow(acHigh, bdHigh);
    d = interleavedHigh(acHigh, bdHigh);
}

// Truncates toward zero; INT_MIN where no int holds the value, NaN included. That is what x86 does by itself, where AArch64 gives
// the nearest int and 0.
inline int truncated(double value) {
#ifdef __SSE2__
    return _mm_cvttsd_si32(_mm_set_sd(value));
#else
    return value > INT_MIN - 1.0 && value < INT_MAX + 1.0 ? static_cast<int>(value) : INT_MIN;
#endif
}

} // namespace kel

#endif
