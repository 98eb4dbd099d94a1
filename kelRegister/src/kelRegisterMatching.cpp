// Nearest neighbours of descriptions, from either side, that stand out from the next place.
#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>

#include "kelRegisterKernels.h"
#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr float kClearly = 0.95f; // of the next place's distance
constexpr float kSamePlace = 6;   // pixels, or three times the larger of the features

bool isSamePlace(const Feature& a, const Feature& b) {
    const float dx = a.x - b.x, dy = a.y - b.y, reach = std::max(kSamePlace, 3 * std::max(a.scale, b.scale));
    return dx * dx + dy * dy < reach * reach;
}

// The nearest of some features, and how near the next one at another place comes.
struct Nearest {
    int index = -1;
    int distance = std::numeric_limits<int>::max();

    // `next` is kept by the caller, who compares many distances with it.
    void take(int candidate, int candidateDistance, const std::vector<Feature>& features, int& next) {
        if (candidateDistance < distance) {
            if (index >= 0 && !isSamePlace(features[candidate], features[index]))
                next = distance;
            distance = candidateDistance;
            index = candidate;
        } else if (candidateDistance < next && !isSamePlace(features[candidate], features[index])) {
            next = candidateDistance;
        }
    }
    bool standsOut(int next) const { return static_cast<float>(distance) < kClearly * static_cast<float>(next); }
};

// Descriptions side by side, zeros behind the last up to a multiple of 4.
std::vector<uint8_t> descriptionsOf(const std::vector<Feature>& features) {
    std::vector<uint8_t> all((features.size() + 3) / 4 * 4 * kDescription);
    for (size_t i = 0; i < features.size(); ++i)
        std::memcpy(all.data() + i * kDescription, features[i].descriptor, kDescription);
    return all;
}

struct Joined {
    Match match;
    int distance;
};

// Of pairs that join the same two places the nearest.
std::vector<Match> withoutRepeats(std::vector<Joined> joined, const std::vector<Feature>& first,
                                  const std::vector<Feature>& second) {
    std::stable_sort(joined.begin(), joined.end(), [](const Joined& a, const Joined& b) { return a.distance < b.distance; });
    std::vector<Match> kept;
    for (const Joined& j : joined) {
        const bool repeated = std::any_of(kept.begin(), kept.end(), [&](const Match& k) {
            return isSamePlace(first[j.match.first], first[k.first]) && isSamePlace(second[j.match.second], second[k.second]);
        });
        if (!repeated)
            kept.push_back(j.match);
    }
    return kept;
}

} // namespace

std::vector<Match> matchFeatures(const std::vector<Feature>& first, const std::vector<Feature>& second) {
    constexpr int kBlock = 64; // descriptions that are compared before the bound is taken anew
    constexpr int kFar = std::numeric_limits<int>::max();
    const Kernels& k = kernels();
    const std::vector<uint8_t> ofFirst = descriptionsOf(first), ofSecond = descriptionsOf(second);
    const int count = static_cast<int>(second.size()), padded = (count + 3) / 4 * 4;
    std::vector<Nearest> nearestSecond(first.size()), nearestFirst(second.size());
    std::vector<int> nextFirst(static_cast<size_t>(padded), kFar), nextSecond(first.size(), kFar);
    int found[kBlock], sums[kBlock];
    for (int i = 0; i < static_cast<int>(first.size()); ++i)
        for (int begin = 0; begin < padded; begin += kBlock) {
            const int n = k.differences(found, sums, ofFirst.data() + static_cast<ptrdiff_t>(i) * kDescription,
                                        ofSecond.data() + static_cast<ptrdiff_t>(begin) * kDescription,
                                        nextFirst.data() + begin, nextSecond[i], std::min(kBlock, padded - begin));
            for (int f = 0; f < n && begin + found[f] < count; ++f) {
                const int j = begin + found[f], distance = sums[found[f]];
                nearestSecond[i].take(j, distance, second, nextSecond[i]);
                nearestFirst[j].take(i, distance, first, nextFirst[j]);
            }
        }
    std::vector<Joined> joined;
    for (int i = 0; i < static_cast<int>(first.size()); ++i) {
        const Nearest& nearest = nearestSecond[i];
        if (nearest.index >= 0 && nearestFirst[nearest.index].index == i && nearest.standsOut(nextSecond[i]) &&
            nearestFirst[nearest.index].standsOut(nextFirst[nearest.index]))
            joined.push_back({{i, nearest.index, false}, nearest.distance});
    }
    return withoutRepeats(std::move(joined), first, second);
}

} // namespace kelRegister
