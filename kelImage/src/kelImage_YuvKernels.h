// Kernels of YUV: its luma, and its colour in single precision. With U' = U - 128 and V' = V - 128:
//   C = (Y - 16) * kLuma, R = C + kRedV * V', G = C + kGreenU * U' + kGreenV * V', B = C + kBlueU * U',
// each product rounded to single precision. Four channels sum up the chroma of G first and round by the thread's mode; three
// channels sum up from left to right and truncate: callers rely on either.
#ifndef KEL_IMAGE_YUV_KERNELS_H
#define KEL_IMAGE_YUV_KERNELS_H

#include "kelImage_Walk.h"

namespace {

constexpr float kLuma = 1.164f, kRedV = 1.793f, kGreenU = -0.213f, kGreenV = -0.534f, kBlueU = 2.115f;

// One byte of every long, zeros above it.
template <int byte>
constexpr Sixteen kByteOfLong = {{byte, -1, -1, -1, byte + 4, -1, -1, -1, byte + 8, -1, -1, -1, byte + 12, -1, -1, -1}};

// That byte less a bias, exactly: as the last bits of 2^23, from which 2^23 and the bias are taken again.
template <int byte, class V> typename V::Floats floatsOfByte(V pairs, float bias) {
    constexpr float base = 8388608;
    constexpr int bitsOfBase = 0x4b000000;
    return bitsAsFloats(shuffle(pairs, V::every(kByteOfLong<byte>)) | V::longs(bitsOfBase)) - V::floats(base + bias);
}

// Four pairs of pixels a lane, from U, Y0, V, Y1 in every long. A channel comes out as signed words, the first pixels of the
// four pairs before the second ones.
template <class V> struct YuvPairs {
    using Floats = typename V::Floats;

    explicit YuvPairs(V pairs)
        : first(floatsOfByte<1>(pairs, 16) * V::floats(kLuma)), second(floatsOfByte<3>(pairs, 16) * V::floats(kLuma)),
          u(floatsOfByte<0>(pairs, 128)), v(floatsOfByte<2>(pairs, 128)) {}

    Floats redV() const { return v * V::floats(kRedV); }
    Floats greenU() const { return u * V::floats(kGreenU); }
    Floats greenV() const { return v * V::floats(kGreenV); }
    Floats blueU() const { return u * V::floats(kBlueU); }

    Floats first, second, u, v;
};

// The channels of a pair of pixels, rounded and truncated.
struct YuvRounded {
    template <class V> static V sum(const YuvPairs<V>& p, typename V::Floats chroma) {
        return packLongs(rounded(p.first + chroma), rounded(p.second + chroma));
    }
    template <class V> static V green(const YuvPairs<V>& p) { return sum(p, p.greenU() + p.greenV()); }
};
struct YuvTruncated {
    template <class V> static V sum(const YuvPairs<V>& p, typename V::Floats chroma) {
        return packLongs(truncated(p.first + chroma), truncated(p.second + chroma));
    }
    template <class V> static V green(const YuvPairs<V>& p) {
        return packLongs(truncated((p.first + p.greenU()) + p.greenV()), truncated((p.second + p.greenU()) + p.greenV()));
    }
};

// Words of the three channels of eight pixels a lane.
template <class V> struct Colours { V c0, c1, c2; };
template <class Form, bool blueFirst, class V> Colours<V> coloursOf(V pairs) {
    const YuvPairs<V> p(pairs);
    const V red = Form::sum(p, p.redV()), green = Form::green(p), blue = Form::sum(p, p.blueU());
    return {blueFirst ? blue : red, green, blueFirst ? red : blue};
}

// Byte of pixel x where eight pixels lie as the first and the second ones of four pairs, and eight more behind them.
constexpr int placeOf(int x) {
    return x / 8 * 8 + x % 2 * 4 + x % 8 / 2;
}

// Where the bytes of channel c go in three vectors that hold its pixels by threes. The places of a channel in the three never
// coincide, so that one shuffle serves all of them: vector k takes place i from channel (k + i) % 3.
constexpr Sixteen placesOfChannel(int c) {
    Sixteen places = {};
    for (int i = 0; i < 16; ++i) {
        const int vector = (c + 3 - i % 3) % 3;
        places.byte[i] = static_cast<int8_t>(placeOf((16 * vector + i) / 3));
    }
    return places;
}
constexpr Sixteen everyThirdPlace(int first) {
    Sixteen mask = {};
    for (int i = first; i < 16; i += 3)
        mask.byte[i] = -1;
    return mask;
}
constexpr Sixteen kPlaces0 = placesOfChannel(0), kPlaces1 = placesOfChannel(1), kPlaces2 = placesOfChannel(2),
                  kThird0 = everyThirdPlace(0), kThird1 = everyThirdPlace(1);

// Sixteen pixels a lane of three channels, from bytes in the order of placeOf().
template <class V> void storeByThrees(uint8_t* d, V c0, V c1, V c2) {
    const V a = shuffle(c0, V::every(kPlaces0)), b = shuffle(c1, V::every(kPlaces1)), c = shuffle(c2, V::every(kPlaces2));
    const auto merged = [](V x, V y, V z) { return select(V::every(kThird0), x, select(V::every(kThird1), y, z)); };
    storeInTurn(d, merged(a, b, c), merged(b, c, a), merged(c, a, b));
}

template <bool blueFirst> void yuvToThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<8, 6, 4>(d, s, pixels / 2, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        const auto low = coloursOf<YuvTruncated, blueFirst>(V::loadLanes(from, 32)),
                   high = coloursOf<YuvTruncated, blueFirst>(V::loadLanes(from + 16, 32));
        storeByThrees(to, packWords(low.c0, high.c0), packWords(low.c1, high.c1), packWords(low.c2, high.c2));
    });
}

template <bool blueFirst> void yuvToFour(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<4, 8, 4>(d, s, pixels / 2, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        static constexpr Sixteen inOrder = {{0, 8, 4, 12, 1, 9, 5, 13, 2, 10, 6, 14, 3, 11, 7, 15}};
        const auto colours = coloursOf<YuvRounded, blueFirst>(V::load(from));
        const V c01 = shuffle(packWords(colours.c0, colours.c1), V::every(inOrder)),
                c23 = shuffle(packWords(colours.c2, V::zero()), V::every(inOrder));
        storeInTurn(to, lowWords(c01, c23), highWords(c01, c23));
    });
}

void yuvToGrey(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<16, 1, 2>(d, s, pixels, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        store(to, narrowedWords(shiftRightWords<8>(V::load(from)), shiftRightWords<8>(V::load(from + V::kBytes))));
    });
}

} // namespace

#endif
