// The bilinear sample, for one channel and for three, in two walks over each row: positions, then pixels.
#include "Warp.h"

#include <algorithm>
#include <vector>

namespace kel_examples {

namespace {

constexpr int kOne = 256; // steps between two pixels

// Where the pixels of a row are taken from, in steps; far outside where they are from nowhere.
struct Positions {
    std::vector<int> x, y;
    explicit Positions(int width) : x(static_cast<size_t>(width)), y(static_cast<size_t>(width)) {}

    // A loop without branches, which compilers make vectors of.
    void fill(const float* h, float row) {
        const float a = h[1] * row + h[2], b = h[4] * row + h[5], c = h[7] * row + h[8];
        int *const px = x.data(), *const py = y.data();
        for (int i = 0, width = static_cast<int>(x.size()); i < width; ++i) {
            const float u = static_cast<float>(i), w = kOne / (h[6] * u + c);
            px[i] = inSteps((h[0] * u + a) * w);
            py[i] = inSteps((h[3] * u + b) * w);
        }
    }

private:
    static int inSteps(float value) { // NaN is far outside, too
        constexpr float kFar = 1e9f;
        const float least = value > -kFar ? value : -kFar;
        return static_cast<int>((least < kFar ? least : kFar) + (least < 0 ? -0.5f : 0.5f));
    }
};

template <int channels> void blend(uint8_t* to, const uint8_t* p, ptrdiff_t right, ptrdiff_t below, int fx, int fy) {
    for (int c = 0; c < channels; ++c) {
        const int above = p[c] * kOne + (p[c + right] - p[c]) * fx;
        const int under = p[c + below] * kOne + (p[c + below + right] - p[c + below]) * fx;
        to[c] = static_cast<uint8_t>((above * kOne + (under - above) * fy + kOne * kOne / 2) / (kOne * kOne));
    }
}

template <int channels> void warpRow(uint8_t* to, const Positions& positions, const Image& picture) {
    const unsigned lastX = static_cast<unsigned>(picture->width - 1) * kOne,
                   lastY = static_cast<unsigned>(picture->height - 1) * kOne;
    const ptrdiff_t step = static_cast<ptrdiff_t>(picture->step) * channels;
    for (size_t i = 0; i < positions.x.size(); ++i, to += channels) {
        int x = positions.x[i], y = positions.y[i];
        ptrdiff_t right = channels, below = step;
        if (static_cast<unsigned>(x) >= lastX ||
            static_cast<unsigned>(y) >= lastY) { // up to half a pixel outside the edge goes on
            const int endX = static_cast<int>(lastX), endY = static_cast<int>(lastY);
            if (x < -kOne / 2 || y < -kOne / 2 || x > endX + kOne / 2 || y > endY + kOne / 2)
                continue;
            x = std::clamp(x, 0, endX);
            y = std::clamp(y, 0, endY);
            right = x < endX ? channels : 0;
            below = y < endY ? step : 0;
        }
        const uint8_t* const p = picture->data + y / kOne * step + x / kOne * channels;
        blend<channels>(to, p, right, below, x % kOne, y % kOne);
    }
}

} // namespace

Image warpPicture(const Image& picture, const kelMat& H, Size size) {
    const kelMat back = H.getInversedMatrix();
    Image result(size.width, size.height, picture->type);
    clearKelImage(result.get());
    Positions positions(size.width);
    for (int y = 0; back.m_Width == 3 && y < size.height; ++y) {
        positions.fill(back.m_Data, static_cast<float>(y));
        (picture->channels == 1 ? warpRow<1> : warpRow<3>)(result.row(y), positions, picture);
    }
    return result;
}

} // namespace kel_examples
