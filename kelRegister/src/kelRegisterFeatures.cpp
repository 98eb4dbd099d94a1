// Keypoints of all levels, the strongest of every region, and their descriptions.
#include <algorithm>
#include <array>

#include "kelRegisterDescription.h"

namespace kelRegister {

namespace {

struct Candidate {
    kelKeypoint2DF32_t point; // in pixels of the level, border included
    int level;
    float x, y; // in pixels of the picture
};

std::vector<Candidate> detect(const Pyramid& pyramid) {
    std::vector<Candidate> candidates;
    std::vector<kelKeypoint2DF32_t> points;
    for (size_t i = pyramid.firstWorking; i < pyramid.levels.size(); ++i) {
        const Level& level = pyramid.levels[i];
        points.resize(static_cast<size_t>(level.smooth->width) * level.smooth->height / 16);
        const int count = applyKelDetectorKeypointYape(points.data(), static_cast<kelValue_s32>(points.size()),
                                                       toRead(level.smooth), toRead(level.cross));
        for (int k = 0; k < count; ++k) {
            const float x = points[k].x - kBorder, y = points[k].y - kBorder;
            if (x >= 2 && y >= 2 && x <= static_cast<float>(level.width() - 3) && y <= static_cast<float>(level.height() - 3))
                candidates.push_back({points[k], static_cast<int>(i), static_cast<float>(x * level.scale + level.offset),
                                      static_cast<float>(y * level.scale + level.offset)});
        }
    }
    return candidates;
}

// Half of the room is shared evenly by a grid over the picture; the strongest of every level are taken, too, so that a picture
// four times as large is known by its coarse levels; what room is left goes to the strongest of the rest.
std::vector<Candidate> strongest(std::vector<Candidate> candidates, int width, int height, int levels, int most) {
    constexpr int kColumns = 8, kRows = 6;
    if (static_cast<int>(candidates.size()) <= most)
        return candidates;
    std::stable_sort(candidates.begin(), candidates.end(),
                     [](const Candidate& a, const Candidate& b) { return a.point.score > b.point.score; });
    const auto cellOf = [&](const Candidate& c) {
        const int column = std::min(kColumns - 1, std::max(0, static_cast<int>(c.x * kColumns / static_cast<float>(width))));
        const int row = std::min(kRows - 1, std::max(0, static_cast<int>(c.y * kRows / static_cast<float>(height))));
        return row * kColumns + column;
    };
    const int cellShare = std::max(1, most / (2 * kColumns * kRows));
    const int levelShare = std::max(1, most / 8);
    std::array<int, kColumns * kRows> ofCell{};
    std::vector<int> ofLevel(static_cast<size_t>(levels));
    std::vector<Candidate> chosen, rest;
    for (const Candidate& c : candidates) {
        const bool ofFew = ofCell[cellOf(c)]++ < cellShare, ofSmall = ofLevel[c.level]++ < levelShare;
        const bool isRoom = static_cast<int>(chosen.size()) < most; // the shares of cells and levels may come to more
        (isRoom && (ofFew || ofSmall) ? chosen : rest).push_back(c);
    }
    const ptrdiff_t room = most - static_cast<ptrdiff_t>(chosen.size());
    chosen.insert(chosen.end(), rest.begin(), rest.begin() + room);
    // Level by level, so that the gradients of one level are there at a time.
    std::stable_sort(chosen.begin(), chosen.end(), [](const Candidate& a, const Candidate& b) { return a.level < b.level; });
    return chosen;
}

} // namespace

std::vector<Feature> findFeatures(const Pyramid& pyramid, int most) {
    const std::vector<Candidate> chosen =
        strongest(detect(pyramid), pyramid.width, pyramid.height, static_cast<int>(pyramid.levels.size()), most);
    const Describer describer;
    std::vector<Feature> features;
    std::vector<float> angles;
    for (size_t i = 0; i < chosen.size();) {
        const Level& level = pyramid.levels[chosen[i].level];
        const Gradients gradients(level);
        for (const int current = chosen[i].level; i < chosen.size() && chosen[i].level == current; ++i) {
            const Candidate& c = chosen[i];
            describer.prevailingAngles(gradients, static_cast<int>(c.point.x + 0.5f), static_cast<int>(c.point.y + 0.5f),
                                       angles);
            for (const float angle : angles) {
                Feature feature{c.x, c.y, static_cast<float>(level.scale), angle, 1, 0, c.point.score, {}};
                describer.describe(gradients, c.point.x, c.point.y, angle, feature.descriptor);
                features.push_back(feature);
            }
        }
    }
    return features;
}

} // namespace kelRegister
