// Robust fits of a homography to pairs, in units of the pairs themselves, so that libkel's bounds of plausibility speak of the
// region that the pairs cover.
#include <algorithm>
#include <cmath>
#include <set>
#include <utility>

#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr int kTries = 4;       // the search ends early at 50 inliers, so more than one pays
constexpr int kLeastPairs = 5;  // of a least-squares fit
constexpr double kExtent = 330; // units within which most pairs lie: the bound of 0.002 on the perspective is 0.66 there
constexpr double kMost = 0.8;

// Coordinates of one picture: the origin at the pairs' median.
struct Units {
    double x, y, scale;
    float fromX(double px) const { return static_cast<float>((px - x) * scale); }
    float fromY(double py) const { return static_cast<float>((py - y) * scale); }
    Map from() const { return {{scale, 0, -x * scale, 0, scale, -y * scale, 0, 0, 1}}; }
    Map back() const { return {{1 / scale, 0, x, 0, 1 / scale, y, 0, 0, 1}}; }
};

double quantile(std::vector<double>& values, double share) {
    const auto at = values.begin() + static_cast<ptrdiff_t>(share * static_cast<double>(values.size() - 1));
    std::nth_element(values.begin(), at, values.end());
    return *at;
}

Units unitsOf(const std::vector<Pair>& pairs, Point Pair::*which) {
    std::vector<double> xs, ys, distances;
    for (const Pair& p : pairs) {
        xs.push_back((p.*which).x);
        ys.push_back((p.*which).y);
    }
    const double x = quantile(xs, 0.5), y = quantile(ys, 0.5);
    for (const Pair& p : pairs)
        distances.push_back(distance(p.*which, {x, y}));
    return {x, y, kExtent / std::max(1e-3, quantile(distances, kMost))};
}

bool isFinite(const kelMat& H) {
    return std::all_of(H.m_Data, H.m_Data + 9, [](float v) { return std::isfinite(v); });
}

// The pairs in units of the fit.
struct UnitPairs {
    Units first, second;
    kelMatCorrespH of(const std::vector<Pair>& pairs) const {
        kelMatCorrespH set;
        for (const Pair& p : pairs)
            set.add(first.fromX(p.first.x), first.fromY(p.first.y), second.fromX(p.second.x), second.fromY(p.second.y));
        return set;
    }
};

bool search(kelMatCorrespH& pairs, float threshold, kelMat& H) {
    int best = 0;
    for (int attempt = 0; attempt < kTries; ++attempt) {
        kelMatEstimatorH estimator;
        int inliers = 0;
        if (estimator.estimate_byRANSAC_fine(pairs, threshold, &inliers) && isFinite(estimator) && inliers > best) {
            best = inliers;
            H = estimator;
        }
    }
    return best > 0;
}

// Least squares over all that agree, with a bound that tightens.
void polish(kelMatCorrespH& pairs, float threshold, kelMat& H) {
    std::vector<bool> mask(static_cast<size_t>(pairs.m_Num));
    for (const float factor : {2.0f, 1.5f, 1.0f, 1.0f}) {
        kelMatCorrespH chosen;
        if (judgeInliers(H, pairs, mask, factor * threshold) < kLeastPairs)
            return;
        for (int i = 0; i < pairs.m_Num; ++i)
            if (mask[i])
                chosen.add(pairs.m_SrcX[i], pairs.m_SrcY[i], pairs.m_DstX[i], pairs.m_DstY[i]);
        kelMatEstimatorH estimator;
        if (!estimator.estimate_byLSM_fine(chosen) || !isFinite(estimator))
            return;
        H = estimator;
    }
}

Map mapOf(const kelMat& H) {
    Map map;
    std::copy_n(H.m_Data, 9, map.m);
    return map;
}

} // namespace

bool fitRobustly(const std::vector<Pair>& proposing, const std::vector<Pair>& polishing, Bound bound, Map& H) {
    if (static_cast<int>(proposing.size()) < kLeastPairs)
        return false;
    const UnitPairs units = {unitsOf(proposing, &Pair::first), unitsOf(proposing, &Pair::second)};
    const float threshold = static_cast<float>(std::max(bound.first * units.first.scale, bound.second * units.second.scale));
    kelMatCorrespH some = units.of(proposing), all = units.of(polishing);
    kelMat fit;
    if (!search(some, threshold, fit))
        return false;
    polish(all, threshold, fit);
    H = units.second.back() * mapOf(fit) * units.first.from();
    return true;
}

std::vector<bool> agreeing(const Map& H, const std::vector<Pair>& pairs, Bound bound) {
    const Map back = H.inverse();
    std::vector<bool> marks;
    marks.reserve(pairs.size());
    for (const Pair& p : pairs)
        marks.push_back(distance(H.at(p.first), p.second) < bound.second || distance(back.at(p.second), p.first) < bound.first);
    return marks;
}

int differentPlaces(const std::vector<Pair>& pairs, const std::vector<bool>& marked, Bound cell) {
    std::set<std::pair<int, int>> inFirst, inSecond;
    const auto cellOf = [](Point p, double size) {
        return std::make_pair(static_cast<int>(std::floor(p.x / size)), static_cast<int>(std::floor(p.y / size)));
    };
    for (size_t i = 0; i < pairs.size(); ++i)
        if (marked[i]) {
            inFirst.insert(cellOf(pairs[i].first, cell.first));
            inSecond.insert(cellOf(pairs[i].second, cell.second));
        }
    return static_cast<int>(std::min(inFirst.size(), inSecond.size()));
}

} // namespace kelRegister
