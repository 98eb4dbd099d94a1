// Sampling at whole-number ratios: output x samples source position (x + 0.5) * ratio, in single precision. An enlargement has
// ratio 0 and samples pixel (0, 0) throughout. Rests on the kernels that take every second pixel or average four.
#include <cstring>

#include "kelDivision.h"
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"
#include "kelImage_Resize.h"

namespace {

using kel::Kernels;
using kel::rowByWidth;

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

// The index of that sample, in a source of that size; without floats, which cost a tenth of a small row.
kelValue_s32 sampleIndex(kelValue_s32 i, kelValue_s32 ratio, kelValue_s32 size) {
    return size < kExactSize ? i * ratio + ratio / 2 : sampleAt(i, static_cast<float>(ratio)).index;
}

// dst[x] = src[x * ratio + ratio / 2].
template <class P> void decimateRow(const Kernels& kernels, P* dst, const P* src, ptrdiff_t width, ptrdiff_t ratio) {
    auto* const to = reinterpret_cast<uint8_t*>(dst);
    const auto* const sampled = reinterpret_cast<const uint8_t*>(src + ratio / 2);
    if (ratio == 1)
        memcpy(dst, src, width * sizeof(P));
    else if (ratio == 2)
        kernels.oddPixels[sizeof(P) - 1](to, reinterpret_cast<const uint8_t*>(src), width);
    else if (sizeof(P) == 1 && ratio <= 4)
        kernels.averageOfFour(to, sampled, sampled, width, 0, ratio); // four times the same byte
    else
        for (ptrdiff_t x = 0; x < width; ++x)
            dst[x] = src[x * ratio + ratio / 2];
}

template <class P> void nearest(kelImage_t* dst, const kelImage_t* src) {
    const kelValue_s32 rx = src->width / kel::divisor(dst->width), ry = src->height / kel::divisor(dst->height);
    __asm__ volatile("" ::"r"(rx), "r"(ry)); // an empty destination divides by zero here, whether the ratio is needed or not
    if (dst->width < 0)
        return;
    const Kernels& kernels = kel::kernels();
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        P* const to = rowByWidth<P>(dst, y);
        const P* const from = rowByWidth<P>(src, sampleIndex(y, ry, src->height));
        if (src->width < kExactSize)
            decimateRow(kernels, to, from, dst->width, rx);
        else
            for (kelValue_s32 x = 0; x < dst->width; ++x)
                to[x] = from[sampleAt(x, static_cast<float>(rx)).index];
    }
}

// With whole-number ratios both weights are 0 or 0.5, so the interpolated and rounded value is (a + b + c + d + 2) / 4, where a
// neighbour of weight 0 is the pixel itself.
void bilinearExact(kelImage_t* dst, const kelImage_t* src, kelValue_s32 rx, kelValue_s32 ry) {
    // Only the last column can sample the source's last column, which has no right neighbour but itself.
    const ptrdiff_t last = static_cast<ptrdiff_t>(dst->width - 1) * rx + rx / 2;
    const Kernels& kernels = kel::kernels();
    const bool clamped = rx % 2 && last == src->width - 1;
    for (kelValue_s32 y = 0; y < dst->height; ++y) {
        uint8_t* const to = rowByWidth<uint8_t>(dst, y);
        const kelValue_s32 iy = y * ry + ry / 2;
        const uint8_t* const s = rowByWidth<uint8_t>(src, iy);
        const uint8_t* const below = ry % 2 && iy != src->height - 1 ? s + src->width : s;
        if (rx % 2 == 0 && below == s) {
            decimateRow(kernels, to, s, dst->width, rx);
            continue;
        }
        kernels.averageOfFour(to, s + rx / 2, below + rx / 2, dst->width - clamped, rx % 2, rx);
        if (clamped)
            kernels.averageOfFour(to + dst->width - 1, s + last, below + last, 1, 0, rx);
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

} // namespace

void kel::sampleNearest(kelImage_t* dst, const kelImage_t* src) {
    withPixel(dst->type, [=](auto pixel) { nearest<decltype(pixel)>(dst, src); });
}

void kel::sampleBilinear(kelImage_t* dst, const kelImage_t* src, kelValue_s32 rx, kelValue_s32 ry) {
    if (src->width < kExactSize && src->height < kExactSize)
        bilinearExact(dst, src, rx, ry);
    else
        bilinearFloat(dst, src, static_cast<float>(rx), static_cast<float>(ry));
}

void kel::keepEverySecond(kelImage_t* dst, const kelImage_t* src) {
    withPixel(dst->type, [=](auto pixel) {
        constexpr int bytes = sizeof(pixel);
        const Run evenPixels = kernels().evenPixels[bytes - 1];
        for (kelValue_s32 y = 0; y < dst->height; ++y)
            evenPixels(row<uint8_t>(dst, y, bytes), row<uint8_t>(src, 2 * y, bytes), dst->width);
    });
}
