// Matches whose neighbours move as their own two frames say.
#include <cmath>

#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr int kWitnesses = 2;
constexpr double kShare = 0.15; // of the predicted distance

// The plane about a feature: columns are where its unit axes come to lie in the picture.
struct Frame {
    double a, b, c, d;
    explicit Frame(const Feature& f) {
        const double cosine = std::cos(f.angle) * f.scale, sine = std::sin(f.angle) * f.scale;
        // R diag(s, 1) R^-1 is 1 + (s - 1) n n^T with n along the squeeze.
        const double nx = std::cos(f.direction), ny = std::sin(f.direction), more = f.squeeze - 1;
        const double along = more * (nx * cosine + ny * sine), across = more * (ny * cosine - nx * sine);
        a = cosine + along * nx;
        b = -sine + across * nx;
        c = sine + along * ny;
        d = cosine + across * ny;
    }
};

// From the first picture to the second about a match, and what of it a comparison of two needs.
struct Prediction {
    double a, b, c, d, x1, y1, x2, y2;
    Prediction(const Feature& first, const Feature& second) : x1(first.x), y1(first.y), x2(second.x), y2(second.y) {
        const Frame p(first), q(second);
        const double determinant = p.a * p.d - p.b * p.c;
        a = (q.a * p.d - q.b * p.c) / determinant;
        b = (q.b * p.a - q.a * p.b) / determinant;
        c = (q.c * p.d - q.d * p.c) / determinant;
        d = (q.d * p.a - q.c * p.b) / determinant;
    }
    bool fits(const Prediction& other, double slack) const {
        const double dx = other.x1 - x1, dy = other.y1 - y1;
        const double px = a * dx + b * dy, py = c * dx + d * dy;
        const double allowed = kShare * std::sqrt(px * px + py * py) + slack;
        const double ex = other.x2 - x2 - px, ey = other.y2 - y2 - py;
        return ex * ex + ey * ey < allowed * allowed;
    }
};

} // namespace

std::vector<bool> supported(const std::vector<Feature>& first, const std::vector<Feature>& second,
                            const std::vector<Match>& matches, double reach, double slack) {
    std::vector<Prediction> predictions;
    predictions.reserve(matches.size());
    for (const Match& match : matches)
        predictions.emplace_back(first[match.first], second[match.second]);
    std::vector<bool> marks(matches.size());
    for (size_t i = 0; i < predictions.size(); ++i) {
        const Prediction& own = predictions[i];
        int witnesses = 0;
        for (size_t j = 0; j < predictions.size() && witnesses < kWitnesses; ++j) {
            const double dx = predictions[j].x1 - own.x1, dy = predictions[j].y1 - own.y1;
            witnesses += j != i && dx * dx + dy * dy < reach * reach && own.fits(predictions[j], slack);
        }
        marks[i] = witnesses >= kWitnesses;
    }
    return marks;
}

} // namespace kelRegister
