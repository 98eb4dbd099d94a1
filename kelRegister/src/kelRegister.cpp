// The calls of the interface: what they accept, the order of the stages, and the verdict.
#include <algorithm>
#include <cmath>
#include <utility>

#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr int kLeastPlaces = 12;       // that agree in the end
constexpr double kMostExpected = 1.5;  // pixels of the second picture
constexpr double kMostRepeating = 0.5; // of the agreeing patches
constexpr double kLongest = 16;        // of squared half circumferences to areas, 14 : 1
constexpr double kViewMargin = 6;      // working pixels from the edge
constexpr int kViewFeatures = 500;     // keypoints of a squeezed view
constexpr double kSupportReach = 0.2;  // of the first picture's diagonal
constexpr double kSupportSlack = 3;    // working pixels of the second
constexpr int kMostPatches = 600;      // that are compared; fewer where few features are asked for
constexpr double kLeastLast = 1e-6;    // of the homography's last element beside a point's third coordinate
constexpr int kLeastMatches = 5;       // to try a fit on

std::string whyWrong(const Options& options) {
    if (!(options.threshold >= 0.1f && options.threshold <= 100))
        return "the threshold is not between 0.1 and 100 pixels";
    if (options.mostFeatures < 50 || options.mostFeatures > 5000)
        return "the number of features is not between 50 and 5000";
    if (options.workingSize < 200 || options.workingSize > 8000)
        return "the working size is not between 200 and 8000 pixels";
    return std::string();
}

std::string percent(double share) {
    return std::to_string(static_cast<int>(100 * share)) + " %";
}

Point pointOf(const Feature& f) {
    return {f.x, f.y};
}

Ready makeReady(const kelImage_t* picture, const char* name, const Options& options) {
    Ready ready;
    ready.reason = whyWrong(options);
    if (ready.reason.empty())
        ready.reason = whyUnusable(picture, name);
    if (!ready.reason.empty())
        return ready;
    ready.pyramid = makePyramid(greyOf(picture), options.workingSize);
    ready.features = findFeatures(ready.pyramid, options.mostFeatures);
    ready.mostFeatures = options.mostFeatures;
    for (Level& level : ready.pyramid.levels)
        level.cross = Image(); // two thirds of the memory
    return ready;
}

// From matching to the verdict.
class Registration {
public:
    Registration(const Ready& first, const Ready& second, const Options& options, Result& result)
        : m_options(options), m_result(result), m_readyFirst(first), m_readySecond(second), m_first(first.pyramid),
          m_second(second.pyramid) {}

    void run() {
        m_result.first = m_readyFirst.features;
        m_result.second = m_readySecond.features;
        if (!attempt() && m_options.views) {
            addViews(m_first, std::min(kViewFeatures, m_readyFirst.mostFeatures), m_result.first);
            addViews(m_second, std::min(kViewFeatures, m_readySecond.mostFeatures), m_result.second);
            attempt();
        }
    }

private:
    static void addViews(const Pyramid& picture, int most, std::vector<Feature>& features) {
        const double sum = picture.width + picture.height, product = static_cast<double>(picture.width) * picture.height;
        const bool isStrip = sum * sum > kLongest * product; // aslant it would fill a small part of a huge square
        for (int eighths = 0; eighths < kViews; eighths += isStrip ? 2 : 1) {
            const View view = makeView(picture, eighths);
            for (Feature f : findFeatures(view.pyramid, most)) {
                const Point place = view.toPicture.at(pointOf(f));
                f.x = static_cast<float>(place.x);
                f.y = static_cast<float>(place.y);
                f.angle += static_cast<float>(view.turned);
                f.squeeze = 2;
                f.direction = static_cast<float>(view.direction);
                const double margin = kViewMargin * picture.workingScale; // turned views end in the picture's edge
                if (place.x >= margin && place.y >= margin && place.x < picture.width - margin &&
                    place.y < picture.height - margin)
                    features.push_back(f);
            }
        }
    }

    Bound bound() const { return {m_options.threshold * m_first.workingScale, m_options.threshold * m_second.workingScale}; }

    bool refuse(const std::string& reason) {
        m_result.reason = reason;
        return false;
    }

    // Matching to verdict with the features that there are.
    bool attempt() {
        Result& r = m_result;
        r.tested = r.agreeing = 0;
        r.share = r.expectedError = 0;
        r.matches = matchFeatures(r.first, r.second);
        const double diagonal = distance({0, 0}, {double(m_first.width), double(m_first.height)});
        const std::vector<bool> marks =
            supported(r.first, r.second, r.matches, kSupportReach * diagonal, kSupportSlack * m_second.workingScale);
        std::vector<Pair> all, some;
        for (size_t i = 0; i < r.matches.size(); ++i) {
            all.push_back({pointOf(r.first[r.matches[i].first]), pointOf(r.second[r.matches[i].second])});
            if (marks[i])
                some.push_back(all.back());
        }
        if (static_cast<int>(some.size()) < kLeastMatches)
            return refuse("only " + std::to_string(some.size()) + " matches that support each other of " +
                          std::to_string(r.matches.size()));
        Map H;
        if (!fitRobustly(some, all, bound(), H))
            return refuse("no plausible homography among " + std::to_string(some.size()) + " matches");
        const int patches = std::min(kMostPatches, std::min(m_readyFirst.mostFeatures, m_readySecond.mostFeatures) / 2);
        const Judgement judgement =
            refine(m_first, m_second, r.first, r.second, std::min(m_options.threshold, 3.0f), patches, H);
        r.tested = judgement.tested;
        r.agreeing = judgement.agreeing;
        r.share = static_cast<float>(judgement.share());
        if (judgement.places < kLeastPlaces)
            return refuse("the pictures agree at only " + std::to_string(judgement.places) + " places");
        if (judgement.share() < kLeastShare)
            return refuse("the pictures agree in only " + percent(judgement.share()) + " of the patches compared");
        if (judgement.repeating > kMostRepeating)
            return refuse("the pictures repeat themselves: " + percent(judgement.repeating) +
                          " of the patches fit many other places as well");
        const double error = expectedError(H, judgement.pairs, m_first, m_second);
        r.expectedError = static_cast<float>(error);
        if (!(error <= kMostExpected))
            return refuse("the places that agree lie too close together to tell of the whole");
        if (!(std::fabs(H.m[8]) > kLeastLast * std::fabs(H.weight(judgement.pairs[0].first))))
            return refuse("the first pixel lies on the horizon");
        accept(H, all);
        return true;
    }

    void accept(const Map& H, const std::vector<Pair>& all) {
        Result& r = m_result;
        r.found = true;
        r.reason.clear();
        r.H.create(3, 3, false);
        for (int i = 0; i < 9; ++i)
            r.H.m_Data[i] = static_cast<float>(H.m[i] / H.m[8]);
        const std::vector<bool> marks = agreeing(H, all, bound());
        for (size_t i = 0; i < all.size(); ++i)
            r.matches[i].inlier = marks[i];
    }

    const Options& m_options;
    Result& m_result;
    const Ready &m_readyFirst, &m_readySecond;
    const Pyramid &m_first, &m_second;
};

Result registered(const Ready& first, const Ready& second, const Options& options) {
    Result result;
    result.reason = whyWrong(options);
    if (result.reason.empty())
        result.reason = first.reason.empty() ? second.reason : first.reason;
    if (result.reason.empty())
        Registration(first, second, options, result).run();
    return result;
}

} // namespace

struct Prepared::Body : Ready {
    explicit Body(Ready ready) : Ready(std::move(ready)) {}
};

Prepared::Prepared(std::unique_ptr<Body> body) : m_body(std::move(body)) {}
Prepared::Prepared(const kelImage_t* picture, const Options& options)
    : m_body(new Body(makeReady(picture, "given", options))) {}
Prepared::Prepared(Prepared&& other) noexcept = default;
Prepared& Prepared::operator=(Prepared&& other) noexcept = default;
Prepared::~Prepared() = default;

const std::string& Prepared::reason() const {
    return m_body->reason;
}

std::vector<unsigned char> Prepared::store() const {
    return reason().empty() ? kelRegister::store(*m_body) : std::vector<unsigned char>();
}

Prepared Prepared::restored(const void* bytes, size_t size) {
    return Prepared(std::unique_ptr<Body>(new Body(kelRegister::restored(static_cast<const unsigned char*>(bytes), size))));
}

Result registerPictures(const Prepared& first, const Prepared& second, const Options& options) {
    return registered(*first.m_body, *second.m_body, options);
}

std::vector<Feature> findFeatures(const kelImage_t* picture, const Options& options, std::string* reason) {
    Ready ready = makeReady(picture, "given", options);
    if (reason && !ready.reason.empty())
        *reason = ready.reason;
    return std::move(ready.features);
}

Result registerPictures(const kelImage_t* first, const kelImage_t* second, const Options& options) {
    return registered(makeReady(first, "first", options), makeReady(second, "second", options), options);
}

} // namespace kelRegister
