// YUV to four channels, written once for vectors of any width. Every operation works within lanes of 128 bits, so that a wider
// vector does the same on more of them; only loads and stores know the width. The source files that include this compile
// it for their own instruction set, hence the unnamed namespace.
#ifndef KEL_IMAGE_YUV_FOUR_CHANNELS_H
#define KEL_IMAGE_YUV_FOUR_CHANNELS_H

#include <immintrin.h>
#include <stddef.h>
#include <stdint.h>

#include "kelImage_YuvWide.h"

namespace {

// The first and the second pixels' value of pairs, in one channel: C + chroma, rounded by the thread's rounding mode.
template <class V> struct YuvPairs {
    using Floats = typename V::Floats;
    using Bytes = typename V::Bytes;

    // `pairs` holds U, Y0, V, Y1 in every 32 bits.
    explicit YuvPairs(Bytes pairs)
        : first(luma(pairs, 1)), second(luma(pairs, 3)), u(byteOf(pairs, 0) - V::all(128.0f)),
          v(byteOf(pairs, 2) - V::all(128.0f)) {}

    Bytes channel(Floats chroma) const { return V::packWords(V::rounded(first + chroma), V::rounded(second + chroma)); }
    Bytes red() const { return channel(v * V::all(kel::kRedV)); }
    Bytes green() const { return channel(u * V::all(kel::kGreenU) + v * V::all(kel::kGreenV)); }
    Bytes blue() const { return channel(u * V::all(kel::kBlueU)); }

private:
    static Floats byteOf(Bytes pairs, int byte) { // with zero bytes above it
        const int select = byte | ~0xff;
        return V::toFloats(V::shuffle(pairs, _mm_setr_epi32(select, select + 4, select + 8, select + 12)));
    }
    static Floats luma(Bytes pairs, int byte) { return (byteOf(pairs, byte) - V::all(16.0f)) * V::all(kel::kLuma); }

    Floats first, second, u, v;
};

// Converts V::kPixels pixels.
template <class V, bool blueFirst> void yuvBlock(uint8_t* dst, const uint8_t* src) {
    const YuvPairs<V> pairs(V::load(src));
    const __m128i inOrder = _mm_setr_epi8(0, 8, 4, 12, 1, 9, 5, 13, 2, 10, 6, 14, 3, 11, 7, 15);
    const typename V::Bytes c0 = blueFirst ? pairs.blue() : pairs.red(), c2 = blueFirst ? pairs.red() : pairs.blue();
    const typename V::Bytes c01 = V::shuffle(V::packBytes(c0, pairs.green()), inOrder);
    const typename V::Bytes c23 = V::shuffle(V::packBytes(c2, V::zero()), inOrder);
    V::store(dst, V::unpackLow(c01, c23), V::unpackHigh(c01, c23));
}

// Whole blocks of a run; moves both pointers behind them and returns the pixels left.
template <class V, bool blueFirst> ptrdiff_t yuvBlocks(uint8_t*& d, const uint8_t*& s, ptrdiff_t pixels) {
    constexpr ptrdiff_t ahead = 24 * 64; // lines to be written are asked for ahead, which is harmless behind the end
    for (; pixels >= V::kPixels; pixels -= V::kPixels, d += 4 * V::kPixels, s += 2 * V::kPixels) {
        for (int byte = 0; byte < 4 * V::kPixels; byte += 64)
            _mm_prefetch(reinterpret_cast<const char*>(d + ahead + byte), _MM_HINT_T0);
        yuvBlock<V, blueFirst>(d, s);
    }
    return pixels;
}

} // namespace

#endif
