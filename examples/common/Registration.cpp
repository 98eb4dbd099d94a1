// The fit is the library's, in units in which its bounds of plausibility say something; the judgement is here.
#include "Registration.h"

#include <algorithm>
#include <cmath>
#include <set>
#include <utility>

namespace kel_examples {

namespace {

constexpr int kLeastInliers = 12;         // at different places
constexpr float kLeastShare = 0.10f;      // of the matches
constexpr float kReverseAgreement = 6.0f; // pixels between there and back
constexpr int kTries = 4;

// Coordinates for the fit: the origin in the middle of the picture, so that scales are judged there, and units such that the
// bound of 0.002 on the perspective is reached where the horizon comes close to the picture's corner.
struct Units {
    float centreX, centreY, scale;
    float x(float px) const { return (px - centreX) * scale; }
    float y(float py) const { return (py - centreY) * scale; }
    kelMat matrix() const { // from pixels
        kelMat T(3, 3, true);
        T.setDataIdentity(scale);
        T[0][2] = -centreX * scale;
        T[1][2] = -centreY * scale;
        T[2][2] = 1;
        return T;
    }
};

constexpr float kHorizon = 450; // units from the middle of the picture to its corner: 0.9 / 0.002

float halfDiagonal(Size size) {
    return 0.5f * std::hypot(static_cast<float>(size.width), static_cast<float>(size.height));
}

Units unitsOf(Size size, float scale) {
    return {0.5f * static_cast<float>(size.width - 1), 0.5f * static_cast<float>(size.height - 1), scale};
}

bool isFinite(const kelMat& H) {
    return std::all_of(H.m_Data, H.m_Data + 9, [](float v) { return std::isfinite(v); });
}

// The best of some robust fits; the library's search stops early at 50 inliers, so more than one try pays.
bool robustFit(kelMatCorrespH& pairs, float threshold, kelMat& H) {
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

// Inliers at different places, counted in either picture: features of several levels or angles lie upon each other.
int differentPlaces(const std::vector<Feature>& first, const std::vector<Feature>& second, const std::vector<Match>& matches,
                    const std::vector<bool>& inlier) {
    constexpr float kCell = 6;
    std::set<std::pair<int, int>> inFirst, inSecond;
    const auto cell = [](const Feature& f) {
        return std::make_pair(int(std::floor(f.x / kCell)), int(std::floor(f.y / kCell)));
    };
    for (size_t i = 0; i < matches.size(); ++i)
        if (inlier[i]) {
            inFirst.insert(cell(first[matches[i].first]));
            inSecond.insert(cell(second[matches[i].second]));
        }
    return static_cast<int>(std::min(inFirst.size(), inSecond.size()));
}

} // namespace

Registration fitHomography(const std::vector<Feature>& first, const std::vector<Feature>& second,
                           const std::vector<Match>& matches, Size firstSize, Size secondSize, float threshold) {
    Registration result;
    result.inlier.assign(matches.size(), false);
    if (static_cast<int>(matches.size()) < kLeastInliers) {
        result.refusal = "only " + std::to_string(matches.size()) + " matches";
        return result;
    }
    const float scale = kHorizon / std::max(halfDiagonal(firstSize), halfDiagonal(secondSize));
    const Units from = unitsOf(firstSize, scale), to = unitsOf(secondSize, scale);
    kelMatCorrespH pairs, reverse;
    for (const Match& match : matches) {
        const Feature &a = first[match.first], &b = second[match.second];
        pairs.add(from.x(a.x), from.y(a.y), to.x(b.x), to.y(b.y));
        reverse.add(to.x(b.x), to.y(b.y), from.x(a.x), from.y(a.y));
    }
    kelMat H, back;
    if (!robustFit(pairs, threshold * scale, H)) {
        result.refusal = "no plausible homography among " + std::to_string(matches.size()) + " matches";
        return result;
    }
    result.inliers = judgeInliers(H, pairs, result.inlier, threshold * scale);
    const int places = differentPlaces(first, second, matches, result.inlier);
    if (places < kLeastInliers || static_cast<float>(result.inliers) < kLeastShare * static_cast<float>(matches.size())) {
        result.refusal = "only " + std::to_string(places) + " places agree, of " + std::to_string(matches.size()) + " matches";
        return result;
    }
    // A fresh fit of the way back has to undo this one where the inliers are.
    if (!robustFit(reverse, threshold * scale, back)) {
        result.refusal = "the way back does not fit";
        return result;
    }
    float sum = 0;
    for (size_t i = 0; i < matches.size(); ++i)
        if (result.inlier[i]) {
            float u, v, x, y;
            H.cvtPoint(pairs.m_SrcX[i], pairs.m_SrcY[i], &u, &v);
            back.cvtPoint(u, v, &x, &y);
            sum += std::hypot(x - pairs.m_SrcX[i], y - pairs.m_SrcY[i]) / scale;
        }
    if (!(sum / static_cast<float>(result.inliers) < kReverseAgreement)) {
        result.refusal = "the way there and the way back disagree";
        return result;
    }
    result.H = to.matrix().getInversedMatrix() * H * from.matrix();
    result.H.setDataUnitize();
    return result;
}

Image warpPicture(const Image& picture, const kelMat& H, Size size) {
    kelMat back = H.getInversedMatrix(), shift(3, 3, true);
    Image result(size.width, size.height, picture->type);
    if (back.m_Width != 3)
        return clearKelImage(result.get()), std::move(result);
    if (picture->type == KEL_PIXEL_TYPE_U8G) { // the library takes grey pictures through corners: pixel 0 has its centre at 0.5
        shift.setDataIdentity(1);
        shift[0][2] = shift[1][2] = 0.5f;
        back = shift * back * shift.getInversedMatrix();
    }
    const float* const h = back.m_Data;
    rotateKelImageHomography(result.get(), picture.get(), h[0], h[1], h[2], h[3], h[4], h[5], h[6], h[7], h[8]);
    return result;
}

} // namespace kel_examples
