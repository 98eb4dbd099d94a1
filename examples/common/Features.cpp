// The pyramid is the library's: border, 7x7 smoothing with halving, cross response, detector. Description and matching are here.
#include "Features.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <emmintrin.h>
#include <kel/kelImage.h>
#include <limits>

namespace kel_examples {

namespace {

constexpr float kPi = 3.14159265f;
constexpr int kBorder = 32;        // of every level, so that no neighbourhood leaves it
constexpr int kSmallestLevel = 40; // pixels on the shorter side
constexpr int kMostOctaves = 4;

// One level: smoothed, with a border all round, and its cross response. Level pixel p is picture pixel (p + 0.5) * scale - 0.5
// for the chain in between, p * scale for the main chain: p * scale + offset.
struct Level {
    Image smooth, cross;
    float scale, offset;
};

// The level of `image` and the image for the next one, half as large.
Level makeLevel(const Image& image, float scale, float offset, Image& next) {
    const int width = image->width + 2 * kBorder, height = image->height + 2 * kBorder;
    Level level{Image(width, height, KEL_PIXEL_TYPE_U8G), Image(width, height, KEL_PIXEL_TYPE_S16G), scale, offset};
    Image scratch(width, height, KEL_PIXEL_TYPE_U8G);
    Image half((width + 1) / 2, (height + 1) / 2, KEL_PIXEL_TYPE_U8G);
    clearKelImage(scratch.get());
    clearKelImage(level.cross.get());
    clearKelImage(half.get());
    clearKelImage(level.smooth.get());
    resizeKelImageEnborder(level.smooth.get(), image.get(), kBorder);
    applyKelFilterGaussian7X7_downsampling(level.smooth.get(), half.get(), level.smooth.get(), scratch.get());
    applyKelFilterLaplacian3X3(level.cross.get(), level.smooth.get());
    next = Image(half->width - kBorder, half->height - kBorder, KEL_PIXEL_TYPE_U8G);
    resizeKelImageDeborder(next.get(), half.get(), kBorder / 2);
    return level;
}

void addChain(std::vector<Level>& levels, Image image, float scale, float offset) {
    for (int octave = 0; octave < kMostOctaves && std::min(image->width, image->height) >= kSmallestLevel; ++octave) {
        Image next;
        levels.push_back(makeLevel(image, scale, offset, next));
        image = std::move(next);
        scale *= 2;
    }
}

// Two chains of halves: from the picture, and from its first smoothed level reduced by the square root of 2.
std::vector<Level> makePyramid(const Image& grey) {
    Image stretched(grey->width, grey->height, KEL_PIXEL_TYPE_U8G);
    adjustKelImage(stretched.get(), grey.get());
    std::vector<Level> levels;
    addChain(levels, stretched.clone(), 1, 0);
    if (levels.empty())
        return levels;
    const float root = std::sqrt(2.0f);
    Image between(static_cast<int>(grey->width / root), static_cast<int>(grey->height / root), KEL_PIXEL_TYPE_U8G);
    rotateKelImageHomography(between.get(), levels[0].smooth.get(), root, 0, kBorder, 0, root, kBorder, 0, 0, 1);
    // Pixel centres map to pixel centres at p * root + (root - 1) / 2; halving keeps even pixels, and so the offset.
    addChain(levels, std::move(between), root, (root - 1) / 2);
    return levels;
}

// ---- description ------------------------------------------------------------------------------------------------------------

// Angle of (x, y) to about 0.3 degrees, as bins of a full circle of `bins`.
float angleBin(float x, float y, float bins) {
    const float ax = std::fabs(x), ay = std::fabs(y), longer = std::max(ax, ay) + 1e-9f, ratio = std::min(ax, ay) / longer;
    float turn = ratio * (0.1591549f + ratio * (0.0388f - 0.0729f * ratio)); // arctangent in turns, ratio in 0..1
    if (ay > ax)
        turn = 0.25f - turn;
    if (x < 0)
        turn = 0.5f - turn;
    if (y < 0)
        turn = 1 - turn;
    return turn * bins;
}

struct Sample {
    int dx, dy;
    float weight;
};

// A disc of samples with a Gaussian weight.
std::vector<Sample> disc(int radius, float sigma) {
    std::vector<Sample> samples;
    for (int dy = -radius; dy <= radius; ++dy)
        for (int dx = -radius; dx <= radius; ++dx)
            if (dx * dx + dy * dy <= radius * radius)
                samples.push_back({dx, dy, std::exp(-0.5f * static_cast<float>(dx * dx + dy * dy) / (sigma * sigma))});
    return samples;
}

// The prevailing gradient directions round a pixel: the highest peak of a histogram and any other that comes near it.
void prevailingAngles(const kelImage_t* image, int x, int y, std::vector<float>& angles) {
    static const std::vector<Sample> samples = disc(11, 5.5f);
    constexpr int kBins = 36;
    float histogram[kBins + 1] = {}, smooth[kBins];
    const int step = image->step;
    const uint8_t* const centre = image->data + static_cast<ptrdiff_t>(y) * step + x;
    for (const Sample& s : samples) {
        const uint8_t* const p = centre + s.dy * step + s.dx;
        const float gx = static_cast<float>(p[1] - p[-1]), gy = static_cast<float>(p[step] - p[-step]);
        const int bin = static_cast<int>(angleBin(gx, gy, kBins));
        histogram[std::min(bin, kBins)] += s.weight * std::sqrt(gx * gx + gy * gy);
    }
    histogram[0] += histogram[kBins];
    for (int i = 0; i < kBins; ++i)
        smooth[i] = (histogram[(i + kBins - 2) % kBins] + histogram[(i + 2) % kBins]) +
                    4 * (histogram[(i + kBins - 1) % kBins] + histogram[(i + 1) % kBins]) + 6 * histogram[i];
    const float peak = *std::max_element(smooth, smooth + kBins);
    angles.clear();
    for (int i = 0; i < kBins; ++i) {
        const float left = smooth[(i + kBins - 1) % kBins], middle = smooth[i], right = smooth[(i + 1) % kBins];
        if (middle >= 0.85f * peak && middle > left && middle >= right) {
            const float shift = 0.5f * (left - right) / (left - 2 * middle + right);
            angles.push_back((static_cast<float>(i) + 0.5f + shift) * (2 * kPi / kBins));
        }
    }
}

// 4 x 4 cells of 8 directions over a rotated square of 32 pixels: the brightness is sampled on a rotated grid, two pixels
// apart, and each gradient is shared between the two nearest directions and the four nearest cells.
void describe(const kelImage_t* image, float x, float y, float angle, uint8_t* descriptor) {
    constexpr int kSide = 16, kGrid = kSide + 2, kCells = 4, kDirections = 8;
    constexpr float kSpacing = 2.0f;
    const float c = std::cos(angle) * kSpacing, s = std::sin(angle) * kSpacing;
    float grid[kGrid][kGrid];
    for (int j = 0; j < kGrid; ++j)
        for (int i = 0; i < kGrid; ++i) {
            const float u = static_cast<float>(i) - (kGrid - 1) / 2.0f, v = static_cast<float>(j) - (kGrid - 1) / 2.0f;
            const float px = x + c * u - s * v, py = y + s * u + c * v;
            const int ix = static_cast<int>(px), iy = static_cast<int>(py);
            const float fx = px - static_cast<float>(ix), fy = py - static_cast<float>(iy);
            const uint8_t* const p = image->data + static_cast<ptrdiff_t>(iy) * image->step + ix;
            const float top = p[0] + fx * static_cast<float>(p[1] - p[0]);
            const float bottom = p[image->step] + fx * static_cast<float>(p[image->step + 1] - p[image->step]);
            grid[j][i] = top + fy * (bottom - top);
        }

    // One cell more on every side takes what falls outside.
    float cells[kCells + 2][kCells + 2][kDirections + 1] = {};
    for (int j = 0; j < kSide; ++j)
        for (int i = 0; i < kSide; ++i) {
            const float gx = grid[j + 1][i + 2] - grid[j + 1][i], gy = grid[j + 2][i + 1] - grid[j][i + 1];
            const float u = (static_cast<float>(i) - 7.5f) / 8, v = (static_cast<float>(j) - 7.5f) / 8;
            const float strength = std::sqrt(gx * gx + gy * gy) * (1 - 0.3f * (u * u + v * v));
            const float direction = std::min(angleBin(gx, gy, kDirections), kDirections - 1e-3f);
            const int d = static_cast<int>(direction);
            const float fd = direction - static_cast<float>(d);
            const float cx = (static_cast<float>(i) + 2.5f) / 4, cy = (static_cast<float>(j) + 2.5f) / 4; // 0.625 .. 4.375
            const int ix = static_cast<int>(cx), iy = static_cast<int>(cy);
            const float fx = cx - static_cast<float>(ix), fy = cy - static_cast<float>(iy);
            for (int dy = 0; dy < 2; ++dy)
                for (int dx = 0; dx < 2; ++dx) {
                    const float share = strength * (dx ? fx : 1 - fx) * (dy ? fy : 1 - fy);
                    cells[iy + dy][ix + dx][d] += share * (1 - fd);
                    cells[iy + dy][ix + dx][d + 1] += share * fd;
                }
        }

    // Roots of the shares of the whole: differences of weak directions count as much as those of strong ones.
    float sum = 1e-6f;
    for (int j = 1; j <= kCells; ++j)
        for (int i = 1; i <= kCells; ++i) {
            cells[j][i][0] += cells[j][i][kDirections];
            for (int d = 0; d < kDirections; ++d)
                sum += cells[j][i][d];
        }
    for (int j = 1; j <= kCells; ++j)
        for (int i = 1; i <= kCells; ++i)
            for (int d = 0; d < kDirections; ++d)
                *descriptor++ = static_cast<uint8_t>(std::min(255.0f, 600 * std::sqrt(cells[j][i][d] / sum)));
}

// ---- selection --------------------------------------------------------------------------------------------------------------

struct Candidate {
    kelKeypoint2DF32_t point; // in pixels of the level, border included
    int level;
    float x, y; // in pixels of the picture
};

std::vector<Candidate> detect(std::vector<Level>& levels) {
    std::vector<Candidate> candidates;
    std::vector<kelKeypoint2DF32_t> points;
    for (size_t i = 0; i < levels.size(); ++i) {
        Level& level = levels[i];
        const int width = level.smooth->width - 2 * kBorder, height = level.smooth->height - 2 * kBorder;
        points.resize(static_cast<size_t>(level.smooth->width) * level.smooth->height / 16);
        const int count = applyKelDetectorKeypointYape(points.data(), static_cast<kelValue_s32>(points.size()),
                                                       level.smooth.get(), level.cross.get());
        for (int k = 0; k < count; ++k) {
            const float x = points[k].x - kBorder, y = points[k].y - kBorder;
            if (x >= 2 && y >= 2 && x <= static_cast<float>(width - 3) && y <= static_cast<float>(height - 3))
                candidates.push_back(
                    {points[k], static_cast<int>(i), x * level.scale + level.offset, y * level.scale + level.offset});
        }
    }
    return candidates;
}

// The strongest of every cell of a grid over the picture.
std::vector<Candidate> strongest(std::vector<Candidate> candidates, int width, int height, int most) {
    constexpr int kColumns = 8, kRows = 6;
    if (static_cast<int>(candidates.size()) <= most)
        return candidates;
    std::stable_sort(candidates.begin(), candidates.end(),
                     [](const Candidate& a, const Candidate& b) { return a.point.score > b.point.score; });
    const auto cellOf = [&](const Candidate& c) {
        const int column = std::clamp(static_cast<int>(c.x * kColumns / static_cast<float>(width)), 0, kColumns - 1);
        const int row = std::clamp(static_cast<int>(c.y * kRows / static_cast<float>(height)), 0, kRows - 1);
        return row * kColumns + column;
    };
    // Half of the room is shared evenly, the other half goes to the strongest of the rest.
    const int share = std::max(1, most / (2 * kColumns * kRows));
    std::array<int, kColumns * kRows> taken{};
    std::vector<Candidate> chosen, rest;
    for (const Candidate& c : candidates)
        (taken[cellOf(c)]++ < share ? chosen : rest).push_back(c);
    const size_t room = static_cast<size_t>(std::max(0, most - static_cast<int>(chosen.size())));
    chosen.insert(chosen.end(), rest.begin(), rest.begin() + static_cast<ptrdiff_t>(std::min(room, rest.size())));
    return chosen;
}

// ---- matching ---------------------------------------------------------------------------------------------------------------

int distance(const uint8_t* a, const uint8_t* b) {
    __m128i sum = _mm_setzero_si128();
    for (int i = 0; i < Feature::kLength; i += 16)
        sum = _mm_add_epi32(sum, _mm_sad_epu8(_mm_load_si128(reinterpret_cast<const __m128i*>(a + i)),
                                              _mm_load_si128(reinterpret_cast<const __m128i*>(b + i))));
    return _mm_cvtsi128_si32(sum) + _mm_extract_epi16(sum, 4);
}

struct Best {
    int index = -1;
    int distance = std::numeric_limits<int>::max(), next = std::numeric_limits<int>::max();

    // `next` is the best at another place: neighbours of the best one are other views of the same.
    void take(int candidate, int candidateDistance, const std::vector<Feature>& features) {
        constexpr float kSamePlace = 6;
        const auto samePlace = [&] {
            const float dx = features[candidate].x - features[index].x, dy = features[candidate].y - features[index].y;
            return dx * dx + dy * dy < kSamePlace * kSamePlace;
        };
        if (candidateDistance < distance) {
            if (index >= 0 && !samePlace())
                next = distance;
            distance = candidateDistance;
            index = candidate;
        } else if (candidateDistance < next && !samePlace()) {
            next = candidateDistance;
        }
    }
};

} // namespace

std::vector<Feature> findFeatures(const Image& grey, int most) {
    std::vector<Level> levels = makePyramid(grey);
    std::vector<Feature> features;
    std::vector<float> angles;
    for (const Candidate& c : strongest(detect(levels), grey->width, grey->height, most)) {
        const Level& level = levels[c.level];
        prevailingAngles(level.smooth.get(), static_cast<int>(c.point.x + 0.5f), static_cast<int>(c.point.y + 0.5f), angles);
        for (float angle : angles) {
            Feature feature{c.x, c.y, level.scale, angle, c.point.score, {}};
            describe(level.smooth.get(), c.point.x, c.point.y, angle, feature.descriptor);
            features.push_back(feature);
        }
    }
    return features;
}

std::vector<Match> matchFeatures(const std::vector<Feature>& first, const std::vector<Feature>& second) {
    constexpr float kClearly = 0.88f; // of the next place's distance
    std::vector<Best> ofFirst(first.size()), ofSecond(second.size());
    for (int i = 0; i < static_cast<int>(first.size()); ++i)
        for (int j = 0; j < static_cast<int>(second.size()); ++j) {
            const int d = distance(first[i].descriptor, second[j].descriptor);
            if (d < ofFirst[i].next)
                ofFirst[i].take(j, d, second);
            if (d < ofSecond[j].distance) {
                ofSecond[j].distance = d;
                ofSecond[j].index = i;
            }
        }
    std::vector<Match> matches;
    for (int i = 0; i < static_cast<int>(first.size()); ++i) {
        const Best& best = ofFirst[i];
        if (best.index >= 0 && ofSecond[best.index].index == i &&
            static_cast<float>(best.distance) < kClearly * static_cast<float>(best.next))
            matches.push_back({i, best.index});
    }
    return matches;
}

} // namespace kel_examples
