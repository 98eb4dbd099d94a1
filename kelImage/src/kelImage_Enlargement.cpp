// Linear enlargement of four-byte pixels, weights in 1/256: rows across, as many as are needed, then two of them mixed.
#include <algorithm>
#include <cstring>

#include "kelDivision.h"
#include "kelImage_Kernels.h"
#include "kelImage_Private.h"
#include "kelImage_Resize.h"

namespace {

using kel::allocate;
using kel::Buffer;

// For every output position the source position and the weight of the next one. At most one source position is stepped per
// output position.
struct Steps {
    Buffer<int32_t> index;
    Buffer<uint16_t> weight;

    Steps(kelValue_s32 outputs, kelValue_s32 inputs) : index(allocate<int32_t>(outputs)), weight(allocate<uint16_t>(outputs)) {
        const kelValue_s32 common = kel::divisor(kel::gcd(outputs, inputs));
        const int64_t a = outputs / common, b = inputs / common;
        kelValue_s32 k = 0;
        for (kelValue_s32 i = 0; i < outputs; ++i) {
            k += (k + 1) * a <= i * b;
            index[i] = k;
            weight[i] = static_cast<uint16_t>(i * b % a * 256 / a);
        }
    }
};

// The same as kernels take it: up to a whole block the last position again, and every weight four times.
struct StepsAcross {
    Buffer<int32_t> index;
    Buffer<uint16_t> weights;

    StepsAcross(kelValue_s32 outputs, kelValue_s32 inputs)
        : index(allocate<int32_t>(kel::wholeFours(outputs))), weights(allocate<uint16_t>(4 * kel::wholeFours(outputs))) {
        const Steps steps(outputs, inputs);
        for (ptrdiff_t i = 0; i < kel::wholeFours(outputs); ++i) {
            const ptrdiff_t from = std::min<ptrdiff_t>(i, outputs - 1);
            index[i] = steps.index[from];
            std::fill_n(&weights[4 * i], 4, steps.weight[from]);
        }
    }
};

} // namespace

void kel::enlarge(kelImage_t* dst, const kelImage_t* src) {
    const kelValue_s32 width = dst->width, end = src->height - 1; // the row below the last one is the last one
    const StepsAcross across(width, src->width);
    const Steps down(dst->height, src->height);
    const Kernels& kernels = kel::kernels();
    const ptrdiff_t whole = wholeFours(width);
    Buffer<uint32_t> above = allocate<uint32_t>(whole), below = allocate<uint32_t>(whole), last = allocate<uint32_t>(whole);
    const auto interpolate = [&](Buffer<uint32_t>& to, kelValue_s32 y) {
        kernels.enlargeAcross(to.get(), rowByWidth<uint32_t>(src, y), across.index.get(), across.weights.get(), whole);
    };
    // The last row first: it reads the pixel behind the source, which may be the destination's.
    interpolate(last, end);
    const auto interpolated = [&](Buffer<uint32_t>& to, kelValue_s32 y) {
        if (y < end)
            interpolate(to, y);
        else
            memcpy(to.get(), last.get(), static_cast<size_t>(width) * sizeof(uint32_t));
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
        kernels.mixRows(reinterpret_cast<uint8_t*>(rowByWidth<uint32_t>(dst, y)), reinterpret_cast<const uint8_t*>(above.get()),
                        reinterpret_cast<const uint8_t*>(below.get()), down.weight[y], 4 * static_cast<ptrdiff_t>(width));
    }
}
