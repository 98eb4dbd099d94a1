// Rows in blocks of a vector's pixels: unaligned loads and stores, and the walk. Rests on SSE4.1 alone.
#ifndef KEL_IMAGE_BLOCKS_H
#define KEL_IMAGE_BLOCKS_H

#include <smmintrin.h>
#include <stddef.h>
#include <stdint.h>

namespace kel {

inline __m128i load16(const uint8_t* src) {
    return _mm_loadu_si128(reinterpret_cast<const __m128i*>(src));
}
inline __m128i load8(const uint8_t* src) {
    return _mm_loadl_epi64(reinterpret_cast<const __m128i*>(src));
}
inline void store16(uint8_t* dst, __m128i value) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(dst), value);
}
inline void store8(uint8_t* dst, __m128i value) {
    _mm_storel_epi64(reinterpret_cast<__m128i*>(dst), value);
}

// Calls body(d, s) for each whole block of N units, of D bytes in the destination and S bytes in the source, moves both
// pointers behind the last of them, and returns the units left. Large images are bound by fetching the lines to be written, so
// these are asked for ahead (harmless behind the end), each once in a group of blocks.
template <int N, int D, int S, class Body>
inline ptrdiff_t walkBlocks(uint8_t*& d, const uint8_t*& s, ptrdiff_t units, Body body) {
    constexpr int group = 4, line = 64, ahead = 24 * line;
    for (; units >= group * N; units -= group * N) {
        for (int byte = 0; byte < group * N * D; byte += line)
            _mm_prefetch(reinterpret_cast<const char*>(d + ahead + byte), _MM_HINT_T0);
        for (int i = 0; i < group; ++i, d += N * D, s += N * S)
            body(d, s);
    }
    for (; units >= N; units -= N, d += N * D, s += N * S)
        body(d, s);
    return units;
}

// Calls body(d, s) for each 16 bytes of a row of 8-bit grey, its padding included.
template <class Body> inline void walkRow(uint8_t* d, const uint8_t* s, ptrdiff_t width, Body body) {
    walkBlocks<16, 1, 1>(d, s, (width + 15) / 16 * 16, body);
}

} // namespace kel

#endif
