// Kernels of YUV: its luma, and its colour in single precision. With U' = U - 128 and V' = V - 128:
//   C = (Y - 16) * kLuma, R = C + kRedV * V', G = C + kGreenU * U' + kGreenV * V', B = C + kBlueU * U',
// each product rounded to single precision. Four channels sum up the chroma of G first and round by the thread's mode; three
// channels sum up from left to right and truncate: callers rely on either. Integers give the bytes of three channels faster, not
// those of four: there sums of every channel that end in a half would have to be found and go through floats.
#ifndef KEL_IMAGE_YUV_KERNELS_H
#define KEL_IMAGE_YUV_KERNELS_H

#include "kelImage_Walk.h"

namespace {

constexpr float kLuma = 1.164f, kRedV = 1.793f, kGreenU = -0.213f, kGreenV = -0.534f, kBlueU = 2.115f;

// Words of three channels of eight pixels a lane.
template <class V> struct Colours { V red, green, blue; };

// ---- In single precision

// One byte of every long, zeros above it.
template <int byte>
constexpr Sixteen kByteOfLong = {{byte, -1, -1, -1, byte + 4, -1, -1, -1, byte + 8, -1, -1, -1, byte + 12, -1, -1, -1}};
template <int byte, class V> V byteOfLong(V pairs) {
    return shuffle(pairs, V::every(kByteOfLong<byte>));
}

// Four pairs of pixels a lane, from U, Y0, V, Y1 in every long. A channel comes out as signed words, the first pixels of the
// four pairs before the second ones.
template <class V> struct YuvPairs {
    using Floats = typename V::Floats;

    explicit YuvPairs(V pairs)
        : first(timesDifference(byteOfLong<1>(pairs), 16, kLuma)), second(timesDifference(byteOfLong<3>(pairs), 16, kLuma)),
          u(byteOfLong<0>(pairs)), v(byteOfLong<2>(pairs)) {}

    Floats redV() const { return timesDifference(v, 128, kRedV); }
    Floats greenU() const { return timesDifference(u, 128, kGreenU); }
    Floats greenV() const { return timesDifference(v, 128, kGreenV); }
    Floats blueU() const { return timesDifference(u, 128, kBlueU); }

    Floats first, second;
    V u, v;
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

template <class Form, class V> Colours<V> coloursOf(V pairs) {
    const YuvPairs<V> p(pairs);
    return {Form::sum(p, p.redV()), Form::green(p), Form::sum(p, p.blueU())};
}

// Words of four first pixels and four second ones in the order of pixels.
template <class V> V inOrder(V words) {
    static constexpr Sixteen order = {{0, 1, 8, 9, 2, 3, 10, 11, 4, 5, 12, 13, 6, 7, 14, 15}};
    return shuffle(words, V::every(order));
}

// ---- The truncated channels in integers
//
// Where the thread rounds to nearest or up, the truncated sums are the true ones, floor(e / 1000) with e = 1164 (Y - 16) + 1793 V'
// and the like, limited to 0 .. 255: of red and blue always, of green but for some hundreds of those colours whose e / 1000 is
// whole. In units of 2^-16 the weights below are whole numbers, of which a byte and a word are factors. Their sums for green are 0
// to 126 too large, so that the lower words of those that are whole, or seem to be, are below kNearWhole: those go through floats.
// Sums for red and blue are off by less than what parts the values of e / 1000, 65.5, wherever they are not limited, and never too
// small where it is whole.

constexpr Sixteen bytesOfPairs(int u, int first, int v, int second) {
    Sixteen bytes = {};
    for (int i = 0; i < 16; i += 4) {
        bytes.byte[i] = static_cast<int8_t>(u), bytes.byte[i + 1] = static_cast<int8_t>(first);
        bytes.byte[i + 2] = static_cast<int8_t>(v), bytes.byte[i + 3] = static_cast<int8_t>(second);
    }
    return bytes;
}
constexpr Sixteen wordsOfPairs(int low, int high) {
    return bytesOfPairs(low & 0xff, low >> 8 & 0xff, high & 0xff, high >> 8 & 0xff);
}
constexpr Sixteen longsOfPairs(int value) {
    return wordsOfPairs(value & 0xffff, value >> 16);
}
// 1.164 is 4 * 19071, 1.793 is 41 * 2866, 2.115 is 9 * 15401, 0.213 is 13959, 0.534 is 2 * 17498.
constexpr Sixteen kLumaBytes = bytesOfPairs(0, 4, 0, 4), kFirstWords = wordsOfPairs(19071, 0),
                  kSecondWords = wordsOfPairs(0, 19071);
constexpr Sixteen kChromaBytes = bytesOfPairs(9, 0, 41, 0), kRedWords = wordsOfPairs(0, 2866),
                  kBlueWords = wordsOfPairs(15401, 0);
constexpr Sixteen kGreenBytes = bytesOfPairs(1, 0, 2, 0), kGreenWords = wordsOfPairs(-13959, -17498);
// What the sums lack at Y = 16, U = V = 128; red and blue in the middle of what gives the same bytes.
constexpr Sixteen kRedBias = longsOfPairs(-16261289), kGreenBias = longsOfPairs(5045748), kBlueBias = longsOfPairs(-18962475);
constexpr Sixteen kLowerWords = longsOfPairs(0xffff);
constexpr int kNearWhole = 128;

// Words of eight pixels a lane in order; `lows` keeps the least of the lower words of green.
template <class V> [[gnu::always_inline]] inline Colours<V> coloursByIntegers(V pairs, V& lows) {
    const V luma = weighBytes(pairs, V::every(kLumaBytes)), chroma = weighBytes(pairs, V::every(kChromaBytes));
    const V first = weighWords(luma, V::every(kFirstWords)), second = weighWords(luma, V::every(kSecondWords));
    const V red = addLongs(weighWords(chroma, V::every(kRedWords)), V::every(kRedBias));
    const V blue = addLongs(weighWords(chroma, V::every(kBlueWords)), V::every(kBlueBias));
    const V green = addLongs(weighWords(weighBytes(pairs, V::every(kGreenBytes)), V::every(kGreenWords)), V::every(kGreenBias));
    const V firstGreen = addLongs(first, green), secondGreen = addLongs(second, green);
    lows = minUnsignedWords(lows, minUnsignedWords(firstGreen, secondGreen));
    return {upperWords(addLongs(first, red), addLongs(second, red)), upperWords(firstGreen, secondGreen),
            upperWords(addLongs(first, blue), addLongs(second, blue))};
}
template <class V> [[gnu::noinline]] V greenByFloats(V pairs) {
    return inOrder(YuvTruncated::green(YuvPairs<V>(pairs)));
}

// Sixteen pixels a lane, in order.
struct ByIntegers {
    template <class V> [[gnu::always_inline]] static void truncate(V lowPairs, V highPairs, Colours<V>& low, Colours<V>& high) {
        V lows = V::words(-1);
        low = coloursByIntegers(lowPairs, lows);
        high = coloursByIntegers(highPairs, lows);
        if (signsOfLongs(greaterLongs(V::longs(kNearWhole), lows & V::every(kLowerWords))) != 0) {
            low.green = greenByFloats(lowPairs);
            high.green = greenByFloats(highPairs);
        }
    }
};
struct ByFloats {
    template <class V> static void truncate(V lowPairs, V highPairs, Colours<V>& low, Colours<V>& high) {
        const auto colours = [](V pairs) {
            const Colours<V> c = coloursOf<YuvTruncated>(pairs);
            return Colours<V>{inOrder(c.red), inOrder(c.green), inOrder(c.blue)};
        };
        low = colours(lowPairs);
        high = colours(highPairs);
    }
};

inline bool roundsToNearestOrUp() {
    volatile float x = 1.5f; // which no compiler rounds beforehand
    int32_t longs[4];
    store(longs, rounded(Lanes1::floats(x)));
    return longs[0] == 2;
}

// Where the bytes of channel c go in three vectors that hold its pixels by threes. The places of a channel in the three never
// coincide, so that one shuffle serves all of them: vector k takes place i from channel (k + i) % 3.
constexpr Sixteen placesOfChannel(int c) {
    Sixteen places = {};
    for (int i = 0; i < 16; ++i) {
        const int vector = (c + 3 - i % 3) % 3;
        places.byte[i] = static_cast<int8_t>((16 * vector + i) / 3);
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

// Sixteen pixels a lane of three channels.
template <class V> void storeByThrees(uint8_t* d, V c0, V c1, V c2) {
    const V a = shuffle(c0, V::every(kPlaces0)), b = shuffle(c1, V::every(kPlaces1)), c = shuffle(c2, V::every(kPlaces2));
    const auto merged = [](V x, V y, V z) { return select(V::every(kThird0), x, select(V::every(kThird1), y, z)); };
    storeInTurn(d, merged(a, b, c), merged(b, c, a), merged(c, a, b));
}

template <bool blueFirst, class Arithmetic> void truncatedThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<8, 6, 4>(d, s, pixels / 2, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        Colours<V> low, high;
        Arithmetic::truncate(V::loadLanes(from, 32), V::loadLanes(from + 16, 32), low, high);
        const V red = packWords(low.red, high.red), blue = packWords(low.blue, high.blue);
        storeByThrees(to, blueFirst ? blue : red, packWords(low.green, high.green), blueFirst ? red : blue);
    });
}
template <bool blueFirst> void yuvToThree(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    (roundsToNearestOrUp() ? truncatedThree<blueFirst, ByIntegers> : truncatedThree<blueFirst, ByFloats>)(d, s, pixels);
}

template <bool blueFirst> void yuvToFour(uint8_t* d, const uint8_t* s, ptrdiff_t pixels) {
    walk<4, 8, 4>(d, s, pixels / 2, [](auto of, uint8_t* to, const uint8_t* from) {
        using V = LanesOf<decltype(of)>;
        static constexpr Sixteen inTurn = {{0, 8, 4, 12, 1, 9, 5, 13, 2, 10, 6, 14, 3, 11, 7, 15}};
        const Colours<V> c = coloursOf<YuvRounded>(V::load(from));
        const V c01 = shuffle(packWords(blueFirst ? c.blue : c.red, c.green), V::every(inTurn)),
                c23 = shuffle(packWords(blueFirst ? c.red : c.blue, V::zero()), V::every(inTurn));
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
