// The matrix kernels written plainly: every loop in the textbook order. With T = float the results are the library's own bit
// for bit; with T = double they serve as truth.
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

    explicit Mat(int rows = 0, int columns = 0) : rows(rows), columns(columns), data(static_cast<size_t>(rows) * columns) {}
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

template <class T> Mat<T> product(const Mat<T>& A, const Mat<T>& B) {
    Mat<T> R(A.rows, B.columns);
    for (int i = 0; i < A.rows; ++i)
        for (int j = 0; j < B.columns; ++j)
            for (int k = 0; k < A.columns; ++k)
                R[i][j] = A[i][k] * B[k][j] + R[i][j];
    return R;
}

template <class T> T sign(T x) {
    return x >= 0 ? T(1) : T(-1);
}

template <class T> T pythag(T a, T b) {
    const T A = std::fabs(a), B = std::fabs(b);
    if (A > B) {
        const T r = B / A, q = r * r + T(1);
        return static_cast<T>(static_cast<double>(A) * std::sqrt(static_cast<double>(q)));
    }
    if (B == 0)
        return 0;
    const T r = A / B, q = r * r + T(1);
    return static_cast<T>(static_cast<double>(B) * std::sqrt(static_cast<double>(q)));
}

// Crout, column by column.
template <class T> bool ludcmp(Mat<T>& a, int* indx, T* d) {
    const int n = a.columns;
    *d = 1;
    std::vector<T> vv(n);
    for (int i = 0; i < n; ++i) {
        T big = 0;
        for (int j = 0; j < n; ++j)
            if (std::fabs(a[i][j]) > big)
                big = std::fabs(a[i][j]);
        if (big == 0)
            return false;
        vv[i] = T(1) / big;
    }
    int imax = 0;
    for (int j = 0; j < n; ++j) {
        for (int i = 0; i < j; ++i)
            for (int k = 0; k < i; ++k)
                a[i][j] = a[i][j] - a[i][k] * a[k][j];
        T big = 0;
        for (int i = j; i < n; ++i) {
            for (int k = 0; k < j; ++k)
                a[i][j] = a[i][j] - a[i][k] * a[k][j];
            const T dum = vv[i] * std::fabs(a[i][j]);
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
            a[j][j] = T(1.0e-40f);
        if (j != n - 1) {
            const T dum = T(1) / a[j][j];
            for (int i = j + 1; i < n; ++i)
                a[i][j] = a[i][j] * dum;
        }
    }
    return true;
}

template <class T> void lubksb(const Mat<T>& a, const int* indx, T* b) {
    const int n = a.columns;
    bool set = false;
    int ii = 0;
    for (int i = 0; i < n; ++i) {
        const int ip = indx[i];
        T sum = b[ip];
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
        T sum = b[i];
        for (int k = i + 1; k < n; ++k)
            sum = sum - a[i][k] * b[k];
        b[i] = sum / a[i][i];
    }
}

template <class T> bool inverse(const Mat<T>& A, Mat<T>& R) {
    const int n = A.columns;
    std::vector<int> indx(n);
    Mat<T> LU = A;
    T d;
    if (!ludcmp(LU, indx.data(), &d))
        return false;
    R = Mat<T>(n, n);
    for (int j = 0; j < n; ++j) {
        std::vector<T> column(n);
        column[j] = 1;
        lubksb(LU, indx.data(), column.data());
        for (int i = 0; i < n; ++i)
            R[i][j] = column[i];
    }
    return true;
}

template <class T> bool choldc(Mat<T>& a) {
    const int n = a.columns;
    for (int i = 0; i < n; ++i)
        for (int j = 0; j <= i; ++j) {
            T s = a[i][j];
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
template <class T> void rotateColumns(Mat<T>& M, int p, int q, T c, T s) {
    for (int r = 0; r < M.rows; ++r) {
        const T x = M[r][p], y = M[r][q];
        M[r][p] = x * c + y * s;
        M[r][q] = y * c - x * s;
    }
}

template <class T> bool svdcmp(const Mat<T>& a, Mat<T>& u, Mat<T>& W, Mat<T>& v) {
    const int m = a.rows, n = a.columns;
    u = a;
    v = Mat<T>(n, n);
    W = Mat<T>(n, n);
    std::vector<T> w(n), e(n);
    T norm = 0;

    T carried = 0; // superdiagonal element of the row before
    for (int i = 0; i < n; ++i) {
        e[i] = carried;
        w[i] = 0;
        carried = 0;
        T scale = 0;
        for (int r = i; r < m; ++r)
            scale += std::fabs(u[r][i]);
        if (scale != 0) {
            T s = 0;
            for (int r = i; r < m; ++r) {
                u[r][i] /= scale;
                s += u[r][i] * u[r][i];
            }
            const T f = u[i][i], g = -(sign(f) * std::sqrt(s)), h = f * g - s;
            u[i][i] = f - g;
            for (int c = i + 1; c < n; ++c) {
                T sum = 0;
                for (int r = i; r < m; ++r)
                    sum += u[r][i] * u[r][c];
                const T factor = sum / h;
                for (int r = i; r < m; ++r)
                    u[r][c] += factor * u[r][i];
            }
            for (int r = i; r < m; ++r)
                u[r][i] *= scale;
            w[i] = scale * g;
        }
        scale = 0;
        if (i < m)
            for (int c = i + 1; c < n; ++c)
                scale += std::fabs(u[i][c]);
        if (scale != 0) {
            T s = 0;
            for (int c = i + 1; c < n; ++c) {
                u[i][c] /= scale;
                s += u[i][c] * u[i][c];
            }
            const T f = u[i][i + 1], g = -(sign(f) * std::sqrt(s)), h = f * g - s;
            u[i][i + 1] = f - g;
            std::vector<T> direction(n);
            for (int c = i + 1; c < n; ++c)
                direction[c] = u[i][c] / h;
            for (int r = i + 1; r < m; ++r) {
                T sum = 0;
                for (int c = i + 1; c < n; ++c)
                    sum += u[r][c] * u[i][c];
                for (int c = i + 1; c < n; ++c)
                    u[r][c] += sum * direction[c];
            }
            for (int c = i + 1; c < n; ++c)
                u[i][c] *= scale;
            carried = scale * g;
        }
        const T size = std::fabs(w[i]) + std::fabs(e[i]);
        norm = norm > size ? norm : size;
    }

    for (int i = n - 1; i >= 0; --i) {
        if (i + 1 < n && e[i + 1] != 0) {
            for (int c = i + 1; c < n; ++c)
                v[c][i] = (u[i][c] / u[i][i + 1]) / e[i + 1];
            for (int c = i + 1; c < n; ++c) {
                T sum = 0;
                for (int k = i + 1; k < n; ++k)
                    sum += u[i][k] * v[k][c];
                for (int k = i + 1; k < n; ++k)
                    v[k][c] += sum * v[k][i];
            }
        }
        for (int c = i + 1; c < n; ++c)
            v[i][c] = v[c][i] = 0;
        v[i][i] = 1;
    }

    for (int i = (m < n ? m : n) - 1; i >= 0; --i) {
        for (int c = i + 1; c < n; ++c)
            u[i][c] = 0;
        if (w[i] == 0) {
            for (int r = i; r < m; ++r)
                u[r][i] = 0;
        } else {
            const T reciprocal = T(1) / w[i];
            for (int c = i + 1; c < n; ++c) {
                T sum = 0;
                for (int r = i + 1; r < m; ++r)
                    sum += u[r][i] * u[r][c];
                const T factor = (sum / u[i][i]) * reciprocal;
                for (int r = i; r < m; ++r)
                    u[r][c] += factor * u[r][i];
            }
            for (int r = i; r < m; ++r)
                u[r][i] *= reciprocal;
        }
        u[i][i] += T(1);
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
                T c = 0, s = 1;
                for (int i = l; i <= k; ++i) {
                    const T f = s * e[i];
                    e[i] = c * e[i];
                    if (std::fabs(f) + norm == norm)
                        break;
                    const T g = w[i], h = pythag(f, g), reciprocal = T(1) / h;
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
            T x = w[l], y = w[k - 1], z = w[k], g = e[k - 1], h = e[k];
            T f = ((y - z) * (y + z) + (g - h) * (g + h)) / (T(2) * h * y);
            g = pythag(f, T(1));
            f = ((x - z) * (x + z) + h * ((y / (f + sign(f) * g)) - h)) / x;
            T c = 1, s = 1;
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
                    z = T(1) / z;
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

template <class T> bool jacobi(Mat<T>& a, Mat<T>& d, Mat<T>& v, int* nrot) {
    const int n = a.columns;
    d = Mat<T>(n, 1);
    v = identity<T>(n);
    std::vector<T> b(n), z(n);
    for (int i = 0; i < n; ++i)
        b[i] = d[i][0] = a[i][i];
    *nrot = 0;
    for (int sweep = 0; sweep < 50; ++sweep) {
        T sm = 0;
        for (int p = 0; p < n; ++p)
            for (int q = p + 1; q < n; ++q)
                sm += std::fabs(a[p][q]);
        if (sm == 0)
            return true;
        const T tresh = sweep <= 3 ? T(0.2f) * sm / T(n * n) : T(0);
        for (int p = 0; p < n; ++p)
            for (int q = p + 1; q < n; ++q) {
                const T g = T(100) * std::fabs(a[p][q]);
                const double dp = std::fabs(d[p][0]), dq = std::fabs(d[q][0]), gg = g;
                if (sweep > 4 && dp + gg == dp && dq + gg == dq) {
                    a[p][q] = 0;
                    continue;
                }
                if (!(std::fabs(a[p][q]) > tresh))
                    continue;
                T h = d[q][0] - d[p][0], t;
                const double hh = std::fabs(h);
                if (hh + gg == hh)
                    t = a[p][q] / h;
                else {
                    const T theta = T(0.5) * h / a[p][q], divisor = std::fabs(theta) + std::sqrt(T(1) + theta * theta);
                    t = static_cast<T>(1.0 / static_cast<double>(divisor));
                    if (theta < 0)
                        t = -t;
                }
                const T square = t * t + T(1), c = static_cast<T>(1.0 / std::sqrt(static_cast<double>(square)));
                const T s = t * c, tau = s / (T(1) + c);
                h = t * a[p][q];
                z[p] -= h;
                z[q] += h;
                d[p][0] -= h;
                d[q][0] += h;
                a[p][q] = 0;
                const auto rotate = [=](T& x, T& y) {
                    const T gx = x, hy = y;
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

template <class T> Mat<T> adjugateInverse3x3(const Mat<T>& A) {
    Mat<T> R(3, 3);
    T det = (A[1][0] * A[2][1] - A[1][1] * A[2][0]) * A[0][2];
    det = (A[2][0] * A[0][1] - A[2][1] * A[0][0]) * A[1][2] + det;
    det = (A[0][0] * A[1][1] - A[0][1] * A[1][0]) * A[2][2] + det;
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j) {
            const int r = (j + 1) % 3, rr = (j + 2) % 3, c = (i + 1) % 3, cc = (i + 2) % 3;
            R[i][j] = (A[r][c] * A[rr][cc] - A[r][cc] * A[rr][c]) / det;
        }
    return R;
}

// A x = lambda B x for n > 3, through L^-1 A L^-T.
template <class T> void generalizedEigen(const Mat<T>& A, const Mat<T>& B, Mat<T>& d, Mat<T>& X) {
    Mat<T> L = B, M(0, 0), Y;
    choldc(L);
    if (!inverse(transposed(L), M)) {
        d = X = Mat<T>(0, 0);
        return;
    }
    Mat<T> C = product(product(transposed(M), A), M);
    int rotations;
    jacobi(C, d, Y, &rotations);
    X = product(M, Y);
}

} // namespace kel_ref

#endif
