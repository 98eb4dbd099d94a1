// Normalisation, fits and RANSAC beside their references: with equal seeds they draw alike and give equal bits.
#include <cstdio>
#include <kel/kelMat.h>

#include "Correspondences.h"
#include "Fuzz.h"

using kel_fuzz::fail;
using kel_fuzz::Input;

namespace {

void expectSame(const kelMat& A, const kelMat& B, const char* what) {
    if (A.m_Width != B.m_Width || A.m_Height != B.m_Height)
        fail(what);
    kel_fuzz::expectSame(A.m_Data, B.m_Data, static_cast<size_t>(A.m_Width) * static_cast<size_t>(A.m_Height), what);
}

// Pairs that a transform relates, some coordinates of any kind, or few places: degenerate samples.
template <class Kind> typename Kind::Set somePairs(Input& input) {
    std::mt19937 random(input.word());
    const uint8_t kind = input.byte();
    typename Kind::Set set =
        kel_test::pairs<Kind>(input.between(0, 60), kind % 3 ? 2.0f : 0.0f, static_cast<float>(kind) / 256, random);
    for (auto values : Kind::kCoordinates)
        for (float& value : set.*values)
            value = kind % 8 == 0 ? input.number() : kind % 8 == 1 ? std::round(value / 300) : value;
    return set;
}

template <class Kind> void expectSameSets(const typename Kind::Set& a, const typename Kind::Set& b) {
    for (auto values : Kind::kCoordinates) {
        if ((a.*values).size() != (b.*values).size())
            fail("size of a normalised set");
        kel_fuzz::expectSame((a.*values).data(), (b.*values).data(), (a.*values).size(), "normalised set");
    }
}

template <class Kind> void estimator(Input& input) {
    using Set = typename Kind::Set;
    Set set = somePairs<Kind>(input);
    const float threshold = static_cast<float>(input.byte()) / 16.0f;
    constexpr int columns = Kind::kColumns;
    typename Kind::Estimator lib;
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
            expectSameSets<Kind>(libSet, refSet);
        }
        return;
    }
    case 1:
        libResult = lib.estimate_byLSM(set);
        refResult = kel_ref::leastSquares(ref, set);
        break;
    case 2:
        libResult = lib.estimate_byLSM_fine(set);
        refResult = kel_ref::leastSquaresFine(ref, set, Kind::kRules.least);
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
        libResult = Kind::ransac(lib, set, threshold, &libInliers);
        const int next = rand();
        srand(seed);
        refResult = kel_ref::ransac(ref, set, threshold, columns == 3 ? &refInliers : nullptr, Kind::kRules);
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
    (input.byte() % 2 ? estimator<kel_test::Plane> : estimator<kel_test::Space>)(input);
    return 0;
}
