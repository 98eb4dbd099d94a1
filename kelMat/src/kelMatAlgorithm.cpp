// The numerical kernels behind the matrix class: LU, Cholesky, singular values, symmetric eigenvalues, and the products they
// need. Every element's own sum runs in the order that the textbook algorithms have, whatever the loops around it look like.
#include <algorithm>
#include <cfloat>
#include <cmath>

#include "kelMat_Private.h"

namespace {

using kel::all, kel::Floats, kel::kLanes, kel::load, kel::loadAligned, kel::magnitude, kel::Mask, kel::store, kel::storeAligned,
    kel::unless;

// Rows x (4 Vectors) elements of a product, summed in registers. The rows of A are `inner` apart, those of B and R `columns`.
template <int Rows, int Vectors>
void multiplyBlock(float* R, const float* A, const float* B, ptrdiff_t inner, ptrdiff_t columns) {
    Floats sums[Rows][Vectors] = {};
    for (ptrdiff_t k = 0; k < inner; ++k, B += columns)
        for (int i = 0; i < Rows; ++i) {
            const Floats a = all(A[i * inner + k]);
            for (int v = 0; v < Vectors; ++v)
                sums[i][v] = a * load(B + kLanes * v) + sums[i][v];
        }
    for (int i = 0; i < Rows; ++i)
        for (int v = 0; v < Vectors; ++v)
            store(R + i * columns + kLanes * v, sums[i][v]);
}

// The columns that do not fill a vector.
template <int Rows> void multiplyColumn(float* R, const float* A, const float* B, ptrdiff_t inner, ptrdiff_t columns) {
    float sums[Rows] = {};
    for (ptrdiff_t k = 0; k < inner; ++k, B += columns)
        for (int i = 0; i < Rows; ++i)
            sums[i] = A[i * inner + k] * *B + sums[i];
    for (int i = 0; i < Rows; ++i)
        R[i * columns] = sums[i];
}

template <int Rows> void multiplyRows(float* R, const float* A, const float* B, ptrdiff_t inner, ptrdiff_t columns) {
    ptrdiff_t j = 0;
    for (; j + 2 * kLanes <= columns; j += 2 * kLanes)
        multiplyBlock<Rows, 2>(R + j, A, B + j, inner, columns);
    for (; j + kLanes <= columns; j += kLanes)
        multiplyBlock<Rows, 1>(R + j, A, B + j, inner, columns);
    for (; j < columns; ++j)
        multiplyColumn<Rows>(R + j, A, B + j, inner, columns);
}

} // namespace

namespace kel {

void multiply(float* R, const float* A, const float* B, int rows, int inner, int columns) {
    for (; rows >= 4; rows -= 4, A += 4 * static_cast<ptrdiff_t>(inner), R += 4 * static_cast<ptrdiff_t>(columns))
        multiplyRows<4>(R, A, B, inner, columns);
    if (rows == 3)
        multiplyRows<3>(R, A, B, inner, columns);
    else if (rows == 2)
        multiplyRows<2>(R, A, B, inner, columns);
    else if (rows == 1)
        multiplyRows<1>(R, A, B, inner, columns);
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
bool rowScales(const float* a, ptrdiff_t n, float* scales) {
    for (ptrdiff_t i = 0; i < n; ++i, a += n) {
        float largest = 0.0f;
        for (ptrdiff_t j = 0; j < n; ++j)
            if (const float magnitude = fabsf(a[j]); magnitude > largest)
                largest = magnitude;
        if (largest == 0.0f)
            return false;
        scales[i] = 1.0f / largest;
    }
    return true;
}

// A matrix in the course of its decomposition: columns before the current one are finished.
struct LU {
    float* const a;
    const ptrdiff_t n;
    float* const scales;
    int* const indx;
    float* const parity;
    ptrdiff_t pivotRow = 0; // the last one picked

    float* row(ptrdiff_t i) const { return a + i * n; }

    // Picks the pivot of column j among the rows from j on, the last of equals, and brings it to its place; a column without a
    // candidate (all NaN) takes over the row of the column before. Then divides the column below by the pivot.
    void pivot(ptrdiff_t j) {
        float best = 0.0f;
        for (ptrdiff_t i = j; i < n; ++i) {
            const float candidate = scales[i] * fabsf(row(i)[j]);
            if (candidate >= best) {
                best = candidate;
                pivotRow = i;
            }
        }
        if (pivotRow != j) {
            std::swap_ranges(row(pivotRow), row(pivotRow + 1), row(j));
            *parity = -*parity;
            scales[pivotRow] = scales[j];
        }
        indx[j] = static_cast<int>(pivotRow);
        float& diagonal = row(j)[j];
        if (diagonal == 0.0f)
            diagonal = kTinyPivot;
        const float reciprocal = 1.0f / diagonal;
        for (ptrdiff_t i = j + 1; i < n; ++i)
            row(i)[j] *= reciprocal;
    }

    // Crout's order from column `first` on: a column gets the products of the columns before it when its turn comes.
    void finishByColumns(ptrdiff_t first) {
        for (ptrdiff_t j = first; j < n; ++j) {
            for (ptrdiff_t i = 1; i < n; ++i)
                for (ptrdiff_t k = 0; k < std::min(i, j); ++k)
                    row(i)[j] -= row(i)[k] * row(k)[j];
            pivot(j);
        }
    }

    // The same sums for a panel of columns at once: first the products of all columns before it, row by row, then those of its
    // own columns, each as soon as it is finished. That is the same as long as no row that is finished returns as a pivot, which
    // takes a column of NaN; then false, and the columns after that one, whose number goes to `finished`, as they came in.
    // `before` has room for the panel.
    bool takePanel(ptrdiff_t begin, ptrdiff_t width, float* before, ptrdiff_t* finished) {
        for (ptrdiff_t i = 0; i < n; ++i)
            std::copy_n(row(i) + begin, width, before + i * width);
        for (ptrdiff_t i = 1; begin > 0 && i < n; ++i)
            kel::subtractMultiples(row(i) + begin, row(i), row(0) + begin, n, std::min(i, begin), width);
        for (ptrdiff_t j = begin; j < begin + width; ++j) {
            pivot(j);
            if (pivotRow != j)
                std::swap_ranges(before + pivotRow * width, before + (pivotRow + 1) * width, before + j * width);
            if (pivotRow < j) {
                for (ptrdiff_t i = 0; i < n; ++i)
                    std::copy(before + i * width + (j + 1 - begin), before + (i + 1) * width, row(i) + j + 1);
                *finished = j + 1;
                return false;
            }
            for (ptrdiff_t i = j + 1; i < n; ++i)
                kel::subtractMultiple(row(i) + j + 1, row(i)[j], row(j) + j + 1, begin + width - j - 1);
        }
        return true;
    }
};

// An order that the compiler knows, the same bits without a call or a panel. False, and nothing written, where a finished row would
// return as a pivot.
template <int N> bool decomposeSmall(float* a, const float* rowScales, int* indx, float* parity) {
    float A[N][N], scales[N], sign = 1.0f;
    int picked[N], row = 0;
    std::copy_n(a, N * N, A[0]);
    std::copy_n(rowScales, N, scales);
    for (int j = 0; j < N; ++j) {
        float best = 0.0f;
        for (int i = j; i < N; ++i) {
            const float candidate = scales[i] * fabsf(A[i][j]);
            row = candidate >= best ? i : row;
            best = candidate >= best ? candidate : best;
        }
        if (row < j)
            return false;
        if (row != j) {
            std::swap_ranges(A[row], A[row] + N, A[j]);
            sign = -sign;
            scales[row] = scales[j];
        }
        picked[j] = row;
        if (A[j][j] == 0.0f)
            A[j][j] = kTinyPivot;
        const float reciprocal = 1.0f / A[j][j];
        for (int i = j + 1; i < N; ++i) {
            A[i][j] *= reciprocal;
            for (int k = j + 1; k < N; ++k)
                A[i][k] -= A[i][j] * A[j][k];
        }
    }
    std::copy_n(A[0], N * N, a);
    std::copy_n(picked, N, indx);
    *parity = sign;
    return true;
}

} // namespace

bool kel::decomposeLU(float* a, int n, int* indx, float* parity) {
    constexpr ptrdiff_t kPanel = 32;
    *parity = 1.0f;
    if (n < 1)
        return true;
    kel::Scratch<float, kel::kSmallOrder> scales(n);
    if (!rowScales(a, n, scales.data()))
        return false;
    if (n == 4 && decomposeSmall<4>(a, scales.data(), indx, parity))
        return true;
    kel::SquareScratch before(n * std::min<ptrdiff_t>(n, kPanel));
    LU lu = {a, n, scales.data(), indx, parity};
    for (ptrdiff_t begin = 0, finished; begin < n; begin += kPanel)
        if (!lu.takePanel(begin, std::min(n - begin, kPanel), before.data(), &finished)) {
            lu.finishByColumns(finished);
            break;
        }
    return true;
}

bool nr_ludcmp(kelMat& a, int* indx, float* d) {
    return kel::decomposeLU(a.m_Data, a.m_Width, indx, d);
}

void kel::substituteLU(const float* lu, int n, const int* indx, float* b) {
    const float* row = lu;
    int first = -1; // the first element of b that is not zero, once met
    for (int i = 0; i < n; ++i, row += n) {
        float sum = b[indx[i]];
        b[indx[i]] = b[i];
        if (first >= 0)
            for (int k = first; k < i; ++k)
                sum -= row[k] * b[k];
        else if (sum != 0.0f)
            first = i;
        b[i] = sum;
    }
    for (int i = n - 1; i >= 0; --i) {
        row -= n;
        float sum = b[i];
        for (int k = i + 1; k < n; ++k)
            sum -= row[k] * b[k];
        b[i] = sum / row[i];
    }
}

bool nr_lubksb(kelMat& a, int* indx, float* b) {
    kel::substituteLU(a.m_Data, a.m_Width, indx, b);
    return true;
}

// ---- Cholesky --------------------------------------------------------------------------------------------------------------

// First L D L^T with the products D L^T kept in the lower triangle, then every column divided by the root of its pivot.
bool kel::decomposeCholesky(float* a, int order) {
    const ptrdiff_t n = order;
    for (ptrdiff_t i = 0; i < n; ++i) {
        float* const row = a + i * n;
        for (ptrdiff_t j = 0; j <= i; ++j) {
            const float* const other = a + j * n;
            float sum = row[j];
            for (ptrdiff_t k = 0; k < j; ++k)
                sum -= row[k] * other[k] / a[k * n + k];
            if (j == i && 0.0f >= sum)
                return false;
            row[j] = sum;
        }
    }
    for (ptrdiff_t i = 0; i < n; ++i)
        a[i * n + i] = sqrtf(a[i * n + i]);
    for (ptrdiff_t i = 0; i < n; ++i) {
        for (ptrdiff_t j = 0; j < i; ++j)
            a[i * n + j] /= a[j * n + j];
        std::fill(a + i * n + i + 1, a + (i + 1) * n, 0.0f);
    }
    return true;
}

bool nr_choldc(kelMat& a) {
    return kel::decomposeCholesky(a.m_Data, a.m_Width);
}

// ---- singular values -------------------------------------------------------------------------------------------------------

bool nr_svdcmp(const kelMat& a, kelMat& u, kelMat& w, kelMat& v) {
    const int m = a.m_Height, n = a.m_Width;
    const bool goes = &w == &a || &v == &a; // with the outputs below
    if (goes)
        u = a;
    else if (&u != &a)
        u.create(m, n, false);
    const float* const from = goes ? u.m_Data : a.m_Data;
    w.create(n, n, true);
    v.create(n, n, false);
    kel::Scratch<float, kel::kSmallOrder> values(n);
    const bool converged = kel::decomposeSV(from, m, n, u.m_Data, true, values.data(), v.m_Data);
    for (int i = 0; i < n; ++i)
        w[i][i] = values[i];
    return converged;
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

struct JacobiRotation {
    float t, s, tau; // tangent, sine, tangent of half the angle
    bool small;      // the cosine is 1
    float theta;     // magnitude of the cotangent of the double angle
};

// What takes `element` to zero, h the difference of its diagonal elements and g a multiple of its magnitude.
KEL_INLINE inline JacobiRotation jacobiRotation(float element, float h, float g) {
    constexpr float kLargeTheta = 8192.0f;       // beyond it 1 + theta^2 is theta^2
    constexpr float kSmallTangent = 1.0f / 4096; // below it 1 + t^2 is 1
    JacobiRotation r;
    const float theta = 0.5f * h / element;
    r.theta = std::min(fabsf(theta), FLT_MAX);
    if (vanishes(g, h)) {
        r.t = element / h;
    } else {
        const float root = r.theta > kLargeTheta ? r.theta : sqrtf(1.0f + theta * theta), t = 1.0f / (r.theta + root);
        r.t = copysignf(t, theta + 0.0f); // + 0 for its sign: a theta of -0 turns as +0 does
    }
    r.small = fabsf(r.t) < kSmallTangent;
    if (r.small) {
        r.s = r.t;
        r.tau = 0.5f * r.s;
    } else {
        const float c = static_cast<float>(1.0 / sqrt(static_cast<double>(r.t * r.t + 1.0f)));
        r.s = r.t * c;
        r.tau = r.s / (1.0f + c);
    }
    return r;
}

// g - s (h + g tau) and h + s (g - h tau) for two rows, `count` a multiple of four.
KEL_INLINE inline void rotateRows(float* x, float* y, ptrdiff_t count, const JacobiRotation& r) {
    const Floats s = all(r.s), tau = all(r.tau);
    for (ptrdiff_t i = 0; i < count; i += kLanes) {
        const Floats g = loadAligned(x + i), h = loadAligned(y + i);
        storeAligned(x + i, g - s * (h + g * tau));
        storeAligned(y + i, h + s * (g - h * tau));
    }
}

// The same, with the same results, for a small rotation. Its products often are subnormal, which costs the processor dearly;
// where such a product is added to a number it cannot change, a factor of zero takes its place.
KEL_INLINE inline void rotateRowsLittle(float* x, float* y, ptrdiff_t count, const JacobiRotation& r) {
    const Floats s = all(r.s), tau = all(r.tau);
    const Floats leastForS = all(0x1p-124f * r.theta);   // from here on a product with s is a normal number,
    const Floats leastForTau = all(0x1p-123f * r.theta); // with tau; s is 1 / (2 theta), tau half of it
    const Floats firm = all(0x1p-99f);                   // changed by no product below that
    for (ptrdiff_t i = 0; i < count; i += kLanes) {
        const Floats g = loadAligned(x + i), h = loadAligned(y + i), sizeG = magnitude(g), sizeH = magnitude(h);
        const Mask firmG = sizeG >= firm, firmH = sizeH >= firm;
        const Floats a = h + unless((sizeG < leastForTau) & firmH, g) * tau;
        const Floats b = g - unless((sizeH < leastForTau) & firmG, h) * tau;
        storeAligned(x + i, g - s * unless((magnitude(a) < leastForS) & firmG, a));
        storeAligned(y + i, h + s * unless((magnitude(b) < leastForS) & firmH, b));
    }
}

// The iteration on a symmetric matrix. Rows are kept whole, mirrored over the diagonal, and eigenvectors as rows, all padded to
// fours, so that a rotation is that of two rows.
class Jacobi {
public:
    Jacobi(const float* a, int n, float* d)
        : n(n), m_pitch((n + kLanes - 1) / kLanes * kLanes), d(d), b(n), z(n), m_rows(n * m_pitch), m_vectors(n * m_pitch) {
        std::fill_n(m_rows.data(), n * m_pitch, 0.0f);
        std::fill_n(m_vectors.data(), n * m_pitch, 0.0f);
        for (int i = 0; i < n; ++i) {
            for (int j = i + 1; j < n; ++j)
                row(i)[j] = row(j)[i] = a[static_cast<ptrdiff_t>(i) * n + j];
            vector(i)[i] = 1.0f;
            b[i] = d[i] = a[static_cast<ptrdiff_t>(i) * n + i];
            z[i] = 0.0f;
        }
    }

    bool run(int* rotations) {
        for (int sweep = 0; sweep < kJacobiSweeps; ++sweep) {
            const float sum = offDiagonalSum();
            if (sum == 0.0f)
                return true;
            const float threshold =
                sweep < kThresholdSweeps ? 0.2f * sum / static_cast<float>(static_cast<ptrdiff_t>(n) * n) : 0.0f;
            for (int p = 0; p < n - 1; ++p)
                for (int q = p + 1; q < n; ++q)
                    *rotations += visit(p, q, sweep > kShortcutSweep, threshold);
            for (int i = 0; i < n; ++i) {
                b[i] += z[i];
                d[i] = b[i];
                z[i] = 0.0f;
            }
        }
        return false;
    }

    // The strict upper triangle back into a, the eigenvectors as columns into v.
    void store(float* a, float* v) {
        for (int i = 0; i < n; ++i) {
            std::copy(row(i) + i + 1, row(i) + n, a + static_cast<ptrdiff_t>(i) * n + i + 1);
            for (int j = 0; j < n; ++j)
                v[static_cast<ptrdiff_t>(j) * n + i] = vector(i)[j];
        }
    }

private:
    const int n;
    const ptrdiff_t m_pitch;
    float* const d;
    kel::Scratch<float, kel::kSmallOrder> b, z; // d at the start of the sweep, and what the sweep adds to it
    kel::Scratch<float, kel::kSmallOrder * kel::kSmallOrder> m_rows, m_vectors;

    float* row(int i) { return m_rows.data() + m_pitch * i; }
    float* vector(int i) { return m_vectors.data() + m_pitch * i; }

    float offDiagonalSum() {
        float sum = 0.0f;
        for (int p = 0; p < n - 1; ++p)
            for (int q = p + 1; q < n; ++q)
                sum += fabsf(row(p)[q]);
        return sum;
    }

    KEL_INLINE void rotate(float* x, float* y, const JacobiRotation& r) const {
        if (r.small)
            rotateRowsLittle(x, y, m_pitch, r);
        else
            rotateRows(x, y, m_pitch, r);
    }

    // Takes element (p, q) to zero; whether that was by a rotation.
    bool visit(int p, int q, bool shortcut, float threshold) {
        float *const P = row(p), *const Q = row(q);
        const float element = P[q], g = 100.0f * fabsf(element);
        if (shortcut && vanishes(g, d[p]) && vanishes(g, d[q])) {
            P[q] = Q[p] = 0.0f;
            return false;
        }
        if (!(fabsf(element) > threshold))
            return false;
        const JacobiRotation r = jacobiRotation(element, d[q] - d[p], g);
        const float h = r.t * element;
        z[p] -= h;
        z[q] += h;
        d[p] -= h;
        d[q] += h;
        rotate(P, Q, r);
        P[q] = Q[p] = 0.0f;
        float* mirror = m_rows.data();
        for (int j = 0; j < n; ++j, mirror += m_pitch) {
            mirror[p] = P[j];
            mirror[q] = Q[j];
        }
        rotate(vector(p), vector(q), r);
        return true;
    }
};

} // namespace

bool kel::jacobi(float* a, int n, float* d, float* v, int* rotations) {
    *rotations = 0;
    Jacobi iteration(a, n, d);
    const bool converged = iteration.run(rotations);
    iteration.store(a, v);
    return converged;
}

bool nr_jacobi(kelMat& a, kelMat& d, kelMat& v, int* nrot) {
    const int n = a.m_Width;
    d.create(n, 1, false);
    v.create(n, n, false);
    return kel::jacobi(a.m_Data, n, d.m_Data, v.m_Data, nrot);
}
