// Both kinds of correspondence sets in one form for unit tests and fuzz targets: transforms drawn at random, and pairs that they
// relate with some noise and some outliers.
#ifndef KEL_TESTS_CORRESPONDENCES_H
#define KEL_TESTS_CORRESPONDENCES_H

#include <cmath>
#include <cstdlib>
#include <kel/kelMat.h>
#include <random>
#include <vector>

#include "EstimatorReference.h"

namespace kel_test {

inline float uniform(std::mt19937& random, float lo, float hi) {
    return std::uniform_real_distribution<float>(lo, hi)(random);
}

// Between planes, and from space to a plane.
struct Plane {
    using Set = kelMatCorrespH;
    using Estimator = kelMatEstimatorH;
    static constexpr int kColumns = 3;
    static constexpr kel_ref::Rules kRules{5, 4, 50, true};
    static constexpr std::vector<float> Set::*kCoordinates[] = {&Set::m_SrcX, &Set::m_SrcY, &Set::m_DstX, &Set::m_DstY};

    static kelMat transform(std::mt19937& random) {
        kelMat H(3, 3, true);
        const float most[9] = {0.5f, 0.3f, 80, 0.3f, 0.5f, 80, 2e-4f, 2e-4f, 0}, middle[9] = {1.1f, 0, 0, 0, 1.1f, 0, 0, 0, 1};
        for (int i = 0; i < 9; ++i)
            H.m_Data[i] = middle[i] + uniform(random, -most[i], most[i]);
        return H;
    }
    static void addPair(Set& set, kelMat& H, const float* noise, bool outlier, std::mt19937& random) {
        const float x = uniform(random, 0, 640), y = uniform(random, 0, 480);
        float u = noise[2], v = noise[3];
        if (!outlier)
            H.cvtPoint(x, y, &u, &v);
        set.add(x, y, outlier ? u : u + noise[0], outlier ? v : v + noise[1]);
    }
    static bool ransac(Estimator& H, Set& set, float threshold, int* inliers) {
        return H.estimate_byRANSAC_fine(set, threshold, inliers);
    }
};

struct Space {
    using Set = kelMatCorrespP;
    using Estimator = kelMatEstimatorP;
    static constexpr int kColumns = 4;
    static constexpr kel_ref::Rules kRules{6, 6, 400, false};
    static constexpr std::vector<float> Set::*kCoordinates[] = {&Set::m_ObjX, &Set::m_ObjY, &Set::m_ObjZ, &Set::m_ImgX,
                                                                &Set::m_ImgY};

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
    static void addPair(Set& set, kelMat& P, const float* noise, bool outlier, std::mt19937& random) {
        const float x = uniform(random, -500, 500), y = uniform(random, -500, 500), z = uniform(random, -500, 500);
        float u = noise[2], v = noise[3];
        if (!outlier)
            P.cvtPoint(x, y, z, &u, &v);
        set.add(x, y, z, outlier ? u : u + noise[0], outlier ? v : v + noise[1]);
    }
    static bool ransac(Estimator& P, Set& set, float threshold, int*) { return P.estimate_byRANSAC_fine(set, threshold); }
};

template <class Kind>
void addPairs(typename Kind::Set& set, kelMat transform, int n, float most, float outliers, std::mt19937& random) {
    for (int i = 0; i < n; ++i) {
        const float noise[] = {uniform(random, -most, most), uniform(random, -most, most), uniform(random, 0, 640),
                               uniform(random, 0, 480)}; // of an inlier, and an outlier's place
        Kind::addPair(set, transform, noise, uniform(random, 0, 1) < outliers, random);
    }
}
template <class Kind> typename Kind::Set pairs(int n, float most, float outliers, std::mt19937& random) {
    typename Kind::Set set;
    addPairs<Kind>(set, Kind::transform(random), n, most, outliers, random);
    return set;
}

} // namespace kel_test

#endif
