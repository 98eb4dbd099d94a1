// Refinement by the pictures: patches of the finer one, brought to scale and shape of the coarser one by the homography, are
// looked for in the coarser one, and the homography is fitted anew to where they are found.
#include <algorithm>
#include <cmath>

#include "kelRegisterKernels.h"
#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr int kReachCoarse = 6, kReachFine = 5; // level pixels either way
constexpr int kMostReach = 6;
constexpr int kRounds = 4;
constexpr double kEnough = 0.7;       // share of the patches from which another round is not needed
constexpr double kBlurredShare = 0.5; // that two of different sharpness have to reach at half size
constexpr double kNearlyAsMany = 0.8; // of the share before, at which a finer pass counts: it is more exact
constexpr double kAlike = 0.75;       // least correlation
constexpr double kRepeated = 0.9;     // of its correlation, from which a patch is alike to another place
constexpr double kManyOthers = 0.1;   // share of the other places to which a patch of a repeating texture is alike
constexpr int kMostRepeating = 48;    // patches that are compared with each other's places
constexpr double kLeastSpread = 2;    // standard deviation, in grey values, below which a patch says nothing
constexpr double kPlace = 6;          // pixels of a working picture between places
constexpr int kFraction = 16;         // steps of a grey value in a patch

constexpr int kPixels = kPatch * kPatch;

// A patch without its mean, in 1/kFraction.
struct Patch {
    alignas(32) int16_t values[kPixels];
    double norm; // root of the sum of squares
};

// From pixels of one level, border included, to those of another.
Map betweenLevels(const Level& from, const Level& to, const Map& H) {
    const Map start = {
        {from.scale, 0, from.offset - kBorder * from.scale, 0, from.scale, from.offset - kBorder * from.scale, 0, 0, 1}};
    const double s = 1 / to.scale, t = kBorder - to.offset / to.scale;
    return Map{{s, 0, t, 0, s, t, 0, 0, 1}} * H * start;
}

// Whether a square from (x, y) on lies inside the level's picture altogether when it is mapped.
bool liesInside(const Map& map, int x, int y, const Level& level) {
    const double middle = map.weight({x + 7.5, y + 7.5});
    for (int corner = 0; corner < 4; ++corner) {
        const Point c = {static_cast<double>(x + (corner & 1) * (kPatch - 1)),
                         static_cast<double>(y + (corner >> 1) * (kPatch - 1))};
        const Point p = map.at(c);
        if (!(map.weight(c) * middle > 0 && p.x >= kBorder && p.y >= kBorder && p.x < kBorder + level.width() - 1 &&
              p.y < kBorder + level.height() - 1))
            return false;
    }
    return true;
}

// Samples a level between its pixels at the mapped places of a square. False where it holds nothing to go by.
bool samplePatch(const Map& map, int left, int top, const Level& level, Patch& patch) {
    const kelImage_t* const image = level.smooth.get();
    const ptrdiff_t step = image->step;
    int sum = 0;
    for (int j = 0; j < kPatch; ++j) {
        const double y = top + j;
        const float x0 = static_cast<float>(map.m[0] * left + map.m[1] * y + map.m[2]), dx = static_cast<float>(map.m[0]);
        const float y0 = static_cast<float>(map.m[3] * left + map.m[4] * y + map.m[5]), dy = static_cast<float>(map.m[3]);
        const float w0 = static_cast<float>(map.m[6] * left + map.m[7] * y + map.m[8]), dw = static_cast<float>(map.m[6]);
        for (int i = 0; i < kPatch; ++i) {
            const float k = static_cast<float>(i), w = 1 / (w0 + k * dw), px = (x0 + k * dx) * w, py = (y0 + k * dy) * w;
            const int ix = static_cast<int>(px), iy = static_cast<int>(py);
            const float fx = px - static_cast<float>(ix), fy = py - static_cast<float>(iy);
            const uint8_t* const p = image->data + iy * step + ix;
            const float above = static_cast<float>(p[0]) + fx * static_cast<float>(p[1] - p[0]);
            const float below = static_cast<float>(p[step]) + fx * static_cast<float>(p[step + 1] - p[step]);
            const int value = static_cast<int>(kFraction * (above + fy * (below - above)) + 0.5f);
            patch.values[j * kPatch + i] = static_cast<int16_t>(value);
            sum += value;
        }
    }
    const int mean = (sum + kPixels / 2) / kPixels;
    double squares = 0;
    for (int16_t& value : patch.values) {
        value = static_cast<int16_t>(value - mean);
        squares += static_cast<double>(value) * value;
    }
    patch.norm = std::sqrt(squares);
    return patch.norm > kLeastSpread * kFraction * kPatch;
}

// Sums of the values and of their squares over every square of a region, from running sums down its columns and then along.
class Squares {
public:
    Squares(const uint8_t* region, ptrdiff_t step, int shifts) {
        const int side = kPatch + shifts - 1;
        int sum[kMost] = {}, square[kMost] = {};
        for (int y = 0; y < side; ++y) {
            const uint8_t* const entering = region + y * step;
            const uint8_t* const leaving = entering - kPatch * step;
            for (int x = 0; x < side; ++x) {
                sum[x] += entering[x];
                square[x] += entering[x] * entering[x];
            }
            if (y >= kPatch)
                for (int x = 0; x < side; ++x) {
                    sum[x] -= leaving[x];
                    square[x] -= leaving[x] * leaving[x];
                }
            if (y >= kPatch - 1)
                along(y - (kPatch - 1), shifts, sum, square);
        }
    }
    // Root of the sum of squares about the mean.
    float norm(int x, int y) const { return m_norms[y][x]; }

private:
    static constexpr int kShifts = 2 * kMostReach + 1, kMost = kPatch + kShifts - 1;

    void along(int row, int shifts, const int* sum, const int* square) {
        int s = 0, q = 0;
        for (int x = 0; x < kPatch - 1; ++x) {
            s += sum[x];
            q += square[x];
        }
        for (int x = 0; x < shifts; ++x) {
            s += sum[x + kPatch - 1];
            q += square[x + kPatch - 1];
            const float value = static_cast<float>(q) - static_cast<float>(s) * static_cast<float>(s) / kPixels;
            m_norms[row][x] = std::sqrt(std::max(1.0f, value));
            s -= sum[x];
            q -= square[x];
        }
    }
    float m_norms[kShifts][kShifts];
};

// Where between three equally spaced values the peak lies, the middle one being the greatest.
double peakOf(double before, double here, double behind) {
    const double curvature = before - 2 * here + behind;
    return curvature < 0 ? std::max(-0.5, std::min(0.5, 0.5 * (before - behind) / curvature)) : 0;
}

// Correlations of a patch with the squares round (left, top).
class Correlations {
public:
    Correlations(const Patch& patch, const kelImage_t* image, int left, int top, int reach) : m_reach(reach) {
        const int shifts = 2 * reach + 1;
        const uint8_t* const region = rowOf(image, top - reach) + left - reach;
        const Squares squares(region, image->step, shifts);
        const Kernels& k = kernels();
        for (int y = 0; y < shifts; ++y)
            for (int x = 0; x < shifts; ++x) {
                const float product = static_cast<float>(k.correlate(patch.values, region + y * image->step + x, image->step));
                m_values[y][x] = product / squares.norm(x, y);
                if (m_values[y][x] > m_values[m_y][m_x]) {
                    m_x = x;
                    m_y = y;
                }
            }
        m_best = m_values[m_y][m_x] / patch.norm;
    }
    double best() const { return m_best; }
    // Whether the best is enough, and has a peak about it: where from (left, top).
    bool hasPeak(Point& offset) const {
        const int last = 2 * m_reach;
        if (m_best < kAlike || m_x == 0 || m_y == 0 || m_x == last || m_y == last)
            return false;
        const float* const row = m_values[m_y];
        offset.x = m_x - m_reach + peakOf(row[m_x - 1], row[m_x], row[m_x + 1]);
        offset.y = m_y - m_reach + peakOf(m_values[m_y - 1][m_x], row[m_x], m_values[m_y + 1][m_x]);
        return true;
    }

private:
    const int m_reach;
    int m_x = 0, m_y = 0;
    double m_best;
    float m_values[2 * kMostReach + 1][2 * kMostReach + 1];
};

const Level& nearestLevel(const Pyramid& pyramid, double scale) {
    const auto ratio = [scale](const Level& level) { return std::max(level.scale / scale, scale / level.scale); };
    return *std::min_element(pyramid.levels.begin(), pyramid.levels.end(),
                             [&](const Level& a, const Level& b) { return ratio(a) < ratio(b); });
}

// The places of a picture that a homography takes into another one, and the median of the areas that a pixel becomes there.
std::vector<Point> placesInside(const std::vector<Feature>& features, const Map& H, const Pyramid& other, double& area) {
    std::vector<Point> places;
    std::vector<double> areas;
    for (const Feature& f : features) {
        const Point here = {f.x, f.y}, there = H.at(here);
        if (f.squeeze != 1 || !(there.x > 0 && there.y > 0 && there.x < other.width && there.y < other.height))
            continue;
        if (!places.empty() && places.back().x == here.x && places.back().y == here.y) // another direction of the same
            continue;
        places.push_back(here);
        areas.push_back(H.areaAt(here));
    }
    area = 0;
    if (!areas.empty()) {
        std::nth_element(areas.begin(), areas.begin() + static_cast<ptrdiff_t>(areas.size() / 2), areas.end());
        area = areas[areas.size() / 2];
    }
    return places;
}

// Looks for the patches at one scale of the coarser picture and fits anew.
struct Refinement {
    const Pyramid &coarse, &fine;
    std::vector<Point> places; // of the coarser one
    double growth;             // finer pixels to a coarser one
    double threshold;          // working pixels
    size_t mostPatches;
    Map toFine;

    // The levels that meet at a scale of the coarser picture.
    struct Meeting {
        const Level &from, &to;
        Map map;
        // The first pixel of the patch about a place.
        int start(double picture) const { return static_cast<int>(from.x(picture) + 0.5) - kPatch / 2; }
        bool sample(int left, int top, Patch& patch) const {
            return liesInside(map, left, top, to) && samplePatch(map, left, top, to, patch);
        }
        Correlations correlate(const Patch& patch, int left, int top, int reach) const {
            return Correlations(patch, from.smooth.get(), left, top, reach);
        }
    };
    Meeting meet(double scale) const {
        const Level &from = nearestLevel(coarse, scale), &to = nearestLevel(fine, from.scale * growth);
        return {from, to, betweenLevels(from, to, toFine)};
    }

    // The pairs that the patches give; `tested` counts the patches that could be looked for.
    std::vector<Pair> search(const Meeting& meeting, int reach, int& tested) const {
        std::vector<Pair> pairs;
        const Level& level = meeting.from;
        const size_t count = std::min(places.size(), mostPatches);
        for (size_t i = 0; i < count; ++i) {
            const Point place = places[i * places.size() / count];
            const int left = meeting.start(place.x), top = meeting.start(place.y);
            Patch patch;
            if (!meeting.sample(left, top, patch))
                continue;
            ++tested;
            Point offset;
            if (!meeting.correlate(patch, left, top, reach).hasPeak(offset))
                continue;
            const double half = (kPatch - 1) / 2.0 - kBorder;
            const Point centre = {(left + half) * level.scale + level.offset, (top + half) * level.scale + level.offset};
            pairs.push_back({{centre.x + offset.x * level.scale, centre.y + offset.y * level.scale}, toFine.at(centre)});
        }
        return pairs;
    }

    Judgement pass(double scale, int reach) {
        Judgement judgement;
        const Meeting meeting = meet(scale);
        const std::vector<Pair> pairs = search(meeting, reach, judgement.tested);
        // Pixels of the coarser level are what the patches were found to.
        const double allowed = threshold * coarse.workingScale;
        const Bound bound = {allowed, allowed * growth};
        Map fit;
        if (!fitRobustly(pairs, pairs, bound, fit))
            return judgement;
        const std::vector<bool> marks = agreeing(fit, pairs, bound);
        judgement.agreeing = static_cast<int>(std::count(marks.begin(), marks.end(), true));
        const double cell = kPlace * coarse.workingScale;
        judgement.places = differentPlaces(pairs, marks, {cell, cell * growth});
        for (size_t i = 0; i < pairs.size(); ++i)
            if (marks[i])
                judgement.pairs.push_back(pairs[i]);
        toFine = fit;
        return judgement;
    }

    // The share of the agreeing patches that look like many other places as well.
    double repeating(const std::vector<Pair>& pairs, double scale) const {
        const Meeting meeting = meet(scale);
        const size_t count = std::min<size_t>(pairs.size(), kMostRepeating);
        int sampled = 0, repeating = 0;
        for (size_t i = 0; i < count; ++i) {
            const Point place = pairs[i * pairs.size() / count].first;
            const int left = meeting.start(place.x), top = meeting.start(place.y);
            Patch patch;
            if (!meeting.sample(left, top, patch))
                continue;
            const double own = meeting.correlate(patch, left, top, 1).best();
            int others = 0, alike = 0;
            for (size_t j = 0; j < count; ++j) {
                const Point other = pairs[j * pairs.size() / count].first;
                const int x = meeting.start(other.x), y = meeting.start(other.y);
                if (std::max(std::abs(x - left), std::abs(y - top)) < kPatch)
                    continue;
                ++others;
                alike += meeting.correlate(patch, x, y, 1).best() > kRepeated * own;
            }
            ++sampled;
            repeating += alike > kManyOthers * others;
        }
        return sampled ? static_cast<double>(repeating) / sampled : 0;
    }

    // Another pass; what it finds is kept where it agrees to so much of the share before.
    bool improve(Judgement& judgement, double scale, int reach, double least = 1) {
        const Map before = toFine;
        Judgement next = pass(scale, reach);
        if (next.agreeing == 0 || next.share() <= least * judgement.share()) {
            toFine = before;
            return false;
        }
        judgement = std::move(next);
        return true;
    }

    void improveWhileItHelps(Judgement& judgement, double scale, int reach) {
        int rounds = 0;
        while (rounds++ < kRounds && judgement.share() < kEnough && improve(judgement, scale, reach))
            ;
    }
};

} // namespace

Judgement refine(const Pyramid& first, const Pyramid& second, const std::vector<Feature>& ofFirst,
                 const std::vector<Feature>& ofSecond, double threshold, int mostPatches, Map& H) {
    double area = 0;
    std::vector<Point> places = placesInside(ofFirst, H, second, area);
    if (!(area > 0))
        return Judgement();
    const bool firstIsCoarse = area >= 1;
    Map toFine = H;
    if (!firstIsCoarse) {
        toFine = H.inverse();
        places = placesInside(ofSecond, toFine, first, area);
        if (!(area > 0))
            return Judgement();
    }
    const Pyramid& coarse = firstIsCoarse ? first : second;
    Refinement r = {
        coarse, firstIsCoarse ? second : first, std::move(places), std::sqrt(area), threshold, static_cast<size_t>(mostPatches),
        toFine};

    Judgement judgement;
    const double working = coarse.workingScale;
    double judged = working;
    r.improveWhileItHelps(judgement, 2 * working, kReachCoarse);
    judgement = Judgement(); // at half size compromises agree with much; what counts is what the working pictures say
    r.improveWhileItHelps(judgement, working, kReachFine);
    if (judgement.share() < kLeastShare) { // one of the two may be out of focus: judged at half size then, but strictly
        r.threshold /= 2;
        Judgement strict;
        if (r.improve(strict, 2 * working, kReachCoarse) && r.improve(strict, 2 * working, kReachCoarse, kNearlyAsMany) &&
            strict.share() > kBlurredShare) {
            judgement = strict;
            judged = 2 * working;
        }
    }
    if (coarse.firstWorking > 0)
        r.improve(judgement, 1, kReachFine, kNearlyAsMany);
    judgement.repeating = r.repeating(judgement.pairs, judged);
    H = firstIsCoarse ? r.toFine : r.toFine.inverse();
    if (!firstIsCoarse)
        for (Pair& pair : judgement.pairs)
            std::swap(pair.first, pair.second);
    return judgement;
}

} // namespace kelRegister
