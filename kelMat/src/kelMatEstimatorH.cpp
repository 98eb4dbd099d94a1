// Homographies from pairs of 2-D points: four-point solution, least squares, Taubin's method, RANSAC.
#include <cstdlib>

#include "kelDivision.h"
#include "kelMatEstimator_Private.h"

namespace {

constexpr int kUnknowns = 9; // h00 h01 h02 h10 ... h22

// Two design rows of a pair, theta times each of which a right homography makes zero:
// | 0   0   0  -x1 -y1 -1   y2 x1   y2 y1   y2 |
// | x1  y1  1   0   0   0  -x2 x1  -x2 y1  -x2 |
void fillRows(float* row, float x1, float y1, float x2, float y2) {
    const float rows[2 * kUnknowns] = {0,  0,  0, -x1, -y1, -1, y2 * x1,  y2 * y1,  y2, //
                                       x1, y1, 1, 0,   0,   0,  -x2 * x1, -x2 * y1, -x2};
    std::copy_n(rows, 2 * kUnknowns, row);
}

// The inverse of a homography of the unit square, the adjugate over the determinant:
//     | g0 g1 g2 |           | g4 - g5 g7     g2 g7 - g1     g1 g5 - g2 g4 |
// G = | g3 g4 g5 |,  adj G = | g5 g6 - g3     g0 - g2 g6     g2 g3 - g0 g5 |
//     | g6 g7 1  |           | g3 g7 - g4 g6  g1 g6 - g0 g7  g0 g4 - g1 g3 |
void invertUnitSquareProjection(const float* g, float* inverse) {
    const float g04 = g[0] * g[4], g05 = g[0] * g[5], g07 = g[0] * g[7], g13 = g[1] * g[3], g15 = g[1] * g[5],
                g16 = g[1] * g[6], g23 = g[2] * g[3], g24 = g[2] * g[4], g26 = g[2] * g[6], g27 = g[2] * g[7],
                g37 = g[3] * g[7], g46 = g[4] * g[6], g56 = g[5] * g[6], g57 = g[5] * g[7];
    const float determinant = g04 - g[7] * g05 - g13 + g[7] * g23 + g[5] * g16 - g[4] * g26;
    const float r = 1.0f / determinant;
    const float adjugate[9] = {g[4] - g57, g27 - g[1], g15 - g24, //
                               g56 - g[3], g[0] - g26, g23 - g05, //
                               g37 - g46,  g16 - g07,  g04 - g13};
    for (int i = 0; i < 9; ++i)
        inverse[i] = adjugate[i] * r;
}

// The homography through four pairs, each x1, y1, x2, y2, by way of the unit square: H = G2 G1^-1, where G1 takes the square to the
// first points and G2 to the second.
void fitFourPairs(kelMat& H, const float (&p)[4][4]) {
    float G1[9], G2[9], inverse[9], product[9];
    UnitSquareProjection(p[0][0], p[0][1], p[1][0], p[1][1], p[2][0], p[2][1], p[3][0], p[3][1], G1);
    UnitSquareProjection(p[0][2], p[0][3], p[1][2], p[1][3], p[2][2], p[2][3], p[3][2], p[3][3], G2);
    G2[8] = 1.0f;
    invertUnitSquareProjection(G1, inverse);
    kel::multiplySmall<3, 3, 3>(product, G2, inverse);
    kel::assign<3>(H, product);
}

struct Model {
    using Set = kelMatCorrespH;
    static constexpr int kColumns = 3, kLeastPairs = 5, kSample = 4, kEnoughInliers = 50;
    static void fillRows(float* row, const Set& set, int i) {
        ::fillRows(row, set.m_SrcX[i], set.m_SrcY[i], set.m_DstX[i], set.m_DstY[i]);
    }
    static int count(const kelMat& M, const Set& set, float threshold, int best, uint8_t* marks) {
        const kel::PairsView pairs = {
            set.m_Num, {set.m_SrcX.data(), set.m_SrcY.data()}, {set.m_DstX.data(), set.m_DstY.data()}};
        return kel::inlierKernels().plane(M.m_Data, pairs, threshold, best, marks);
    }
    static void fitSample(kelMat& H, const Set& set) {
        int a, b, c, d;
        getRandomIndex(a, b, c, d, set.m_Num);
        const auto &x1 = set.m_SrcX, &y1 = set.m_SrcY, &x2 = set.m_DstX, &y2 = set.m_DstY;
        fitFourPairs(H, {{x1[a], y1[a], x2[a], y2[a]},
                         {x1[b], y1[b], x2[b], y2[b]},
                         {x1[c], y1[c], x2[c], y2[c]},
                         {x1[d], y1[d], x2[d], y2[d]}});
    }
    static bool isPlausible(kelMat& H) { return judgeHomography(H); }
    // Rounded; more than there are to be had change nothing.
    static int fewerDraws(int draws, double needed) {
        return needed > kel::kMostDraws ? draws : std::min(draws, kel::truncated(needed + 0.5));
    }
};

} // namespace

kelMatEstimatorH::kelMatEstimatorH() : kelMat(3, 3, true) {}

kelMatEstimatorH::~kelMatEstimatorH() {}

bool kelMatEstimatorH::estimate_by4P(float x1_0, float y1_0, float x2_0, float y2_0, float x1_1, float y1_1, float x2_1,
                                     float y2_1, float x1_2, float y1_2, float x2_2, float y2_2, float x1_3, float y1_3,
                                     float x2_3, float y2_3) {
    fitFourPairs(*this,
                 {{x1_0, y1_0, x2_0, y2_0}, {x1_1, y1_1, x2_1, y2_1}, {x1_2, y1_2, x2_2, y2_2}, {x1_3, y1_3, x2_3, y2_3}});
    return true;
}

bool kelMatEstimatorH::estimate_byLSM(kelMatCorrespH& corresp) {
    return kel::leastSquares<Model>(*this, corresp);
}

bool kelMatEstimatorH::estimate_byLSM_fine(kelMatCorrespH& corresp) {
    return kel::leastSquaresFine<Model>(*this, corresp);
}

bool kelMatEstimatorH::estimate_byTaubin(kelMatCorrespH& corresp) {
    const int n = corresp.m_Num;
    if (n < Model::kLeastPairs)
        return false;
    kel::Moments<kUnknowns> ofRows, ofDerivatives;
    for (int i = 0; i < n; ++i) {
        const float x1 = corresp.m_SrcX[i], y1 = corresp.m_SrcY[i], x2 = corresp.m_DstX[i], y2 = corresp.m_DstY[i];
        float rows[2][kUnknowns];
        fillRows(rows[0], x1, y1, x2, y2);
        ofRows.addRow(rows[0]);
        ofRows.addRow(rows[1]);
        // By x1, y1 and y2 of the first row (by x2 it is zero), by x1, y1 and x2 of the second.
        ofDerivatives.addRow({0, 0, 0, -1, 0, 0, y2, 0, 0});
        ofDerivatives.addRow({0, 0, 0, 0, -1, 0, 0, y2, 0});
        ofDerivatives.addRow({0, 0, 0, 0, 0, 0, x1, y1, 1});
        ofDerivatives.addRow({1, 0, 0, 0, 0, 0, -x2, 0, 0});
        ofDerivatives.addRow({0, 1, 0, 0, 0, 0, 0, -x2, 0});
        ofDerivatives.addRow({0, 0, 0, 0, 0, 0, -x1, -y1, -1});
    }
    kelMat M, N, lambda, X;
    ofRows.get(M, 1.0f);
    ofDerivatives.get(N, 1.0f);
    N.getGeneralizedEigenValue(M, lambda, X);
    int k = 0;
    for (int i = 1; i < lambda.m_Height; ++i)
        if (lambda[i][0] > lambda[k][0])
            k = i;
    kel::assignEigenvector<3>(*this, X, k);
    return true;
}

bool kelMatEstimatorH::estimate_byRANSAC_fine(kelMatCorrespH& corresp, float threshold, int* inliers) {
    const int count = kel::robustFit<Model>(*this, corresp, threshold);
    if (count >= 0 && inliers)
        *inliers = count;
    return count >= 0;
}

void getRandomIndex(int& a, int& b, int& c, int& d, int n) {
    a = rand() % kel::divisor(n);
    do
        b = rand() % n;
    while (b == a);
    do // c is compared with b alone and may equal a; callers rely on the draws
        c = rand() % n;
    while (c == b);
    do
        d = rand() % n;
    while (d == c || d == b || d == a);
}

// Every test is written so that NaN passes it. The scale bounds are compared in single precision, the others in double.
bool judgeHomography(kelMat& H) {
    constexpr float kLargestScale = 4.0f;
    constexpr double kSmallestScale = 0.1, kLargestPerspective = 0.002;
    const float *const h0 = H[0], *const h1 = H[1], *const h2 = H[2];
    if (h0[0] * h1[1] - h1[0] * h0[1] < 0.0f)
        return false;
    for (int c = 0; c < 2; ++c) {
        const float scale = std::sqrt(h0[c] * h0[c] + h1[c] * h1[c]);
        if (scale > kLargestScale || static_cast<double>(scale) < kSmallestScale)
            return false;
    }
    const float perspective = std::sqrt(h2[0] * h2[0] + h2[1] * h2[1]);
    return !(static_cast<double>(perspective) > kLargestPerspective);
}

int judgeInliers(kelMat& H, kelMatCorrespH& corresp, std::vector<bool>& mask, float threshold) {
    if (corresp.m_Num < 1)
        return 0;
    if (H.m_Width != 3 || H.m_Height != 3) {
        float x, y;
        H.cvtPoint(0.0f, 0.0f, &x, &y); // stops the process on the size
    }
    return kel::judge<Model>(H, corresp, mask, threshold);
}
