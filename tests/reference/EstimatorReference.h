// Plain references of normalisation, estimators and their sampling, on the public matrix arithmetic alone. They draw from rand()
// in the library's own order, so that equal seeds must give equal bits.
#ifndef KEL_TESTS_ESTIMATOR_REFERENCE_H
#define KEL_TESTS_ESTIMATOR_REFERENCE_H

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <kel/kelMat.h>
#include <vector>

namespace kel_ref {

using Values = std::vector<float>;

// Centres and scales one point cloud of any dimension; returns {scale, centre...}.
inline Values normalizeCloud(std::vector<Values*> in, std::vector<Values>& out) {
    const int n = static_cast<int>(in[0]->size());
    Values result(1);
    for (Values* values : in) {
        float sum = 0;
        for (float value : *values)
            sum += value;
        result.push_back(sum / static_cast<float>(n));
    }
    float distances = 0;
    out.assign(in.size(), Values());
    for (int i = 0; i < n; ++i) {
        float squares = 0;
        for (size_t d = 0; d < in.size(); ++d) {
            const float delta = (*in[d])[i] - result[d + 1];
            out[d].push_back(delta);
            squares = d == 0 ? delta * delta : squares + delta * delta;
        }
        distances = static_cast<float>(static_cast<double>(distances) + std::sqrt(static_cast<double>(squares)));
    }
    result[0] = static_cast<float>(static_cast<double>(n) * std::sqrt(2.0) / static_cast<double>(distances));
    for (Values& values : out)
        for (float& value : values)
            value *= result[0];
    return result;
}

inline kelMat inverseNormaliser(const Values& t) {
    kelMat T(3, 3, true);
    T.setDataIdentity(1 / t[0]);
    T[2][2] = 1;
    T[0][2] = t[1];
    T[1][2] = t[2];
    return T;
}

inline kelMat normaliser(const Values& t) {
    const int n = static_cast<int>(t.size());
    kelMat T(n, n, true);
    T.setDataIdentity(t[0]);
    T[n - 1][n - 1] = 1;
    for (int i = 0; i + 1 < n; ++i)
        T[i][n - 1] = t[i + 1] * -t[0];
    return T;
}

inline void normalize(kelMatCorrespH& in, kelMatCorrespH& out, kelMat& T1, kelMat& T2) {
    std::vector<Values> src, dst;
    const Values t1 = normalizeCloud({&in.m_SrcX, &in.m_SrcY}, src), t2 = normalizeCloud({&in.m_DstX, &in.m_DstY}, dst);
    for (int i = 0; i < in.m_Num; ++i)
        out.add(src[0][i], src[1][i], dst[0][i], dst[1][i]);
    T1 = normaliser(t1);
    T2 = inverseNormaliser(t2);
}

inline void normalize(kelMatCorrespP& in, kelMatCorrespP& out, kelMat& T1, kelMat& T2) {
    std::vector<Values> obj, img;
    const Values t1 = normalizeCloud({&in.m_ObjX, &in.m_ObjY, &in.m_ObjZ}, obj),
                 t2 = normalizeCloud({&in.m_ImgX, &in.m_ImgY}, img);
    for (int i = 0; i < in.m_Num; ++i)
        out.add(obj[0][i], obj[1][i], obj[2][i], img[0][i], img[1][i]);
    T1 = normaliser(t1);
    T2 = inverseNormaliser(t2);
}

inline void denormalize(kelMat& M, const kelMat& T2, const kelMat& T1) {
    const kelMat product = T2 * M * T1;
    M.setData(product.m_Data);
    M.setDataUnitize();
}

// The last column of a least-squares problem: the first of the smallest singular values.
inline void smallest(const kelMat& A, kelMat& result) {
    kelMat U, W, V;
    A.getDecomposedMatrix_SV(U, W, V);
    int k = 0;
    for (int i = 1; i < A.m_Width; ++i)
        if (W[i][i] < W[k][k])
            k = i;
    for (int i = 0; i < A.m_Width; ++i)
        result.m_Data[i] = V[i][k];
    result.setDataUnitize();
}

inline void setRow(kelMat& A, int r, const Values& row) {
    for (size_t c = 0; c < row.size(); ++c)
        A[r][c] = row[c];
}

inline bool leastSquares(kelMat& H, kelMatCorrespH& s) {
    if (s.m_Num < 5)
        return false;
    kelMat A(2 * s.m_Num, 9, true);
    for (int i = 0; i < s.m_Num; ++i) {
        const float x1 = s.m_SrcX[i], y1 = s.m_SrcY[i], x2 = s.m_DstX[i], y2 = s.m_DstY[i];
        setRow(A, 2 * i, {0, 0, 0, -x1, -y1, -1, y2 * x1, y2 * y1, y2});
        setRow(A, 2 * i + 1, {x1, y1, 1, 0, 0, 0, -x2 * x1, -x2 * y1, -x2});
    }
    smallest(A, H);
    return true;
}

inline bool leastSquares(kelMat& P, kelMatCorrespP& s) {
    if (s.m_Num < 6)
        return false;
    kelMat A(2 * s.m_Num, 12, true);
    for (int i = 0; i < s.m_Num; ++i) {
        const float X = s.m_ObjX[i], Y = s.m_ObjY[i], Z = s.m_ObjZ[i], x = s.m_ImgX[i], y = s.m_ImgY[i];
        setRow(A, 2 * i, {X, Y, Z, 1, 0, 0, 0, 0, -x * X, -x * Y, -x * Z, -x});
        setRow(A, 2 * i + 1, {0, 0, 0, 0, X, Y, Z, 1, -y * X, -y * Y, -y * Z, -y});
    }
    smallest(A, P);
    return true;
}

template <class Set> bool leastSquaresFine(kelMat& M, Set& set, int least) {
    if (set.m_Num < least)
        return false;
    Set normalized;
    kelMat T1, T2;
    normalize(set, normalized, T1, T2);
    leastSquares(M, normalized);
    denormalize(M, T2, T1);
    return true;
}

// The largest eigenvalue's vector of N x = lambda M x, with M = A^T A and N = B^T B formed in full.
inline bool taubin(kelMat& H, kelMatCorrespH& s) {
    if (s.m_Num < 5)
        return false;
    kelMat A(2 * s.m_Num, 9, true), B(8 * s.m_Num, 9, true);
    for (int i = 0; i < s.m_Num; ++i) {
        const float x1 = s.m_SrcX[i], y1 = s.m_SrcY[i], x2 = s.m_DstX[i], y2 = s.m_DstY[i];
        setRow(A, 2 * i, {0, 0, 0, -x1, -y1, -1, y2 * x1, y2 * y1, y2});
        setRow(A, 2 * i + 1, {x1, y1, 1, 0, 0, 0, -x2 * x1, -x2 * y1, -x2});
        setRow(B, 8 * i, {0, 0, 0, -1, 0, 0, y2, 0, 0});
        setRow(B, 8 * i + 1, {0, 0, 0, 0, -1, 0, 0, y2, 0});
        setRow(B, 8 * i + 3, {0, 0, 0, 0, 0, 0, x1, y1, 1});
        setRow(B, 8 * i + 4, {1, 0, 0, 0, 0, 0, -x2, 0, 0});
        setRow(B, 8 * i + 5, {0, 1, 0, 0, 0, 0, 0, -x2, 0});
        setRow(B, 8 * i + 6, {0, 0, 0, 0, 0, 0, -x1, -y1, -1});
    }
    kelMat M = A.getTransposedMatrix() * A, N = B.getTransposedMatrix() * B, lambda, X;
    N.getGeneralizedEigenValue(M, lambda, X);
    int k = 0;
    for (int i = 1; i < 9; ++i)
        if (lambda[i][0] > lambda[k][0])
            k = i;
    for (int i = 0; i < 9; ++i)
        H.m_Data[i] = X[i][k];
    H.setDataUnitize();
    return true;
}

// With its diagnostic output.
inline bool taubin(kelMat& P, kelMatCorrespP& s) {
    if (s.m_Num < 6)
        return false;
    kelMat A(3 * s.m_Num, 12, true), B(15 * s.m_Num, 12, true);
    for (int i = 0; i < s.m_Num; ++i) {
        const float X[4] = {s.m_ObjX[i], s.m_ObjY[i], s.m_ObjZ[i], 1}, x = s.m_ImgX[i], y = s.m_ImgY[i];
        for (int c = 0; c < 4; ++c) {
            A[3 * i][c] = X[c];
            A[3 * i][8 + c] = -x * X[c];
            A[3 * i + 1][4 + c] = -X[c];
            A[3 * i + 1][8 + c] = y * X[c];
            A[3 * i + 2][c] = -y * X[c];
            A[3 * i + 2][4 + c] = x * X[c];
            B[15 * i + 3][8 + c] = -X[c];
            B[15 * i + 9][8 + c] = -X[c];
            B[15 * i + 13][4 + c] = X[c];
            B[15 * i + 14][c] = -X[c];
        }
        for (int c = 0; c < 3; ++c) {
            B[15 * i + c][c] = 1;
            B[15 * i + c][8 + c] = -x;
            B[15 * i + 5 + c][4 + c] = 1;
            B[15 * i + 5 + c][8 + c] = -y;
            B[15 * i + 10 + c][c] = -y;
            B[15 * i + 10 + c][4 + c] = x;
        }
    }
    kelMat M = A.getTransposedMatrix() * A, N = B.getTransposedMatrix() * B, lambda, V;
    for (int i = 0; i < 144; ++i) {
        M.m_Data[i] /= static_cast<float>(s.m_Num);
        N.m_Data[i] /= static_cast<float>(s.m_Num);
    }
    std::puts("M");
    M.print(nullptr);
    std::puts("N");
    N.print(nullptr);
    N.getGeneralizedEigenValue(M, lambda, V);
    int chosen = 0;
    float best = lambda[0][0];
    for (int k = 1; k < 12; ++k)
        if (std::fabs(lambda[k][0]) < 2147483648.0f && static_cast<float>(std::abs(static_cast<int>(lambda[k][0]))) > best) {
            chosen = k;
            best = static_cast<float>(std::abs(static_cast<int>(lambda[k][0])));
        }
    std::puts("eigenvalue");
    lambda.print(nullptr);
    for (int i = 0; i < 12; ++i)
        P.m_Data[i] = V[i][chosen];
    P.setDataUnitize();
    std::puts("result");
    P.print(nullptr);
    return true;
}

inline int inliers(kelMat& H, kelMatCorrespH& s, std::vector<bool>& mask, float threshold) {
    int count = 0;
    for (int i = 0; i < s.m_Num; ++i) {
        float X, Y;
        H.cvtPoint(s.m_SrcX[i], s.m_SrcY[i], &X, &Y);
        const float dx = s.m_DstX[i] - X, dy = s.m_DstY[i] - Y;
        mask[i] = threshold * threshold > dx * dx + dy * dy;
        count += mask[i];
    }
    return count;
}

inline int inliers(kelMat& P, kelMatCorrespP& s, std::vector<bool>& mask, float threshold) {
    int count = 0;
    for (int i = 0; i < s.m_Num; ++i) {
        float X, Y;
        P.cvtPoint(s.m_ObjX[i], s.m_ObjY[i], s.m_ObjZ[i], &X, &Y);
        const float dx = s.m_ImgX[i] - X, dy = s.m_ImgY[i] - Y;
        mask[i] = threshold * threshold > dx * dx + dy * dy;
        count += mask[i];
    }
    return count;
}

inline void addPair(kelMatCorrespH& to, const kelMatCorrespH& s, int i) {
    to.add(s.m_SrcX[i], s.m_SrcY[i], s.m_DstX[i], s.m_DstY[i]);
}
inline void addPair(kelMatCorrespP& to, const kelMatCorrespP& s, int i) {
    to.add(s.m_ObjX[i], s.m_ObjY[i], s.m_ObjZ[i], s.m_ImgX[i], s.m_ImgY[i]);
}
inline bool plausible(kelMat& H, const kelMatCorrespH&) {
    const float sx = std::sqrt(H[0][0] * H[0][0] + H[1][0] * H[1][0]), sy = std::sqrt(H[0][1] * H[0][1] + H[1][1] * H[1][1]);
    const float p = std::sqrt(H[2][0] * H[2][0] + H[2][1] * H[2][1]);
    return !(H[0][0] * H[1][1] - H[1][0] * H[0][1] < 0) && !(sx > 4.0f) && !(double(sx) < 0.1) && !(sy > 4.0f) &&
           !(double(sy) < 0.1) && !(double(p) > 0.002);
}
inline bool plausible(kelMat&, const kelMatCorrespP&) {
    return true;
}

// One candidate from a random sample of the normalised pairs.
inline void drawCandidate(kelMat& H, const kelMatCorrespH& s) {
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
inline void drawCandidate(kelMat& P, const kelMatCorrespP& s) {
    std::vector<int> drawn;
    kelMatCorrespP six;
    while (drawn.size() < 6) {
        const int index = rand() % s.m_Num;
        bool isNew = true;
        for (int earlier : drawn)
            isNew = isNew && earlier != index;
        if (isNew) {
            drawn.push_back(index);
            addPair(six, s, index);
        }
    }
    leastSquares(P, six);
}

struct Rules {
    int least, sample, enough;
    bool rounds; // whether the number of draws is rounded and 1600 stands for more than 1500
};

template <class Set> bool ransac(kelMat& M, Set& set, float threshold, int* inlierCount, Rules rules) {
    const int n = set.m_Num;
    if (n < rules.sample)
        return false;
    Set normalized;
    kelMat T1, T2;
    normalize(set, normalized, T1, T2);
    std::vector<bool> mask(n), bestMask(n);
    int best = 0, maxIter = 1500, iter = 0;
    do {
        drawCandidate(M, normalized);
        denormalize(M, T2, T1);
        if (plausible(M, set)) {
            const int count = inliers(M, set, mask, threshold);
            if (count > best) {
                const double e = 1 - static_cast<double>(count) / n,
                             N = -4.605170185988091 / std::log(1 - std::pow(1 - e, 4.0));
                if (rules.rounds)
                    maxIter = std::min(maxIter, N > 1500 ? 1600 : static_cast<int>(N + 0.5));
                else if (maxIter > N)
                    maxIter = static_cast<int>(N);
                bestMask = mask;
                best = count;
            }
        }
        ++iter;
    } while (best < rules.enough && iter < maxIter);
    for (;;) {
        Set chosen;
        for (int i = 0; i < n; ++i)
            if (bestMask[i])
                addPair(chosen, normalized, i);
        if (!leastSquares(M, chosen))
            return false;
        denormalize(M, T2, T1);
        if (!plausible(M, set))
            return false;
        const int count = inliers(M, set, bestMask, threshold);
        if (count <= best) {
            if (inlierCount)
                *inlierCount = count;
            return true;
        }
        best = count;
    }
}

} // namespace kel_ref

#endif
