// How far a homography holds away from the pairs that it was fitted to: its covariance, carried to the rest of the picture.
#include <algorithm>
#include <cmath>
#include <limits>

#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr int kUnknowns = 8;        // the elements of a homography whose last is 1
constexpr int kGrid = 16;           // points either way at which the error is expected
constexpr double kLeastNoise = 0.3; // pixels of the second picture: residuals of few pairs may be small by chance

// How the place of a point moves with each unknown.
struct Derivative {
    double x[kUnknowns], y[kUnknowns];
    Derivative(const Map& H, Point p) {
        const Point to = H.at(p);
        const double w = H.weight(p), u = p.x / w, v = p.y / w, one = 1 / w;
        const double ofX[kUnknowns] = {u, v, one, 0, 0, 0, -to.x * u, -to.x * v};
        const double ofY[kUnknowns] = {0, 0, 0, u, v, one, -to.y * u, -to.y * v};
        std::copy_n(ofX, kUnknowns, x);
        std::copy_n(ofY, kUnknowns, y);
    }
};

// The lower factor of the moments' Cholesky decomposition. False where the pairs leave an unknown open.
struct Factor {
    double l[kUnknowns][kUnknowns] = {};

    void add(const double* row) {
        for (int r = 0; r < kUnknowns; ++r)
            for (int c = 0; c <= r; ++c)
                l[r][c] += row[r] * row[c];
    }
    bool decompose() {
        for (int r = 0; r < kUnknowns; ++r)
            for (int c = 0; c <= r; ++c) {
                double sum = l[r][c];
                for (int k = 0; k < c; ++k)
                    sum -= l[r][k] * l[c][k];
                if (r == c && !(sum > 0))
                    return false;
                l[r][c] = r == c ? std::sqrt(sum) : sum / l[c][c];
            }
        return true;
    }
    // row (L L^T)^-1 row^T
    double form(const double* row) const {
        double solved[kUnknowns], sum = 0;
        for (int r = 0; r < kUnknowns; ++r) {
            double value = row[r];
            for (int k = 0; k < r; ++k)
                value -= l[r][k] * solved[k];
            solved[r] = value / l[r][r];
            sum += solved[r] * solved[r];
        }
        return sum;
    }
};

// The middle of the first points, and their extent.
Map unitsOf(const std::vector<Pair>& pairs) {
    double x = 0, y = 0, extent = 1e-3;
    const double n = static_cast<double>(pairs.size());
    for (const Pair& p : pairs) {
        x += p.first.x / n;
        y += p.first.y / n;
    }
    for (const Pair& p : pairs)
        extent = std::max(extent, distance(p.first, {x, y}));
    return {{extent, 0, x, 0, extent, y, 0, 0, 1}};
}

} // namespace

double expectedError(const Map& H, const std::vector<Pair>& pairs, const Pyramid& first, const Pyramid& second) {
    constexpr double kNone = std::numeric_limits<double>::infinity();
    if (2 * pairs.size() <= kUnknowns)
        return kNone;
    // In units of the first points the moments are well conditioned; the last element is 1 in the points' middle.
    const Map units = unitsOf(pairs), back = units.inverse();
    Map inUnits = H * units;
    for (double& value : inUnits.m)
        value /= (H * units).m[8];
    Factor factor;
    double squares = 0;
    for (const Pair& pair : pairs) {
        const Point from = back.at(pair.first), to = inUnits.at(from);
        const Derivative derivative(inUnits, from);
        factor.add(derivative.x);
        factor.add(derivative.y);
        squares += (to.x - pair.second.x) * (to.x - pair.second.x) + (to.y - pair.second.y) * (to.y - pair.second.y);
    }
    if (!factor.decompose())
        return kNone;
    const double noise = std::max(kLeastNoise * kLeastNoise, squares / static_cast<double>(2 * pairs.size() - kUnknowns));
    double sum = 0;
    int count = 0;
    for (int j = 0; j <= kGrid; ++j)
        for (int i = 0; i <= kGrid; ++i) {
            const Point p = {i * (first.width - 1.0) / kGrid, j * (first.height - 1.0) / kGrid}, to = H.at(p);
            if (!(to.x >= 0 && to.y >= 0 && to.x < second.width && to.y < second.height))
                continue;
            const Derivative derivative(inUnits, back.at(p));
            sum += noise * (factor.form(derivative.x) + factor.form(derivative.y));
            ++count;
        }
    return count ? std::sqrt(sum / count) : kNone;
}

} // namespace kelRegister
