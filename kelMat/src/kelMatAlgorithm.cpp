// The numerical kernels behind the matrix class: LU, Cholesky, singular values, symmetric eigenvalues, and the products they
// need. Every element's own sum runs in the order that the textbook algorithms have, whatever the loops around it look like.
#include <algorithm>
#include <math.h>

#include "kelMat_Private.h"

namespace kel {

void multiply(float* R, const float* A, const float* B, int rows, int inner, int columns) {
    for (int i = 0; i < rows; ++i, A += inner, R += columns) {
        std::fill_n(R, columns, 0.0f);
        const float* b = B;
        for (int k = 0; k < inner; ++k, b += columns)
            for (int j = 0; j < columns; ++j)
                R[j] = A[k] * b[j] + R[j];
    }
}

void transpose(float* T, const float* A, int rows, int columns) {
    for (int r = 0; r < rows; ++r)
        for (int c = 0; c < columns; ++c)
            T[static_cast<ptrdiff_t>(c) * rows + r] = A[static_cast<ptrdiff_t>(r) * columns + c];
}

} // namespace kel

float nr_sign(float x) {
    return kel::sign(x);
}

float nr_pythag(float a, float b) {
    return kel::pythag(a, b);
}

// ---- LU --------------------------------------------------------------------------------------------------------------------

namespace {

// Stands for a pivot of zero. Subnormal: its reciprocal is infinite, and callers rely on what comes of that.
constexpr float kTinyPivot = 1.0e-40f;

// The reciprocal of the largest magnitude of each row; false for a row of zeros.
bool rowScales(const kelMat& a, float* scales) {
    const int n = a.m_Width;
    for (int i = 0; i < n; ++i) {
        float largest = 0.0f;
        for (int j = 0; j < n; ++j)
            if (const float magnitude = fabsf(a[i][j]); magnitude > largest)
                largest = magnitude;
        if (largest == 0.0f)
            return false;
        scales[i] = 1.0f / largest;
    }
    return true;
}

// a[i][j] less the products of row i and column j up to `count`, subtracted one at a time.
float reduced(const kelMat& a, int i, int j, int count) {
    float sum = a[i][j];
    for (int k = 0; k < count; ++k)
        sum -= a[i][k] * a[k][j];
    return sum;
}

} // namespace

bool nr_ludcmp(kelMat& a, int* indx, float* d) {
    const int n = a.m_Width;
    *d = 1.0f;
    kel::Scratch<float, kel::kSmallOrder> scales(n);
    if (!rowScales(a, scales.data()))
        return false;
    int pivot = 0; // a column that has no candidate (all NaN) takes over the row of the column before
    for (int j = 0; j < n; ++j) {
        for (int i = 0; i < j; ++i)
            a[i][j] = reduced(a, i, j, i);
        float best = 0.0f;
        for (int i = j; i < n; ++i) {
            a[i][j] = reduced(a, i, j, j);
            const float candidate = scales[i] * fabsf(a[i][j]);
            if (candidate >= best) { // the last of equals
                best = candidate;
                pivot = i;
            }
        }
        if (pivot != j) {
            std::swap_ranges(a[pivot], a[pivot] + n, a[j]);
            *d = -*d;
            scales[pivot] = scales[j];
        }
        indx[j] = pivot;
        if (a[j][j] == 0.0f)
            a[j][j] = kTinyPivot;
        const float reciprocal = 1.0f / a[j][j];
        for (int i = j + 1; i < n; ++i)
            a[i][j] *= reciprocal;
    }
    return true;
}

bool nr_lubksb(kelMat& a, int* indx, float* b) {
    const int n = a.m_Width;
    int first = -1; // the first element of b that is not zero, once met
    for (int i = 0; i < n; ++i) {
        float sum = b[indx[i]];
        b[indx[i]] = b[i];
        if (first >= 0)
            for (int k = first; k < i; ++k)
                sum -= a[i][k] * b[k];
        else if (sum != 0.0f)
            first = i;
        b[i] = sum;
    }
    for (int i = n - 1; i >= 0; --i) {
        float sum = b[i];
        for (int k = i + 1; k < n; ++k)
            sum -= a[i][k] * b[k];
        b[i] = sum / a[i][i];
    }
    return true;
}

// ---- Cholesky --------------------------------------------------------------------------------------------------------------

// First L D L^T with the products D L^T kept in the lower triangle, then every column divided by the root of its pivot.
bool nr_choldc(kelMat& a) {
    const int n = a.m_Width;
    for (int i = 0; i < n; ++i)
        for (int j = 0; j <= i; ++j) {
            float sum = a[i][j];
            for (int k = 0; k < j; ++k)
                sum -= a[i][k] * a[j][k] / a[k][k];
            if (j == i && 0.0f >= sum)
                return false;
            a[i][j] = sum;
        }
    for (int i = 0; i < n; ++i)
        a[i][i] = sqrtf(a[i][i]);
    for (int i = 1; i < n; ++i)
        for (int j = 0; j < i; ++j)
            a[i][j] /= a[j][j];
    for (int i = 0; i < n; ++i)
        std::fill(a[i] + i + 1, a[i] + n, 0.0f);
    return true;
}

// ---- singular values -------------------------------------------------------------------------------------------------------

bool nr_svdcmp(const kelMat& a, kelMat& u, kelMat& w, kelMat& v) {
    u.create(a.m_Height, a.m_Width, false);
    return kel::decompose(a.m_Data, u, true, w, v);
}

// ---- symmetric eigenvalues -------------------------------------------------------------------------------------------------

namespace {

constexpr int kJacobiSweeps = 50;
constexpr int kThresholdSweeps = 4; // that spare the small elements
constexpr int kShortcutSweep = 4;   // after it, negligible elements are set to zero without a rotation

// Whether g vanishes beside x at double precision; at single precision more would, and callers rely on the difference.
bool vanishes(float g, float x) {
    const double magnitude = static_cast<double>(fabsf(x));
    return magnitude + static_cast<double>(g) == magnitude;
}

void rotateJacobi(float& x, float& y, float s, float tau) {
    const float g = x, h = y;
    x = g - s * (h + g * tau);
    y = h + s * (g - h * tau);
}

float offDiagonalSum(const kelMat& a) {
    float sum = 0.0f;
    for (int p = 0; p < a.m_Width - 1; ++p)
        for (int q = p + 1; q < a.m_Width; ++q)
            sum += fabsf(a[p][q]);
    return sum;
}

// The tangent of the angle that takes `element` to zero, h the difference of its diagonal elements.
float rotationTangent(float element, float h, float g) {
    if (vanishes(g, h))
        return element / h;
    const float theta = 0.5f * h / element;
    const float t = 1.0f / (fabsf(theta) + sqrtf(1.0f + theta * theta));
    return theta < 0.0f ? -t : t;
}

} // namespace

bool nr_jacobi(kelMat& a, kelMat& d, kelMat& v, int* nrot) {
    const int n = a.m_Width;
    d.create(n, 1, true);
    v.create(n, n, false);
    v.setDataIdentity(1.0f);
    kel::LocalMat<kel::kSmallOrder> b(n, 1), z(n, 1);
    z.setDataZero();
    for (int i = 0; i < n; ++i)
        b[i][0] = d[i][0] = a[i][i];
    *nrot = 0;
    for (int sweep = 0; sweep < kJacobiSweeps; ++sweep) {
        const float sum = offDiagonalSum(a);
        if (sum == 0.0f)
            return true;
        const float threshold = sweep < kThresholdSweeps ? 0.2f * sum / static_cast<float>(n * n) : 0.0f;
        for (int p = 0; p < n - 1; ++p)
            for (int q = p + 1; q < n; ++q) {
                const float element = a[p][q], g = 100.0f * fabsf(element);
                if (sweep > kShortcutSweep && vanishes(g, d[p][0]) && vanishes(g, d[q][0])) {
                    a[p][q] = 0.0f;
                    continue;
                }
                if (!(fabsf(element) > threshold))
                    continue;
                const float t = rotationTangent(element, d[q][0] - d[p][0], g);
                const float c = static_cast<float>(1.0 / sqrt(static_cast<double>(t * t + 1.0f)));
                const float s = t * c, tau = s / (1.0f + c), h = t * element;
                z[p][0] -= h;
                z[q][0] += h;
                d[p][0] -= h;
                d[q][0] += h;
                a[p][q] = 0.0f;
                for (int j = 0; j < p; ++j)
                    rotateJacobi(a[j][p], a[j][q], s, tau);
                for (int j = p + 1; j < q; ++j)
                    rotateJacobi(a[p][j], a[j][q], s, tau);
                for (int j = q + 1; j < n; ++j)
                    rotateJacobi(a[p][j], a[q][j], s, tau);
                for (int j = 0; j < n; ++j)
                    rotateJacobi(v[j][p], v[j][q], s, tau);
                ++*nrot;
            }
        for (int i = 0; i < n; ++i) {
            b[i][0] += z[i][0];
            d[i][0] = b[i][0];
            z[i][0] = 0.0f;
        }
    }
    return false;
}
