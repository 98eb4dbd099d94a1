// Normalisation, fits and RANSAC beside their references: with equal seeds they draw alike and give equal bits.
#include <cstdio>
#include <kel/kelMat.h>

#include "EstimatorReference.h"
#include "Fuzz.h"

using kel_fuzz::fail;
using kel_fuzz::Input;

namespace {

void expectSame(const kelMat& A, const kelMat& B, const char* what) {
    if (A.m_Width != B.m_Width || A.m_Height != B.m_Height)
        fail(what);
    kel_fuzz::expectSame(A.m_Data, B.m_Data, static_cast<size_t>(A.m_Width) * static_cast<size_t>(A.m_Height), what);
}

// Pairs that a transform relates, with some noise, some outliers and some numbers of any kind.
struct Source {
    Input& input;
    std::mt19937 random;
    uint8_t kind;
    explicit Source(Input& input) : input(input), random(input.word()), kind(input.byte()) {}
    float coordinate() {
        if (kind % 8 == 0)
            return input.number();
        const float value = static_cast<float>(random() % 1000) - 300.0f;
        return kind % 8 == 1 ? std::round(value / 300) : value; // few places: degenerate samples
    }
    float noise() { return kind % 3 ? static_cast<float>(random() % 100) / 50.0f : 0.0f; }
    bool outlier() { return random() % 256 < static_cast<unsigned>(kind); }
};

void addPairs(Source& source, kelMatCorrespH& set, int n) {
    kelMat H(3, 3);
    H.setDataIdentity(1);
    for (int i = 0; i < 6; ++i)
        H.m_Data[i] += static_cast<float>(source.random() % 100) / 200.0f * (i % 3 == 2 ? 100.0f : 1.0f);
    for (int i = 0; i < n; ++i) {
        const float x = source.coordinate(), y = source.coordinate();
        float u, v;
        H.cvtPoint(x, y, &u, &v);
        if (source.outlier())
            u = source.coordinate(), v = source.coordinate();
        set.add(x, y, u + source.noise(), v + source.noise());
    }
}

void addPairs(Source& source, kelMatCorrespP& set, int n) {
    kelMatGeneratorP generator;
    generator.setMatView(600);
    generator.setMatObject(static_cast<float>(source.random() % 90), static_cast<float>(source.random() % 90), 10, 0, 0, 2500);
    kelMat P;
    generator.getMat(P);
    for (int i = 0; i < n; ++i) {
        const float x = source.coordinate(), y = source.coordinate(), z = source.coordinate();
        float u, v;
        P.cvtPoint(x, y, z, &u, &v);
        if (source.outlier())
            u = source.coordinate(), v = source.coordinate();
        set.add(x, y, z, u + source.noise(), v + source.noise());
    }
}

void expectSameSets(const kelMatCorrespH& a, const kelMatCorrespH& b) {
    for (auto values : {&kelMatCorrespH::m_SrcX, &kelMatCorrespH::m_SrcY, &kelMatCorrespH::m_DstX, &kelMatCorrespH::m_DstY}) {
        if ((a.*values).size() != (b.*values).size())
            fail("size of a normalised set");
        kel_fuzz::expectSame((a.*values).data(), (b.*values).data(), (a.*values).size(), "normalised set");
    }
}
void expectSameSets(const kelMatCorrespP& a, const kelMatCorrespP& b) {
    for (auto values : {&kelMatCorrespP::m_ObjX, &kelMatCorrespP::m_ObjY, &kelMatCorrespP::m_ObjZ, &kelMatCorrespP::m_ImgX,
                        &kelMatCorrespP::m_ImgY}) {
        if ((a.*values).size() != (b.*values).size())
            fail("size of a normalised set");
        kel_fuzz::expectSame((a.*values).data(), (b.*values).data(), (a.*values).size(), "normalised set");
    }
}

bool ransac(kelMatEstimatorH& H, kelMatCorrespH& set, float threshold, int* inliers) {
    return H.estimate_byRANSAC_fine(set, threshold, inliers);
}
bool ransac(kelMatEstimatorP& P, kelMatCorrespP& set, float threshold, int*) {
    return P.estimate_byRANSAC_fine(set, threshold);
}
constexpr kel_ref::Rules kRulesH{5, 4, 50, true}, kRulesP{6, 6, 400, false};

template <class Estimator, class Set> void estimator(Input& input, const kel_ref::Rules& rules, int columns) {
    Source source(input);
    Set set;
    addPairs(source, set, input.between(0, 60));
    const float threshold = static_cast<float>(input.byte()) / 16.0f;
    Estimator lib;
    kelMat ref(3, columns);
    bool libResult = true, refResult = true;
    int libInliers = -1, refInliers = -1;
    switch (input.byte() % 6) {
    case 0: {
        Set libSet, refSet;
        kelMat libT1, libT2, refT1, refT2;
        set.normalize(libSet, libT1, libT2);
        if (set.m_Num > 0) {
            kel_ref::normalize(set, refSet, refT1, refT2);
            expectSame(libT1, refT1, "T1");
            expectSame(libT2, refT2, "T2");
            expectSameSets(libSet, refSet);
        }
        return;
    }
    case 1:
        libResult = lib.estimate_byLSM(set);
        refResult = kel_ref::leastSquares(ref, set);
        break;
    case 2:
        libResult = lib.estimate_byLSM_fine(set);
        refResult = kel_ref::leastSquaresFine(ref, set, rules.least);
        break;
    case 3: {
        std::vector<bool> libMask(static_cast<size_t>(set.m_Num)), refMask(libMask);
        kelMat M(3, columns);
        for (int i = 0; i < 3 * columns; ++i)
            M.m_Data[i] = input.number();
        if (judgeInliers(M, set, libMask, threshold) != kel_ref::inliers(M, set, refMask, threshold) || libMask != refMask)
            fail("inliers");
        return;
    }
    default: {
        const unsigned seed = input.word();
        srand(seed);
        libResult = ransac(lib, set, threshold, &libInliers);
        const int next = rand();
        srand(seed);
        refResult = kel_ref::ransac(ref, set, threshold, columns == 3 ? &refInliers : nullptr, rules);
        if (rand() != next)
            fail("draws of RANSAC");
    }
    }
    if (libResult != refResult || libInliers != refInliers)
        fail("result of an estimator");
    expectSame(lib, ref, "estimate");
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Input input(data, size);
    if (input.byte() % 2)
        estimator<kelMatEstimatorH, kelMatCorrespH>(input, kRulesH, 3);
    else
        estimator<kelMatEstimatorP, kelMatCorrespP>(input, kRulesP, 4);
    return 0;
}
