// What the vector filters share: the extent of their walk along a row, and short names for the memory operations.
// Rests on the intrinsics of SSE4.1.
#ifndef KEL_IMAGE_VECTOR_H
#define KEL_IMAGE_VECTOR_H

#include <smmintrin.h>
#include <stdint.h>

#include "kelImage.h"

namespace kel {

// A vector filter does blocks of `block` columns from column `margin`: a block at x is done while x < width - margin.
// Returns the first column after the last block, `margin` where there is none; it is never beyond the row's step.
constexpr kelValue_s32 blocksEnd(kelValue_s32 width, kelValue_s32 margin, kelValue_s32 block) {
    return width > 2 * margin ? margin + (width - 2 * margin + block - 1) / block * block : margin;
}

inline __m128i load16(const void* p) {
    return _mm_loadu_si128(static_cast<const __m128i*>(p));
}
inline __m128i load8(const void* p) {
    return _mm_loadl_epi64(static_cast<const __m128i*>(p));
}
inline void store16(void* p, __m128i v) {
    _mm_storeu_si128(static_cast<__m128i*>(p), v);
}
inline void store8(void* p, __m128i v) {
    _mm_storel_epi64(static_cast<__m128i*>(p), v);
}

// Weights of one pair of bytes, in all eight pairs.
inline __m128i weights(int first, int second) {
    return _mm_set1_epi16(static_cast<short>(second * 256 + (first & 255)));
}
// weight0 * byte0 + weight1 * byte1 of every pair, 16 bits each.
inline __m128i weigh(__m128i pairs, __m128i weights) {
    return _mm_maddubs_epi16(pairs, weights);
}

} // namespace kel

#endif
