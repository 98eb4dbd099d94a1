// What the files of the geometry half share: memory that stays on the stack while it is small, and the kernels behind the
// members of kelMat, for callers that bring their own storage. Rests on kelMat.h alone.
#ifndef KEL_MAT_PRIVATE_H
#define KEL_MAT_PRIVATE_H

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdlib>

#include "kelFloats.h"
#include "kelMat.h"

#define KEL_INLINE __attribute__((always_inline))

namespace kel {

// n elements of a plain type, indeterminate at first: inside the object up to N, from malloc beyond.
template <class T, size_t N> class Scratch {
public:
    explicit Scratch(size_t n) : m_data(n <= N ? m_inside : static_cast<T*>(malloc(n * sizeof(T)))) {}
    ~Scratch() {
        if (m_data != m_inside)
            free(m_data);
    }
    Scratch(const Scratch&) = delete;
    Scratch& operator=(const Scratch&) = delete;

    T* data() { return m_data; }
    T& operator[](ptrdiff_t i) { return m_data[i]; }

private:
    alignas(16) T m_inside[N];
    T* m_data;
};

// Orders up to which temporaries stay on the stack: those of the estimators, 12 at most.
constexpr int kSmallOrder = 12;
using SquareScratch = Scratch<float, kSmallOrder * kSmallOrder>;

inline float sign(float x) {
    return x >= 0.0f ? 1.0f : -1.0f;
}

// The longer of the two times a root in double.
inline float pythag(float a, float b) {
    const float A = std::fabs(a), B = std::fabs(b);
    const float longer = A > B ? A : B, shorter = A > B ? B : A;
    if (longer == 0.0f)
        return 0.0f;
    const float ratio = shorter / longer, q = ratio * ratio + 1.0f;
    return static_cast<float>(static_cast<double>(longer) * std::sqrt(static_cast<double>(q)));
}

// From the rows of the matrix; that of order 3 along the last column, summed from its top.
inline float determinant2x2(const float* a, const float* b) {
    return a[0] * b[1] - a[1] * b[0];
}
inline float determinant3x3(const float* a, const float* b, const float* c) {
    const float top = (b[0] * c[1] - b[1] * c[0]) * a[2];
    const float middle = (c[0] * a[1] - c[1] * a[0]) * b[2] + top;
    return (a[0] * b[1] - a[1] * b[0]) * c[2] + middle;
}

// to[i] -= factor * from[i].
inline void subtractMultiple(float* to, float factor, const float* from, ptrdiff_t count) {
    const Floats factors = all(factor);
    ptrdiff_t i = 0;
    for (; i + kLanes <= count; i += kLanes)
        store(to + i, load(to + i) - factors * load(from + i));
    for (; i < count; ++i)
        to[i] -= factor * from[i];
}

// The same of `count` rows, `pitch` apart, with a factor each: for every element term by term in their order.
inline void subtractMultiples(float* to, const float* factors, const float* rows, ptrdiff_t pitch, ptrdiff_t count,
                              ptrdiff_t columns) {
    constexpr int kVectors = 4; // kept in registers
    ptrdiff_t c = 0;
    for (; c + kLanes * kVectors <= columns; c += kLanes * kVectors) {
        Floats sums[kVectors];
        for (int v = 0; v < kVectors; ++v)
            sums[v] = load(to + c + kLanes * v);
        for (ptrdiff_t k = 0; k < count; ++k)
            for (int v = 0; v < kVectors; ++v)
                sums[v] -= all(factors[k]) * load(rows + k * pitch + c + kLanes * v);
        for (int v = 0; v < kVectors; ++v)
            store(to + c + kLanes * v, sums[v]);
    }
    for (; c + kLanes <= columns; c += kLanes) {
        Floats sum = load(to + c);
        for (ptrdiff_t k = 0; k < count; ++k)
            sum -= all(factors[k]) * load(rows + k * pitch + c);
        store(to + c, sum);
    }
    for (; c < columns; ++c)
        for (ptrdiff_t k = 0; k < count; ++k)
            to[c] -= factors[k] * rows[k * pitch + c];
}

// ---- kernels over elements that the caller owns: row by row without gaps, n x n where no other size is given -----------------

// R = A B, A (rows x inner) and B (inner x columns), apart from R. Every element sums over `inner` in increasing order, from 0.
void multiply(float* R, const float* A, const float* B, int rows, int inner, int columns);

// T = the transpose of A (rows x columns), apart from A.
void transpose(float* T, const float* A, int rows, int columns);

// What nr_ludcmp(), nr_lubksb(), nr_choldc() and nr_jacobi() do.
bool decomposeLU(float* a, int n, int* indx, float* parity);
void substituteLU(const float* lu, int n, const int* indx, float* b);
bool decomposeCholesky(float* a, int n);
bool jacobi(float* a, int n, float* d, float* v, int* rotations);

// The inverse into R, apart from the decomposition.
void invertLU(const float* lu, int n, const int* indx, float* R);

// The inverse of a, which is left with nothing of use, into R apart from it: in closed form for n of 2 and 3, by LU beyond. False, and
// R as it was, where it is singular.
bool invert(float* a, int n, float* R);

// A square matrix's decomposition on a copy; `ok` is that of decomposeLU().
struct LUCopy {
    SquareScratch a;
    Scratch<int, kSmallOrder> indx;
    float parity;
    bool ok;
    explicit LUCopy(const kelMat& M) : a(static_cast<size_t>(M.m_Width) * M.m_Width), indx(M.m_Width) {
        std::copy_n(M.m_Data, static_cast<ptrdiff_t>(M.m_Width) * M.m_Width, a.data());
        ok = decomposeLU(a.data(), M.m_Width, indx.data(), &parity);
    }
};

// Singular value decomposition of a (m x n), which is u itself or apart from it: n singular values in w, v n x n. With `withU` u
// (m x n) becomes the matrix of the left singular vectors; without, it is left with nothing of use, which costs about half, and
// w and v have the same bits. u and v are aligned to 16 bytes. False where a value does not converge.
bool decomposeSV(const float* a, int m, int n, float* u, bool withU, float* w, float* v);

} // namespace kel

#endif
