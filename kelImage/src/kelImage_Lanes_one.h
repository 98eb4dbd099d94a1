// What a vocabulary of one lane has without instructions of its own: Lanes1, its loads and stores and packWords are there before.
#ifndef KEL_IMAGE_LANES_ONE_H
#define KEL_IMAGE_LANES_ONE_H

namespace {

// Lane k to p + k * stride, lower lanes first.
inline void storeLanes(uint8_t* p, ptrdiff_t, Lanes1 a) {
    store(p, a);
}
// Lane k of each in turn: a0 b0, a1 b1, ...
inline void storeInTurn(void* p, Lanes1 a, Lanes1 b) {
    store(p, a);
    store(static_cast<uint8_t*>(p) + 16, b);
}
// a0 b0 c0, a1 b1 c1, ...
inline void storeInTurn(uint8_t* p, Lanes1 a, Lanes1 b, Lanes1 c) {
    storeInTurn(p, a, b);
    store(p + 32, c);
}
inline void loadInTurn(const uint8_t* p, Lanes1& a, Lanes1& b, Lanes1& c) {
    a = Lanes1::load(p), b = Lanes1::load(p + 16), c = Lanes1::load(p + 32);
}
// The first twelve bytes of every lane, one after another; kTwelveSpare bytes behind them are read or written, too.
constexpr int kTwelveSpare = 16;
inline Lanes1 loadTwelves(const uint8_t* p, Lanes1) {
    return Lanes1::load(p);
}
inline void storeTwelves(uint8_t* p, Lanes1 a) {
    store(p, a);
}
// The lanes in the opposite order.
inline Lanes1 reversedLanes(Lanes1 a) {
    return a;
}
// What has a half of each lane from a and the other from b, as packs and every second long have, in the order of memory: all of
// a, then all of b.
inline Lanes1 ordered(Lanes1 ab) {
    return ab;
}
// The first longs of all lanes, then all second ones, and so on.
inline Lanes1 longsInTurn(Lanes1 a) {
    return a;
}
// Words that are not negative, narrowed in the order of memory.
inline Lanes1 narrowedWords(Lanes1 a, Lanes1 b) {
    return packWords(a, b);
}

} // namespace

#endif
