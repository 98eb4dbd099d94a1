// Resizing at whole-number and rational ratios, halving, and borders, each written once over pixels of 1 to 4 bytes.
#include <algorithm>
#include <memory>
#include <smmintrin.h>
#include <stdlib.h>
#include <string.h>
#include <vector>

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

// dst[x] = src[x * ratio + ratio / 2], by a loop of its own for the ratios that matter.
template <int R, class P> void decimate(P* __restrict dst, const P* __restrict src, ptrdiff_t width) {
    for (ptrdiff_t x = 0; x < width; ++x)
        dst[x] = src[x * R];
}
template <class P> void decimateRow(P* dst, const P* src, ptrdiff_t width, ptrdiff_t ratio, ptrdiff_t offset) {
    src += offset;
    switch (ratio) {
    case 1:
        memcpy(dst, src, width * sizeof(P));
        return;
    case 2:
        return decimate<2>(dst, src, width);
    case 3:
        return decimate<3>(dst, src, width);
    case 4:
        return decimate<4>(dst, src, width);
    default:
        for (ptrdiff_t x = 0; x < width; ++x)
            dst[x] = src[x * ratio];
    }
}

template <class P> void nearest(kelImage_t* dst, const kelImage_t* src) {
    const kelValue_s32 rx = src->width / dst->width, ry = src->height / dst->height;
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        P* const to = rowByWidth<P>(dst, y);
        const P* const from = rowByWidth<P>(src, sampleAt(y, static_cast<float>(ry)).index);
        if (src->width < kExactSize)
            decimateRow(to, from, dst->width, rx, rx / 2);
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
            decimateRow(to, s, dst->width, rx, rx / 2);
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

// Interpolates a row along x; the fourth channel becomes 0. The neighbour of the row's last pixel is the next in memory.
void interpolateAcross(uint32_t* to, const uint32_t* from, const Steps& steps, kelValue_s32 width) {
    const __m128i zero = _mm_setzero_si128(),
                  threeChannels = _mm_setr_epi8(-1, -1, -1, 0, -1, -1, -1, 0, 0, 0, 0, 0, 0, 0, 0, 0);
    for (kelValue_s32 i = 0; i < width; ++i) {
        const __m128i pair = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(from + steps.index[i]));
        const int weight = steps.weight[i];
        const __m128i weights =
            _mm_unpacklo_epi64(_mm_set1_epi16(static_cast<short>(256 - weight)), _mm_set1_epi16(static_cast<short>(weight)));
        const __m128i products = _mm_mullo_epi16(_mm_unpacklo_epi8(pair, zero), weights); // at most 255 * 256, unsigned
        const __m128i sum = _mm_srli_epi16(_mm_add_epi16(products, _mm_srli_si128(products, 8)), 8);
        to[i] = static_cast<uint32_t>(_mm_cvtsi128_si32(_mm_and_si128(_mm_packus_epi16(sum, zero), threeChannels)));
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
        const __m128i a = _mm_loadu_si128(reinterpret_cast<const __m128i*>(above + i));
        const __m128i b = _mm_loadu_si128(reinterpret_cast<const __m128i*>(below + i));
        const __m128i low = mix(_mm_unpacklo_epi8(a, zero), _mm_unpacklo_epi8(b, zero));
        const __m128i high = mix(_mm_unpackhi_epi8(a, zero), _mm_unpackhi_epi8(b, zero));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(to + i), _mm_packus_epi16(low, high));
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
    Box at(kelValue_s32 output) const {
        const int64_t begin = output * box, end = begin + box;
        const int64_t first = begin / repeat, last = (end - 1) / repeat;
        const int64_t head = std::min((first + 1) * repeat, end) - begin;
        return {static_cast<kelValue_s32>(first), static_cast<kelValue_s32>(last), static_cast<kelValue_s32>(head),
                static_cast<kelValue_s32>(first == last ? 0 : end - last * repeat)};
    }
};

// Exact division of sums up to 255 * box, rounding down: by a multiplication where 255 * box * box < 2^32, else as it is.
class Division {
public:
    explicit Division(int64_t divisor)
        : m_divisor(static_cast<uint32_t>(divisor)), m_fast(255 * divisor * divisor < int64_t(1) << 32),
          m_magic(static_cast<uint32_t>(((int64_t(1) << 32) + divisor - 1) / divisor)) {}

    bool isFast() const { return m_fast; }
    uint32_t of(uint32_t sum) const { return sum / m_divisor; }
    // Four sums at once, the fast way only. Division by 1 has no 32-bit reciprocal.
    __m128i of(__m128i sums) const {
        if (m_divisor == 1)
            return sums;
        const __m128i magic = _mm_set1_epi32(static_cast<int>(m_magic));
        const __m128i even = _mm_srli_epi64(_mm_mul_epu32(sums, magic), 32);
        const __m128i odd = _mm_mul_epu32(_mm_srli_epi64(sums, 32), magic);
        return _mm_blend_epi16(even, odd, 0xcc);
    }

private:
    uint32_t m_divisor;
    bool m_fast;
    uint32_t m_magic;
};

__m128i widened(uint32_t pixel) {
    return _mm_cvtepu8_epi32(_mm_cvtsi32_si128(static_cast<int>(pixel)));
}
__m128i times(__m128i v, kelValue_s32 factor) {
    return _mm_mullo_epi32(v, _mm_set1_epi32(factor));
}

uint32_t quotient(__m128i sums, const Division& division) {
    if (!division.isFast()) {
        alignas(16) uint32_t sum[4];
        _mm_store_si128(reinterpret_cast<__m128i*>(sum), sums);
        sums = _mm_setr_epi32(static_cast<int>(division.of(sum[0])), static_cast<int>(division.of(sum[1])),
                              static_cast<int>(division.of(sum[2])), static_cast<int>(division.of(sum[3])));
    } else {
        sums = division.of(sums);
    }
    const __m128i words = _mm_packus_epi32(sums, sums);
    return static_cast<uint32_t>(_mm_cvtsi128_si32(_mm_packus_epi16(words, words)));
}

// Two to one, the ratio of pyramids: (a + b) / 2 rounding down, four pixels at a time.
__m128i halfOfSum(__m128i a, __m128i b) {
    return _mm_sub_epi8(_mm_avg_epu8(a, b), _mm_and_si128(_mm_xor_si128(a, b), _mm_set1_epi8(1)));
}

void averageAcross(uint32_t* to, const uint32_t* from, const Ratio& ratio, const Division& division, kelValue_s32 width) {
    kelValue_s32 j = 0;
    if (ratio.repeat == 1 && ratio.box == 2)
        for (; j + 4 <= width; j += 4) {
            const __m128 low = _mm_loadu_ps(reinterpret_cast<const float*>(from + 2 * j));
            const __m128 high = _mm_loadu_ps(reinterpret_cast<const float*>(from + 2 * j + 4));
            const __m128i even = _mm_castps_si128(_mm_shuffle_ps(low, high, _MM_SHUFFLE(2, 0, 2, 0)));
            const __m128i odd = _mm_castps_si128(_mm_shuffle_ps(low, high, _MM_SHUFFLE(3, 1, 3, 1)));
            _mm_storeu_si128(reinterpret_cast<__m128i*>(to + j), halfOfSum(even, odd));
        }
    for (; j < width; ++j) {
        const Box box = ratio.at(j);
        __m128i between = _mm_setzero_si128();
        for (kelValue_s32 k = box.first + 1; k < box.last; ++k)
            between = _mm_add_epi32(between, widened(from[k]));
        const __m128i ends = _mm_add_epi32(times(widened(from[box.first]), box.head), times(widened(from[box.last]), box.tail));
        to[j] = quotient(_mm_add_epi32(times(between, static_cast<kelValue_s32>(ratio.repeat)), ends), division);
    }
}

// sums += factor * row, pixel by pixel.
void accumulate(uint32_t* sums, const uint32_t* row, kelValue_s32 factor, kelValue_s32 width) {
    const __m128i f = _mm_set1_epi32(factor);
    for (kelValue_s32 x = 0; x < width; ++x) {
        __m128i* const sum = reinterpret_cast<__m128i*>(sums + 4 * static_cast<ptrdiff_t>(x));
        _mm_storeu_si128(sum, _mm_add_epi32(_mm_loadu_si128(sum), _mm_mullo_epi32(widened(row[x]), f)));
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
    const ptrdiff_t end = dst->size / static_cast<ptrdiff_t>(sizeof(Pixel<2>));
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
    if (dst->type != KEL_PIXEL_TYPE_U8G)
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
            decimate<2>(row<P>(dst, y), row<P>(src, 2 * y), dst->width);
    });
}

void resizeLinerInterpolation(kelImage_t* dst, const kelImage_t* src) {
    const Steps across(dst->width, src->width), down(dst->height, src->height);
    Buffer<uint32_t> above = allocate<uint32_t>(dst->width), below = allocate<uint32_t>(dst->width);
    const auto interpolated = [&](Buffer<uint32_t>& to, kelValue_s32 y) { // the row below the last one is the last one
        interpolateAcross(to.get(), rowByWidth<uint32_t>(src, std::min(y, src->height - 1)), across, dst->width);
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
    const Ratio across(dst->width, src->width), down(dst->height, src->height);
    const Division byAcross(across.box), byDown(down.box);
    Buffer<uint32_t> reduced = allocate<uint32_t>(dst->width), sums = allocate<uint32_t>(4 * static_cast<size_t>(dst->width));
    kelValue_s32 held = -1; // the source row that `reduced` holds
    const auto add = [&](kelValue_s32 y, kelValue_s32 factor) {
        if (y != held)
            averageAcross(reduced.get(), rowByWidth<uint32_t>(src, y), across, byAcross, dst->width);
        held = y;
        accumulate(sums.get(), reduced.get(), factor, dst->width);
    };
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        const Box box = down.at(y);
        memset(sums.get(), 0, 16 * static_cast<size_t>(dst->width));
        add(box.first, box.head);
        for (kelValue_s32 k = box.first + 1; k < box.last; ++k)
            add(k, static_cast<kelValue_s32>(down.repeat));
        if (box.last > box.first)
            add(box.last, box.tail);
        uint32_t* const to = rowByWidth<uint32_t>(dst, y);
        for (kelValue_s32 x = 0; x < dst->width; ++x)
            to[x] = quotient(_mm_loadu_si128(reinterpret_cast<const __m128i*>(sums.get()) + x), byDown);
    }
}

void resizeKelImageEnborder(kelImage_t* dst, const kelImage_t* src, kelValue_s32 size) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width +2*size && dst->height == src->height + 2*size);
    kel::withPixel(dst->type, [=](auto pixel) { enborder<sizeof(pixel)>(dst, src, size); });
}

void resizeKelImageDeborder(kelImage_t* dst, const kelImage_t* src, kelValue_s32 size) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->width == src->width - 2*size && dst->height == src->height - 2*size);
    if (dst->width < 1)
        return;
    kel::withPixel(dst->type, [=](auto pixel) {
        using P = decltype(pixel);
        for (kelValue_s32 y = 0; y < dst->height; ++y)
            memcpy(row<P>(dst, y), row<P>(src, y + size) + size, dst->width * sizeof(P));
    });
}

} // extern "C"
