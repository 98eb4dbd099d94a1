// Correspondence sets, homography and projection estimators against plain references, bit for bit, and against the truth.
#include <cfenv>
#include <cmath>
#include <fstream>
#include <functional>

#include "Correspondences.h"
#include "MatSupport.h"
#include "Memory.h"
#include "Stops.h"
#include "Valgrind.h"

namespace {

using kel_test::addPairs;
using kel_test::pairs;
using kel_test::Plane;
using kel_test::same;
using kel_test::Space;
using kel_test::uniform;

// Tests of both kinds of sets.
template <class Kind> class Correspondences : public testing::Test {};
template <class Kind> class LeastSquares : public testing::Test {};
template <class Kind> class RansacOf : public testing::Test {};
using Kinds = testing::Types<Plane, Space>;
TYPED_TEST_SUITE(Correspondences, Kinds, );
TYPED_TEST_SUITE(LeastSquares, Kinds, );
TYPED_TEST_SUITE(RansacOf, Kinds, );

// Largest distance between the images of points under two transforms.
float distanceOf(kelMat A, kelMat B, Plane = {}) {
    float worst = 0;
    for (float x : {0.f, 320.f, 640.f})
        for (float y : {0.f, 240.f, 480.f}) {
            float u, v, s, t;
            A.cvtPoint(x, y, &u, &v);
            B.cvtPoint(x, y, &s, &t);
            worst = std::max(worst, std::hypot(u - s, v - t));
        }
    return worst;
}
float distanceOf(kelMat A, kelMat B, Space) {
    float worst = 0;
    for (int corner = 0; corner < 8; ++corner) {
        const float X = corner & 1 ? 500.f : -500.f, Y = corner & 2 ? 500.f : -500.f, Z = corner & 4 ? 500.f : -500.f;
        float u, v, s, t;
        A.cvtPoint(X, Y, Z, &u, &v);
        B.cvtPoint(X, Y, Z, &s, &t);
        worst = std::max(worst, std::hypot(u - s, v - t));
    }
    return worst;
}

} // namespace

TYPED_TEST(Correspondences, StopGrowingSilentlyAtTheirMost) {
    std::mt19937 random = kel_test::generator(70);
    typename TypeParam::Set set = pairs<TypeParam>(10000, 0, 0, random);
    const typename TypeParam::Set before = set;
    addPairs<TypeParam>(set, TypeParam::transform(random), 1, 0, 0, random);
    EXPECT_EQ(set.m_Num, 10000);
    for (auto values : TypeParam::kCoordinates)
        EXPECT_EQ(set.*values, before.*values);
}

TYPED_TEST(Correspondences, StayWholeWhereMemoryRunsOut) {
    if (!kel_test::ownMalloc())
        GTEST_SKIP() << "another malloc is in use";
    std::mt19937 random = kel_test::generator(70);
    kelMat transform = TypeParam::transform(random);
    const float noise[4] = {};
    for (int number = 0; number < TypeParam::kColumns + 1; ++number) {
        typename TypeParam::Set set = pairs<TypeParam>(1, 0, 0, random);
        {
            const kel_test::ScarceMemory memory(number);
            EXPECT_THROW(TypeParam::addPair(set, transform, noise, true, random), std::bad_alloc);
        }
        EXPECT_EQ(set.m_Num, 1);
        for (auto values : TypeParam::kCoordinates)
            EXPECT_EQ((set.*values).size(), 1u) << number;
    }
}

TYPED_TEST(Correspondences, NormaliseAsTheReferenceDoes) {
    std::mt19937 random = kel_test::generator(71);
    for (int n : {0, 1, 2, 3, 5, 17, 1000}) {
        typename TypeParam::Set set = pairs<TypeParam>(n, 1, 0.3f, random), normalised, expected;
        kelMat A1(2, 2, true), A2, B1, B2;
        set.normalize(normalised, A1, A2);
        kel_ref::normalize(set, expected, B1, B2);
        EXPECT_TRUE(same(A1, B1));
        EXPECT_TRUE(same(A2, B2));
        EXPECT_EQ(normalised.m_Num, n);
        for (auto values : TypeParam::kCoordinates)
            if (n > 1) {
                EXPECT_EQ(normalised.*values, expected.*values);
            }
    }
}

TEST(Normalisation, ScalesTheFirstEntriesOfAFilledSet) {
    kelMatCorrespH in, out;
    in.add(0, 0, 0, 0);
    in.add(2, 0, 0, 4);
    out.add(10, 20, 30, 40);
    kelMat T1, T2;
    in.normalize(out, T1, T2);
    EXPECT_EQ(out.m_Num, 3);
    const float s1 = T1[0][0];
    EXPECT_EQ(out.m_SrcX, (std::vector<float>{10 * s1, -1 * s1, 1}));
}

TEST(Normalisation, RefusesShortSequencesAndLeavesTheOutputAlone) {
    kelMatCorrespH h, out;
    h.add(1, 2, 3, 4);
    h.m_Num = 2;
    kelMat T1, T2;
    EXPECT_THROW(h.normalize(out, T1, T2), std::out_of_range);
    EXPECT_EQ(out.m_Num, 0);
    kelMatCorrespP p, pOut;
    p.add(1, 2, 3, 4, 5);
    p.m_ImgY.clear();
    EXPECT_THROW(p.normalize(pOut, T1, T2), std::out_of_range);
    EXPECT_THROW(kelMatEstimatorP().estimate_byLSM_fine((p.m_Num = 6, p)), std::out_of_range);
}

TEST(UnitSquare, TakesItsCornersInOrder) {
    float h[9] = {0, 0, 0, 0, 0, 0, 0, 0, 77};
    UnitSquareProjection(10, 20, 110, 25, 120, 130, 5, 115, h);
    EXPECT_EQ(h[8], 77) << "eight values are written";
    h[8] = 1;
    kelMat H(3, 3, false);
    H.setData(h);
    const float corners[4][4] = {{0, 0, 10, 20}, {0, 1, 110, 25}, {1, 1, 120, 130}, {1, 0, 5, 115}};
    for (const float* c : corners) {
        float u, v;
        H.cvtPoint(c[0], c[1], &u, &v);
        EXPECT_NEAR(u, c[2], 1e-3);
        EXPECT_NEAR(v, c[3], 1e-3);
    }
    UnitSquareProjection(0, 0, 1, 1, 2, 2, 3, 3, h);
    EXPECT_FALSE(std::isfinite(h[0]));
}

TEST(FourPoints, GiveTheHomographyThroughThem) {
    std::mt19937 random = kel_test::generator(72);
    for (int round = 0; round < 50; ++round) {
        kelMat truth = Plane::transform(random);
        kelMatCorrespH s;
        const float corners[4][2] = {{20, 30}, {40, 450}, {600, 440}, {620, 10}};
        for (const float* c : corners) {
            float u, v;
            truth.cvtPoint(c[0], c[1], &u, &v);
            s.add(c[0], c[1], u, v);
        }
        kelMatEstimatorH H;
        EXPECT_EQ(H.getNorm(), 0);
        const auto &x = s.m_SrcX, &y = s.m_SrcY, &u = s.m_DstX, &v = s.m_DstY;
        EXPECT_TRUE(
            H.estimate_by4P(x[0], y[0], u[0], v[0], x[1], y[1], u[1], v[1], x[2], y[2], u[2], v[2], x[3], y[3], u[3], v[3]));
        EXPECT_LT(distanceOf(H, truth), 1.0f);
    }
    kelMatEstimatorH H;
    EXPECT_TRUE(H.estimate_by4P(0, 0, 0, 0, 1, 1, 1, 1, 2, 2, 2, 2, 3, 3, 3, 3)) << "on a line";
    EXPECT_FALSE(std::isfinite(H[0][0]));
}

TYPED_TEST(LeastSquares, EqualsTheReferenceAndFindsTheTruth) {
    std::mt19937 random = kel_test::generator(73);
    constexpr bool plane = TypeParam::kColumns == 3;
    for (int n : {5, 6, 7, 20, 101, 2000}) {
        const kelMat truth = TypeParam::transform(random);
        typename TypeParam::Set set;
        addPairs<TypeParam>(set, truth, n, n > 6 ? 0.5f : 0, 0, random);
        if (n < TypeParam::kRules.least)
            continue;
        typename TypeParam::Estimator fit, expected;
        EXPECT_TRUE(fit.estimate_byLSM(set));
        kel_ref::leastSquares(expected, set);
        EXPECT_TRUE(same(fit, expected));
        EXPECT_TRUE(fit.estimate_byLSM_fine(set));
        kel_ref::leastSquaresFine(expected, set, TypeParam::kRules.least);
        EXPECT_TRUE(same(fit, expected));
        if (plane) {
            EXPECT_NEAR(fit[2][2], 1, 1e-6);
            EXPECT_LT(distanceOf(fit, truth, TypeParam()), n == 7 ? 60.0f : 8.0f) << n;
        } else if (n >= 20) {
            EXPECT_LT(distanceOf(fit, truth, TypeParam()), 6.0f) << n;
        }
    }
}

// On noisy data: with exact pairs the factorised matrix is singular, and rounding decides.
TYPED_TEST(LeastSquares, TakesTheFirstOfEqualSingularValues) {
    typename TypeParam::Set set;
    for (auto values : TypeParam::kCoordinates)
        (set.*values).assign(6, 0.0f);
    set.m_Num = 6;
    typename TypeParam::Estimator fit, expected;
    fit.estimate_byLSM(set);
    kel_ref::leastSquares(expected, set);
    EXPECT_TRUE(same(fit, expected));
}

namespace {

void expectTaubinLikeReference(kelMatCorrespP& set) {
    kelMatEstimatorP P, expected;
    testing::internal::CaptureStdout();
    EXPECT_TRUE(P.estimate_byTaubin(set));
    const std::string printed = testing::internal::GetCapturedStdout();
    testing::internal::CaptureStdout();
    kel_ref::taubin(expected, set);
    EXPECT_EQ(printed, testing::internal::GetCapturedStdout());
    EXPECT_TRUE(same(P, expected));
    EXPECT_EQ(printed.compare(0, 8, "M\n<mat>\n"), 0);
}

} // namespace

TEST(Taubin, NeverChoosesAnEigenvalueThatNoIntHolds) {
    std::mt19937 random = kel_test::generator(80);
    for (int round = 0; round < 8; ++round) { // tiny objects give huge eigenvalues
        kelMatCorrespP wide = pairs<Space>(9, 0, 0, random), p;
        for (int i = 0; i < wide.m_Num; ++i)
            p.add(wide.m_ObjX[i] * 1e-4f, wide.m_ObjY[i] * 1e-4f, wide.m_ObjZ[i] * 1e-4f, wide.m_ImgX[i] / 100,
                  wide.m_ImgY[i] / 100);
        expectTaubinLikeReference(p);
    }
}

TEST(Taubin, EqualsTheReferenceAndFindsTheTruth) {
    std::mt19937 random = kel_test::generator(74);
    for (int n : {20, 100, 1000}) {
        kelMat truth = Plane::transform(random), P = Space::transform(random);
        kelMatCorrespH wide, h;
        kelMatCorrespP wideP, p;
        addPairs<Plane>(wide, truth, n, 1.0f, 0, random);
        addPairs<Space>(wideP, P, n, 1.0f, 0, random);
        kelMat T1, T2;
        wide.normalize(h, T1, T2);
        kelMatEstimatorH H, expected;
        EXPECT_TRUE(H.estimate_byTaubin(h));
        kel_ref::taubin(expected, h);
        EXPECT_TRUE(same(H, expected));
        kel_ref::denormalize(H, T2, T1);
        EXPECT_LT(distanceOf(H, truth), 8.0f) << n;

        wideP.normalize(p, T1, T2);
        expectTaubinLikeReference(p);
    }
}

TEST(Taubin, FillsWithNaNWhereTheEigenproblemHasNoSolution) {
    testing::internal::CaptureStdout();
    kelMatCorrespH onAxis, notANumber, atOrigin;
    kelMatCorrespP plane;
    for (int i = 0; i < 8; ++i) {
        onAxis.add(float(i), 0, float(i), 0);
        atOrigin.add(0, 0, 0, 0);
        notANumber.add(kel_test::kNan, float(i), 1, float(i * i));
        plane.add(float(i), float(i * i % 5), 0, float(i), float(i % 3));
    }
    for (kelMatCorrespH* set : {&onAxis, &notANumber, &atOrigin}) {
        kelMatEstimatorH H;
        EXPECT_TRUE(H.estimate_byTaubin(*set));
        EXPECT_EQ(H.m_Width, 3);
        EXPECT_TRUE(std::isnan(H[0][0]));
    }
    kelMatEstimatorP P;
    EXPECT_TRUE(P.estimate_byTaubin(plane));
    EXPECT_EQ(P.m_Width, 4);
    EXPECT_TRUE(std::isnan(P[0][0]));
    testing::internal::GetCapturedStdout();
}

TEST(Fits, RefuseSmallSetsAndKeepTheirContents) {
    testing::internal::CaptureStdout();
    std::mt19937 random = kel_test::generator(75);
    kelMatCorrespH h = pairs<Plane>(4, 0, 0, random);
    kelMatCorrespP p = pairs<Space>(5, 0, 0, random);
    kelMatEstimatorH H;
    kelMatEstimatorP P;
    H.setDataIdentity(3);
    P.setDataIdentity(3);
    const kelMat beforeH = H, beforeP = P;
    EXPECT_FALSE(H.estimate_byLSM(h) || H.estimate_byLSM_fine(h) || H.estimate_byTaubin(h));
    EXPECT_FALSE(P.estimate_byLSM(p) || P.estimate_byLSM_fine(p) || P.estimate_byTaubin(p) || P.estimate_byRANSAC_fine(p, 1));
    kelMatCorrespH three = pairs<Plane>(3, 0, 0, random);
    int count = 99;
    EXPECT_FALSE(H.estimate_byRANSAC_fine(three, 1, &count));
    EXPECT_TRUE(same(H, beforeH));
    EXPECT_TRUE(same(P, beforeP));
    EXPECT_EQ(count, 99);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
}

// As a product of matrices does.
TEST(Fits, StopOnAnEstimatorOfAnotherSize) {
    std::mt19937 random = kel_test::generator(79);
    kelMatCorrespH h = pairs<Plane>(20, 0, 0, random);
    kelMatCorrespP p = pairs<Space>(20, 0, 0, random);
    const char *const text = "this->m_Width == M.m_Height", *const file = "kelMat/src/kelMat.cpp",
                      *const product = "kelMat kelMat::operator*(const kelMat&) const";
    kelMatEstimatorH H, plain;
    H.create(4, 4, true);
    EXPECT_STOPS(H.estimate_byLSM_fine(h), text, file, product);
    EXPECT_STOPS(H.estimate_byRANSAC_fine(h, 2, nullptr), text, file, product);
    kelMatEstimatorP P;
    P.create(4, 4, true);
    EXPECT_STOPS(P.estimate_byLSM_fine(p), text, file, product);
    EXPECT_STOPS(P.estimate_byRANSAC_fine(p, 2), text, file, product);
    H.create(4, 4, true);
    H[3][3] = 0.5f;
    plain.estimate_byLSM(h);
    EXPECT_TRUE(H.estimate_byLSM(h)) << "rows at the matrix's own width";
    for (int i = 0; i < 9; ++i)
        EXPECT_NEAR(H[i / 3][i % 3] / H[2][2], plain[i / 3][i % 3], 1e-6 * std::fabs(plain[i / 3][i % 3]));
}

TEST(RandomIndex, DrawsInOrderAndLetsTheThirdOfFourEqualTheFirst) {
    int a, b, c, d, e, f;
    bool thirdIsFirst = false;
    for (unsigned seed = 0; seed < 300; ++seed) {
        srand(seed);
        getRandomIndex(a, b, c, d, 4);
        EXPECT_TRUE(b != a && c != b && d != a && d != b && d != c);
        thirdIsFirst = thirdIsFirst || c == a;
        getRandomIndex(6, a, b, c, d, e, f);
        EXPECT_EQ((1 << a | 1 << b | 1 << c | 1 << d | 1 << e | 1 << f), 63);
    }
    EXPECT_TRUE(thirdIsFirst);
    EXPECT_DIVISION_BY_ZERO(getRandomIndex(a, b, c, d, 0));
    EXPECT_DIVISION_BY_ZERO(getRandomIndex(0, a, b, c, d, e, f));
}

TEST(Plausibility, HasAbsoluteBoundsThatNaNPasses) {
    const auto judge = [](std::function<void(kelMat&)> change) {
        kelMat H(3, 3, true);
        H.setDataIdentity(1);
        change(H);
        return judgeHomography(H);
    };
    EXPECT_TRUE(judge([](kelMat&) {}));
    for (int i : {0, 1}) {
        EXPECT_TRUE(judge([=](kelMat& H) { H[i][i] = 4; }));
        EXPECT_FALSE(judge([=](kelMat& H) { H[i][i] = std::nextafter(4.0f, 5.0f); }));
        EXPECT_TRUE(judge([=](kelMat& H) { H[i][i] = 0.1f; })) << "the float 0.1 lies above the double";
        EXPECT_FALSE(judge([=](kelMat& H) { H[i][i] = std::nextafter(0.1f, 0.0f); }));
        EXPECT_FALSE(judge([=](kelMat& H) { H[i][i] = -1; })) << "a mirror";
        EXPECT_FALSE(judge([=](kelMat& H) { H[2][i] = 0.002f; })) << "the float 0.002 lies above the double";
        EXPECT_TRUE(judge([=](kelMat& H) { H[2][i] = 0.001f; }));
    }
    EXPECT_TRUE(judge([](kelMat& H) { H[0][1] = H[1][0] = H[0][0] = H[1][1] = 1; })) << "zero area passes";
    EXPECT_TRUE(judge([](kelMat& H) { std::fill_n(H.m_Data, 9, kel_test::kNan); }));
    EXPECT_TRUE([] {
        kelMat zero(3, 4, true);
        return judgeMatrixP(zero);
    }());
}

TEST(Inliers, AreCountedStrictlyAndMarkedForEveryLength) {
    std::mt19937 random = kel_test::generator(76);
    for (int n : {0, 1, 2, 3, 4, 5, 7, 8, 9, 15, 16, 17, 255, 256, 257, 513}) {
        kelMat H = Plane::transform(random), P = Space::transform(random);
        kelMatCorrespH h;
        kelMatCorrespP p;
        addPairs<Plane>(h, H, n, 2, 0.3f, random);
        addPairs<Space>(p, P, n, 2, 0.3f, random);
        if (n > 5)
            h.m_SrcX[5] = p.m_ObjX[5] = kel_test::kNan;
        for (float threshold : {0.0f, 0.5f, 1.5f, -1.5f, 1e20f}) {
            std::vector<bool> mask(n + 3, true), expected(n + 3, true);
            EXPECT_EQ(judgeInliers(H, h, mask, threshold), kel_ref::inliers(H, h, expected, threshold));
            EXPECT_EQ(mask, expected);
            EXPECT_EQ(judgeInliers(P, p, mask, threshold), kel_ref::inliers(P, p, expected, threshold));
            EXPECT_EQ(mask, expected);
        }
    }
    kelMatCorrespH onBound;
    kelMatCorrespP onBoundP;
    for (int i = 0; i < 9; ++i) {
        onBound.add(0, 0, 3, 4);
        onBoundP.add(0, 0, 0, 3, 4);
    }
    kelMat identity(3, 3, true), flat(3, 4, true);
    identity.setDataIdentity(1);
    flat[0][0] = flat[1][1] = flat[2][3] = 1;
    std::vector<bool> mask(9);
    EXPECT_EQ(judgeInliers(identity, onBound, mask, 5), 0) << "a pair at the threshold is an outlier";
    EXPECT_EQ(judgeInliers(flat, onBoundP, mask, 5), 0);
    // Just at the error of one pair after the other: a sum in another order counts some of them differently.
    kelMatCorrespP close;
    kelMat P = Space::transform(random);
    addPairs<Space>(close, P, 200, 2, 0, random);
    std::vector<bool> closeMask(200), expectedMask(200);
    for (int i = 0; i < close.m_Num; ++i) {
        float u, v;
        P.cvtPoint(close.m_ObjX[i], close.m_ObjY[i], close.m_ObjZ[i], &u, &v);
        const float error = std::hypot(close.m_ImgX[i] - u, close.m_ImgY[i] - v);
        for (float threshold : {std::nextafter(error, 0.0f), error, std::nextafter(error, 9.0f)})
            EXPECT_EQ(judgeInliers(P, close, closeMask, threshold), kel_ref::inliers(P, close, expectedMask, threshold));
    }
    // A pair that nothing divides by zero at, alone in its block: nothing else is computed.
    kelMatCorrespH far;
    far.add(1, 1, 1, 1);
    kelMat pole(3, 3, true);
    pole[0][0] = pole[1][1] = pole[2][0] = 1;
    std::feclearexcept(FE_ALL_EXCEPT);
    EXPECT_EQ(judgeInliers(pole, far, mask, 5), 1);
    EXPECT_FALSE(std::fetestexcept(FE_DIVBYZERO | FE_INVALID));
    kelMat wrong(3, 4, true);
    EXPECT_STOPS(judgeInliers(wrong, onBound, mask, 5), "this->m_Width == 3 && this->m_Height == 3", "kelMat/src/kelMat.cpp",
                 "void kelMat::cvtPoint(float, float, float*, float*)");
}

namespace {

template <class Kind> void expectRansacLikeReference(typename Kind::Set set, unsigned seed) {
    constexpr bool plane = Kind::kColumns == 3; // only there inliers are counted for the caller
    typename Kind::Estimator fit, expected;
    int count = -5, expectedCount = -5;
    const float threshold = plane ? 2 : 4;
    srand(seed);
    const bool ok = Kind::ransac(fit, set, threshold, &count);
    const int next = rand();
    srand(seed);
    EXPECT_EQ(ok, kel_ref::ransac(expected, set, threshold, plane ? &expectedCount : nullptr, Kind::kRules));
    EXPECT_EQ(next, rand()) << "the number of draws";
    EXPECT_EQ(count, expectedCount);
    EXPECT_TRUE(same(fit, expected));
}

} // namespace

TYPED_TEST(RansacOf, StopsAtEnoughInliersAndNotOneBefore) {
    std::mt19937 random = kel_test::generator(79);
    for (int fewer : {0, 1}) {
        typename TypeParam::Set set = pairs<TypeParam>(TypeParam::kRules.enough - fewer, 0, 0, random);
        addPairs<TypeParam>(set, TypeParam::transform(random), 100, 0, 1, random);
        expectRansacLikeReference<TypeParam>(set, random());
    }
}

TYPED_TEST(RansacOf, EqualsTheReferenceToTheBitAndToTheDraw) {
    KEL_NOT_UNDER_VALGRIND("it adds only time");
    std::mt19937 random = kel_test::generator(77);
    for (int n : {4, 5, 6, 7, 10, 30, 49, 50, 60, 120, 450})
        for (float outliers : {0.0f, 0.2f, 0.5f, 0.8f, 1.0f})
            if (TypeParam::kColumns == 3 || (n >= 6 && (n < 100 || outliers < 0.4f))) {
                SCOPED_TRACE(std::to_string(n) + " pairs, outliers " + std::to_string(outliers));
                expectRansacLikeReference<TypeParam>(pairs<TypeParam>(n, 1, outliers, random), random());
            }
}

TEST(Ransac, FindsTheTruthAmongOutliers) {
    std::mt19937 random = kel_test::generator(78);
    int near = 0;
    for (int round = 0; round < 20; ++round) {
        kelMat truth = Plane::transform(random);
        kelMatCorrespH h;
        addPairs<Plane>(h, truth, 200, 0.5f, 0.4f, random);
        kelMatEstimatorH H;
        srand(random());
        near += H.estimate_byRANSAC_fine(h, 3, nullptr) && distanceOf(H, truth) < 3;
    }
    EXPECT_GE(near, 18);

    kelMat mirror(3, 3, true);
    mirror.setDataIdentity(1);
    mirror[0][0] = -1;
    mirror[0][2] = 640;
    kelMatCorrespH h;
    addPairs<Plane>(h, mirror, 100, 0, 0, random);
    kelMatEstimatorH H;
    EXPECT_FALSE(H.estimate_byRANSAC_fine(h, 3, nullptr)) << "a mirror is never returned";
}

TEST(Generator, ComposesObjectCameraAndView) {
    kelMatGeneratorP generator;
    kelMat P;
    generator.getMat(P);
    EXPECT_EQ(P.getNorm(), 0) << "no focal length yet";
    EXPECT_EQ(P.m_Width, 4);
    const auto expect = [&](std::vector<float> values) {
        generator.getMat(P);
        for (int i = 0; i < 12; ++i)
            EXPECT_EQ(P.m_Data[i], values[i]) << i;
    };
    generator.setMatView(500);
    expect({500, 0, 0, 0, 0, 500, 0, 0, 0, 0, 1, 3000});
    generator.setMatObjectScale(2);
    expect({250, 0, 0, 0, 0, 250, 0, 0, 0, 0, 0.5f, 3000});
    generator.setMatViewShift(3, 4);
    expect({250, 0, 1.5f, 9000, 0, 250, 2, 12000, 0, 0, 0.5f, 3000});
    generator.setMatObjectShift(8, 16, 32);
    expect({250, 0, 1.5f, 11048, 0, 250, 2, 16064, 0, 0, 0.5f, 3016});
    generator.setMatViewScale(2);
    expect({500, 0, 3, 22096, 0, 500, 4, 32128, 0, 0, 1, 6032});

    generator.setMatCamera(10, 20, 30, 1, 2, 3);
    kelMat R;
    R.setDataRotationMatrix_XYZ_3x3(10, 20, 30);
    EXPECT_EQ(generator.matCamera[1][2], R[1][2]);
    EXPECT_EQ(generator.matCamera[2][3], 3);
    const kelMat product = generator.matCamera * generator.matCameraInverse;
    for (int i = 0; i < 16; ++i)
        EXPECT_NEAR(product.m_Data[i], i % 5 == 0, 1e-6);
}

TEST(Generator, DrawsItsValuesInArgumentOrder) {
    const auto draw = [](float a, float b) {
        const float lo = std::min(a, b), hi = std::max(a, b);
        return ((hi - lo) * static_cast<float>(rand())) * 4.656612873077393e-10f + lo;
    };
    kelMatGeneratorP random, fixed;
    srand(31);
    random.setMatViewRandom(900, 300);
    random.setMatCameraRandom(1, 10, 20, 2, 3, 30, 4, 40, 5, 50, 60, 6);
    random.setMatObjectRandom(1, 10, 20, 2, 3, 30, 4, 40, 5, 50, 60, 6);
    srand(31);
    fixed.setMatView(draw(900, 300));
    for (void (kelMatGeneratorP::*set)(float, float, float, float, float, float) :
         {&kelMatGeneratorP::setMatCamera, &kelMatGeneratorP::setMatObject}) {
        const float a = draw(1, 10), b = draw(20, 2), c = draw(3, 30), d = draw(4, 40), e = draw(5, 50), f = draw(60, 6);
        (fixed.*set)(a, b, c, d, e, f);
    }
    kelMat P, expected;
    random.getMat(P);
    fixed.getMat(expected);
    EXPECT_TRUE(same(P, expected));
    random.setMatViewRandom(1, kel_test::kNan);
    EXPECT_TRUE(std::isnan(random.matView[0][0])) << "bounds are swapped only where the first is larger";
}

// Real tentative matches, where a folder of them is named at configure time.
TEST(Ransac, HoldsOnMatchesOfPhotographs) {
    const std::string folder = std::string(KEL_DATA_DIR) + "/points/";
    if (!std::ifstream(folder + "graf_pts.txt"))
        GTEST_SKIP() << "KEL_DATA_DIR names no folder with points";
    const struct {
        const char* name;
        int least; // successes of 200 seeds
        bool plausibleBackwards;
    } sets[] = {{"graf", 200, true},     {"WhiteBoard", 198, true}, {"LePoint1", 200, true},
                {"Brussels", 200, true}, {"adam", 200, false},      {"CapitalRegion", 195, true}};
    for (const auto& set : sets) {
        kelMatCorrespH matches, validation;
        std::ifstream in(folder + set.name + "_pts.txt");
        float x1, y1, w1, x2, y2, w2;
        for (int label; in >> x1 >> y1 >> w1 >> x2 >> y2 >> w2 >> label;)
            (label ? validation : matches).add(x1, y1, x2, y2);
        int successes = 0;
        for (unsigned seed = 1; seed <= 200; ++seed) {
            srand(seed);
            kelMatEstimatorH H;
            if (!H.estimate_byRANSAC_fine(matches, 3, nullptr))
                continue;
            float sum = 0;
            for (int i = 0; i < validation.m_Num; ++i) {
                float u, v;
                H.cvtPoint(validation.m_SrcX[i], validation.m_SrcY[i], &u, &v);
                sum += std::hypot(u - validation.m_DstX[i], v - validation.m_DstY[i]);
            }
            successes += sum < 5 * static_cast<float>(validation.m_Num);
        }
        EXPECT_GE(successes, set.least) << set.name;
        kelMat truth(3, 3, true);
        std::ifstream truthFile(folder + set.name + "_H.txt");
        for (int i = 0; i < 9; ++i)
            truthFile >> truth.m_Data[i];
        kelMat back = truth.getInversedMatrix();
        back.setDataUnitize();
        EXPECT_TRUE(judgeHomography(truth)) << set.name;
        EXPECT_EQ(judgeHomography(back), set.plausibleBackwards) << set.name;
    }
}
