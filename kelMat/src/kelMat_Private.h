// What the files of the geometry half share: memory that stays on the stack while it is small, and the kernels behind the
// members of kelMat, for callers that bring their own storage. Rests on kelMat.h alone.
#ifndef KEL_MAT_PRIVATE_H
#define KEL_MAT_PRIVATE_H

#include <cmath>
#include <cstddef>
#include <cstdlib>
#include <smmintrin.h>

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

// A temporary matrix whose elements (indeterminate at first) lie inside the object up to N of them. It may be used wherever
// elements are read or written, but not where it would be created anew, resized or assigned to.
template <size_t N> class LocalMat : public kelMat {
public:
    LocalMat(int height, int width) {
        if (height < 1 || width < 1)
            return;
        if (static_cast<size_t>(height) * static_cast<size_t>(width) > N) {
            create(height, width, false);
            return;
        }
        m_Height = height;
        m_Width = width;
        m_IsCreated = true;
        m_Data = m_inside;
    }
    explicit LocalMat(const kelMat& M) : LocalMat(M.m_Height, M.m_Width) { setData(M.m_Data); }
    ~LocalMat() {
        if (m_Data == m_inside)
            m_Data = nullptr;
    }
    LocalMat(const LocalMat&) = delete;
    LocalMat& operator=(const LocalMat&) = delete;

private:
    alignas(16) float m_inside[N];
};

// Orders up to which temporaries stay on the stack: those of the estimators, 12 at most.
constexpr int kSmallOrder = 12;
using SmallMat = LocalMat<kSmallOrder * kSmallOrder>;

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

// to[i] -= factor * from[i].
inline void subtractMultiple(float* to, float factor, const float* from, ptrdiff_t count) {
    const __m128 factors = _mm_set1_ps(factor);
    ptrdiff_t i = 0;
    for (; i + 4 <= count; i += 4)
        _mm_storeu_ps(to + i, _mm_sub_ps(_mm_loadu_ps(to + i), _mm_mul_ps(factors, _mm_loadu_ps(from + i))));
    for (; i < count; ++i)
        to[i] -= factor * from[i];
}

// R = A B, A (rows x inner) and B (inner x columns) row by row without gaps, apart from R. Every element sums over `inner` in
// increasing order, from 0.
void multiply(float* R, const float* A, const float* B, int rows, int inner, int columns);

// T = the transpose of A (rows x columns), apart from A.
void transpose(float* T, const float* A, int rows, int columns);

// Singular value decomposition of a, which has the size of u and is u.m_Data itself or apart from it. Creates w and v, n x n.
// With `withU` u becomes the matrix of the left singular vectors; without, it is left with nothing of use, which costs about
// half, and w and v have the same bits. False where a value does not converge.
bool decompose(const float* a, kelMat& u, bool withU, kelMat& w, kelMat& v);

// The w and v of nr_svdcmp(), bit for bit, where a is not needed any more.
inline bool decomposeWithoutU(kelMat& a, kelMat& w, kelMat& v) {
    return decompose(a.m_Data, a, false, w, v);
}

} // namespace kel

#endif
