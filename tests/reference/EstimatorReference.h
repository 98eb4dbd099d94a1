// Plain references of normalisation, estimators and their sampling, on the public matrix arithmetic alone. They draw from rand()
// in the library's own order, so that equal seeds must give equal bits.
#ifndef KEL_TESTS_ESTIMATOR_REFERENCE_H
#define KEL_TESTS_ESTIMATOR_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <kel/kelMat.h>
#include <limits>
#include <vector>

namespace kel_ref {

using Values = std::vector<float>;
using Rows = std::vector<Values>;

// The coordinates of pair i in their order.
template <class Kind> Values pairOf(const typename Kind::Set& s, int i) {
    Values p;
    for (auto coordinate : Kind::kCoordinates)
        p.push_back((s.*coordinate)[i]);
    return p;
}

inline kelMat matrixOf(const Rows& rows) {
    kelMat A(static_cast<int>(rows.size()), static_cast<int>(rows[0].size()), false);
    float* out = A.m_Data;
    for (const Values& row : rows)
        out = std::copy(row.begin(), row.end(), out);
    return A;
}

// The matrix of all rows that `of` makes of the pairs.
template <class Kind> kelMat design(const typename Kind::Set& s, Rows (*of)(const Values&)) {
    Rows all;
    for (int i = 0; i < s.m_Num; ++i)
        for (const Values& row : of(pairOf<Kind>(s, i)))
            all.push_back(row);
    return matrixOf(all);
}

// Centres and scales coordinates `begin` to `end` of all pairs to the end of out; returns {scale, centre...}.
template <class Kind> Values normalizeCloud(const typename Kind::Set& in, typename Kind::Set& out, int begin, int end) {
    const int n = in.m_Num;
    Values result(1);
    for (int k = begin; k < end; ++k) {
        float sum = 0;
        for (float value : in.*Kind::kCoordinates[k])
            sum += value;
        result.push_back(sum / static_cast<float>(n));
    }
    float distances = 0;
    for (int i = 0; i < n; ++i) {
        float squares = 0;
        for (int k = begin; k < end; ++k) {
            const float delta = (in.*Kind::kCoordinates[k])[i] - result[k - begin + 1];
            (out.*Kind::kCoordinates[k]).push_back(delta);
            squares += delta * delta;
        }
        distances = static_cast<float>(static_cast<double>(distances) + std::sqrt(static_cast<double>(squares)));
    }
    result[0] = static_cast<float>(static_cast<double>(n) * std::sqrt(2.0) / static_cast<double>(distances));
    for (int k = begin; k < end; ++k)
        for (float& value : out.*Kind::kCoordinates[k])
            value *= result[0];
    return result;
}

template <class Kind> void normalize(const typename Kind::Set& in, typename Kind::Set& out, kelMat& T1, kelMat& T2) {
    constexpr int D = Kind::kColumns - 1;
    const Values t1 = normalizeCloud<Kind>(in, out, 0, D), t2 = normalizeCloud<Kind>(in, out, D, D + 2);
    out.m_Num = in.m_Num;
    T1 = kelMat(D + 1, D + 1);
    T1[D][D] = 1;
    for (int i = 0; i < D; ++i) {
        T1[i][i] = t1[0];
        T1[i][D] = t1[i + 1] * -t1[0];
    }
    T2 = matrixOf({{1 / t2[0], 0, t2[1]}, {0, 1 / t2[0], t2[2]}, {0, 0, 1}});
}

inline void denormalize(kelMat& M, const kelMat& T2, const kelMat& T1) {
    const kelMat product = T2 * M * T1;
    M.setData(product.m_Data);
    M.setDataUnitize();
}

// The last column of a least-squares problem: the first of the smallest singular values.
template <class Kind> bool leastSquares(kelMat& M, const typename Kind::Set& s) {
    if (s.m_Num < Kind::kLeast)
        return false;
    kelMat U, W, V;
    design<Kind>(s, Kind::rows).getDecomposedMatrix_SV(U, W, V);
    int k = 0;
    for (int i = 1; i < W.m_Width; ++i)
        if (W[i][i] < W[k][k])
            k = i;
    for (int i = 0; i < W.m_Width; ++i)
        M.m_Data[i] = V[i][k];
    M.setDataUnitize();
    return true;
}

template <class Kind> bool leastSquaresFine(kelMat& M, const typename Kind::Set& s) {
    typename Kind::Set normalized;
    kelMat T1, T2;
    normalize<Kind>(s, normalized, T1, T2);
    if (!leastSquares<Kind>(M, normalized))
        return false;
    denormalize(M, T2, T1);
    return true;
}

// One eigenvector of N x = lambda M x, with M = A^T A and N = B^T B formed in full, or NaN where there is none.
template <class Kind> bool taubin(kelMat& result, const typename Kind::Set& s) {
    if (s.m_Num < Kind::kLeast)
        return false;
    const auto print = [](const char* title, kelMat& M) {
        if (Kind::kPrints) {
            std::puts(title);
            M.print(nullptr);
        }
    };
    const kelMat A = design<Kind>(s, Kind::crossRows), B = design<Kind>(s, Kind::derivatives);
    kelMat M = A.getTransposedMatrix() * A, N = B.getTransposedMatrix() * B, lambda, X;
    for (kelMat* moments : {&M, &N})
        for (int i = 0; i < M.m_Width * M.m_Width; ++i)
            moments->m_Data[i] /= Kind::kPrints ? static_cast<float>(s.m_Num) : 1;
    print("M", M);
    print("N", N);
    N.getGeneralizedEigenValue(M, lambda, X);
    print("eigenvalue", lambda);
    const int k = X.m_IsCreated ? Kind::chosen(lambda) : 0;
    for (int i = 0; i < M.m_Width; ++i)
        result.m_Data[i] = X.m_IsCreated ? X[i][k] : std::numeric_limits<float>::quiet_NaN();
    result.setDataUnitize();
    print("result", result);
    return true;
}

template <class Kind> int inliers(kelMat& M, const typename Kind::Set& s, std::vector<bool>& mask, float threshold) {
    constexpr int D = Kind::kColumns - 1;
    int count = 0;
    for (int i = 0; i < s.m_Num; ++i) {
        const Values p = pairOf<Kind>(s, i);
        float u, v;
        Kind::project(M, p, &u, &v);
        const float dx = p[D] - u, dy = p[D + 1] - v;
        mask[i] = threshold * threshold > dx * dx + dy * dy;
        count += mask[i];
    }
    return count;
}

template <class Kind> bool ransac(kelMat& M, const typename Kind::Set& set, float threshold, int* inlierCount) {
    using Set = typename Kind::Set;
    const int n = set.m_Num;
    if (n < Kind::kSample)
        return false;
    Set normalized;
    kelMat T1, T2;
    normalize<Kind>(set, normalized, T1, T2);
    std::vector<bool> mask(n), bestMask(n);
    int best = 0, maxIter = 1500, iter = 0;
    do {
        Kind::drawCandidate(M, normalized);
        denormalize(M, T2, T1);
        if (Kind::plausible(M)) {
            const int count = inliers<Kind>(M, set, mask, threshold);
            if (count > best) {
                const double e = 1 - static_cast<double>(count) / n;
                maxIter = Kind::fewerDraws(maxIter, -4.605170185988091 / std::log(1 - std::pow(1 - e, 4.0)));
                bestMask = mask;
                best = count;
            }
        }
        ++iter;
    } while (best < Kind::kEnough && iter < maxIter);
    for (;;) {
        Set chosen;
        for (int i = 0; i < n; ++i)
            if (bestMask[i])
                Kind::add(chosen, pairOf<Kind>(normalized, i));
        if (!leastSquares<Kind>(M, chosen))
            return false;
        denormalize(M, T2, T1);
        if (!Kind::plausible(M))
            return false;
        const int count = inliers<Kind>(M, set, bestMask, threshold);
        if (count <= best) {
            if (inlierCount)
                *inlierCount = count;
            return true;
        }
        best = count;
    }
}

// ---- what tells the kinds of pairs apart ------------------------------------------------------------------------------------

// Between planes.
struct Plane {
    using Set = kelMatCorrespH;
    static constexpr int kColumns = 3, kLeast = 5, kSample = 4, kEnough = 50;
    static constexpr bool kPrints = false;
    static constexpr Values Set::*kCoordinates[] = {&Set::m_SrcX, &Set::m_SrcY, &Set::m_DstX, &Set::m_DstY};

    static void add(Set& s, const Values& p) { s.add(p[0], p[1], p[2], p[3]); }
    static void project(kelMat& H, const Values& p, float* u, float* v) { H.cvtPoint(p[0], p[1], u, v); }
    static Rows rows(const Values& p) {
        const float x1 = p[0], y1 = p[1], x2 = p[2], y2 = p[3];
        return {{0, 0, 0, -x1, -y1, -1, y2 * x1, y2 * y1, y2}, {x1, y1, 1, 0, 0, 0, -x2 * x1, -x2 * y1, -x2}};
    }
    static constexpr auto crossRows = rows;
    static Rows derivatives(const Values& p) {
        const float x1 = p[0], y1 = p[1], x2 = p[2], y2 = p[3];
        return {{0, 0, 0, -1, 0, 0, y2, 0, 0}, {0, 0, 0, 0, -1, 0, 0, y2, 0}, {0, 0, 0, 0, 0, 0, x1, y1, 1},
                {1, 0, 0, 0, 0, 0, -x2, 0, 0}, {0, 1, 0, 0, 0, 0, 0, -x2, 0}, {0, 0, 0, 0, 0, 0, -x1, -y1, -1}};
    }
    static int chosen(const kelMat& lambda) {
        return static_cast<int>(std::max_element(lambda[0], lambda[lambda.m_Height]) - lambda[0]);
    }
    static void drawCandidate(kelMat& H, const Set& s) {
        const int n = s.m_Num, a = rand() % n;
        int b = rand() % n;
        while (b == a)
            b = rand() % n;
        int c = rand() % n;
        while (c == b)
            c = rand() % n;
        int d = rand() % n;
        while (d == a || d == b || d == c)
            d = rand() % n;
        kelMatEstimatorH four;
        const auto &x = s.m_SrcX, &y = s.m_SrcY, &u = s.m_DstX, &v = s.m_DstY;
        four.estimate_by4P(x[a], y[a], u[a], v[a], x[b], y[b], u[b], v[b], x[c], y[c], u[c], v[c], x[d], y[d], u[d], v[d]);
        H.setData(four.m_Data);
    }
    static bool plausible(kelMat& H) {
        const float sx = std::sqrt(H[0][0] * H[0][0] + H[1][0] * H[1][0]),
                    sy = std::sqrt(H[0][1] * H[0][1] + H[1][1] * H[1][1]);
        const float p = std::sqrt(H[2][0] * H[2][0] + H[2][1] * H[2][1]);
        return !(H[0][0] * H[1][1] - H[1][0] * H[0][1] < 0) && !(sx > 4.0f) && !(double(sx) < 0.1) && !(sy > 4.0f) &&
               !(double(sy) < 0.1) && !(double(p) > 0.002);
    }
    static int fewerDraws(int draws, double needed) { // 1600 stands for more than 1500
        return std::min(draws, needed > 1500 ? 1600 : static_cast<int>(needed + 0.5));
    }
};

// From space to a plane.
struct Space {
    using Set = kelMatCorrespP;
    static constexpr int kColumns = 4, kLeast = 6, kSample = 6, kEnough = 400;
    static constexpr bool kPrints = true;
    static constexpr Values Set::*kCoordinates[] = {&Set::m_ObjX, &Set::m_ObjY, &Set::m_ObjZ, &Set::m_ImgX, &Set::m_ImgY};

    static void add(Set& s, const Values& p) { s.add(p[0], p[1], p[2], p[3], p[4]); }
    static void project(kelMat& P, const Values& p, float* u, float* v) { P.cvtPoint(p[0], p[1], p[2], u, v); }
    static Rows rows(const Values& p) {
        const float X = p[0], Y = p[1], Z = p[2], x = p[3], y = p[4];
        return {{X, Y, Z, 1, 0, 0, 0, 0, -x * X, -x * Y, -x * Z, -x}, {0, 0, 0, 0, X, Y, Z, 1, -y * X, -y * Y, -y * Z, -y}};
    }
    static Rows crossRows(const Values& p) {
        const float X[4] = {p[0], p[1], p[2], 1}, x = p[3], y = p[4];
        Rows rows(3, Values(12));
        for (int c = 0; c < 4; ++c) {
            rows[0][c] = X[c];
            rows[0][8 + c] = -x * X[c];
            rows[1][4 + c] = -X[c];
            rows[1][8 + c] = y * X[c];
            rows[2][c] = -y * X[c];
            rows[2][4 + c] = x * X[c];
        }
        return rows;
    }
    // Five of each row, by X, Y, Z, x and y; the second row's are taken of its negative.
    static Rows derivatives(const Values& p) {
        const float X[4] = {p[0], p[1], p[2], 1}, x = p[3], y = p[4];
        Rows rows(15, Values(12));
        for (int c = 0; c < 4; ++c) {
            rows[3][8 + c] = rows[9][8 + c] = rows[14][c] = -X[c];
            rows[13][4 + c] = X[c];
        }
        for (int c = 0; c < 3; ++c) {
            rows[c][c] = rows[5 + c][4 + c] = 1;
            rows[c][8 + c] = -x;
            rows[5 + c][8 + c] = rows[10 + c][c] = -y;
            rows[10 + c][4 + c] = x;
        }
        return rows;
    }
    static int chosen(const kelMat& lambda) {
        int chosen = 0;
        float best = lambda[0][0];
        for (int k = 1; k < 12; ++k)
            if (std::fabs(lambda[k][0]) < 2147483648.0f && std::trunc(std::fabs(lambda[k][0])) > best) {
                chosen = k;
                best = std::trunc(std::fabs(lambda[k][0]));
            }
        return chosen;
    }
    static void drawCandidate(kelMat& P, const Set& s) {
        std::vector<int> drawn;
        Set six;
        while (six.m_Num < 6) {
            const int index = rand() % s.m_Num;
            if (std::find(drawn.begin(), drawn.end(), index) == drawn.end()) {
                drawn.push_back(index);
                add(six, pairOf<Space>(s, index));
            }
        }
        leastSquares<Space>(P, six);
    }
    static bool plausible(kelMat&) { return true; }
    static int fewerDraws(int draws, double needed) { return draws > needed ? static_cast<int>(needed) : draws; }
};

} // namespace kel_ref

#endif
