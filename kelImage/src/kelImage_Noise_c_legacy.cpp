// Additive uniform noise, one draw of rand() a pixel. Rests on the row helpers.
#include <algorithm>
#include <cstdlib>

#include "kelImage_Private.h"

extern "C" void applyKelFilterNoise(kelImage_t* dst, kelImage_t* src, kelValue_s32 amplitude) {
    KEL_ASSERT(dst->type == src->type);
    KEL_ASSERT(dst->step == src->step && dst->width == src->width && dst->height == src->height);
    if (src->type != KEL_PIXEL_TYPE_U8G)
        return;
    const int64_t values = 2 * static_cast<int64_t>(amplitude) + 1; // 64 bits: any amplitude is defined
    for (kelValue_s32 y = 0; y < src->height; ++y) {
        uint8_t* const out = kel::row<uint8_t>(dst, y);
        const uint8_t* const in = kel::row<uint8_t>(src, y);
        for (kelValue_s32 x = 0; x < src->width; ++x) {
            const int64_t noise = amplitude == 0 ? 0 : rand() % values - amplitude; // no noise, no draw
            out[x] = static_cast<uint8_t>(std::clamp<int64_t>(in[x] + noise, 0, 255));
        }
    }
}
