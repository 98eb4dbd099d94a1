// The bilinear sample, for one channel and for three. Where positions may lie is worked out once a row, so that no pixel asks.
#include "Warp.h"

#include <algorithm>
#include <cmath>

namespace kel_examples {

namespace {

constexpr int kOne = 256; // steps between two pixels

// Whether sample (u, v) has four neighbours, those half a pixel outside included.
bool isInside(float u, float v, const Image& picture) {
    return u >= -0.5f && v >= -0.5f && u <= static_cast<float>(picture->width) - 0.5f &&
           v <= static_cast<float>(picture->height) - 0.5f;
}

template <int channels> void sample(uint8_t* to, const Image& picture, float u, float v) {
    const int fixedU = static_cast<int>(std::clamp(u, 0.0f, static_cast<float>(picture->width - 1)) * kOne + 0.5f);
    const int fixedV = static_cast<int>(std::clamp(v, 0.0f, static_cast<float>(picture->height - 1)) * kOne + 0.5f);
    const int x = fixedU / kOne, y = fixedV / kOne, fx = fixedU % kOne, fy = fixedV % kOne;
    const ptrdiff_t right = x + 1 < picture->width ? channels : 0;
    const ptrdiff_t below = y + 1 < picture->height ? static_cast<ptrdiff_t>(picture->step) * channels : 0;
    const uint8_t* const p = picture.row(y) + static_cast<ptrdiff_t>(x) * channels;
    for (int c = 0; c < channels; ++c) {
        const int above = p[c] * (kOne - fx) + p[c + right] * fx,
                  under = p[c + below] * (kOne - fx) + p[c + below + right] * fx;
        to[c] = static_cast<uint8_t>((above * (kOne - fy) + under * fy + kOne * kOne / 2) / (kOne * kOne));
    }
}

template <int channels> void warpRow(uint8_t* to, int width, float y, const Image& picture, const float* h) {
    for (int x = 0; x < width; ++x, to += channels) {
        const float fx = static_cast<float>(x), w = 1 / (h[6] * fx + (h[7] * y + h[8]));
        const float u = (h[0] * fx + (h[1] * y + h[2])) * w, v = (h[3] * fx + (h[4] * y + h[5])) * w;
        if (isInside(u, v, picture))
            sample<channels>(to, picture, u, v);
        else
            std::fill_n(to, channels, uint8_t(0));
    }
}

} // namespace

Image warpPicture(const Image& picture, const kelMat& H, Size size) {
    const kelMat back = H.getInversedMatrix();
    Image result(size.width, size.height, picture->type);
    clearKelImage(result.get());
    if (back.m_Width == 3)
        for (int y = 0; y < size.height; ++y)
            (picture->channels == 1 ? warpRow<1> : warpRow<3>)(result.row(y), size.width, static_cast<float>(y), picture,
                                                               back.m_Data);
    return result;
}

} // namespace kel_examples
