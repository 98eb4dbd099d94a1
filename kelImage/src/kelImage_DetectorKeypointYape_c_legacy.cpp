// YAPE keypoints: local extrema of the cross response that are strong, not edge-like, and refined to a fraction of a pixel.
// Rests on the row helpers; a kernel finds the few columns of a row that can be extrema at all.
#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "kelImage_Kernels.h"
#include "kelImage_Private.h"

namespace {

constexpr kelValue_s32 kBorder = 9; // pixels nearer to an edge are never examined
constexpr int kWeak = 19;           // up to here the scan steps over the next column
constexpr int kStrong = 31;         // from here an extremum counts
constexpr int kLeastScore = 26;
constexpr int kRounds = 5;          // of the refinement
constexpr kelValue_s32 kBlock = 64; // columns of a mask

struct Offset {
    float x, y;
};

// A candidate is beyond its four direct neighbours already; an extremum is beyond the diagonal ones, too.
bool isExtremum(const int16_t* r, ptrdiff_t step) {
    const int here = *r, a = r[-step - 1], b = r[-step + 1], c = r[step - 1], d = r[step + 1];
    const bool peak = here > std::max({a, b, c, d}), pit = here < std::min({a, b, c, d});
    return (peak & (here > 0)) | (pit & (here < 0));
}

// The scan starts at kBorder, and after a weak column it steps over the next one: an extremum there is missed, and callers
// rely on it. So a strong column is examined exactly where an even number of weak ones stands right before it.
bool isExamined(const int16_t* row, kelValue_s32 x) {
    kelValue_s32 first = x;
    while (first > kBorder && std::abs(row[first - 1]) <= kWeak)
        --first;
    return (x - first) % 2 == 0;
}

// The response plays the trace of a curvature matrix, `edge` the difference of its eigenvalues: what is left is the weaker one.
int score(const uint8_t* g, ptrdiff_t step, int response) {
    const int a = g[3 * step + 3] + g[-3 * step - 3] - g[3 * step - 3] - g[-3 * step + 3];
    const int b = g[5] + g[-5] - g[-5 * step] - g[5 * step];
    const int edge = static_cast<int>(std::sqrt(static_cast<double>(b * b + 4 * a * a)));
    return std::min(std::abs(response - edge), std::abs(response + edge));
}

// One Newton step to the extremum of the quadratic through the 3x3 responses around r, in single precision.
Offset newtonStep(const int16_t* r, ptrdiff_t step) {
    const float dx = static_cast<float>(r[1] - r[-1]) * 0.5f;
    const float dy = static_cast<float>(r[step] - r[-step]) * 0.5f;
    const float dxx = static_cast<float>(r[-1] + r[1] - 2 * r[0]);
    const float dyy = static_cast<float>(r[-step] + r[step] - 2 * r[0]);
    const float dxy = static_cast<float>(r[step + 1] - r[step - 1] - r[-step + 1] + r[-step - 1]) * 0.25f;
    const float determinant = dxx * dyy - dxy * dxy;
    const float k = determinant != 0 ? -1 / determinant : -0.0f;
    return {(dyy * dx - dxy * dy) * k, (dxx * dy - dxy * dx) * k};
}

// Truncates; beyond 32 bits, and for NaN, the result is the least integer, which lies outside every image.
int64_t truncated(float value) {
    return std::abs(value) < 2147483648.0f ? static_cast<int64_t>(value) : INT32_MIN;
}

bool isInside(int64_t x, int64_t y, const kelImage_t* image) {
    return x > kBorder && y > kBorder && x < image->width - kBorder && y < image->height - kBorder;
}

Offset refine(const kelImage_t* laplacian, kelValue_s32 x, kelValue_s32 y) {
    Offset offset{0, 0};
    int64_t px = x, py = y;
    for (int round = 0; round < kRounds; ++round) {
        offset = newtonStep(kel::row<int16_t>(laplacian, static_cast<kelValue_s32>(py)) + px, laplacian->step);
        if (std::abs(offset.x) < 0.5f && std::abs(offset.y) < 0.5f)
            break;
        px += truncated(offset.x);
        py += truncated(offset.y);
        if (!isInside(px, py, laplacian))
            return {0, 0};
    }
    return offset;
}

// The last step goes onto the pixel itself, not onto where the refinement had moved: callers rely on it.
kelKeypoint2DF32_t keypointAt(const kelImage_t* laplacian, kelValue_s32 x, kelValue_s32 y, int score) {
    const Offset offset = refine(laplacian, x, y);
    const float fx = static_cast<float>(x), fy = static_cast<float>(y), least = static_cast<float>(kBorder);
    const float fine[] = {fx + offset.x, fy + offset.y};
    if (fine[0] <= least || fine[0] >= static_cast<float>(laplacian->width - kBorder) || fine[1] <= least ||
        fine[1] >= static_cast<float>(laplacian->height - kBorder))
        return {fx, fy, score, -1};
    return {fine[0], fine[1], score, -1};
}

// The scan of one pair of images: what it reads, where its records go, and the candidates of a row that are still to be judged.
class Scan {
public:
    Scan(const kelImage_t* gaussian, const kelImage_t* laplacian, kelKeypoint2DF32_t* keypoints, kelValue_s32 max)
        : m_gaussian(gaussian), m_laplacian(laplacian), m_keypoints(keypoints), m_max(max) {}

    // Masks at the end of a row read on into the rows below, of which there are enough.
    void row(kelValue_s32 y) {
        const int16_t* const response = kel::row<int16_t>(m_laplacian, y);
        const kelValue_s32 end = kel::lessReach(m_laplacian->width, kBorder);
        for (kelValue_s32 first = kBorder; first < end; first += kMasks * kBlock) {
            uint64_t masks[kMasks];
            const kelValue_s32 count = std::min((end - first + kBlock - 1) / kBlock, kMasks);
            m_kernels.extremaMasks(masks, response + first, m_laplacian->step, count, kStrong);
            for (kelValue_s32 i = 0; i < count; ++i)
                take(y, first + i * kBlock, end, masks[i]);
        }
        judge(y);
    }
    kelValue_s32 count() const { return m_count; }

private:
    void take(kelValue_s32 y, kelValue_s32 block, kelValue_s32 end, uint64_t mask) {
        if (end - block < kBlock) // columns behind the last may be padding, whose bytes are anyone's
            mask &= (uint64_t(1) << (end - block)) - 1;
        for (; mask != 0; mask &= mask - 1)
            m_columns[m_pending++] = block + __builtin_ctzll(mask);
        if (m_pending > kCapacity - kBlock)
            judge(y);
    }

    // Most candidates fail and none can be predicted, so the failing ones are overwritten instead of branched around.
    __attribute__((noinline)) void judge(kelValue_s32 y) {
        const int16_t* const response = kel::row<int16_t>(m_laplacian, y);
        const uint8_t* const grey = kel::row<uint8_t>(m_gaussian, y);
        int kept = 0, strengths[kCapacity];
        for (int i = 0; i < m_pending; ++i) {
            const kelValue_s32 x = m_columns[i];
            const int strength = score(grey + x, m_gaussian->step, response[x]);
            m_columns[kept] = x;
            strengths[kept] = strength;
            kept += (strength >= kLeastScore) & isExtremum(response + x, m_laplacian->step);
        }
        m_pending = 0;
        for (int i = 0; i < kept; ++i)
            if (isExamined(response, m_columns[i]) && m_count < m_max)
                m_keypoints[m_count++] = keypointAt(m_laplacian, m_columns[i], y, strengths[i]);
    }

    static constexpr int kCapacity = 128;
    static constexpr kelValue_s32 kMasks = 8; // at a time
    const kel::Kernels& m_kernels = kel::kernels();
    const kelImage_t* const m_gaussian;
    const kelImage_t* const m_laplacian;
    kelKeypoint2DF32_t* const m_keypoints;
    const kelValue_s32 m_max;
    kelValue_s32 m_count = 0;
    int m_pending = 0;
    kelValue_s32 m_columns[kCapacity];
};

} // namespace

extern "C" kelValue_s32 applyKelDetectorKeypointYape(kelKeypoint2DF32_t* keypoints, kelValue_s32 max, kelImage_t* gaussian,
                                                     kelImage_t* laplacian) {
    KEL_ASSERT(gaussian->width == laplacian->width && gaussian->height == laplacian->height);
    if (gaussian->type != KEL_PIXEL_TYPE_U8G)
        return 0;
    Scan scan(gaussian, laplacian, keypoints, max);
    for (kelValue_s32 y = kBorder; y < kel::lessReach(gaussian->height, kBorder); ++y)
        scan.row(y);
    return scan.count();
}
