// Mirror, flip, half turn, and projective warp, each written once over pixels of 1 to 4 bytes.
#include <limits.h>
#include <smmintrin.h>
#include <string.h>

#include "kelImage_Private.h"

namespace {

using kel::Pixel;
using kel::row;

// How 16 bytes of pixels are reversed: `pixels` of them, from a load that starts `lead` bytes before the first.
template <int N> struct Reversal {
    static constexpr int pixels = 16 / N;
    static constexpr int lead = 16 % N;
    static __m128i apply(__m128i v) {
        switch (N) {
        case 1:
            return _mm_shuffle_epi8(v, _mm_setr_epi8(15, 14, 13, 12, 11, 10, 9, 8, 7, 6, 5, 4, 3, 2, 1, 0));
        case 2:
            return _mm_shuffle_epi8(v, _mm_setr_epi8(14, 15, 12, 13, 10, 11, 8, 9, 6, 7, 4, 5, 2, 3, 0, 1));
        case 3: // byte 0 belongs to the pixel before; the last byte is overwritten by the next store
            return _mm_shuffle_epi8(v, _mm_setr_epi8(13, 14, 15, 10, 11, 12, 7, 8, 9, 4, 5, 6, 1, 2, 3, 0));
        default:
            return _mm_shuffle_epi32(v, _MM_SHUFFLE(0, 1, 2, 3));
        }
    }
};

// dst[x] = src[width-1-x]; reads and writes nothing outside the two rows.
template <int N> void reverseRow(Pixel<N>* dst, const Pixel<N>* src, ptrdiff_t width) {
    using R = Reversal<N>;
    constexpr ptrdiff_t spare = R::lead ? 1 : 0; // one pixel more on either side where blocks overlap by a byte
    ptrdiff_t x = 0;
    for (; x + R::pixels + spare <= width; x += R::pixels) {
        const uint8_t* const from = reinterpret_cast<const uint8_t*>(src + (width - R::pixels - x)) - R::lead;
        const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(from));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(dst + x), R::apply(v));
    }
    for (; x < width; ++x)
        dst[x] = src[width - 1 - x];
}

template <int N> void copyRow(Pixel<N>* dst, const Pixel<N>* src, ptrdiff_t width) {
    memcpy(dst, src, width * N);
}

// The common shape of the flips: row y of the destination is row y or H-1-y of the source, as it is or reversed.
template <bool upsideDown, bool mirrored> void flip(kelImage_t* dst, const kelImage_t* src) {
    if (dst->width < 1)
        return;
    kel::withPixel(dst->type, [=](auto pixel) {
        using P = decltype(pixel);
        for (kelValue_s32 y = 0; y < dst->height; ++y) {
            P* const to = row<P>(dst, y);
            const P* const from = row<P>(src, upsideDown ? dst->height - 1 - y : y);
            mirrored ? reverseRow(to, from, dst->width) : copyRow(to, from, dst->width);
        }
    });
}

// Row-major homography from destination to source coordinates.
struct Homography {
    float h[9];
};

// One row of it: (a u + b v) + c for four u; the products of v are the same along an image row.
struct Line {
    __m128 a, bv, c;
    Line(const float* h, float v) : a(_mm_set1_ps(h[0])), bv(_mm_set1_ps(h[1] * v)), c(_mm_set1_ps(h[2])) {}
    __m128 at(__m128 u) const { return _mm_add_ps(_mm_add_ps(_mm_mul_ps(a, u), bv), c); }
};

// Truncated source coordinates of four quotients. Those that no int holds, infinities and NaN come out as INT_MIN and so fail
// the range test. Truncation is toward zero: a quotient in (-1, 0) is accepted as 0, as callers rely on.
template <bool centred> __m128i sourceIndex(__m128 numerator, __m128 w) {
    const __m128 quotient = _mm_div_ps(numerator, w);
    return _mm_cvttps_epi32(centred ? quotient : _mm_add_ps(quotient, _mm_set1_ps(0.5f)));
}

__m128i inRange(__m128i i, __m128i end) {
    return _mm_andnot_si128(_mm_srai_epi32(i, 31), _mm_cmplt_epi32(i, end));
}

// Warps one row. U8G is sampled through pixel centres with truncation (`centred`), other types through pixel corners with
// 0.5 added to the quotient: callers rely on the difference.
template <bool centred, int N>
void warpRow(Pixel<N>* to, ptrdiff_t width, float y, const Homography& homography, const kelImage_t* src) {
    const float v = centred ? y + 0.5f : y;
    const Line top(homography.h, v), middle(homography.h + 3, v), bottom(homography.h + 6, v);
    const __m128i srcWidth = _mm_set1_epi32(src->width), srcHeight = _mm_set1_epi32(src->height);
    const __m128i step = _mm_set1_epi32(src->step), last = _mm_set1_epi32(static_cast<int>(width - 1));
    const bool far = static_cast<int64_t>(src->step) * src->height > INT_MAX; // an int holds no index of its last pixels
    const Pixel<N>* const from = row<Pixel<N>>(src, 0);
    __m128i column = _mm_setr_epi32(0, 1, 2, 3);
    for (ptrdiff_t x = 0; x < width; x += 4, column = _mm_add_epi32(column, _mm_set1_epi32(4))) {
        // Behind the last column that one again: nothing is computed for columns that nobody asked for.
        const __m128 corner = _mm_cvtepi32_ps(_mm_min_epi32(column, last));
        const __m128 u = centred ? _mm_add_ps(corner, _mm_set1_ps(0.5f)) : corner;
        const __m128 w = bottom.at(u);
        const __m128i sx = sourceIndex<centred>(top.at(u), w), sy = sourceIndex<centred>(middle.at(u), w);
        const __m128i inside = _mm_and_si128(inRange(sx, srcWidth), inRange(sy, srcHeight));
        const int mask = _mm_movemask_ps(_mm_castsi128_ps(inside));
        const int count = static_cast<int>(width - x < 4 ? width - x : 4);
        if (mask == 0xf && count == 4 && !far) {
            const __m128i element = _mm_add_epi32(_mm_mullo_epi32(sy, step), sx);
            to[x] = from[_mm_cvtsi128_si32(element)];
            to[x + 1] = from[_mm_extract_epi32(element, 1)];
            to[x + 2] = from[_mm_extract_epi32(element, 2)];
            to[x + 3] = from[_mm_extract_epi32(element, 3)];
        } else if (mask == 0 && count == 4) {
            memset(to + x, 0, 4 * N);
        } else {
            alignas(16) int sourceX[4], sourceY[4];
            _mm_store_si128(reinterpret_cast<__m128i*>(sourceX), sx);
            _mm_store_si128(reinterpret_cast<__m128i*>(sourceY), sy);
            for (int i = 0; i < count; ++i)
                to[x + i] = mask >> i & 1 ? row<Pixel<N>>(src, sourceY[i])[sourceX[i]] : Pixel<N>();
        }
    }
}

} // namespace

extern "C" {

void rotateKelImageH(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    flip<false, true>(dst, src);
}

void rotateKelImageV(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    flip<true, false>(dst, src);
}

void rotateKelImageVH(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width && dst->height == src->height);
    flip<true, true>(dst, src);
}

void rotateKelImageHomography(kelImage_t* dst, const kelImage_t* src, float h0, float h1, float h2, float h3, float h4,
                              float h5, float h6, float h7, float h8) {
    KEL_ASSERT(dst->type == src->type);
    const Homography homography = {{h0, h1, h2, h3, h4, h5, h6, h7, h8}};
    kel::withPixel(dst->type, [&](auto pixel) {
        using P = decltype(pixel);
        constexpr bool centred = sizeof(P) == 1;
        for (kelValue_s32 y = 0; y < dst->height; ++y)
            warpRow<centred>(row<P>(dst, y), dst->width, static_cast<float>(y), homography, src);
    });
}

} // extern "C"
