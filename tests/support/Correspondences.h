// Both kinds of correspondence sets for unit tests and fuzz targets: transforms drawn at random, pairs that they relate with some
// noise and some outliers, and every operation on them with its plain reference.
#ifndef KEL_TESTS_CORRESPONDENCES_H
#define KEL_TESTS_CORRESPONDENCES_H

#include <cstdio>
#include <cstring>
#include <random>
#include <utility>

#include "EstimatorReference.h"
#include "MatOperations.h"

namespace kel_test {

inline float uniform(std::mt19937& random, float lo, float hi) {
    return std::uniform_real_distribution<float>(lo, hi)(random);
}

struct Plane : kel_ref::Plane {
    using Estimator = kelMatEstimatorH;
    static constexpr bool kCounts = true; // the robust fit says how many inliers it has
    static constexpr float kBox[][2] = {{0, 640}, {0, 480}};

    static kelMat transform(std::mt19937& random) {
        kelMat H(3, 3, true);
        const float most[9] = {0.5f, 0.3f, 80, 0.3f, 0.5f, 80, 2e-4f, 2e-4f, 0}, middle[9] = {1.1f, 0, 0, 0, 1.1f, 0, 0, 0, 1};
        for (int i = 0; i < 9; ++i)
            H.m_Data[i] = middle[i] + uniform(random, -most[i], most[i]);
        return H;
    }
    static bool ransac(Estimator& H, Set& set, float threshold, int* inliers) {
        return H.estimate_byRANSAC_fine(set, threshold, inliers);
    }
};

struct Space : kel_ref::Space {
    using Estimator = kelMatEstimatorP;
    static constexpr bool kCounts = false;
    static constexpr float kBox[][2] = {{-500, 500}, {-500, 500}, {-500, 500}};

    static kelMat transform(std::mt19937& random) {
        kelMatGeneratorP generator;
        srand(random());
        generator.setMatView(uniform(random, 500, 1000));
        generator.setMatViewShift(320, 240);
        generator.setMatObjectRandom(-40, 40, -40, 40, -180, 180, -200, 200, -200, 200, 2500, 3500);
        kelMat P;
        generator.getMat(P);
        P.setDataUnitize();
        return P;
    }
    static bool ransac(Estimator& P, Set& set, float threshold, int*) { return P.estimate_byRANSAC_fine(set, threshold); }
};

template <class Kind>
void addPairs(typename Kind::Set& set, kelMat transform, int n, float most, float outliers, std::mt19937& random) {
    for (int i = 0; i < n; ++i) {
        std::vector<float> p;
        for (const auto& side : Kind::kBox)
            p.push_back(uniform(random, side[0], side[1]));
        float u, v;
        Kind::project(transform, p, &u, &v);
        const bool outlier = uniform(random, 0, 1) < outliers;
        p.push_back(outlier ? uniform(random, 0, 640) : u + uniform(random, -most, most));
        p.push_back(outlier ? uniform(random, 0, 480) : v + uniform(random, -most, most));
        Kind::add(set, p);
    }
}
template <class Kind> typename Kind::Set pairs(int n, float most, float outliers, std::mt19937& random) {
    typename Kind::Set set;
    addPairs<Kind>(set, Kind::transform(random), n, most, outliers, random);
    return set;
}

// All coordinates one behind the other.
template <class Kind> Floats allOf(const typename Kind::Set& set) {
    Floats all;
    for (auto coordinate : Kind::kCoordinates)
        append(all, set.*coordinate);
    return all;
}

// Results are one behind the other. M is the estimator as it is before, or what inliers are counted under.
template <class Kind> struct SetOperation {
    using Call = Floats (*)(typename Kind::Set set, typename Kind::Estimator M, float threshold);
    const char* name;
    Call call, reference;
};

template <class Kind> const std::vector<SetOperation<Kind>>& setOperations() {
    using Set = typename Kind::Set;
    using Estimator = typename Kind::Estimator;
    static const std::vector<SetOperation<Kind>> list = {
        {"normalize",
         [](Set s, Estimator, float) {
             Set out;
             kelMat T1, T2;
             s.normalize(out, T1, T2);
             return results(T1, T2, out.m_Num, allOf<Kind>(out));
         },
         [](Set s, Estimator, float) {
             Set out;
             kelMat T1, T2;
             kel_ref::normalize<Kind>(s, out, T1, T2);
             return results(T1, T2, out.m_Num, allOf<Kind>(out));
         }},
        {"estimate_byLSM", [](Set s, Estimator M, float) { return results(M.estimate_byLSM(s), M); },
         [](Set s, Estimator M, float) { return results(kel_ref::leastSquares<Kind>(M, s), M); }},
        {"estimate_byLSM_fine", [](Set s, Estimator M, float) { return results(M.estimate_byLSM_fine(s), M); },
         [](Set s, Estimator M, float) { return results(kel_ref::leastSquaresFine<Kind>(M, s), M); }},
        {"estimate_byTaubin", [](Set s, Estimator M, float) { return results(M.estimate_byTaubin(s), M); },
         [](Set s, Estimator M, float) { return results(kel_ref::taubin<Kind>(M, s), M); }},
        {"judgeInliers",
         [](Set s, Estimator M, float threshold) {
             std::vector<bool> mask(s.m_Num + 3, s.m_Num % 2 == 0);
             return results(judgeInliers(M, s, mask, threshold), mask);
         },
         [](Set s, Estimator M, float threshold) {
             std::vector<bool> mask(s.m_Num + 3, s.m_Num % 2 == 0);
             return results(kel_ref::inliers<Kind>(M, s, mask, threshold), mask);
         }},
        {"estimate_byRANSAC_fine",
         [](Set s, Estimator M, float threshold) {
             int inliers = -5;
             return results(Kind::ransac(M, s, threshold, &inliers), inliers, M);
         },
         [](Set s, Estimator M, float threshold) {
             int inliers = -5;
             return results(kel_ref::ransac<Kind>(M, s, threshold, Kind::kCounts ? &inliers : nullptr), inliers, M);
         }},
    };
    return list;
}

// Whether library and reference agree, also in what they draw from rand() and print.
template <class Kind>
bool agrees(const SetOperation<Kind>& o, const typename Kind::Set& set, const typename Kind::Estimator& M, float threshold) {
    const auto resultsOf = [&](auto call) {
        char* text;
        size_t size;
        std::FILE* const console = std::exchange(stdout, open_memstream(&text, &size));
        srand(static_cast<unsigned>(set.m_Num));
        Floats all = call(set, M, threshold);
        append(all, rand());
        std::fclose(stdout);
        stdout = console;
        for (char* nan = text; (nan = std::strstr(nan, "-nan")) != nullptr;)
            *nan = ' '; // its sign is the processor's affair
        append(all, std::vector<char>(text, text + size));
        std::free(text);
        return all;
    };
    return sameFloats(resultsOf(o.call), resultsOf(o.reference));
}

} // namespace kel_test

#endif
