// Resizing at whole-number and rational ratios, halving, and borders, each written once over pixels of 1 to 4 bytes.
#include <algorithm>
#include <memory>
#include <smmintrin.h>
#include <stdlib.h>
#include <string.h>

#include "kelImage_Private.h"

namespace {

using kel::Pixel;
using kel::row;
using kel::rowByWidth;

kelValue_s32 gcd(kelValue_s32 x, kelValue_s32 y) {
    while (y != 0) {
        if (x > y) {
            const kelValue_s32 rest = x % y;
            x = y;
            y = rest;
        } else {
            y = y % x;
        }
    }
    return x;
}

// ---------------------------------------------------------------------------------------------------------------------
// Whole-number ratios: output x samples source position (x + 0.5) * ratio, in single precision. An enlargement has ratio 0 and
// samples pixel (0, 0) throughout.
// ---------------------------------------------------------------------------------------------------------------------

// Below this source size every sample position is exact in single precision, so that integers give the same samples.
constexpr kelValue_s32 kExactSize = 1 << 22;

struct Sample {
    kelValue_s32 index;
    float weight; // of the next pixel
};

Sample sampleAt(kelValue_s32 x, float ratio) {
    const float position = (static_cast<float>(x) + 0.5f) * ratio;
    const kelValue_s32 index = static_cast<kelValue_s32>(position);
    return {index, position - static_cast<float>(index)};
}

__m128i load(const void* p) {
    return _mm_loadu_si128(static_cast<const __m128i*>(p));
}
void store(void* p, __m128i v) {
    _mm_storeu_si128(static_cast<__m128i*>(p), v);
}

// The even or the odd pixels of two vectors, in order.
template <bool odd> __m128i everySecond(__m128i low, __m128i high, Pixel<1>) {
    const __m128i mask = _mm_set1_epi16(0xff);
    return odd ? _mm_packus_epi16(_mm_srli_epi16(low, 8), _mm_srli_epi16(high, 8))
               : _mm_packus_epi16(_mm_and_si128(low, mask), _mm_and_si128(high, mask));
}
template <bool odd> __m128i everySecond(__m128i low, __m128i high, Pixel<2>) {
    const __m128i mask = _mm_set1_epi32(0xffff);
    return odd ? _mm_packus_epi32(_mm_srli_epi32(low, 16), _mm_srli_epi32(high, 16))
               : _mm_packus_epi32(_mm_and_si128(low, mask), _mm_and_si128(high, mask));
}
template <bool odd> __m128i everySecond(__m128i low, __m128i high, Pixel<4>) {
    constexpr int order = odd ? _MM_SHUFFLE(3, 1, 3, 1) : _MM_SHUFFLE(2, 0, 2, 0);
    return _mm_castps_si128(_mm_shuffle_ps(_mm_castsi128_ps(low), _mm_castsi128_ps(high), order));
}

// dst[x] = src[2 * x + odd], reading nothing beyond pixel 2 * width - 1.
template <bool odd, class P> void halveRow(P* dst, const P* src, ptrdiff_t width) {
    ptrdiff_t x = 0;
    if constexpr (sizeof(P) != 3) {
        constexpr ptrdiff_t block = 16 / sizeof(P);
        for (; x + block <= width; x += block)
            store(dst + x, everySecond<odd>(load(src + 2 * x), load(src + 2 * x + block), Pixel<sizeof(P)>()));
    }
    for (; x < width; ++x)
        dst[x] = src[2 * x + odd];
}

// dst[x] = src[x * ratio + ratio / 2].
template <class P> void decimateRow(P* dst, const P* src, ptrdiff_t width, ptrdiff_t ratio) {
    if (ratio == 1)
        memcpy(dst, src, width * sizeof(P));
    else if (ratio == 2)
        halveRow<true>(dst, src, width);
    else
        for (ptrdiff_t x = 0; x < width; ++x)
            dst[x] = src[x * ratio + ratio / 2];
}

template <class P> void nearest(kelImage_t* dst, const kelImage_t* src) {
    const kelValue_s32 rx = src->width / dst->width, ry = src->height / dst->height;
    if (dst->width < 0)
        return;
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        P* const to = rowByWidth<P>(dst, y);
        const P* const from = rowByWidth<P>(src, sampleAt(y, static_cast<float>(ry)).index);
        if (src->width < kExactSize)
            decimateRow(to, from, dst->width, rx);
        else
            for (kelValue_s32 x = 0; x < dst->width; ++x)
                to[x] = from[sampleAt(x, static_cast<float>(rx)).index];
    }
}

// With whole-number ratios both weights are 0 or 0.5, so the interpolated and rounded value is (a + b + c + d + 2) / 4, where a
// neighbour of weight 0 is the pixel itself.
template <int R>
void averageRow(uint8_t* __restrict dst, const uint8_t* __restrict s, const uint8_t* __restrict below, ptrdiff_t width,
                ptrdiff_t neighbour, ptrdiff_t ratio) {
    const ptrdiff_t stride = R ? R : ratio;
    const uint8_t *const t = s + neighbour, *const belowT = below + neighbour;
    for (ptrdiff_t x = 0; x < width; ++x) {
        const ptrdiff_t i = x * stride;
        dst[x] = static_cast<uint8_t>((s[i] + t[i] + below[i] + belowT[i] + 2) >> 2);
    }
}

void averageRow(uint8_t* dst, const uint8_t* s, const uint8_t* below, ptrdiff_t width, ptrdiff_t neighbour, ptrdiff_t ratio) {
    switch (ratio) {
    case 1:
        return averageRow<1>(dst, s, below, width, neighbour, ratio);
    case 2:
        return averageRow<2>(dst, s, below, width, neighbour, ratio);
    case 3:
        return averageRow<3>(dst, s, below, width, neighbour, ratio);
    case 4:
        return averageRow<4>(dst, s, below, width, neighbour, ratio);
    default:
        return averageRow<0>(dst, s, below, width, neighbour, ratio);
    }
}

void bilinearExact(kelImage_t* dst, const kelImage_t* src, kelValue_s32 rx, kelValue_s32 ry) {
    // Only the last column can sample the source's last column, which has no right neighbour but itself.
    const ptrdiff_t last = static_cast<ptrdiff_t>(dst->width - 1) * rx + rx / 2;
    const bool clamped = rx % 2 && last == src->width - 1;
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        uint8_t* const to = rowByWidth<uint8_t>(dst, y);
        const kelValue_s32 iy = y * ry + ry / 2;
        const uint8_t* const s = rowByWidth<uint8_t>(src, iy);
        const uint8_t* const below = ry % 2 && iy != src->height - 1 ? s + src->width : s;
        if (rx % 2 == 0 && below == s) {
            decimateRow(to, s, dst->width, rx);
            continue;
        }
        averageRow(to, s + rx / 2, below + rx / 2, dst->width - clamped, rx % 2, rx);
        if (clamped)
            averageRow<0>(to + dst->width - 1, s + last, below + last, 1, 0, rx);
    }
}

void bilinearFloat(kelImage_t* dst, const kelImage_t* src, float rx, float ry) {
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        uint8_t* const to = rowByWidth<uint8_t>(dst, y);
        const Sample v = sampleAt(y, ry);
        const uint8_t* const s = rowByWidth<uint8_t>(src, v.index);
        const uint8_t* const below = v.index == src->height - 1 ? s : s + src->width;
        for (kelValue_s32 x = 0; x < dst->width; ++x) {
            const Sample u = sampleAt(x, rx);
            const kelValue_s32 next = u.index == src->width - 1 ? u.index : u.index + 1;
            const float above = s[u.index] * (1 - u.weight) + s[next] * u.weight;
            const float under = below[u.index] * (1 - u.weight) + below[next] * u.weight;
            to[x] = static_cast<uint8_t>(above * (1 - v.weight) + under * v.weight + 0.5f);
        }
    }
}

// ---------------------------------------------------------------------------------------------------------------------
// Linear enlargement of four-byte pixels, weights in 1/256.
// ---------------------------------------------------------------------------------------------------------------------

struct Free {
    void operator()(void* block) const { free(block); }
};
template <class T> using Buffer = std::unique_ptr<T[], Free>;
template <class T> Buffer<T> allocate(size_t count) {
    return Buffer<T>(static_cast<T*>(malloc(count * sizeof(T))));
}

// For every output position the source position and the weight of the next one. At most one source position is stepped per
// output position.
struct Steps {
    Buffer<kelValue_s32> index;
    Buffer<uint16_t> weight;

    Steps(kelValue_s32 outputs, kelValue_s32 inputs)
        : index(allocate<kelValue_s32>(outputs)), weight(allocate<uint16_t>(outputs)) {
        const kelValue_s32 divisor = gcd(outputs, inputs);
        const int64_t a = outputs / divisor, b = inputs / divisor;
        kelValue_s32 k = 0;
        for (kelValue_s32 i = 0; i < outputs; ++i) {
            k += (k + 1) * a <= i * b;
            index[i] = k;
            weight[i] = static_cast<uint16_t>(i * b % a * 256 / a);
        }
    }
};

// Three channels of two neighbours as words in pairs (p0, n0, p1, n1, p2, n2, 0, 0), times (256 - weight, weight), summed in
// pairs: at most 255 * 256. `weights` is the pair in each 32-bit lane.
__m128i mixed(const uint32_t* pair, __m128i weights) {
    const __m128i words = _mm_shuffle_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(pair)),
                                           _mm_setr_epi8(0, -1, 4, -1, 1, -1, 5, -1, 2, -1, 6, -1, -1, -1, -1, -1));
    return _mm_srli_epi32(_mm_madd_epi16(words, weights), 8);
}

// Interpolates a row along x; the fourth channel becomes 0. The neighbour of the row's last pixel is the next in memory.
void interpolateAcross(uint32_t* to, const uint32_t* from, const Steps& steps, kelValue_s32 width) {
    const auto weights = [&](kelValue_s32 i) { return _mm_set1_epi32((steps.weight[i] << 16) | (256 - steps.weight[i])); };
    const kelValue_s32* const index = steps.index.get();
    kelValue_s32 i = 0;
    for (; i + 4 <= width; i += 4) {
        const __m128i low = _mm_packus_epi32(mixed(from + index[i], weights(i)), mixed(from + index[i + 1], weights(i + 1)));
        const __m128i high =
            _mm_packus_epi32(mixed(from + index[i + 2], weights(i + 2)), mixed(from + index[i + 3], weights(i + 3)));
        store(to + i, _mm_packus_epi16(low, high));
    }
    for (; i < width; ++i) {
        const __m128i words = _mm_packus_epi32(mixed(from + index[i], weights(i)), _mm_setzero_si128());
        to[i] = static_cast<uint32_t>(_mm_cvtsi128_si32(_mm_packus_epi16(words, words)));
    }
}

// Mixes two such rows along y, byte by byte.
void interpolateDown(uint8_t* to, const uint8_t* above, const uint8_t* below, int weight, ptrdiff_t bytes) {
    const __m128i zero = _mm_setzero_si128(), wAbove = _mm_set1_epi16(static_cast<short>(256 - weight)),
                  wBelow = _mm_set1_epi16(static_cast<short>(weight));
    const auto mix = [=](__m128i a, __m128i b) {
        return _mm_srli_epi16(_mm_add_epi16(_mm_mullo_epi16(a, wAbove), _mm_mullo_epi16(b, wBelow)), 8);
    };
    ptrdiff_t i = 0;
    for (; i + 16 <= bytes; i += 16) {
        const __m128i a = load(above + i), b = load(below + i);
        const __m128i low = mix(_mm_unpacklo_epi8(a, zero), _mm_unpacklo_epi8(b, zero));
        const __m128i high = mix(_mm_unpackhi_epi8(a, zero), _mm_unpackhi_epi8(b, zero));
        store(to + i, _mm_packus_epi16(low, high));
    }
    for (; i < bytes; ++i)
        to[i] = static_cast<uint8_t>((below[i] * weight + above[i] * (256 - weight)) >> 8);
}

// ---------------------------------------------------------------------------------------------------------------------
// Reduction of four-byte pixels: every input is repeated `repeat` times, every `box` of those are averaged.
// ---------------------------------------------------------------------------------------------------------------------

// The inputs under one output: the first counts `head` times, the last `tail` times, those between `repeat` times. Where one
// input alone is under the box, head is the whole box and tail 0.
struct Box {
    kelValue_s32 first, last;
    kelValue_s32 head, tail;
};

struct Ratio {
    int64_t repeat, box;

    Ratio(kelValue_s32 outputs, kelValue_s32 inputs)
        : repeat(outputs / gcd(outputs, inputs)), box(inputs / gcd(outputs, inputs)) {}
    bool isHalf() const { return repeat == 1 && box == 2; }
    Box at(kelValue_s32 output) const {
        const int64_t begin = output * box, end = begin + box;
        const int64_t first = begin / repeat, last = (end - 1) / repeat;
        const int64_t head = std::min((first + 1) * repeat, end) - begin;
        return {static_cast<kelValue_s32>(first), static_cast<kelValue_s32>(last), static_cast<kelValue_s32>(head),
                static_cast<kelValue_s32>(first == last ? 0 : end - last * repeat)};
    }
};

// Sums of bytes that are averaged over a box, and their division by it, rounding down. In 16 bits it is exact by a
// multiplication with ceil(2^16 / box) as long as 255 * box * box < 2^16; larger boxes sum in 32 bits and multiply with
// ceil(2^32 / box) as long as that, too, is exact; the largest sum in 64 bits and divide.
constexpr int64_t kWordBox = 16, kReciprocalBox = 4103;

// Two pixels as eight sums of 16 bits, for boxes up to kWordBox.
struct WordSums {
    using Lanes = __m128i;
    static Lanes widened(uint64_t twoPixels) { return _mm_cvtepu8_epi16(_mm_cvtsi64_si128(static_cast<long long>(twoPixels))); }
    static Lanes times(Lanes v, int64_t factor) { return _mm_mullo_epi16(v, _mm_set1_epi16(static_cast<short>(factor))); }
    static Lanes plus(Lanes a, Lanes b) { return _mm_add_epi16(a, b); }
    static uint64_t average(Lanes sums, int64_t box) {
        const __m128i magic = _mm_set1_epi16(static_cast<short>((65536 + box - 1) / box)); // 2^16 / 1 is no word
        const __m128i result = box == 1 ? sums : _mm_mulhi_epu16(sums, magic);
        return static_cast<uint64_t>(_mm_cvtsi128_si64(_mm_packus_epi16(result, result)));
    }
};

// Two pixels as eight sums of 32 bits, for boxes up to kReciprocalBox.
struct LongSums {
    struct Lanes {
        __m128i low, high;
    };
    static Lanes widened(uint64_t twoPixels) {
        return {_mm_cvtepu8_epi32(_mm_cvtsi32_si128(static_cast<int>(twoPixels))),
                _mm_cvtepu8_epi32(_mm_cvtsi32_si128(static_cast<int>(twoPixels >> 32)))};
    }
    static Lanes times(Lanes v, int64_t factor) {
        const __m128i f = _mm_set1_epi32(static_cast<int>(factor));
        return {_mm_mullo_epi32(v.low, f), _mm_mullo_epi32(v.high, f)};
    }
    static Lanes plus(Lanes a, Lanes b) { return {_mm_add_epi32(a.low, b.low), _mm_add_epi32(a.high, b.high)}; }
    static __m128i divided(__m128i sums, int64_t box) {
        const __m128i magic = _mm_set1_epi32(static_cast<int>(((int64_t(1) << 32) + box - 1) / box));
        const __m128i even = _mm_srli_epi64(_mm_mul_epu32(sums, magic), 32);
        const __m128i odd = _mm_mul_epu32(_mm_srli_epi64(sums, 32), magic);
        return _mm_blend_epi16(even, odd, 0xcc);
    }
    static uint64_t average(Lanes sums, int64_t box) {
        const __m128i words = _mm_packus_epi32(divided(sums.low, box), divided(sums.high, box));
        return static_cast<uint64_t>(_mm_cvtsi128_si64(_mm_packus_epi16(words, words)));
    }
};

// Two pixels as eight sums of 64 bits, for boxes of any size.
struct AnySums {
    struct Lanes {
        uint64_t sum[8];
    };
    template <class Body> static Lanes each(Body body) {
        Lanes result;
        for (int i = 0; i < 8; ++i)
            result.sum[i] = body(i);
        return result;
    }
    static Lanes widened(uint64_t twoPixels) {
        return each([=](int i) { return twoPixels >> (8 * i) & 0xff; });
    }
    static Lanes times(Lanes v, int64_t factor) {
        return each([=](int i) { return v.sum[i] * static_cast<uint64_t>(factor); });
    }
    static Lanes plus(Lanes a, Lanes b) {
        return each([=](int i) { return a.sum[i] + b.sum[i]; });
    }
    static uint64_t average(Lanes sums, int64_t box) {
        uint64_t result = 0;
        for (int i = 0; i < 8; ++i)
            result |= sums.sum[i] / static_cast<uint64_t>(box) << (8 * i);
        return result;
    }
};

// The average of the inputs under a box; input(k) gives two pixels.
template <class Sums, class Input> uint64_t averageOf(const Box& box, const Ratio& ratio, Input input) {
    using Lanes = typename Sums::Lanes;
    Lanes sum = Sums::times(Sums::widened(input(box.first)), box.head);
    if (box.first + 1 < box.last) {
        Lanes between = Sums::widened(input(box.first + 1));
        for (kelValue_s32 k = box.first + 2; k < box.last; ++k)
            between = Sums::plus(between, Sums::widened(input(k)));
        sum = Sums::plus(sum, Sums::times(between, ratio.repeat));
    }
    if (box.first < box.last)
        sum = Sums::plus(sum, Sums::times(Sums::widened(input(box.last)), box.tail));
    return Sums::average(sum, ratio.box);
}

// Calls body(Sums()) for the cheapest sums that are exact for a box.
template <class Body> void withSums(int64_t box, Body body) {
    if (box <= kWordBox)
        body(WordSums());
    else if (box <= kReciprocalBox)
        body(LongSums());
    else
        body(AnySums());
}

// (a + b) / 2 rounding down, byte by byte.
__m128i halfOfSum(__m128i a, __m128i b) {
    return _mm_sub_epi8(_mm_avg_epu8(a, b), _mm_and_si128(_mm_xor_si128(a, b), _mm_set1_epi8(1)));
}

// Four averages of pairs of neighbours.
__m128i halvedAcross(const uint32_t* from) {
    const __m128i low = load(from), high = load(from + 4);
    return halfOfSum(everySecond<false>(low, high, Pixel<4>()), everySecond<true>(low, high, Pixel<4>()));
}

template <class Sums>
void averageAcross(uint32_t* to, const uint32_t* from, const Ratio& ratio, const Box* boxes, kelValue_s32 width) {
    kelValue_s32 j = 0;
    if (ratio.isHalf())
        for (; j + 4 <= width; j += 4)
            store(to + j, halvedAcross(from + 2 * j));
    for (; j < width; ++j)
        to[j] = static_cast<uint32_t>(averageOf<Sums>(boxes[j], ratio, [=](kelValue_s32 k) { return uint64_t(from[k]); }));
}

// Averages rows of horizontally reduced pixels; rowAt(k) is such a row.
template <class Sums, class RowAt>
void averageDown(uint32_t* to, const Box& box, const Ratio& ratio, kelValue_s32 width, RowAt rowAt) {
    kelValue_s32 x = 0;
    if (ratio.isHalf())
        for (const uint32_t *a = rowAt(box.first), *b = rowAt(box.last); x + 4 <= width; x += 4)
            store(to + x, halfOfSum(load(a + x), load(b + x)));
    for (; x + 2 <= width; x += 2) {
        const uint64_t average = averageOf<Sums>(box, ratio, [=](kelValue_s32 k) {
            uint64_t two;
            memcpy(&two, rowAt(k) + x, sizeof two);
            return two;
        });
        memcpy(to + x, &average, sizeof average);
    }
    if (x < width)
        to[x] = static_cast<uint32_t>(averageOf<Sums>(box, ratio, [=](kelValue_s32 k) { return uint64_t(rowAt(k)[x]); }));
}

// Two to one both ways, the ratio of pyramids, without rows in between; for widths of whole blocks of four.
void halveBothWays(kelImage_t* dst, const kelImage_t* src) {
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        uint32_t* const to = rowByWidth<uint32_t>(dst, y);
        const uint32_t *const above = rowByWidth<uint32_t>(src, 2 * y), *const below = rowByWidth<uint32_t>(src, 2 * y + 1);
        for (kelValue_s32 x = 0; x < dst->width; x += 4)
            store(to + x, halfOfSum(halvedAcross(above + 2 * x), halvedAcross(below + 2 * x)));
    }
}

template <class AcrossSums, class DownSums>
void reduce(kelImage_t* dst, const kelImage_t* src, const Ratio& across, const Ratio& down) {
    const kelValue_s32 width = dst->width;
    Buffer<Box> boxes = allocate<Box>(width);
    for (kelValue_s32 x = 0; x < width; ++x)
        boxes[x] = across.at(x);
    // A ring of reduced rows, large enough for those under one box.
    const kelValue_s32 rows = static_cast<kelValue_s32>((down.box + down.repeat - 1) / down.repeat + 1);
    Buffer<uint32_t> ring = allocate<uint32_t>(static_cast<size_t>(rows) * width);
    const auto rowAt = [&](kelValue_s32 k) { return ring.get() + static_cast<ptrdiff_t>(k % rows) * width; };
    kelValue_s32 reduced = 0; // source rows that have passed through the ring
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        const Box box = down.at(y);
        for (; reduced <= box.last; ++reduced)
            averageAcross<AcrossSums>(rowAt(reduced), rowByWidth<uint32_t>(src, reduced), across, boxes.get(), width);
        averageDown<DownSums>(rowByWidth<uint32_t>(dst, y), box, down, width, rowAt);
    }
}

// ---------------------------------------------------------------------------------------------------------------------
// Borders
// ---------------------------------------------------------------------------------------------------------------------

// U8G and S16G address rows by step, pixels of three and four bytes by width: callers rely on either.
template <int N, class Image> auto borderRow(Image* image, kelValue_s32 y) {
    return N <= 2 ? row<Pixel<N>>(image, y) : rowByWidth<Pixel<N>>(image, y);
}

// The right band of S16G starts at the source's step, not at its width; where that lies beyond the row it runs on in memory, as
// far as the destination's data reaches. Callers rely on it.
void rightBandByStep(kelImage_t* dst, const kelImage_t* src, kelValue_s32 size) {
    Pixel<2>* const data = row<Pixel<2>>(dst, 0);
    const ptrdiff_t end = static_cast<ptrdiff_t>(dst->height) * dst->step; // `size` holds no 2^31 bytes
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        const ptrdiff_t begin = static_cast<ptrdiff_t>(y) * dst->step + src->step + size;
        for (ptrdiff_t i = begin; i < std::min(begin + size, end); ++i)
            data[i] = data[begin - 1];
    }
}

template <int N> void enborder(kelImage_t* dst, const kelImage_t* src, kelValue_s32 size) {
    const ptrdiff_t width = src->width;
    const kelValue_s32 height = src->height;
    if (width > 0 && height > 0)
        for (kelValue_s32 y = 0; y < dst->height; ++y)
            memcpy(borderRow<N>(dst, y) + size, borderRow<N>(src, std::min(std::max(y - size, 0), height - 1)), width * N);
    if (size < 1)
        return;
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        Pixel<N>* const to = borderRow<N>(dst, y);
        std::fill_n(to, size, to[size]);
        if (N != 2)
            std::fill_n(to + size + width, size, to[size + width - 1]);
    }
    if (N == 2)
        rightBandByStep(dst, src, size);
}

} // namespace

extern "C" {

void resizeKelImage(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
}

void resizeKelImageNearest(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    kel::withPixel(dst->type, [=](auto pixel) { nearest<decltype(pixel)>(dst, src); });
}

void resizeKelImageBilinear(kelImage_t* dst, const kelImage_t* src) {
    const kelValue_s32 rx = src->width / dst->width, ry = src->height / dst->height;
    __asm__ volatile("" ::"r"(rx), "r"(ry)); // an empty destination divides by zero here, before any check
    KEL_ASSERT(dst->type == src->type);
    if (dst->type != KEL_PIXEL_TYPE_U8G || dst->width < 0)
        return;
    if (src->width < kExactSize && src->height < kExactSize)
        bilinearExact(dst, src, rx, ry);
    else
        bilinearFloat(dst, src, static_cast<float>(rx), static_cast<float>(ry));
}

void resizeKelImageHalf(kelImage_t* dst, const kelImage_t* src) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width / 2);
    KEL_ASSERT(dst->height == src->height / 2);
    kel::withPixel(dst->type, [=](auto pixel) {
        using P = decltype(pixel);
        for (kelValue_s32 y = 0; y < dst->height; ++y)
            halveRow<false>(row<P>(dst, y), row<P>(src, 2 * y), dst->width);
    });
}

void resizeLinerInterpolation(kelImage_t* dst, const kelImage_t* src) {
    if (dst->width < 0 || dst->height < 0)
        return;
    const Steps across(dst->width, src->width), down(dst->height, src->height);
    const kelValue_s32 end = src->height - 1; // the row below the last one is the last one
    Buffer<uint32_t> above = allocate<uint32_t>(dst->width), below = allocate<uint32_t>(dst->width),
                     last = allocate<uint32_t>(dst->width);
    // The last row first: it reads the pixel behind the source, which may be the destination's.
    interpolateAcross(last.get(), rowByWidth<uint32_t>(src, end), across, dst->width);
    const auto interpolated = [&](Buffer<uint32_t>& to, kelValue_s32 y) {
        if (y < end)
            interpolateAcross(to.get(), rowByWidth<uint32_t>(src, y), across, dst->width);
        else
            memcpy(to.get(), last.get(), static_cast<size_t>(dst->width) * sizeof(uint32_t));
    };
    kelValue_s32 current = 0;
    interpolated(above, 0);
    interpolated(below, 1);
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        if (down.index[y] != current) {
            current = down.index[y];
            std::swap(above, below);
            interpolated(below, current + 1);
        }
        interpolateDown(rowByWidth<uint8_t>(dst, 4 * y), reinterpret_cast<const uint8_t*>(above.get()),
                        reinterpret_cast<const uint8_t*>(below.get()), down.weight[y], 4 * static_cast<ptrdiff_t>(dst->width));
    }
}

void zero_order_hold_plus_ave(kelImage_t* dst, const kelImage_t* src) {
    if (dst->width < 0 || dst->height < 0)
        return;
    const Ratio across(dst->width, src->width), down(dst->height, src->height);
    if (across.isHalf() && down.isHalf() && dst->width % 4 == 0)
        return halveBothWays(dst, src);
    withSums(across.box, [&](auto acrossSums) {
        withSums(down.box, [&](auto downSums) { reduce<decltype(acrossSums), decltype(downSums)>(dst, src, across, down); });
    });
}

void resizeKelImageEnborder(kelImage_t* dst, const kelImage_t* src, kelValue_s32 border) {
    const ptrdiff_t size = border; // twice a border does not overflow
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width +2*size && dst->height == src->height + 2*size);
    kel::withPixel(dst->type, [=](auto pixel) { enborder<sizeof(pixel)>(dst, src, border); });
}

void resizeKelImageDeborder(kelImage_t* dst, const kelImage_t* src, kelValue_s32 border) {
    const ptrdiff_t size = border;
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width - 2*size && dst->height == src->height - 2*size);
    if (dst->width < 1)
        return;
    kel::withPixel(dst->type, [=](auto pixel) {
        using P = decltype(pixel);
        for (kelValue_s32 y = 0; y < dst->height; ++y)
            memcpy(row<P>(dst, y), row<P>(src, y + border) + size, dst->width * sizeof(P));
    });
}

} // extern "C"
