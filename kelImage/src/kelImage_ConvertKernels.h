// Kernels of the converters: bytes that change places, magnitudes and means.
#ifndef KEL_IMAGE_CONVERT_KERNELS_H
#define KEL_IMAGE_CONVERT_KERNELS_H

#include "kelImage_Walk.h"

namespace {

// ---- Grey over more channels

// A byte of each pixel over its three channels: 16 pixels a lane.
constexpr Sixteen kTriple0 = {{0, 0, 0, 1, 1, 1, 2, 2, 2, 3, 3, 3, 4, 4, 4, 5}},
                  kTriple1 = {{5, 5, 6, 6, 6, 7, 7, 7, 8, 8, 8, 9, 9, 9, 10, 10}},
                  kTriple2 = {{10, 11, 11, 11, 12, 12, 12, 13, 13, 13, 14, 14, 14, 15, 15, 15}};

template <class V> void storeTriples(uint8_t* d, V grey) {
    storeInTurn(d, shuffle(grey, V::every(kTriple0)), shuffle(grey, V::every(kTriple1)), shuffle(grey, V::every(kTriple2)));
}

void greyToThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<16, 3, 1>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        storeTriples(to, V::load(from));
    });
}

void greyToFour(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<4, 4, 1>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        static constexpr Sixteen quadruple = {{0, 0, 0, -1, 4, 4, 4, -1, 8, 8, 8, -1, 12, 12, 12, -1}};
        store(to, shuffle(V::loadBytesAsLongs(from), V::every(quadruple)));
    });
}

void greyToWords(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<8, 2, 1>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, V::loadBytesAsWords(from));
    });
}

// ---- Magnitudes of signed words

// abs(s) >> 7 in words: bits 7 to 14, so that -32768 gives 0.
template <class V> V magnitudes(const uint8_t* s) {
    return shiftRightWords<8>(shiftLeftWords<1>(absWords(V::load(s))));
}

template <class V> V magnitudeBytes(const uint8_t* s) {
    return narrowedWords(magnitudes<V>(s), magnitudes<V>(s + V::kBytes));
}

void magnitudeToGrey(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<16, 1, 2>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, magnitudeBytes<V>(from));
    });
}

void magnitudeToThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<16, 3, 2>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        storeTriples(to, magnitudeBytes<V>(from));
    });
}

void magnitudeToFour(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<8, 4, 2>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        static constexpr Sixteen first = {{0, 0, 0, -1, 2, 2, 2, -1, 4, 4, 4, -1, 6, 6, 6, -1}},
                                 second = {{8, 8, 8, -1, 10, 10, 10, -1, 12, 12, 12, -1, 14, 14, 14, -1}};
        const V words = magnitudes<V>(from);
        storeInTurn(to, shuffle(words, V::every(first)), shuffle(words, V::every(second)));
    });
}

// ---- Means of three channels

// The first three bytes of four pixels of `S` bytes, each pixel in a long of its own; the first starts at byte `first`.
template <int S, int first>
constexpr Sixteen kThrees = {{first, first + 1, first + 2, -1, first + S, first + S + 1, first + S + 2, -1, first + 2 * S,
                              first + 2 * S + 1, first + 2 * S + 2, -1, first + 3 * S, first + 3 * S + 1, first + 3 * S + 2,
                              -1}};

// s0 + s1 + s2 of the four pixels in longs.
template <int S, int first, class V> V sumsOfThree(V pixels) {
    return weighWords(weighBytes(shuffle(pixels, V::every(kThrees<S, first>)), V::bytes(1)), V::words(1));
}

// Words (s0 + s1 + s2) / 3 of eight pixels a lane, lanes `stride` bytes apart. A sum is at most 765; there sum * 21846 >> 16 is
// sum / 3. The last load ends with the last pixel: nothing behind it is read.
template <int S, class V> V meansOfEight(const uint8_t* s, ptrdiff_t stride) {
    constexpr int second = 8 * S - 16;
    const V sums =
        packLongs(sumsOfThree<S, 0>(V::loadLanes(s, stride)), sumsOfThree<S, 4 * S - second>(V::loadLanes(s + second, stride)));
    return mulHighWords(sums, V::words(21846));
}

void meanOfThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<16, 1, 3>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, packWords(meansOfEight<3, V>(from, 48), meansOfEight<3, V>(from + 24, 48)));
    });
}

void wordMeanOfThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<8, 2, 3>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, meansOfEight<3, V>(from, 24));
    });
}

// The same of four channels, to every third place of the destination: what lies between is not written.
void meanOfFourSpread(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    const auto block = [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        storeThirds(to, packWords(meansOfEight<4, V>(from, 64), meansOfEight<4, V>(from + 32, 64)));
    };
    for (; pixels >= 16 * Wide::kLanes; pixels -= 16 * Wide::kLanes, d += 48 * Wide::kLanes, s += 64 * Wide::kLanes)
        block(Of<Wide>(), d, s);
    for (; pixels >= 16; pixels -= 16, d += 48, s += 64)
        block(Of<Lanes1>(), d, s);
    for (; pixels > 0; --pixels, d += 3, s += 4)
        *d = static_cast<uint8_t>((s[0] + s[1] + s[2]) / 3);
}

void wordMeanOfFourSpread(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    const auto block = [](auto of, int16_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        storeThirds(to, meansOfEight<4, V>(from, 32));
    };
    int16_t* to = reinterpret_cast<int16_t*>(d);
    for (; pixels >= 8 * Wide::kLanes; pixels -= 8 * Wide::kLanes, to += 24 * Wide::kLanes, s += 32 * Wide::kLanes)
        block(Of<Wide>(), to, s);
    for (; pixels >= 8; pixels -= 8, to += 24, s += 32)
        block(Of<Lanes1>(), to, s);
    for (; pixels > 0; --pixels, to += 3, s += 4)
        *to = static_cast<int16_t>((s[0] + s[1] + s[2]) / 3);
}

// ---- Channels that change places

// Sixteen pixels a lane in three vectors: byte b of the 48 comes from byte b + 2, b or b - 2, which may be in the next or in
// the vector before.
void threeReversed(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<16, 3, 3>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        static constexpr Sixteen m00 = {{2, 1, 0, 5, 4, 3, 8, 7, 6, 11, 10, 9, 14, 13, 12, -1}},
                                 m01 = {{-1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, 1}},
                                 m10 = {{-1, 15, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1}},
                                 m11 = {{0, -1, 4, 3, 2, 7, 6, 5, 10, 9, 8, 13, 12, 11, -1, 15}},
                                 m12 = {{-1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, 0, -1}},
                                 m21 = {{14, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1}},
                                 m22 = {{-1, 3, 2, 1, 6, 5, 4, 9, 8, 7, 12, 11, 10, 15, 14, 13}};
        V a, b, c;
        loadInTurn(from, a, b, c);
        storeInTurn(to, shuffle(a, V::every(m00)) | shuffle(b, V::every(m01)),
                    shuffle(a, V::every(m10)) | shuffle(b, V::every(m11)) | shuffle(c, V::every(m12)),
                    shuffle(b, V::every(m21)) | shuffle(c, V::every(m22)));
    });
}

// Four pixels a lane.
constexpr Sixteen kThreeToFour = {{0, 1, 2, -1, 3, 4, 5, -1, 6, 7, 8, -1, 9, 10, 11, -1}},
                  kThreeToFourReversed = {{2, 1, 0, -1, 5, 4, 3, -1, 8, 7, 6, -1, 11, 10, 9, -1}},
                  kFourToThree = {{0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1}},
                  kFourToThreeReversed = {{2, 1, 0, 6, 5, 4, 10, 9, 8, 14, 13, 12, -1, -1, -1, -1}};
constexpr int kSparePixels = (kTwelveSpare + 2) / 3;

template <const Sixteen& order> void threesToFours(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<4, 4, 3, kSparePixels>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, shuffle(loadTwelves(from, V()), V::every(order)));
    });
}

template <const Sixteen& order> void foursToThrees(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<4, 3, 4, kSparePixels>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        storeTwelves(to, shuffle(V::load(from), V::every(order)));
    });
}

void fourReversed(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<4, 4, 4>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        static constexpr Sixteen reverse = {{2, 1, 0, 3, 6, 5, 4, 7, 10, 9, 8, 11, 14, 13, 12, 15}};
        store(to, shuffle(V::load(from), V::every(reverse)));
    });
}

} // namespace

#endif
