// Kernels that move whole pixels of 1 to 4 bytes: rows reversed, every second pixel, and the samples of a warp.
#ifndef KEL_IMAGE_MOVE_KERNELS_H
#define KEL_IMAGE_MOVE_KERNELS_H

#include "kelImage_Kernels.h"
#include "kelImage_Private.h"
#include "kelImage_Walk.h"

namespace {

// ---- Rows reversed: pixel x comes from width - 1 - x.

template <int N> constexpr Sixteen reversedPixels() {
    Sixteen order = {};
    for (int i = 0; i < 16; ++i)
        order.byte[i] = static_cast<int8_t>(16 - N - i / N * N + i % N);
    return order;
}
template <int N> constexpr Sixteen kReversed = reversedPixels<N>();

// As many blocks as fit from column x on. With three bytes a pixel a block touches one byte before the source's and one behind
// the destination's, too.
template <class V, int N> void reverseBlocks(uint8_t* d, const uint8_t* s, ptrdiff_t& x, ptrdiff_t width) {
    constexpr ptrdiff_t pixels = N == 3 ? V::kThrees : V::kBytes / N, spare = N == 3;
#pragma GCC unroll 4
    for (; x + pixels + spare <= width; x += pixels) {
        const uint8_t* const from = s + N * (width - pixels - x);
        if constexpr (N == 3)
            storeThreesReversed(d + N * x, from, V());
        else
            store(d + N * x, reversedLanes(shuffle(V::load(from), V::every(kReversed<N>))));
    }
}

template <int N> void reversed(uint8_t* d, const uint8_t* s, ptrdiff_t width) {
    ptrdiff_t x = 0;
    reverseBlocks<Wide, N>(d, s, x, width);
    reverseBlocks<Lanes1, N>(d, s, x, width);
    for (; x < width; ++x)
        memcpy(d + N * x, s + N * (width - 1 - x), N);
}

// ---- Every second pixel, from the first or from the second of a pair; nothing behind the last pair is read.

template <bool odd, class V> V everySecondOf(V low, V high, kel::Pixel<1>) {
    const auto one = [](V v) { return odd ? shiftRightWords<8>(v) : v & V::words(0x00ff); };
    return narrowedWords(one(low), one(high));
}
template <bool odd, class V> V everySecondOf(V low, V high, kel::Pixel<2>) {
    const auto one = [](V v) { return odd ? shiftRightLongs<16>(v) : v & V::longs(0x0000ffff); };
    return narrowedLongs(one(low), one(high));
}
template <bool odd, class V> V everySecondOf(V low, V high, kel::Pixel<4>) {
    return ordered(odd ? oddLongs(low, high) : evenLongs(low, high));
}

template <bool odd, int N> void everySecond(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<16 / N, N, 2 * N>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, everySecondOf<odd>(V::load(from), V::load(from + V::kBytes), kel::Pixel<N>()));
    });
}

// Four pixels a lane, from 24 bytes.
template <bool odd> void everySecondThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<4, 3, 6, kTwelveSpare / 3 + 1>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        static constexpr Sixteen evenLow = {{0, 1, 2, 6, 7, 8, 12, 13, 14, -1, -1, -1, -1, -1, -1, -1}},
                                 evenHigh = {{-1, -1, -1, -1, -1, -1, -1, -1, -1, 10, 11, 12, -1, -1, -1, -1}},
                                 oddLow = {{3, 4, 5, 9, 10, 11, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1}},
                                 oddHigh = {{-1, -1, -1, -1, -1, -1, 7, 8, 9, 13, 14, 15, -1, -1, -1, -1}};
        storeTwelves(to, shuffle(V::loadLanes(from, 24), V::every(odd ? oddLow : evenLow)) |
                             shuffle(V::loadLanes(from + 8, 24), V::every(odd ? oddHigh : evenHigh)));
    });
}

// ---- Warp

// One row of a homography: (a u + b v) + c for many u; the products of v are the same along an image row.
template <class V> struct Line {
    using Floats = typename V::Floats;
    Floats a, bv, c;
    Line(const float* h, float v) : a(V::floats(h[0])), bv(V::floats(h[1] * v)), c(V::floats(h[2])) {}
    Floats at(Floats u) const { return ((a * u) + bv) + c; }
};

// Truncated source coordinates of quotients. Those that no int holds, infinities and NaN come out as INT_MIN and so fail the
// range test. Truncation is toward zero: a quotient in (-1, 0) is accepted as 0, as callers rely on.
template <bool centred, class V> V sourceIndex(typename V::Floats numerator, typename V::Floats w) {
    const auto quotient = numerator / w;
    return truncated(centred ? quotient : quotient + V::floats(0.5f));
}

template <class V> V inRange(V i, V end) {
    return greaterLongs(i, V::longs(-1)) & greaterLongs(end, i);
}

// U8G is sampled through pixel centres with truncation (`centred`), other types through pixel corners with 0.5 added to the
// quotient: callers rely on the difference.
template <bool centred, int N> void warpRow(uint8_t* d, ptrdiff_t width, float y, const float* h, const kel::WarpSource& src) {
    using V = Modest;
    using P = kel::Pixel<N>;
    constexpr int columns = V::kBytes / 4;
    P* const to = reinterpret_cast<P*>(d);
    const P* const from = reinterpret_cast<const P*>(src.data);
    const float v = centred ? y + 0.5f : y;
    const Line<V> top(h, v), middle(h + 3, v), bottom(h + 6, v);
    const V srcWidth = V::longs(src.width), srcHeight = V::longs(src.height), step = V::longs(src.step),
            last = V::longs(static_cast<int>(width - 1));
    const bool far = static_cast<int64_t>(src.step) * src.height > INT32_MAX; // an int holds no index of its last pixels
    V column = V::ascendingLongs();
    for (ptrdiff_t x = 0; x < width; x += columns, column = addLongs(column, V::longs(columns))) {
        // Behind the last column that one again: nothing is computed for columns that nobody asked for.
        const auto corner = floatsOf(minLongs(column, last)), u = centred ? corner + V::floats(0.5f) : corner, w = bottom.at(u);
        const V sx = sourceIndex<centred, V>(top.at(u), w), sy = sourceIndex<centred, V>(middle.at(u), w);
        const V inside = inRange(sx, srcWidth) & inRange(sy, srcHeight);
        const int count = static_cast<int>(width - x < columns ? width - x : columns);
        const uint64_t mask = signsOfLongs(inside), all = (uint64_t(1) << columns) - 1;
        if (mask == all && count == columns && !far) {
            alignas(64) int32_t index[columns];
            store(index, addLongs(mulLongs(sy, step), sx));
            for (int i = 0; i < columns; ++i)
                to[x + i] = from[index[i]];
        } else if (mask == 0 && count == columns) {
            memset(to + x, 0, columns * N);
        } else {
            alignas(64) int32_t sourceX[columns], sourceY[columns];
            store(sourceX, sx);
            store(sourceY, sy);
            for (int i = 0; i < count; ++i)
                to[x + i] = mask >> i & 1 ? from[static_cast<ptrdiff_t>(sourceY[i]) * src.step + sourceX[i]] : P();
        }
    }
}

} // namespace

#endif
