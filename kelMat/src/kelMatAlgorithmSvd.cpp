// The singular value decomposition behind nr_svdcmp: Householder bidiagonalisation, then implicit-shift QR. Every element goes
// through the operations of the textbook loops in their order; only what runs side by side is arranged for vectors.
#include <algorithm>
#include <type_traits>

#include "kelMat_Private.h"

namespace {

using kel::all, kel::Floats, kel::kLanes, kel::load, kel::loadAligned, kel::magnitude, kel::Scratch, kel::store,
    kel::storeAligned;

// Lanes from .. to - 1 added one after the other.
KEL_INLINE inline float addLanes(float sum, Floats v, int from, int to) {
    alignas(16) float lanes[kLanes];
    storeAligned(lanes, v);
    for (int k = from; k < to; ++k)
        sum += lanes[k];
    return sum;
}

// Plane rotation: columns p and q become p c + q s and q c - p s.
struct Rotation {
    int p, q;
    float c, s;
};

// Rotates N tiles, `tileFloats` apart. The second column of a rotation, mostly the first of the next, stays in registers.
template <int N> void rotate(float* tiles, ptrdiff_t tileFloats, const Rotation* begin, const Rotation* end) {
    if (begin == end)
        return;
    float* P = tiles + kLanes * begin->p;
    Floats carried[N];
    for (int k = 0; k < N; ++k)
        carried[k] = loadAligned(P + tileFloats * k);
    for (const Rotation* next = begin; next != end; ++next) {
        const Rotation r = *next;
        float *const first = tiles + kLanes * r.p, *const Q = tiles + kLanes * r.q;
        if (first != P)
            for (int k = 0; k < N; ++k) {
                storeAligned(P + tileFloats * k, carried[k]);
                carried[k] = loadAligned(first + tileFloats * k);
            }
        const Floats c = all(r.c), s = all(r.s);
        for (int k = 0; k < N; ++k) {
            const Floats x = carried[k], y = loadAligned(Q + tileFloats * k);
            storeAligned(first + tileFloats * k, x * c + y * s);
            carried[k] = y * c - x * s;
        }
        P = Q;
    }
    for (int k = 0; k < N; ++k)
        storeAligned(P + tileFloats * k, carried[k]);
}

/*
 * A matrix in tiles of four rows. A tile takes the place of its rows; a vector in it is four rows of one column:
 *
 *     a b c         a d g j
 *     d e f   ->    b e h k
 *     g h i         c f i l
 *     j k l
 *
 * So rows are independent lanes, and a sum down a column runs through the lanes of vector after vector. The last one to three
 * rows, whose place is too small for a tile, have theirs outside the matrix; what its other lanes hold does not matter.
 */
class Tiles {
public:
    Tiles(float* data, int rows, int columns)
        : m_rows(rows), m_columns(columns), m_full(rows / kLanes), m_floats(ptrdiff_t(kLanes) * columns), m_data(data),
          m_last(m_floats), m_spare(m_floats) {}

    ptrdiff_t floats() const { return m_floats; }
    int count() const { return m_full + (kLanes * m_full < m_rows); }
    float* operator[](int tile) { return tile < m_full ? m_data + m_floats * tile : m_last.data(); }
    float& at(int r, int c) { return (*this)[r / kLanes][kLanes * c + r % kLanes]; }

    // Calls f(tile, from, to) for the tiles that hold the rows from `first` on, which are its lanes from .. to - 1.
    template <class F> KEL_INLINE void fromRow(int first, F f) {
        int t = first / kLanes;
        if (first % kLanes != 0 && t < m_full)
            f((*this)[t++], first % kLanes, kLanes);
        for (; t < m_full; ++t)
            f(m_data + m_floats * t, 0, kLanes);
        if (t == m_full && kLanes * m_full < m_rows)
            f(m_last.data(), std::max(first - kLanes * m_full, 0), m_rows - kLanes * m_full);
    }

    // The same with f(tile, from, to, number): number tiles that follow each other at floats() at once, four where there are.
    template <class F> KEL_INLINE void fromRowByFours(int first, F f) {
        const std::integral_constant<int, 1> one;
        int t = first / kLanes;
        if (first % kLanes != 0 && t < m_full)
            f((*this)[t++], first % kLanes, kLanes, one);
        for (; t + 4 <= m_full; t += 4)
            f(m_data + m_floats * t, 0, kLanes, std::integral_constant<int, 4>());
        for (; t < m_full; ++t)
            f(m_data + m_floats * t, 0, kLanes, one);
        if (t == m_full && kLanes * m_full < m_rows)
            f(m_last.data(), std::max(first - kLanes * m_full, 0), m_rows - kLanes * m_full, one);
    }

    // Applies rotations to the tiles first .. last - 1.
    void rotate(int first, int last, const Rotation* begin, const Rotation* end) {
        constexpr int kAtOnce = 8;
        int t = first;
        for (; t + kAtOnce <= std::min(last, m_full); t += kAtOnce)
            ::rotate<kAtOnce>(m_data + m_floats * t, m_floats, begin, end);
        for (; t < last; ++t)
            ::rotate<1>((*this)[t], 0, begin, end);
    }

    // Takes the elements from rows of their own or, one tile after the other, from their place.
    void pack(const float* source) {
        for (int t = 0; t < m_full; ++t) {
            float* const tile = m_data + m_floats * t;
            if (source != m_data) {
                toTile(tile, source + m_floats * t);
            } else {
                toTile(m_spare.data(), tile);
                copy(tile, m_spare.data());
            }
        }
        std::fill_n(m_spare.data(), m_floats, 0.0f);
        std::copy_n(source + m_floats * m_full, restFloats(), m_spare.data());
        toTile(m_last.data(), m_spare.data());
    }
    // Puts the tiles first .. last - 1 back into rows, in their place.
    void unpack(int first, int last) {
        for (int t = first; t < std::min(last, m_full); ++t) {
            float* const tile = m_data + m_floats * t;
            copy(m_spare.data(), tile);
            toRows(tile, m_spare.data());
        }
        if (last > m_full) {
            toRows(m_spare.data(), m_last.data());
            std::copy_n(m_spare.data(), restFloats(), m_data + m_floats * m_full);
        }
    }

private:
    size_t restFloats() const { return static_cast<size_t>(m_columns) * (m_rows - kLanes * m_full); }

    void copy(float* dst, const float* src) const {
        for (ptrdiff_t i = 0; i < m_floats; i += kLanes)
            storeAligned(dst + i, loadAligned(src + i));
    }

    // By blocks of four columns, the last of which overlaps its neighbour where the columns do not come in fours.
    void toTile(float* tile, const float* rows) const {
        const int n = m_columns;
        if (n < kLanes)
            return kel::transpose(tile, rows, kLanes, n);
        for (int j = 0; j < n; j += kLanes) {
            const int c = std::min(j, n - kLanes);
            const float* const from = rows + c;
            Floats v0 = load(from), v1 = load(from + n), v2 = load(from + 2 * n), v3 = load(from + 3 * n);
            kel::transpose(v0, v1, v2, v3);
            storeFour(tile + kLanes * c, kLanes, v0, v1, v2, v3);
        }
    }
    void toRows(float* rows, const float* tile) const {
        const int n = m_columns;
        if (n < kLanes)
            return kel::transpose(rows, tile, n, kLanes);
        for (int j = 0; j < n; j += kLanes) {
            const int c = std::min(j, n - kLanes);
            const float* const from = tile + kLanes * c;
            Floats v0 = loadAligned(from), v1 = loadAligned(from + kLanes), v2 = loadAligned(from + 2 * kLanes),
                   v3 = loadAligned(from + 3 * kLanes);
            kel::transpose(v0, v1, v2, v3);
            storeFour(rows + c, n, v0, v1, v2, v3);
        }
    }
    static void storeFour(float* to, int pitch, Floats v0, Floats v1, Floats v2, Floats v3) {
        store(to, v0);
        store(to + pitch, v1);
        store(to + 2 * pitch, v2);
        store(to + 3 * pitch, v3);
    }

    const int m_rows, m_columns, m_full;
    const ptrdiff_t m_floats; // of a tile
    float* const m_data;
    Scratch<float, kLanes * kel::kSmallOrder> m_last, m_spare;
};

// Dot products of one column with the G groups of four columns that end before column `end`, a lane each. Where the groups
// reach beyond column 0 it stands in for what is not there.
template <int G> class Dots {
public:
    Dots(int x, int end) : m_x(kLanes * x) {
        for (int i = 0; i < kLanes * G; ++i)
            m_column[i] = kLanes * std::max(end - kLanes * G + i, 0);
        for (Floats& sum : m_sums)
            sum = Floats{};
    }
    KEL_INLINE void add(const float* tile, int from, int to) {
        const Floats x = loadAligned(tile + m_x);
        for (int g = 0; g < G; ++g) {
            Floats row[kLanes];
            for (int i = 0; i < kLanes; ++i)
                row[i] = x * loadAligned(tile + m_column[kLanes * g + i]);
            kel::transpose(row[0], row[1], row[2], row[3]);
            for (int k = 0; k < kLanes; ++k)
                if (from <= k && k < to)
                    m_sums[g] += row[k];
        }
    }
    // To the 4 G floats before `end`.
    void store(float* end) const {
        for (int g = 0; g < G; ++g)
            kel::store(end - kLanes * (G - g), m_sums[g]);
    }

private:
    const int m_x;
    int m_column[kLanes * G];
    Floats m_sums[G];
};

constexpr int kMostGroups = 3;

// Calls f with the number of groups that hold `columns` columns, as a constant; the most there is, if more would be needed.
template <class F> void withGroups(int columns, F f) {
    if (columns <= kLanes)
        f(std::integral_constant<int, 1>());
    else if (columns <= 2 * kLanes)
        f(std::integral_constant<int, 2>());
    else
        f(std::integral_constant<int, kMostGroups>());
}

// The rotations of U, kept until the QR iteration is over: U takes no part in it.
class Rotations {
public:
    Rotations() : m_data(m_inside), m_count(0), m_capacity(kInside) {}
    ~Rotations() {
        if (m_data != m_inside)
            free(m_data);
    }
    Rotations(const Rotations&) = delete;
    Rotations& operator=(const Rotations&) = delete;

    void add(const Rotation& rotation) {
        if (m_count == m_capacity)
            grow();
        m_data[m_count++] = rotation;
    }
    const Rotation* begin() const { return m_data; }
    const Rotation* end() const { return m_data + m_count; }

private:
    void grow() {
        Rotation* const larger = static_cast<Rotation*>(malloc(2 * m_capacity * sizeof(Rotation)));
        std::copy_n(m_data, m_count, larger);
        if (m_data != m_inside)
            free(m_data);
        m_data = larger;
        m_capacity *= 2;
    }

    static constexpr size_t kInside = 256;
    Rotation m_inside[kInside];
    Rotation* m_data;
    size_t m_count, m_capacity;
};

class Svd {
public:
    Svd(int rows, int columns, float* u, bool withU, float* values, float* v)
        : m(rows), n(columns), m_withU(withU), U(u, rows, columns), V(v, columns, columns), m_v(v), w(values),
          m_space(spaceFor(columns)) {
        std::fill_n(v, static_cast<ptrdiff_t>(n) * n, 0.0f);
        float* next = m_space.data();
        const auto take = [&](ptrdiff_t floats) {
            next += floats;
            return next - floats;
        };
        m_factor = take(kLanes * n);
        m_row = take(kLanes * n);
        m_step = take(kLanes * n);
        m_sums = take(kLanes * kMostGroups + n) + kLanes * kMostGroups;
        e = take(n);
        m_rows = take(static_cast<ptrdiff_t>(n) * n);
    }

    bool run(const float* a) {
        U.pack(a);
        bidiagonalize();
        accumulateRight();
        V.pack(m_v);
        if (m_withU)
            accumulateLeft();
        bool converged = true;
        for (int k = n - 1; k >= 0 && converged; --k)
            converged = converge(k);
        V.unpack(0, V.count());
        if (m_withU)
            finishU();
        return converged;
    }

private:
    static constexpr int kIterations = 30;
    static constexpr int kFewTiles = 16;

    const int m, n;
    const bool m_withU;
    Tiles U, V;
    float* const m_v;                 // V in rows, before it is packed
    float *m_factor, *m_row, *m_step; // a number per column, each four times
    float* m_sums;                    // a number per column
    float* const w;                   // diagonal: the singular values in the end
    float* e;                         // superdiagonal
    float* m_rows;                    // the Householder vectors of the rows, n x n
    Scratch<float, kLanes * kMostGroups + kel::kSmallOrder*(3 * kLanes + 2 + kel::kSmallOrder)> m_space;
    Rotations m_rotations;
    float m_norm = 0.0f; // the largest |w| + |e|, the measure of what is negligible

    static size_t spaceFor(size_t n) { return kLanes * kMostGroups + n * (3 * kLanes + 2 + n); }
    static void fill4(float* four, float x) { storeAligned(four, all(x)); }
    bool negligible(float x) const { return std::fabs(x) + m_norm == m_norm; }

    // ---- to bidiagonal form

    float columnScale(int i) {
        float scale = 0.0f;
        U.fromRow(i, [&](const float* tile, int from, int to)
                         KEL_INLINE { scale = addLanes(scale, magnitude(loadAligned(tile + kLanes * i)), from, to); });
        return scale;
    }

    // Divides column i by `scale` from row i on; returns the sum of its squares.
    float normalizeColumn(int i, float scale) {
        const Floats divisor = all(scale);
        float squares = 0.0f;
        U.fromRow(i, [&](float* tile, int from, int to) KEL_INLINE {
            const Floats x = loadAligned(tile + kLanes * i) / divisor;
            storeAligned(tile + kLanes * i, x);
            squares = addLanes(squares, x * x, from, to);
        });
        return squares;
    }

    // m_sums[j] = dot product of columns x and j from row `first` on, for left < j < end.
    void dots(int x, int left, int end, int first) {
        for (; end - 1 > left; end -= kLanes * kMostGroups)
            withGroups(end - 1 - left, [&](auto groups) {
                Dots<groups> sums(x, end);
                U.fromRow(first, [&](const float* tile, int from, int to) KEL_INLINE { sums.add(tile, from, to); });
                sums.store(m_sums + end);
            });
    }

    // Reflects the columns right of i by column i, which is multiplied by `scale` then, and the rows below i by row i, all in
    // the rows from i + 1 on. Returns the sum of the magnitudes that column i + 1 has there afterwards.
    template <bool Column, bool Row> float reflect(int i, float scale) {
        const int count = n - i - 1; // columns
        const float *const factor = m_factor + kLanes * (i + 1), *const row = m_row + kLanes * (i + 1),
                           *const step = m_step + kLanes * (i + 1);
        const Floats scales = all(scale);
        float next = 0.0f;
        const ptrdiff_t apart = U.floats();
        U.fromRowByFours(i + 1, [&, count, apart](float* tile, int from, int to, auto number) KEL_INLINE {
            constexpr int N = number;
            float *const X = tile + kLanes * i, *const A = X + kLanes;
            Floats x[N], sum[N];
            for (int t = 0; t < N; ++t) {
                x[t] = loadAligned(X + apart * t);
                sum[t] = Floats{};
            }
            for (int j = 0; j < kLanes * count; j += kLanes) {
                const Floats f = Column ? loadAligned(factor + j) : Floats{}, r = Row ? loadAligned(row + j) : Floats{};
                for (int t = 0; t < N; ++t) {
                    Floats a = loadAligned(A + apart * t + j);
                    if (Column) {
                        a += f * x[t];
                        storeAligned(A + apart * t + j, a);
                    }
                    if (Row)
                        sum[t] += a * r;
                }
            }
            if (Row)
                for (int j = 0; j < kLanes * count; j += kLanes) {
                    const Floats s = loadAligned(step + j);
                    for (int t = 0; t < N; ++t) {
                        float* const a = A + apart * t + j;
                        storeAligned(a, loadAligned(a) + sum[t] * s);
                    }
                }
            for (int t = 0; t < N; ++t) {
                if (Column)
                    storeAligned(X + apart * t, x[t] * scales);
                if (count > 0)
                    next = addLanes(next, magnitude(loadAligned(A + apart * t)), from, to);
            }
        });
        return next;
    }

    // The reflection that takes n numbers, divided by their scale, onto the first: its sum of squares gives the new first
    // number g and the divisor h of the reflection.
    struct Reflection {
        float g, h;
        Reflection(float first, float squares) : g(-kel::sign(first) * std::sqrt(squares)), h(first * g - squares) {}
    };

    void bidiagonalize() {
        float scale = columnScale(0), super = 0.0f;
        for (int i = 0; i < n; ++i) {
            e[i] = super;
            w[i] = super = 0.0f;
            if (i < m)
                scale = reduce(i, scale, super);
            const float size = std::fabs(w[i]) + std::fabs(e[i]);
            m_norm = m_norm > size ? m_norm : size;
        }
    }

    // Column i, with `scale` the sum of its magnitudes, and row i. Sets w[i] and the superdiagonal element `super`; returns the
    // scale of the next column.
    float reduce(int i, float scale, float& super) {
        const bool column = scale != 0.0f;
        const float head = column ? takeColumn(i, scale) : 0.0f;
        const bool row = takeRow(i, super);
        if (!column)
            return row ? reflect<false, true>(i, scale) : reflect<false, false>(i, scale);
        const float next = row ? reflect<true, true>(i, scale) : reflect<true, false>(i, scale);
        U.at(i, i) = head * scale;
        return next;
    }

    // Makes column i a Householder vector, and ready in m_factor what it takes from the columns right of it, in row i already
    // taken. Sets w[i]; returns the first element of the vector.
    float takeColumn(int i, float scale) {
        const float squares = normalizeColumn(i, scale);
        float& first = U.at(i, i);
        const Reflection reflection(first, squares);
        const float head = first - reflection.g;
        first = head;
        dots(i, i, n, i);
        for (int j = i + 1; j < n; ++j) {
            const float factor = m_sums[j] / reflection.h;
            fill4(m_factor + kLanes * j, factor);
            U.at(i, j) += factor * head;
        }
        w[i] = scale * reflection.g;
        return head;
    }

    // Row i right of the diagonal moves to m_rows as a Householder vector, ready for the rows below in m_row and m_step, and
    // gives the next superdiagonal element; false where it is zero.
    bool takeRow(int i, float& super) {
        const int l = i + 1;
        float* const row = m_rows + static_cast<ptrdiff_t>(i) * n;
        float scale = 0.0f, squares = 0.0f;
        for (int k = l; k < n; ++k) {
            row[k] = U.at(i, k);
            scale += std::fabs(row[k]);
        }
        if (scale == 0.0f)
            return false;
        for (int k = l; k < n; ++k) {
            row[k] /= scale;
            squares += row[k] * row[k];
        }
        const Reflection reflection(row[l], squares);
        row[l] -= reflection.g;
        for (int k = l; k < n; ++k) {
            fill4(m_row + kLanes * k, row[k]);
            fill4(m_step + kLanes * k, row[k] / reflection.h);
            row[k] *= scale;
        }
        super = scale * reflection.g;
        return true;
    }

    // ---- the transformations multiplied out

    void accumulateRight() {
        const auto row = [this](int i) { return m_v + static_cast<ptrdiff_t>(i) * n; };
        for (int i = n - 1; i >= 0; --i) {
            const int l = i + 1;
            const float* const reflected = m_rows + static_cast<ptrdiff_t>(i) * n;
            if (l < n && e[l] != 0.0f) {
                for (int j = l; j < n; ++j)
                    row(j)[i] = reflected[j] / reflected[l] / e[l]; // two divisions: the product could underflow
                std::fill(m_sums + l, m_sums + n, 0.0f);
                for (int k = l; k < n; ++k)
                    addMultiple(m_sums, reflected[k], row(k), l);
                for (int k = l; k < n; ++k)
                    addMultiple(row(k), row(k)[i], m_sums, l);
            }
            for (int j = l; j < n; ++j)
                row(i)[j] = row(j)[i] = 0.0f;
            row(i)[i] = 1.0f;
        }
    }

    // to[j] += factor * values[j] for the columns from `first` on.
    void addMultiple(float* to, float factor, const float* values, int first) const {
        for (int j = first; j < n; ++j)
            to[j] += factor * values[j];
    }

    // Column i of N tiles gives its multiples to the columns right of it and is multiplied itself.
    template <int N> KEL_INLINE void spread(float* tiles, int i, Floats multiplier) const {
        const ptrdiff_t apart = U.floats();
        const float* const factor = m_factor + kLanes * (i + 1);
        float *const X = tiles + kLanes * i, *const A = X + kLanes;
        const int count = n - i - 1;
        Floats x[N];
        for (int t = 0; t < N; ++t)
            x[t] = loadAligned(X + apart * t);
        for (int j = 0; j < kLanes * count; j += kLanes) {
            const Floats f = loadAligned(factor + j);
            for (int t = 0; t < N; ++t) {
                float* const a = A + apart * t + j;
                storeAligned(a, loadAligned(a) + f * x[t]);
            }
        }
        for (int t = 0; t < N; ++t)
            storeAligned(X + apart * t, x[t] * multiplier);
    }

    // Step i of the left-hand transformations on the rows from i on, and with it the dot products that step i - 1 needs.
    template <int G> void spreadAndSum(int i, float multiplier) {
        const Floats multipliers = all(multiplier);
        const ptrdiff_t apart = U.floats();
        Dots<G> sums(i - 1, n);
        const int head = i / kLanes;
        spread<1>(U[head], i, multipliers);
        U.at(i, i) += 1.0f;
        sums.add(U[head], i % kLanes, std::min(kLanes, m - kLanes * head));
        U.fromRowByFours(kLanes * (head + 1), [&, apart](float* tiles, int from, int to, auto number) KEL_INLINE {
            spread<number>(tiles, i, multipliers);
            for (int t = 0; t < number; ++t)
                sums.add(tiles + apart * t, from, to);
        });
        sums.store(m_sums + n);
    }

    void accumulateLeft() {
        const int last = std::min(m, n) - 1;
        dots(last, last, n, last + 1);
        for (int i = last; i >= 0; --i) {
            for (int j = i + 1; j < n; ++j)
                U.at(i, j) = 0.0f;
            if (w[i] == 0.0f) {
                U.fromRow(i, [&](float* tile, int, int) KEL_INLINE { fill4(tile + kLanes * i, 0.0f); });
                U.at(i, i) += 1.0f;
                if (i > 0)
                    dots(i - 1, i - 1, n, i);
                continue;
            }
            const float reciprocal = 1.0f / w[i], diagonal = U.at(i, i);
            for (int j = i + 1; j < n; ++j)
                fill4(m_factor + kLanes * j, m_sums[j] / diagonal * reciprocal);
            if (i > 0) {
                withGroups(n - i, [&](auto groups) { spreadAndSum<groups>(i, reciprocal); });
                dots(i - 1, i - 1, n - kLanes * kMostGroups, i);
            } else {
                const Floats multipliers = all(reciprocal);
                U.fromRowByFours(0, [&](float* tiles, int, int, auto number)
                                        KEL_INLINE { spread<number>(tiles, 0, multipliers); });
                U.at(0, 0) += 1.0f;
            }
        }
    }

    // ---- to diagonal form

    // Iterates on the block that ends at k until e[k] is negligible.
    bool converge(int k) {
        for (int iteration = 1;; ++iteration) {
            const int l = split(k);
            if (l == k) {
                if (w[k] < 0.0f) {
                    w[k] = -w[k];
                    V.fromRow(0,
                              [&](float* tile, int, int) { storeAligned(tile + kLanes * k, -loadAligned(tile + kLanes * k)); });
                }
                return true;
            }
            if (iteration == kIterations)
                return false;
            sweep(l, k);
        }
    }

    // The start of the unreduced block that ends at k. It stops at 0 whatever the numbers are, NaN included.
    int split(int k) {
        for (int l = k; l > 0; --l) {
            if (negligible(e[l]))
                return l;
            if (negligible(w[l - 1])) {
                cancel(l, k);
                return l;
            }
        }
        return 0;
    }

    // w[l - 1] is zero: rotates e[l .. k] away.
    void cancel(int l, int k) {
        float c = 0.0f, s = 1.0f;
        for (int i = l; i <= k; ++i) {
            const float f = s * e[i];
            e[i] = c * e[i];
            if (negligible(f))
                return;
            const float g = w[i], h = kel::pythag(f, g), reciprocal = 1.0f / h;
            w[i] = h;
            c = g * reciprocal;
            s = -f * reciprocal;
            rotateU(l - 1, i, c, s);
        }
    }

    // One implicit QR step on the block from l to k, shifted by an eigenvalue of its last 2x2 minor.
    void sweep(int l, int k) {
        float x = w[l], y = w[k - 1], g = e[k - 1], h = e[k];
        const float z = w[k];
        float f = ((y - z) * (y + z) + (g - h) * (g + h)) / (2.0f * h * y);
        g = kel::pythag(f, 1.0f);
        f = ((x - z) * (x + z) + h * (y / (f + kel::sign(f) * g) - h)) / x;
        float c = 1.0f, s = 1.0f;
        for (int j = l; j < k; ++j) {
            const int i = j + 1;
            g = e[i];
            y = w[i];
            h = s * g;
            g = c * g;
            float length = kel::pythag(f, h);
            e[j] = length;
            c = f / length;
            s = h / length;
            f = x * c + g * s;
            g = g * c - x * s;
            h = y * s;
            y = y * c;
            rotateAll(V, {j, i, c, s});
            length = kel::pythag(f, h);
            w[j] = length;
            if (length != 0.0f) { // else c and s stay
                const float reciprocal = 1.0f / length;
                c = f * reciprocal;
                s = h * reciprocal;
            }
            f = c * g + s * y;
            x = c * y - s * g;
            rotateU(j, i, c, s);
        }
        e[l] = 0.0f;
        e[k] = f;
        w[k] = x;
    }

    static void rotateAll(Tiles& M, const Rotation& rotation) { M.rotate(0, M.count(), &rotation, &rotation + 1); }

    // A small U turns at once, beside the long chains of divisions and roots above; a large one in the end, part by part.
    void rotateU(int p, int q, float c, float s) {
        if (!m_withU)
            return;
        if (U.count() <= kFewTiles)
            rotateAll(U, {p, q, c, s});
        else
            m_rotations.add({p, q, c, s});
    }

    void finishU() {
        for (int first = 0; first < U.count(); first += kFewTiles) {
            const int last = std::min(first + kFewTiles, U.count());
            U.rotate(first, last, m_rotations.begin(), m_rotations.end());
            U.unpack(first, last);
        }
    }
};

} // namespace

namespace kel {

bool decomposeSV(const float* a, int m, int n, float* u, bool withU, float* w, float* v) {
    return n == 0 || Svd(m, n, u, withU, w, v).run(a);
}

} // namespace kel
