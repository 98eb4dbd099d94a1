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
    return x >= 0.0f ? 1.0f : -1.0f;
}

float nr_pythag(float a, float b) {
    const float A = fabsf(a), B = fabsf(b);
    if (!(A > B) && B == 0.0f)
        return 0.0f;
    const float longer = A > B ? A : B, shorter = A > B ? B : A;
    const float ratio = shorter / longer;
    const float q = ratio * ratio + 1.0f;
    return static_cast<float>(static_cast<double>(longer) * sqrt(static_cast<double>(q)));
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

namespace {

constexpr int kSvdIterations = 30;

// x and y become x c + y s and y c - x s.
void rotate(float& x, float& y, float c, float s) {
    const float before = x;
    x = before * c + y * s;
    y = y * c - before * s;
}

void rotateColumns(kelMat& M, int p, int q, float c, float s) {
    for (int r = 0; r < M.m_Height; ++r)
        rotate(M[r][p], M[r][q], c, s);
}

// The one pass over a matrix a = u w v^T; the diagonal of the bidiagonal form is in w, the superdiagonal in e.
class Svd {
public:
    Svd(kelMat& u, kelMat& w, kelMat& v) : u(u), w(w), v(v), m(u.m_Height), n(u.m_Width), e(u.m_Width) {}

    bool run() {
        bidiagonalize();
        accumulateRight();
        accumulateLeft();
        for (int k = n - 1; k >= 0; --k)
            if (!converge(k))
                return false;
        return true;
    }

private:
    kelMat &u, &w, &v;
    const int m, n;
    kel::Scratch<float, kel::kSmallOrder> e;
    float norm = 0.0f; // the largest |w| + |e|, the measure of what is negligible

    bool negligible(float x) const { return fabsf(x) + norm == norm; }

    // Householder reflection of column i, applied to the columns right of it; returns the diagonal element.
    float reflectColumn(int i) {
        float scale = 0.0f, squares = 0.0f;
        for (int k = i; k < m; ++k)
            scale += fabsf(u[k][i]);
        if (scale == 0.0f)
            return 0.0f;
        for (int k = i; k < m; ++k) {
            u[k][i] /= scale;
            squares += u[k][i] * u[k][i];
        }
        const float f = u[i][i], g = -nr_sign(f) * sqrtf(squares), h = f * g - squares;
        u[i][i] = f - g;
        for (int j = i + 1; j < n; ++j) {
            float sum = 0.0f;
            for (int k = i; k < m; ++k)
                sum += u[k][i] * u[k][j];
            const float factor = sum / h;
            for (int k = i; k < m; ++k)
                u[k][j] += factor * u[k][i];
        }
        for (int k = i; k < m; ++k)
            u[k][i] *= scale;
        return scale * g;
    }

    // The same for row i right of the diagonal and the rows below it; returns the superdiagonal element.
    float reflectRow(int i) {
        const int l = i + 1;
        float scale = 0.0f, squares = 0.0f;
        for (int k = l; k < n; ++k)
            scale += fabsf(u[i][k]);
        if (scale == 0.0f)
            return 0.0f;
        for (int k = l; k < n; ++k) {
            u[i][k] /= scale;
            squares += u[i][k] * u[i][k];
        }
        const float f = u[i][l], g = -nr_sign(f) * sqrtf(squares), h = f * g - squares;
        u[i][l] = f - g;
        for (int k = l; k < n; ++k)
            e[k] = u[i][k] / h;
        for (int j = l; j < m; ++j) {
            float sum = 0.0f;
            for (int k = l; k < n; ++k)
                sum += u[j][k] * u[i][k];
            for (int k = l; k < n; ++k)
                u[j][k] += sum * e[k];
        }
        for (int k = l; k < n; ++k)
            u[i][k] *= scale;
        return scale * g;
    }

    void bidiagonalize() {
        float super = 0.0f;
        for (int i = 0; i < n; ++i) {
            e[i] = super;
            w[i][i] = i < m ? reflectColumn(i) : 0.0f;
            super = i < m && i < n - 1 ? reflectRow(i) : 0.0f;
            const float size = fabsf(w[i][i]) + fabsf(e[i]);
            norm = norm > size ? norm : size;
        }
    }

    void accumulateRight() {
        for (int i = n - 1; i >= 0; --i) {
            const int l = i + 1;
            if (l < n && e[l] != 0.0f) {
                for (int j = l; j < n; ++j)
                    v[j][i] = u[i][j] / u[i][l] / e[l]; // two divisions: the product of the divisors could underflow
                for (int j = l; j < n; ++j) {
                    float sum = 0.0f;
                    for (int k = l; k < n; ++k)
                        sum += u[i][k] * v[k][j];
                    for (int k = l; k < n; ++k)
                        v[k][j] += sum * v[k][i];
                }
            }
            for (int j = l; j < n; ++j)
                v[i][j] = v[j][i] = 0.0f;
            v[i][i] = 1.0f;
        }
    }

    void accumulateLeft() {
        for (int i = std::min(m, n) - 1; i >= 0; --i) {
            const int l = i + 1;
            std::fill(u[i] + l, u[i] + n, 0.0f);
            if (w[i][i] != 0.0f) {
                const float reciprocal = 1.0f / w[i][i];
                for (int j = l; j < n; ++j) {
                    float sum = 0.0f;
                    for (int k = l; k < m; ++k)
                        sum += u[k][i] * u[k][j];
                    const float factor = sum / u[i][i] * reciprocal;
                    for (int k = i; k < m; ++k)
                        u[k][j] += factor * u[k][i];
                }
                for (int k = i; k < m; ++k)
                    u[k][i] *= reciprocal;
            } else {
                for (int k = i; k < m; ++k)
                    u[k][i] = 0.0f;
            }
            u[i][i] += 1.0f;
        }
    }

    // Iterates on the block that ends at k until e[k] is negligible.
    bool converge(int k) {
        for (int iteration = 1;; ++iteration) {
            const int l = split(k);
            if (l == k) {
                if (w[k][k] < 0.0f) {
                    w[k][k] = -w[k][k];
                    for (int r = 0; r < n; ++r)
                        v[r][k] = -v[r][k];
                }
                return true;
            }
            if (iteration == kSvdIterations)
                return false;
            sweep(l, k);
        }
    }

    // The start of the unreduced block that ends at k. It stops at 0 whatever the numbers are, NaN included.
    int split(int k) {
        for (int l = k; l > 0; --l) {
            if (negligible(e[l]))
                return l;
            if (negligible(w[l - 1][l - 1])) {
                cancel(l, k);
                return l;
            }
        }
        return 0;
    }

    // w[l-1] is zero: rotates e[l .. k] away.
    void cancel(int l, int k) {
        float c = 0.0f, s = 1.0f;
        for (int i = l; i <= k; ++i) {
            const float f = s * e[i];
            e[i] = c * e[i];
            if (negligible(f))
                return;
            const float g = w[i][i], h = nr_pythag(f, g), reciprocal = 1.0f / h;
            w[i][i] = h;
            c = g * reciprocal;
            s = -f * reciprocal;
            rotateColumns(u, l - 1, i, c, s);
        }
    }

    // One implicit QR step on the block from l to k, shifted by an eigenvalue of its last 2x2 minor.
    void sweep(int l, int k) {
        float x = w[l][l], y = w[k - 1][k - 1], g = e[k - 1], h = e[k];
        const float z = w[k][k];
        float f = ((y - z) * (y + z) + (g - h) * (g + h)) / (2.0f * h * y);
        g = nr_pythag(f, 1.0f);
        f = ((x - z) * (x + z) + h * (y / (f + nr_sign(f) * g) - h)) / x;
        float c = 1.0f, s = 1.0f;
        for (int j = l; j < k; ++j) {
            const int i = j + 1;
            g = e[i];
            y = w[i][i];
            h = s * g;
            g = c * g;
            float length = nr_pythag(f, h);
            e[j] = length;
            c = f / length;
            s = h / length;
            f = x * c + g * s;
            g = g * c - x * s;
            h = y * s;
            y = y * c;
            rotateColumns(v, j, i, c, s);
            length = nr_pythag(f, h);
            w[j][j] = length;
            if (length != 0.0f) {
                const float reciprocal = 1.0f / length;
                c = f * reciprocal;
                s = h * reciprocal;
            }
            f = c * g + s * y;
            x = c * y - s * g;
            rotateColumns(u, j, i, c, s);
        }
        e[l] = 0.0f;
        e[k] = f;
        w[k][k] = x;
    }
};

} // namespace

bool nr_svdcmp(const kelMat& a, kelMat& u, kelMat& w, kelMat& v) {
    const int n = a.m_Width;
    u = a;
    w.create(n, n, true);
    v.create(n, n, true);
    return Svd(u, w, v).run();
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
