// The keypoint detector as a plain walk over the pixels: what the block-wise scan must equal bit for bit.
#ifndef KEL_TESTS_YAPE_REFERENCE_H
#define KEL_TESTS_YAPE_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <kel/kelImage.h>

#include "FilterReference.h"

namespace kel_ref {

// What happened to the candidates: tests look here whether their images reach every branch.
struct YapeTally {
    int weakExtremum = 0, edge = 0, moved = 0, leftImage = 0, unfinished = 0, reset = 0, dropped = 0;
};

inline void refine(float& ox, float& oy, kelImage_t* laplacian, int x, int y, YapeTally& tally) {
    const auto l = [&](int64_t u, int64_t v) {
        return static_cast<int>(s16(laplacian, static_cast<int>(u), static_cast<int>(v)));
    };
    int64_t px = x, py = y;
    for (int round = 0; round < 5; ++round) {
        const float dx = (l(px + 1, py) - l(px - 1, py)) * 0.5f, dy = (l(px, py + 1) - l(px, py - 1)) * 0.5f;
        const float dxx = static_cast<float>(l(px - 1, py) + l(px + 1, py) - 2 * l(px, py));
        const float dyy = static_cast<float>(l(px, py - 1) + l(px, py + 1) - 2 * l(px, py));
        const float dxy = (l(px + 1, py + 1) - l(px - 1, py + 1) - l(px + 1, py - 1) + l(px - 1, py - 1)) * 0.25f;
        const float det = dxx * dyy - dxy * dxy;
        const float k = det != 0 ? -1.0f / det : -0.0f;
        ox = (dyy * dx - dxy * dy) * k;
        oy = (dxx * dy - dxy * dx) * k;
        if (std::fabs(ox) < 0.5f && std::fabs(oy) < 0.5f)
            return;
        ++tally.moved;
        px += static_cast<int64_t>(ox);
        py += static_cast<int64_t>(oy);
        if (px <= 9 || py <= 9 || px >= laplacian->width - 9 || py >= laplacian->height - 9) {
            ++tally.leftImage;
            ox = oy = 0;
            return;
        }
    }
    ++tally.unfinished;
}

inline int yape(kelKeypoint2DF32_t* keypoints, int max, kelImage_t* gaussian, kelImage_t* laplacian, YapeTally& tally) {
    const int w = gaussian->width, h = gaussian->height;
    int count = 0;
    for (int y = 9; y < h - 9; ++y)
        for (int x = 9, next; x < w - 9; x = next) {
            const int l = s16(laplacian, x, y);
            next = l >= -19 && l <= 19 ? x + 2 : x + 1;
            bool peak = true, pit = true;
            for (int v = -1; v <= 1; ++v)
                for (int u = -1; u <= 1; ++u)
                    if (u != 0 || v != 0) {
                        peak = peak && l > s16(laplacian, x + u, y + v);
                        pit = pit && l < s16(laplacian, x + u, y + v);
                    }
            if (std::abs(l) < 31) {
                tally.weakExtremum += std::abs(l) > 19 && (peak || pit);
                continue;
            }
            if (l > 0 ? !peak : !pit)
                continue;
            const auto g = [&](int u, int v) { return static_cast<int>(u8(gaussian, x + u, y + v)); };
            const int a = g(3, 3) + g(-3, -3) - g(-3, 3) - g(3, -3), b = g(5, 0) + g(-5, 0) - g(0, -5) - g(0, 5);
            const int e = static_cast<int>(std::sqrt(static_cast<double>(b * b + 4 * a * a)));
            const int score = std::min(std::abs(l - e), std::abs(l + e));
            if (score < 26) {
                ++tally.edge;
                continue;
            }
            float ox = 0, oy = 0;
            refine(ox, oy, laplacian, x, y, tally);
            const float fx = static_cast<float>(x) + ox, fy = static_cast<float>(y) + oy;
            if (fx <= 9.0f || fx >= static_cast<float>(w - 9) || fy <= 9.0f || fy >= static_cast<float>(h - 9)) {
                tally.reset += ox != 0 || oy != 0;
                ox = oy = 0;
            }
            if (count < max)
                keypoints[count++] = {static_cast<float>(x) + ox, static_cast<float>(y) + oy, score, -1};
            else
                ++tally.dropped;
        }
    return count;
}

} // namespace kel_ref

#endif
