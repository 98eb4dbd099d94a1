// How kernels walk: wide blocks as long as they fit, then blocks of one lane, then what is left of a row. Rests on a vocabulary
// of lanes that is included before, on the name Wide for the widest of its types, and on Modest for one of at most 32 bytes,
// which is faster for what reads here and there in a large image.
#ifndef KEL_IMAGE_WALK_H
#define KEL_IMAGE_WALK_H

#include <cstring>

namespace {

// Tells a body which lanes to use, by body(Of<V>(), ...); there, LanesOf<decltype(of)> is V.
template <class V> struct Of { using Lanes = V; };
template <class T> using LanesOf = typename T::Lanes;

// Calls body(of, d, s) for blocks of N units a lane, of D bytes in the destination and S in the source. Blocks may read or
// write up to `spare` units behind their own, as there are always some that follow; the rest of the run goes through a buffer,
// so that nothing beside its own units is touched.
template <int N, int D, int S, int spare = 0, class Body>
inline void walk(uint8_t* d, const uint8_t* s, ptrdiff_t units, Body body) {
    constexpr ptrdiff_t wide = N * Wide::kLanes;
#pragma GCC unroll 4
    for (; units >= wide + spare; units -= wide, d += wide * D, s += wide * S)
        body(Of<Wide>(), d, s);
    for (; units >= N + spare; units -= N, d += N * D, s += N * S)
        body(Of<Lanes1>(), d, s);
    for (; units > 0; units -= N, d += N * D, s += N * S) {
        const size_t rest = static_cast<size_t>(units < N ? units : N);
        uint8_t in[(N + spare) * S] = {}, out[(N + spare) * D];
        memcpy(in, s, rest * S);
        body(Of<Lanes1>(), out, in);
        memcpy(d, out, rest * D);
    }
}

// Calls body(of, x) for blocks of N columns a lane from `begin` to `end`, which are a multiple of N apart.
template <int N, class Body> inline void walkColumns(ptrdiff_t begin, ptrdiff_t end, Body body) {
    ptrdiff_t x = begin;
    for (; x + N * Wide::kLanes <= end; x += N * Wide::kLanes)
        body(Of<Wide>(), x);
    for (; x < end; x += N)
        body(Of<Lanes1>(), x);
}

} // namespace

#endif
