// The matrix kernels written plainly: every loop in the textbook order. Results are the library's own bit for bit. Sums and products
// are there in double precision, too, for what is true.
#ifndef KEL_TESTS_MAT_REFERENCE_H
#define KEL_TESTS_MAT_REFERENCE_H

#include <cmath>
#include <cstddef>
#include <utility>
#include <vector>

namespace kel_ref {

template <class T> struct Mat {
    int rows, columns;
    std::vector<T> data;

    explicit Mat(int rows = 0, int columns = 0) // 0 x 0 without rows
        : rows(rows), columns(rows > 0 ? columns : 0), data(static_cast<size_t>(rows) * columns) {}
    T* operator[](int r) { return data.data() + static_cast<ptrdiff_t>(r) * columns; }
    const T* operator[](int r) const { return data.data() + static_cast<ptrdiff_t>(r) * columns; }
};

template <class T> Mat<T> identity(int n) {
    Mat<T> I(n, n);
    for (int i = 0; i < n; ++i)
        I[i][i] = 1;
    return I;
}

template <class T> Mat<T> transposed(const Mat<T>& A) {
    Mat<T> R(A.columns, A.rows);
    for (int r = 0; r < A.rows; ++r)
        for (int c = 0; c < A.columns; ++c)
            R[c][r] = A[r][c];
    return R;
}

template <class T> Mat<T> operator*(const Mat<T>& A, const Mat<T>& B) {
    Mat<T> R(A.rows, B.columns);
    for (int i = 0; i < A.rows; ++i)
        for (int j = 0; j < B.columns; ++j)
            for (int k = 0; k < A.columns; ++k)
                R[i][j] = A[i][k] * B[k][j] + R[i][j];
    return R;
}

using Matrix = Mat<float>;

inline float sign(float x) {
    return x >= 0 ? 1.0f : -1.0f;
}

// Where one is NaN the second counts as the longer.
inline float pythag(float a, float b) {
    float longer = std::fabs(a), shorter = std::fabs(b);
    if (!(longer > shorter))
        std::swap(longer, shorter);
    if (longer == 0)
        return 0;
    const float ratio = shorter / longer, q = ratio * ratio + 1.0f;
    return static_cast<float>(static_cast<double>(longer) * std::sqrt(static_cast<double>(q)));
}

// Crout, column by column.
inline bool nr_ludcmp(Matrix& a, int* indx, float* d) {
    const int n = a.columns;
    *d = 1;
    std::vector<float> vv(n);
    for (int i = 0; i < n; ++i) {
        float big = 0;
        for (int j = 0; j < n; ++j)
            if (std::fabs(a[i][j]) > big)
                big = std::fabs(a[i][j]);
        if (big == 0)
            return false;
        vv[i] = 1.0f / big;
    }
    int imax = 0;
    for (int j = 0; j < n; ++j) {
        for (int i = 0; i < j; ++i)
            for (int k = 0; k < i; ++k)
                a[i][j] = a[i][j] - a[i][k] * a[k][j];
        float big = 0;
        for (int i = j; i < n; ++i) {
            for (int k = 0; k < j; ++k)
                a[i][j] = a[i][j] - a[i][k] * a[k][j];
            const float dum = vv[i] * std::fabs(a[i][j]);
            if (dum >= big) {
                big = dum;
                imax = i;
            }
        }
        if (imax != j) {
            for (int k = 0; k < n; ++k)
                std::swap(a[imax][k], a[j][k]);
            *d = -*d;
            vv[imax] = vv[j];
        }
        indx[j] = imax;
        if (a[j][j] == 0)
            a[j][j] = 1.0e-40f;
        if (j != n - 1) {
            const float dum = 1.0f / a[j][j];
            for (int i = j + 1; i < n; ++i)
                a[i][j] = a[i][j] * dum;
        }
    }
    return true;
}

inline void nr_lubksb(const Matrix& a, const int* indx, float* b) {
    const int n = a.columns;
    bool set = false;
    int ii = 0;
    for (int i = 0; i < n; ++i) {
        const int ip = indx[i];
        float sum = b[ip];
        b[ip] = b[i];
        if (set)
            for (int k = ii; k <= i - 1; ++k)
                sum = sum - a[i][k] * b[k];
        else if (sum != 0) {
            ii = i;
            set = true;
        }
        b[i] = sum;
    }
    for (int i = n - 1; i >= 0; --i) {
        float sum = b[i];
        for (int k = i + 1; k < n; ++k)
            sum = sum - a[i][k] * b[k];
        b[i] = sum / a[i][i];
    }
}

inline float determinant(const Matrix& A) {
    const int n = A.columns;
    if (n == 2)
        return A[0][0] * A[1][1] - A[0][1] * A[1][0];
    if (n == 3) {
        const float top = (A[1][0] * A[2][1] - A[1][1] * A[2][0]) * A[0][2];
        const float middle = (A[2][0] * A[0][1] - A[2][1] * A[0][0]) * A[1][2] + top;
        return (A[0][0] * A[1][1] - A[0][1] * A[1][0]) * A[2][2] + middle;
    }
    std::vector<int> indx(n);
    Matrix LU = A;
    float product;
    nr_ludcmp(LU, indx.data(), &product);
    for (int i = 0; i < n; ++i)
        product *= LU[i][i];
    return product;
}

// For orders 2 and 3.
inline Matrix adjugate(const Matrix& A) {
    if (A.columns == 2) {
        Matrix R(2, 2);
        R.data = {A[1][1], -A[0][1], -A[1][0], A[0][0]};
        return R;
    }
    Matrix R(3, 3);
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j) {
            const int r = (j + 1) % 3, rr = (j + 2) % 3, c = (i + 1) % 3, cc = (i + 2) % 3;
            R[i][j] = A[r][c] * A[rr][cc] - A[r][cc] * A[rr][c];
        }
    return R;
}

inline bool inverse(const Matrix& A, Matrix& R) {
    const int n = A.columns;
    if (n <= 3) {
        const float det = determinant(A);
        if (det == 0)
            return false;
        R = adjugate(A);
        for (float& x : R.data)
            x /= det;
        return true;
    }
    std::vector<int> indx(n);
    Matrix LU = A;
    float d;
    if (!nr_ludcmp(LU, indx.data(), &d))
        return false;
    R = Matrix(n, n);
    for (int j = 0; j < n; ++j) {
        std::vector<float> column(n);
        column[j] = 1;
        nr_lubksb(LU, indx.data(), column.data());
        for (int i = 0; i < n; ++i)
            R[i][j] = column[i];
    }
    return true;
}

inline bool pseudoInverse(const Matrix& A, Matrix& R) {
    Matrix Q;
    const bool regular = inverse(transposed(A) * A, Q);
    if (regular)
        R = Q * transposed(A);
    return regular;
}

inline bool nr_choldc(Matrix& a) {
    const int n = a.columns;
    for (int i = 0; i < n; ++i)
        for (int j = 0; j <= i; ++j) {
            float s = a[i][j];
            for (int k = 0; k < j; ++k)
                s = s - (a[i][k] * a[j][k]) / a[k][k];
            if (j == i && 0 >= s)
                return false;
            a[i][j] = s;
        }
    for (int i = 0; i < n; ++i)
        a[i][i] = std::sqrt(a[i][i]);
    for (int i = 1; i < n; ++i)
        for (int j = 0; j < i; ++j)
            a[i][j] = a[i][j] / a[j][j];
    for (int i = 0; i < n; ++i)
        for (int j = i + 1; j < n; ++j)
            a[i][j] = 0;
    return true;
}

// x' = x c + y s, y' = y c - x s on columns p and q.
inline void rotateColumns(Matrix& M, int p, int q, float c, float s) {
    for (int r = 0; r < M.rows; ++r) {
        const float x = M[r][p], y = M[r][q];
        M[r][p] = x * c + y * s;
        M[r][q] = y * c - x * s;
    }
}

// What is left of a row or a column from one of its elements on.
struct Line {
    float* data;
    ptrdiff_t first, step;
    int length;

    float& operator[](int i) const { return data[first + i * step]; }
};
inline Line row(Matrix& M, ptrdiff_t r, int c) {
    return {M.data.data(), r * M.columns + c, 1, M.columns - c};
}
inline Line column(Matrix& M, int c, int r) {
    return {M.data.data(), r * static_cast<ptrdiff_t>(M.columns) + c, M.columns, M.rows - r};
}
inline float dot(Line x, Line y) {
    float sum = 0;
    for (int i = 0; i < x.length; ++i)
        sum += x[i] * y[i];
    return sum;
}
inline void addMultiple(Line to, float factor, Line from) {
    for (int i = 0; i < to.length; ++i)
        to[i] += factor * from[i];
}

// The Householder vector in place of x, apply(h) for what it is to reflect, and what the first element of x becomes; 0 for zeros.
template <class Apply> float reflect(Line x, Apply apply) {
    float scale = 0, s = 0;
    for (int i = 0; i < x.length; ++i)
        scale += std::fabs(x[i]);
    if (scale == 0)
        return 0;
    for (int i = 0; i < x.length; ++i) {
        x[i] /= scale;
        s += x[i] * x[i];
    }
    const float f = x[0], g = -(sign(f) * std::sqrt(s));
    x[0] = f - g;
    apply(f * g - s);
    for (int i = 0; i < x.length; ++i)
        x[i] *= scale;
    return scale * g;
}

inline bool nr_svdcmp(const Matrix& a, Matrix& u, Matrix& W, Matrix& v) {
    const int m = a.rows, n = a.columns;
    u = a;
    v = Matrix(n, n);
    W = Matrix(n, n);
    std::vector<float> w(n), e(n + 1), scaled(n); // diagonal, superdiagonal from e[1] on
    float norm = 0;
    for (int i = 0; i < n; ++i) {
        if (i < m) {
            const Line below = column(u, i, i), beside = row(u, i, i + 1), direction = {scaled.data(), 0, 1, n - i - 1};
            w[i] = reflect(below, [&](float h) {
                for (int c = i + 1; c < n; ++c)
                    addMultiple(column(u, c, i), dot(below, column(u, c, i)) / h, below);
            });
            e[i + 1] = reflect(beside, [&](float h) {
                for (int c = 0; c < beside.length; ++c)
                    direction[c] = beside[c] / h;
                for (int r = i + 1; r < m; ++r)
                    addMultiple(row(u, r, i + 1), dot(row(u, r, i + 1), beside), direction);
            });
        }
        const float size = std::fabs(w[i]) + std::fabs(e[i]);
        norm = norm > size ? norm : size;
    }

    for (int i = n - 1; i >= 0; --i) {
        if (e[i + 1] != 0) {
            const Line beside = row(u, i, i + 1), below = column(v, i, i + 1);
            for (int k = 0; k < beside.length; ++k)
                below[k] = (beside[k] / beside[0]) / e[i + 1];
            for (int c = i + 1; c < n; ++c)
                addMultiple(column(v, c, i + 1), dot(beside, column(v, c, i + 1)), below);
        }
        for (int c = i + 1; c < n; ++c)
            v[i][c] = v[c][i] = 0;
        v[i][i] = 1;
    }

    for (int i = (m < n ? m : n) - 1; i >= 0; --i) {
        for (int c = i + 1; c < n; ++c)
            u[i][c] = 0;
        const Line whole = column(u, i, i), rest = column(u, i, i + 1);
        const float reciprocal = 1.0f / w[i];
        if (w[i] != 0)
            for (int c = i + 1; c < n; ++c)
                addMultiple(column(u, c, i), (dot(rest, column(u, c, i + 1)) / u[i][i]) * reciprocal, whole);
        for (int r = 0; r < whole.length; ++r)
            whole[r] = w[i] == 0 ? 0.0f : whole[r] * reciprocal;
        u[i][i] += 1.0f;
    }

    bool converged = true;
    for (int k = n - 1; k >= 0 && converged; --k)
        for (int its = 1;; ++its) {
            int l = k;
            bool cancel = false;
            for (; l > 0; --l) {
                if (std::fabs(e[l]) + norm == norm)
                    break;
                if (std::fabs(w[l - 1]) + norm == norm) {
                    cancel = true;
                    break;
                }
            }
            if (cancel) {
                float c = 0, s = 1;
                for (int i = l; i <= k; ++i) {
                    const float f = s * e[i];
                    e[i] = c * e[i];
                    if (std::fabs(f) + norm == norm)
                        break;
                    const float g = w[i], h = pythag(f, g), reciprocal = 1.0f / h;
                    w[i] = h;
                    c = g * reciprocal;
                    s = -f * reciprocal;
                    rotateColumns(u, l - 1, i, c, s);
                }
            }
            if (l == k) {
                if (w[k] < 0) {
                    w[k] = -w[k];
                    for (int r = 0; r < n; ++r)
                        v[r][k] = -v[r][k];
                }
                break;
            }
            if (its == 30) {
                converged = false;
                break;
            }
            float x = w[l], y = w[k - 1], z = w[k], g = e[k - 1], h = e[k];
            float f = ((y - z) * (y + z) + (g - h) * (g + h)) / (2.0f * h * y);
            g = pythag(f, 1.0f);
            f = ((x - z) * (x + z) + h * ((y / (f + sign(f) * g)) - h)) / x;
            float c = 1, s = 1;
            for (int j = l; j <= k - 1; ++j) {
                g = c * e[j + 1];
                h = s * e[j + 1];
                y = w[j + 1];
                z = pythag(f, h);
                e[j] = z;
                c = f / z;
                s = h / z;
                f = x * c + g * s;
                g = g * c - x * s;
                h = y * s;
                y = y * c;
                rotateColumns(v, j, j + 1, c, s);
                z = pythag(f, h);
                w[j] = z;
                if (z != 0) {
                    z = 1.0f / z;
                    c = f * z;
                    s = h * z;
                }
                f = c * g + s * y;
                x = c * y - s * g;
                rotateColumns(u, j, j + 1, c, s);
            }
            e[l] = 0;
            e[k] = f;
            w[k] = x;
        }
    for (int i = 0; i < n; ++i)
        W[i][i] = w[i];
    return converged;
}

inline bool nr_jacobi(Matrix& a, Matrix& d, Matrix& v, int* nrot) {
    const int n = a.columns;
    d = Matrix(n, 1);
    v = identity<float>(n);
    std::vector<float> b(n), z(n);
    for (int i = 0; i < n; ++i)
        b[i] = d[i][0] = a[i][i];
    *nrot = 0;
    for (int sweep = 0; sweep < 50; ++sweep) {
        float sm = 0;
        for (int p = 0; p < n; ++p)
            for (int q = p + 1; q < n; ++q)
                sm += std::fabs(a[p][q]);
        if (sm == 0)
            return true;
        const float tresh = sweep <= 3 ? 0.2f * sm / static_cast<float>(n * n) : 0.0f;
        for (int p = 0; p < n; ++p)
            for (int q = p + 1; q < n; ++q) {
                const float g = 100.0f * std::fabs(a[p][q]);
                const double dp = std::fabs(d[p][0]), dq = std::fabs(d[q][0]), gg = g;
                if (sweep > 4 && dp + gg == dp && dq + gg == dq) {
                    a[p][q] = 0;
                    continue;
                }
                if (!(std::fabs(a[p][q]) > tresh))
                    continue;
                float h = d[q][0] - d[p][0], t;
                const double hh = std::fabs(h);
                if (hh + gg == hh)
                    t = a[p][q] / h;
                else {
                    const float theta = 0.5f * h / a[p][q], divisor = std::fabs(theta) + std::sqrt(1.0f + theta * theta);
                    t = static_cast<float>(1.0 / static_cast<double>(divisor));
                    if (theta < 0)
                        t = -t;
                }
                const float square = t * t + 1.0f, c = static_cast<float>(1.0 / std::sqrt(static_cast<double>(square)));
                const float s = t * c, tau = s / (1.0f + c);
                h = t * a[p][q];
                z[p] -= h;
                z[q] += h;
                d[p][0] -= h;
                d[q][0] += h;
                a[p][q] = 0;
                const auto rotate = [=](float& x, float& y) {
                    const float gx = x, hy = y;
                    x = gx - s * (hy + gx * tau);
                    y = hy + s * (gx - hy * tau);
                };
                for (int j = 0; j < p; ++j)
                    rotate(a[j][p], a[j][q]);
                for (int j = p + 1; j < q; ++j)
                    rotate(a[p][j], a[j][q]);
                for (int j = q + 1; j < n; ++j)
                    rotate(a[p][j], a[q][j]);
                for (int j = 0; j < n; ++j)
                    rotate(v[j][p], v[j][q]);
                ++*nrot;
            }
        for (int i = 0; i < n; ++i) {
            b[i] = b[i] + z[i];
            d[i][0] = b[i];
            z[i] = 0;
        }
    }
    return false;
}

// A x = lambda B x, through L^-1 A L^-T.
inline void generalizedEigen(const Matrix& A, const Matrix& B, Matrix& d, Matrix& X) {
    Matrix L = B, M, Y;
    nr_choldc(L);
    if (!inverse(transposed(L), M)) {
        d = X = Matrix();
        return;
    }
    Matrix C = transposed(M) * A * M;
    int rotations;
    nr_jacobi(C, d, Y, &rotations);
    X = M * Y;
}

} // namespace kel_ref

#endif
