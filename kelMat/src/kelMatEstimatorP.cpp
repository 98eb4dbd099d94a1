// Camera projections from pairs of a 3-D and a 2-D point: least squares, Taubin's method, RANSAC.
#include <cstdio>
#include <cstdlib>

#include "kelDivision.h"
#include "kelMatEstimator_Private.h"

namespace {

constexpr int kUnknowns = 12; // p00 p01 p02 p03 p10 ... p23

// Two design rows of a pair, theta times each of which a right projection makes zero:
// | X  Y  Z  1  0  0  0  0  -x X  -x Y  -x Z  -x |
// | 0  0  0  0  X  Y  Z  1  -y X  -y Y  -y Z  -y |
void fillRows(float* row, float X, float Y, float Z, float x, float y) {
    const float rows[2 * kUnknowns] = {X, Y, Z, 1, 0, 0, 0, 0, -x * X, -x * Y, -x * Z, -x, //
                                       0, 0, 0, 0, X, Y, Z, 1, -y * X, -y * Y, -y * Z, -y};
    std::copy_n(rows, 2 * kUnknowns, row);
}

struct Model {
    using Set = kelMatCorrespP;
    static constexpr int kColumns = 4, kLeastPairs = 6, kSample = 6, kEnoughInliers = 400;
    static void fillRows(float* row, const Set& set, int i) {
        ::fillRows(row, set.m_ObjX[i], set.m_ObjY[i], set.m_ObjZ[i], set.m_ImgX[i], set.m_ImgY[i]);
    }
    static int count(const kelMat& M, const Set& set, float threshold, int best, uint8_t* marks) {
        const kel::PairsView pairs = {
            set.m_Num, {set.m_ObjX.data(), set.m_ObjY.data(), set.m_ObjZ.data()}, {set.m_ImgX.data(), set.m_ImgY.data()}};
        return kel::inlierKernels().space(M.m_Data, pairs, threshold, best, marks);
    }
    static void fitSample(kelMat& P, const Set& set) {
        int i[kSample];
        getRandomIndex(set.m_Num, i[0], i[1], i[2], i[3], i[4], i[5]);
        alignas(16) float rows[kSample][2 * kUnknowns];
        for (int k = 0; k < kSample; ++k)
            fillRows(rows[k], set, i[k]);
        kel::solveRows<Model>(P, rows[0], kSample);
    }
    static bool isPlausible(kelMat& P) { return judgeMatrixP(P); }
    // Truncated; NaN changes nothing.
    static int fewerDraws(int draws, double needed) { return draws > needed ? kel::truncated(needed) : draws; }
};

void printBlock(const char* title, kelMat& M) {
    puts(title);
    M.print(nullptr);
}

// The index of the eigenvector that Taubin's fit takes. Not the plain maximum, and callers rely on it: eigenvalue 0 counts as it
// is, later ones as magnitudes truncated to an integer; one that no int holds is never chosen.
int chooseEigenvalue(const kelMat& lambda) {
    if (lambda.m_Height < 1)
        return 0;
    int chosen = 0;
    float best = lambda[0][0];
    for (int k = 1; k < lambda.m_Height; ++k) {
        const int whole = kel::truncated(static_cast<double>(lambda[k][0]));
        const float magnitude = static_cast<float>(std::abs(static_cast<double>(whole)));
        if (whole != std::numeric_limits<int>::min() && magnitude > best) {
            chosen = k;
            best = magnitude;
        }
    }
    return chosen;
}

} // namespace

kelMatEstimatorP::kelMatEstimatorP() : kelMat(3, 4, true) {}

kelMatEstimatorP::~kelMatEstimatorP() {}

bool kelMatEstimatorP::estimate_byLSM(kelMatCorrespP& corresp) {
    return kel::leastSquares<Model>(*this, corresp);
}

bool kelMatEstimatorP::estimate_byLSM_fine(kelMatCorrespP& corresp) {
    return kel::leastSquaresFine<Model>(*this, corresp);
}

bool kelMatEstimatorP::estimate_byTaubin(kelMatCorrespP& corresp) {
    const int n = corresp.m_Num;
    if (n < Model::kLeastPairs)
        return false;
    kel::Moments<kUnknowns> ofRows, ofDerivatives;
    for (int i = 0; i < n; ++i) {
        const float X = corresp.m_ObjX[i], Y = corresp.m_ObjY[i], Z = corresp.m_ObjZ[i];
        const float x = corresp.m_ImgX[i], y = corresp.m_ImgY[i];
        // All three rows of the cross product of image point and projection.
        ofRows.addRow({X, Y, Z, 1, 0, 0, 0, 0, -x * X, -x * Y, -x * Z, -x});
        ofRows.addRow({0, 0, 0, 0, -X, -Y, -Z, -1, y * X, y * Y, y * Z, y});
        ofRows.addRow({-y * X, -y * Y, -y * Z, -y, x * X, x * Y, x * Z, x, 0, 0, 0, 0});
        // Their derivatives by X, Y, Z, x and y, without those that are zero; the second row's are taken of its negative.
        ofDerivatives.addRow({1, 0, 0, 0, 0, 0, 0, 0, -x, 0, 0, 0});
        ofDerivatives.addRow({0, 1, 0, 0, 0, 0, 0, 0, 0, -x, 0, 0});
        ofDerivatives.addRow({0, 0, 1, 0, 0, 0, 0, 0, 0, 0, -x, 0});
        ofDerivatives.addRow({0, 0, 0, 0, 0, 0, 0, 0, -X, -Y, -Z, -1});
        ofDerivatives.addRow({0, 0, 0, 0, 1, 0, 0, 0, -y, 0, 0, 0});
        ofDerivatives.addRow({0, 0, 0, 0, 0, 1, 0, 0, 0, -y, 0, 0});
        ofDerivatives.addRow({0, 0, 0, 0, 0, 0, 1, 0, 0, 0, -y, 0});
        ofDerivatives.addRow({0, 0, 0, 0, 0, 0, 0, 0, -X, -Y, -Z, -1});
        ofDerivatives.addRow({-y, 0, 0, 0, x, 0, 0, 0, 0, 0, 0, 0});
        ofDerivatives.addRow({0, -y, 0, 0, 0, x, 0, 0, 0, 0, 0, 0});
        ofDerivatives.addRow({0, 0, -y, 0, 0, 0, x, 0, 0, 0, 0, 0});
        ofDerivatives.addRow({0, 0, 0, 0, X, Y, Z, 1, 0, 0, 0, 0});
        ofDerivatives.addRow({-X, -Y, -Z, -1, 0, 0, 0, 0, 0, 0, 0, 0});
    }
    kelMat M, N, lambda, V;
    ofRows.get(M, static_cast<float>(n));
    ofDerivatives.get(N, static_cast<float>(n));
    printBlock("M", M);
    printBlock("N", N);
    N.getGeneralizedEigenValue(M, lambda, V);
    const int k = chooseEigenvalue(lambda);
    printBlock("eigenvalue", lambda);
    kel::assignEigenvector<4>(*this, V, k);
    printBlock("result", *this);
    return true;
}

bool kelMatEstimatorP::estimate_byRANSAC_fine(kelMatCorrespP& corresp, float threshold) {
    return kel::robustFit<Model>(*this, corresp, threshold) >= 0;
}

void getRandomIndex(int n, int& a, int& b, int& c, int& d, int& e, int& f) {
    int* const drawn[] = {&a, &b, &c, &d, &e, &f};
    for (int i = 0; i < 6; ++i) {
        const auto repeated = [&] {
            return std::any_of(drawn, drawn + i, [&](const int* earlier) { return *earlier == *drawn[i]; });
        };
        do
            *drawn[i] = rand() % kel::divisor(n);
        while (repeated());
    }
}

bool judgeMatrixP(kelMat&) {
    return true;
}

int judgeInliers(kelMat& P, kelMatCorrespP& corresp, std::vector<bool>& mask, float threshold) {
    if (corresp.m_Num < 1)
        return 0;
    if (P.m_Width != 4 || P.m_Height != 3) {
        float x, y;
        P.cvtPoint(0.0f, 0.0f, 0.0f, &x, &y); // stops the process on the size
    }
    return kel::judge<Model>(P, corresp, mask, threshold);
}
