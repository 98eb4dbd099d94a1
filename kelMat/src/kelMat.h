/**
 * @file kelMat.h
 * The geometry half of kel: a dense single-precision matrix, its numerics, and estimators of homographies and camera
 * projections from point pairs.
 *
 * Compiles as C++11 and needs no other header of kel. Throughout
 *  - sizes are given as (rows, columns), angles in degrees, everything is computed in single precision unless stated;
 *  - functions that fill a kelMat& output create it anew, so an empty matrix may be passed;
 *  - a broken precondition writes its condition text, file, line and signature to standard error and aborts, in every
 *    build type; numerical failure is a false result or a zero determinant;
 *  - distinct objects may be used from different threads; functions that draw from rand() share its state.
 */
#ifndef KEL_MAT_H
#define KEL_MAT_H

#include <vector>

#define KEL_VERSION_MAJOR 1 /**< Changes where programs have to be built anew. */
#define KEL_VERSION_MINOR 0 /**< Grows with what is added. */
#define KEL_VERSION_PATCH 0 /**< Grows with what is mended. */
#define KEL_VERSION "1.0.0" /**< The three as text. */

#if defined(__GNUC__)
#define KEL_API __attribute__((visibility("default")))
#else
#define KEL_API
#endif

#if !defined(KEL_NO_INERT_WARNINGS) && defined(__has_attribute)
#if __has_attribute(warning)
#define KEL_INERT __attribute__((warning("does nothing")))
#endif
#endif
#ifndef KEL_INERT
/** Marks functions that do nothing: a call of one warns, unless KEL_NO_INERT_WARNINGS is defined before this header. */
#define KEL_INERT
#endif

/**
 * A dense row-major matrix of floats that owns its elements: element (r, c) is m_Data[r * m_Width + c], or M[r][c].
 *
 * A matrix is either empty (0 x 0, no storage, m_IsCreated false) or created. Copies are deep. Do not assign a matrix to
 * itself: its elements would be indeterminate. An output must be another matrix than *this and the other arguments; only
 * decompositions, eigenproblems, angles and inverses take their inputs before they write.
 * Allocation failure is not detected. A matrix has no lock; different matrices may be used from different threads.
 */
class kelMat {
public:
    int m_Width;      ///< Columns.
    int m_Height;     ///< Rows.
    bool m_IsCreated; ///< Whether there is storage.
    float* m_Data;    ///< m_Height * m_Width floats from malloc, or null.

    /// A matrix of height rows and width columns, zero-filled where `zero` says so, else indeterminate; empty for a size
    /// below 1.
    KEL_API kelMat(int height = 0, int width = 0, bool zero = true);
    /// A copy of its own.
    KEL_API kelMat(const kelMat& M);
    /// Frees the storage.
    KEL_API ~kelMat();

    /// Frees the storage, then allocates anew, also for the same size; returns m_Data, null for a size below 1. Pointers into
    /// the old storage end. Elements are zero where `zero` says so, else indeterminate.
    KEL_API float* create(int height, int width, bool zero);
    /// Frees the storage and leaves the matrix empty; may be repeated.
    KEL_API void release();
    /// Changes the size and keeps the top-left block common to both sizes; the rest is zero where `zero` says so, else
    /// indeterminate.
    KEL_API void resize(int height, int width, bool zero);
    /// Creates *this anew with the size and elements of M, which must be another matrix.
    KEL_API kelMat& operator=(const kelMat& M);

    /// Row `row`, writable also on a const matrix; not checked.
    KEL_API float* operator[](int row) const;
    /// M[y][x] = value. Stops on "0<=x && x<this->m_Width && 0<=y && y<this->m_Height".
    KEL_API void setData(int y, int x, float value);
    /// Takes m_Height * m_Width floats, row by row.
    KEL_API void setData(float* src);
    /// Takes m_Height rows of m_Width floats.
    KEL_API void setData(float** src);
    /// Takes the top-left block common to both matrices; the other elements stay.
    KEL_API void setData(kelMat& M2);
    /// Every element 0.
    KEL_API void setDataZero();
    /// `value` on the diagonal, 0 elsewhere; rectangular matrices too.
    KEL_API void setDataIdentity(float value);
    /// Multiplies every element by the reciprocal of the last one (bottom right), so that it becomes 1; a zero there gives
    /// infinities or NaN.
    KEL_API void setDataUnitize();
    /// Writes the matrix to standard output: a line `<mat name="...">` (`<mat>` for a null name), one line a row in "%8.3f "
    /// each, `</mat>`.
    KEL_API void print(const char* name);

    /// @name Arithmetic
    /// By value, operands untouched. Between two matrices (the dot product excepted) an operand that is empty gives an empty
    /// result; after that the sizes must fit.
    /// @{
    /// v added to every element.
    KEL_API kelMat operator+(float v) const;
    /// v taken from every element.
    KEL_API kelMat operator-(float v) const;
    /// Every element times v.
    KEL_API kelMat operator*(float v) const;
    /// Multiplies by 1 / v, computed once: the last bit may differ from a true division. v = 0 gives infinities or NaN.
    KEL_API kelMat operator/(float v) const;
    /// Stops on "this->m_Width == M.m_Width && this->m_Height == M.m_Height".
    KEL_API kelMat operator+(const kelMat& M) const;
    /// Stops on "this->m_Width == M.m_Width && this->m_Height == M.m_Height".
    KEL_API kelMat operator-(const kelMat& M) const;
    /// Matrix product, m_Height x M.m_Width: element (i, j) is the sum of this[i][k] * M[k][j] from 0 up, k increasing. Stops
    /// on "this->m_Width == M.m_Height".
    KEL_API kelMat operator*(const kelMat& M) const;
    /// [this | M] side by side, m_Height x (m_Width + M.m_Width). Stops on "this->m_Height == M.m_Height".
    KEL_API kelMat operator|(const kelMat& M) const;
    /// Dot product of the elements as flat vectors, (A , B), summed in storage order; mind the parentheses, and that a comma
    /// between two matrices is this operator anywhere but in an argument list. 0 for two empty matrices. Stops on
    /// "this->m_Width == M.m_Width && this->m_Height == M.m_Height", also where just one is empty.
    KEL_API float operator,(const kelMat& M) const;
    /// @}

    /// T[r][c] = this[c][r], T being m_Width x m_Height; it must be another matrix. Always true.
    KEL_API bool getTransposedMatrix(kelMat& T) const;
    /// The same by value.
    KEL_API kelMat getTransposedMatrix() const;
    /// Frobenius norm: root of the sum of squares in storage order; 0 for an empty matrix.
    KEL_API float getNorm() const;
    /// The LENGTH of the diagonal, sqrt of its sum of squares, not its sum. Stops on "this->m_Height == this->m_Width".
    KEL_API float getTrace() const;

    /// @name Points through the matrix, with homogeneous division
    /// With p the point and a 1 behind it: each output is a row times p, summed from the left, times the reciprocal of the last
    /// row times p. A zero there gives infinities or NaN. Integer forms go through float and round f to trunc(f + 0.5):
    /// halves up, but negative values toward zero (-1.7 gives -1); what int cannot hold becomes INT_MIN.
    /// @{
    /// 3x3. Stops on "this->m_Width == 3 && this->m_Height == 3".
    KEL_API void cvtPoint(float x, float y, float* u, float* v);
    /// 3x4, space to image. Stops on "this->m_Width == 4 && this->m_Height == 3".
    KEL_API void cvtPoint(float x, float y, float z, float* u, float* v);
    /// 4x4. Stops on "this->m_Width == 4 && this->m_Height == 4".
    KEL_API void cvtPoint(float x, float y, float z, float* X, float* Y, float* Z);
    /// The 3x3 form for integers.
    KEL_API void cvtPoint(int x, int y, int* u, int* v);
    /// The 3x4 form for integers.
    KEL_API void cvtPoint(int x, int y, int z, int* u, int* v);
    /// The 4x4 form for integers.
    KEL_API void cvtPoint(int x, int y, int z, int* X, int* Y, int* Z);
    /// @}

    /// @name Builders
    /// Each creates *this anew. Angles in degrees, with pi as 3.1415927f; Rx, Ry, Rz are right-handed active rotations.
    /// @{
    /// Rx(a) = [1 0 0; 0 c -s; 0 s c].
    KEL_API void setDataRotationMatrix_X_3x3(float a);
    /// Ry(a) = [c 0 s; 0 1 0; -s 0 c].
    KEL_API void setDataRotationMatrix_Y_3x3(float a);
    /// Rz(a) = [c -s 0; s c 0; 0 0 1].
    KEL_API void setDataRotationMatrix_Z_3x3(float a);
    /// Rz(z) Ry(y) Rx(x): about X first.
    KEL_API void setDataRotationMatrix_XYZ_3x3(float x, float y, float z);
    /// Rx(x) Ry(y) Rz(z): about Z first.
    KEL_API void setDataRotationMatrix_ZYX_3x3(float x, float y, float z);
    /// Rz(q) Ry(t) Rz(p): the tilt comes first among the arguments.
    KEL_API void setDataRotationMatrix_ZYZ_3x3(float t, float p, float q);
    /// Rz(p) Ry(t) Rz(q - p): a roll q, then a tilt t about the horizontal axis at azimuth p.
    KEL_API void setDataRotationMatrix_ZZYZ_3x3(float t, float p, float q);
    /// [fx skew cx; 0 fy cy; 0 0 1].
    KEL_API void setDataIntrinsicMatrix_3x3(float fx, float fy, float cx, float cy, float skew);
    /// The column (x, y, z).
    KEL_API void setDataTranslationMatrix_3x1(float x, float y, float z);
    /// @}

    /// @name Angle extraction
    /// In degrees, from a 3x3 rotation; always true. What is not quite a rotation is borne: sines and cosines are limited to
    /// [-1, 1]. All but the last stop on "this->m_Width == 3 && this->m_Height == 3".
    /// @{
    /// Inverse of setDataRotationMatrix_XYZ_3x3(); y in [-90, 90]. At y = +-90 degrees z is 0 and x takes both angles.
    KEL_API bool getAngleFromRotationMatrix_XYZ_3x3(float& x, float& y, float& z);
    /// Inverse of setDataRotationMatrix_ZYX_3x3(); y in [-90, 90]. At y = +-90 degrees z is 0 and x takes both angles.
    KEL_API bool getAngleFromRotationMatrix_ZYX_3x3(float& x, float& y, float& z);
    /// Inverse of setDataRotationMatrix_ZZYZ_3x3(), in spite of its name; t in [0, 180], p and q in [-180, 180]. Without tilt
    /// t and p are 0.
    KEL_API bool getAngleFromRotationMatrix_ZZYX_3x3(float& t, float& p, float& q);
    /// Inert: returns true, whatever the size, and leaves the outputs alone.
    KEL_API KEL_INERT bool getAngleFromRotationMatrix_ZYZ_3x3(float& t, float& p, float& q);
    /// @}

    /// @name Decompositions
    /// @{
    /// Camera decomposition P ~ A [R | T] of a 3x4 projection, by Gram-Schmidt on its rows from the last: A 3x3 upper
    /// triangular with A[2][2] = 1 and non-negative diagonal, R 3x3 with orthonormal rows (its determinant may be -1), T 3x1
    /// with T[2] >= 0. P and -P give the same, unless P[2][3] is 0: then the sign of P goes to R and T. Always true; degenerate input gives infinities or NaN. Stops on
    /// "this->m_Width == 4 && this->m_Height == 3".
    KEL_API bool getDecomposedMatrix_ART_3x4(kelMat& A, kelMat& R, kelMat& T) const;
    /// Decomposition of a plane homography l K [r1 r2 t], K = diag(f, f, 1): A is diag(f, f, 0), with a zero where K has its
    /// 1; R 3x3 holds r1, r2 and their cross product, T 3x1 is t. r1, r2 and t come out divided by l, so scale the homography
    /// to l = 1. Always true; an impossible focal length gives NaN. Stops on "this->m_Width == 3 && this->m_Height == 3".
    KEL_API bool getDecomposedMatrix_ART_3x3(kelMat& A, kelMat& R, kelMat& T) const;
    /// L unit lower, U upper triangular, their product the row-permuted matrix; the permutation is not given. The result of
    /// nr_ludcmp(); both are filled also where it is false. Stops on "this->m_Width == this->m_Height".
    KEL_API bool getDecomposedMatrix_LU(kelMat& L, kelMat& U) const;
    /// Inert: returns true and leaves both arguments alone.
    KEL_API KEL_INERT bool getDecomposedrixMat_QR(kelMat& Q, kelMat& R) const;
    /// Singular value decomposition U W V^T, nr_svdcmp() of this matrix.
    KEL_API bool getDecomposedMatrix_SV(kelMat& U, kelMat& W, kelMat& V) const;
    /// Eigenvalues (n x 1, not sorted) and eigenvectors (columns) of a symmetric matrix, by nr_jacobi() on a copy. Always true.
    KEL_API bool getEigenValue(kelMat& d, kelMat& v);
    /// Solves (this) x = lambda B x, this matrix symmetric and B symmetric positive definite, through the Cholesky factor of B
    /// and nr_jacobi(): eigenvalues (n x 1, not sorted), B-orthonormal eigenvectors (columns). Always true: where B is not positive
    /// definite d and X come out empty, NaN or, mostly, finite and WRONG, which nothing tells. Stops as getInversedMatrix() does
    /// where B is not square or its order is below 2, and as the product of matrices where this matrix is of another
    /// size, unless d and X come out empty.
    KEL_API bool getGeneralizedEigenValue(kelMat& B, kelMat& d, kelMat& X);
    /// @}

    /// @name Determinant and inverse
    /// Closed forms for 2x2 and 3x3, LU beyond. Stop on "this->m_Width == this->m_Height", then "2 <= this->m_Width". Singular
    /// means a determinant of exactly 0, or beyond 3x3 a row of zeros; a nearly singular matrix gives very large elements.
    /// @{
    /// The determinant, 0 for a singular matrix.
    KEL_API float getDeterminant() const;
    /// False for a singular matrix, R then as it was.
    KEL_API bool getInversedMatrix(kelMat& R) const;
    /// Empty for a singular matrix.
    KEL_API kelMat getInversedMatrix() const;
    /// Left pseudo-inverse (A^T A)^-1 A^T of a matrix of full column rank, m_Width x m_Height. False, R then as it was, where
    /// A^T A is singular. Stops on "2 <= this->m_Width".
    KEL_API bool getInversedMatrix_Pseudo(kelMat& R) const;
    /// Empty where A^T A is singular.
    KEL_API kelMat getInversedMatrix_Pseudo() const;
    /// @}
};

/**
 * LU decomposition of a row permutation, in place, by Crout's method with implicit pivoting (Press et al., Numerical Recipes
 * in C, 2nd ed., section 2.3). The order n is a.m_Width.
 *
 * @param a    n x n, not checked; becomes L (below the diagonal, its own diagonal being 1) and U
 * @param indx n ints: the row swapped into each place
 * @param d    +1 or -1, the parity of the swaps
 * @return false for a row of zeros (`a` and indx as they were, d 1). A pivot of 0 becomes 1.0e-40, a subnormal number, and
 *         counts as success, with infinities or NaN below it; so do not switch subnormal numbers off.
 */
KEL_API bool nr_ludcmp(kelMat& a, int* indx, float* d);
/**
 * Solves A x = b with the output of nr_ludcmp() by forward and back substitution (section 2.3 there); b (n floats) becomes x.
 * Always true.
 */
KEL_API bool nr_lubksb(kelMat& a, int* indx, float* b);
/**
 * Replaces a symmetric positive definite matrix by its lower Cholesky factor (section 2.9 there), the strict upper triangle 0.
 * Reads the lower triangle only. False for a pivot that is zero or negative, `a` then partly overwritten; NaN passes.
 */
KEL_API bool nr_choldc(kelMat& a);
/** 1 for x >= 0, else -1 (NaN too). */
KEL_API float nr_sign(float x);
/** sqrt(a^2 + b^2) without harmful overflow or underflow; its root is taken in double. */
KEL_API float nr_pythag(float a, float b);
/**
 * Singular value decomposition a = u w v^T by Householder bidiagonalisation and implicit-shift QR (Golub and Reinsch,
 * Singular value decomposition and least squares solutions, 1970). For a of m x n: u m x n, w n x n diagonal,
 * non-negative and not sorted, v n x n (not its transpose). m may be below n. False where a value needed 30 iterations. NaN in
 * the input does that from two columns on; with one column, and with fewer rows than columns, it may come out true.
 *
 * Works in single precision throughout: squares must stay in its range, and a rank far below n may leave NaN in v, as what
 * remains of the matrix sinks below that range step by step.
 */
KEL_API bool nr_svdcmp(const kelMat& a, kelMat& u, kelMat& w, kelMat& v);
/**
 * Eigenvalues d (n x 1, not sorted) and eigenvectors (columns of v) of a symmetric matrix by cyclic Jacobi rotations (Press
 * et al., Numerical Recipes in C, 2nd ed., section 11.1). The order n is a.m_Width. Reads the upper triangle of a, and destroys
 * it but for the diagonal. *nrot receives the number of rotations. False after 50 sweeps, d and v then the last estimates.
 */
KEL_API bool nr_jacobi(kelMat& a, kelMat& d, kelMat& v, int* nrot);

/**
 * @name Determinants and inverses by size
 * @{
 */
/**
 * What the members of kelMat choose from; the size is the caller's business, though an inverse in closed form takes the
 * determinant with getDeterminant() and stops as that does. Inverses are false for a singular matrix, R then as it was.
 */
KEL_API float kel_getDeterminant_2x2(const kelMat& A);
KEL_API float kel_getDeterminant_3x3(const kelMat& A);
KEL_API float kel_getDeterminant_NxN(const kelMat& A);
KEL_API bool kel_getInversedMatrix_2x2(const kelMat& A, kelMat& R);
KEL_API bool kel_getInversedMatrix_3x3(const kelMat& A, kelMat& R);
KEL_API bool kel_getInversedMatrix_NxN(const kelMat& A, kelMat& R);
KEL_API bool kel_getInversedMatrix_NxM(const kelMat& A, kelMat& R);
/** @} */

/** The most pairs that a correspondence set holds. */
enum { KEL_CORRESP_MAX = 10000 };

/** A growing set of pairs of 2-D points, the input of the homography fits. */
class kelMatCorrespH {
public:
    int m_Num;                 ///< Pairs.
    std::vector<float> m_SrcX; ///< First points, x.
    std::vector<float> m_SrcY; ///< First points, y.
    std::vector<float> m_DstX; ///< Second points, x.
    std::vector<float> m_DstY; ///< Second points, y.

    /// An empty set.
    KEL_API kelMatCorrespH();
    KEL_API ~kelMatCorrespH(); ///< Frees the pairs.
    /// Appends a pair; beyond KEL_CORRESP_MAX pairs it is dropped silently.
    KEL_API void add(float x1, float y1, float x2, float y2);
    /// Appends to `out` (empty before) the pairs with both point clouds centred and scaled to a mean distance of sqrt 2. T1
    /// (3x3) takes a first point to its normalised place, T2 (3x3) takes a normalised second point back, so that a
    /// homography Hn between the normalised clouds is T2 Hn T1 between the given ones.
    KEL_API void normalize(kelMatCorrespH& out, kelMat& T1, kelMat& T2);
};

/** A growing set of pairs of a 3-D object point and its 2-D image point, the input of the projection fits. */
class kelMatCorrespP {
public:
    int m_Num;                 ///< Pairs.
    std::vector<float> m_ObjX; ///< Object points, X.
    std::vector<float> m_ObjY; ///< Object points, Y.
    std::vector<float> m_ObjZ; ///< Object points, Z.
    std::vector<float> m_ImgX; ///< Image points, x.
    std::vector<float> m_ImgY; ///< Image points, y.

    /// An empty set.
    KEL_API kelMatCorrespP();
    KEL_API ~kelMatCorrespP(); ///< Frees the pairs.
    /// Appends a pair; beyond KEL_CORRESP_MAX pairs it is dropped silently.
    KEL_API void add(float X, float Y, float Z, float x, float y);
    /// As kelMatCorrespH::normalize(), with a 4x4 T1; the object points, too, are scaled to a mean distance of sqrt 2.
    KEL_API void normalize(kelMatCorrespP& out, kelMat& T1, kelMat& T2);
};

/**
 * The homography [h0 h1 h2; h3 h4 h5; h6 h7 1] that takes (0,0), (0,1), (1,1), (1,0) to the four points, in closed form;
 * writes eight floats. Three points on a line give infinities or NaN.
 */
KEL_API void UnitSquareProjection(float x0, float y0, float x1, float y1, float x2, float y2, float x3, float y3, float* h);

/** The 3x3 homography from first to second points of a set. The estimator is the matrix; zero after construction. */
class kelMatEstimatorH : public kelMat {
public:
    /// A 3x3 matrix of zeros.
    KEL_API kelMatEstimatorH();
    KEL_API ~kelMatEstimatorH(); ///< Frees the matrix.
    /// Exactly from four pairs, each given as x1, y1, x2, y2. Not rescaled. Always true: three points on a line give
    /// infinities or NaN.
    KEL_API bool estimate_by4P(float x1_0, float y1_0, float x2_0, float y2_0, float x1_1, float y1_1, float x2_1, float y2_1,
                               float x1_2, float y1_2, float x2_2, float y2_2, float x1_3, float y1_3, float x2_3, float y2_3);
    /// Algebraic least squares (direct linear transformation): the right singular vector of the smallest singular value of two
    /// rows a pair, coordinates as they are, scaled so that H[2][2] is 1. False, and nothing written, below five pairs; true
    /// otherwise, also where degenerate pairs give infinities or NaN.
    KEL_API bool estimate_byLSM(kelMatCorrespH& corresp);
    /// estimate_byLSM() on normalised coordinates (Hartley, In defense of the eight-point algorithm, 1997), the one to use.
    /// False, and nothing written, below five pairs.
    KEL_API bool estimate_byLSM_fine(kelMatCorrespH& corresp);
    /// Taubin's method (Taubin, Estimation of planar curves, surfaces, and nonplanar space curves, 1991), coordinates as they
    /// are: least squares weighted with the covariance that equal noise in all four coordinates gives. For noisy pairs:
    /// with exact ones the factorised matrix is singular and rounding decides. Where degenerate pairs leave no solution the
    /// estimator is filled with NaN. False, and nothing written, below five pairs; true otherwise.
    KEL_API bool estimate_byTaubin(kelMatCorrespH& corresp);
    /// Robust fit by RANSAC (Fischler and Bolles, Random sample consensus, 1981): candidates through four random pairs, judged
    /// by judgeHomography() and by the number of inliers, then least squares on the best one's inliers, repeated while they grow.
    ///
    /// At most 1500 candidates, fewer as the inliers allow for 99 % confidence, and none after the first with 50 inliers.
    /// Draws from rand(): the same seed gives the same bits. The bounds of judgeHomography() are absolute: choose the units.
    ///
    /// @param corresp   the pairs; four or more for a search, five inliers for a result
    /// @param threshold inlier distance, in the units of the second points
    /// @param inliers   receives the final fit's number of inliers on success; may be null
    /// @return false, with `*inliers` untouched and the matrix holding no result, below four pairs (the matrix untouched), where no
    ///         candidate of the search has five inliers, or where a refit is not plausible. The fit in the end may have fewer inliers
    ///         than that candidate, also fewer than five. TRUE SAYS ONLY THAT SOMETHING WAS FITTED, as it nearly always is, also to
    ///         pairs that have nothing to do with each other: test `*inliers` against the number of pairs before using the result.
    KEL_API bool estimate_byRANSAC_fine(kelMatCorrespH& corresp, float threshold, int* inliers);
};

/** Four indices from 0 to n - 1 drawn by rand(); c may equal a, any other two differ. n must be at least 4. */
KEL_API void getRandomIndex(int& a, int& b, int& c, int& d, int n);
/**
 * Whether a homography (3x3, not checked) is plausible: no mirror (H00 H11 - H10 H01 >= 0), lengths of its first two columns' upper parts
 * between 0.1 and 4, length of (H20, H21) at most 0.002. Absolute bounds, for a homography scaled to H[2][2] = 1. NaN passes
 * every test.
 */
KEL_API bool judgeHomography(kelMat& H);
/**
 * Counts the pairs whose transfer error in the second picture is below threshold (a pair at the threshold is none, nor is one whose
 * error is NaN) and sets or clears their entries of `mask`, which must have m_Num of them or more. An empty set gives 0. Stops on
 * "this->m_Width == 3 && this->m_Height == 3".
 */
KEL_API int judgeInliers(kelMat& H, kelMatCorrespH& corresp, std::vector<bool>& mask, float threshold);

/** The 3x4 projection from object to image points of a set. The estimator is the matrix; zero after construction. */
class kelMatEstimatorP : public kelMat {
public:
    /// A 3x4 matrix of zeros.
    KEL_API kelMatEstimatorP();
    KEL_API ~kelMatEstimatorP(); ///< Frees the matrix.
    /// As kelMatEstimatorH::estimate_byLSM(), scaled so that P[2][3] is 1. False, and nothing written, below six pairs. The object
    /// points must not lie in one plane.
    KEL_API bool estimate_byLSM(kelMatCorrespP& corresp);
    /// estimate_byLSM() on normalised coordinates, the one to use. False, and nothing written, below six pairs.
    KEL_API bool estimate_byLSM_fine(kelMatCorrespP& corresp);
    /// Taubin's method with three rows a pair, coordinates as they are; see kelMatEstimatorH::estimate_byTaubin() for noise and
    /// degenerate pairs. Prints the blocks "M", "N", "eigenvalue" and "result" with their matrices to standard output. Among the
    /// eigenvalues the first counts as it is, later ones as magnitudes truncated to an integer; one that no int holds is never
    /// taken, though about every second set of points has such a one, and the best fit with it: prefer
    /// estimate_byLSM_fine(). False, and nothing written
    /// or printed, below six pairs.
    KEL_API bool estimate_byTaubin(kelMatCorrespP& corresp);
    /// Robust fit by RANSAC, as kelMatEstimatorH::estimate_byRANSAC_fine() with samples of six, at most 1500 candidates and none
    /// after the first with 400 inliers; no test of plausibility. False below six pairs (the matrix untouched) or where no candidate has
    /// six inliers; true says only that something was fitted, as there: count with judgeInliers() before using it.
    KEL_API bool estimate_byRANSAC_fine(kelMatCorrespP& corresp, float threshold);
};

/** Six different indices from 0 to n - 1 drawn by rand(). n must be at least 6; it comes first here. */
KEL_API void getRandomIndex(int n, int& a, int& b, int& c, int& d, int& e, int& f);
/** Always true. */
KEL_API bool judgeMatrixP(kelMat& P);
/** As the form for homographies, with the reprojection error. Stops on "this->m_Width == 4 && this->m_Height == 3". */
KEL_API int judgeInliers(kelMat& P, kelMatCorrespP& corresp, std::vector<bool>& mask, float threshold);

/**
 * Composes synthetic camera projections
 * matViewShift * matView * matViewScale * matCameraInverse * matObject * matObjectScale * matObjectShift.
 */
class kelMatGeneratorP {
public:
    kelMat matView;          ///< 3x4 [f 0 0 0; 0 f 0 0; 0 0 1 0]; zero until a focal length is set.
    kelMat matViewScale;     ///< 4x4 diag(s, s, s, 1).
    kelMat matViewShift;     ///< 3x3 [1 0 u; 0 1 v; 0 0 1].
    kelMat matCamera;        ///< 4x4 [R t; 0 0 0 1].
    kelMat matCameraInverse; ///< 4x4, its inverse.
    kelMat matObject;        ///< 4x4 [R t; 0 0 0 1].
    kelMat matObjectScale;   ///< 4x4 diag(1/s, 1/s, 1/s, 1): a larger scale shrinks the object.
    kelMat matObjectShift;   ///< 4x4 translation.

    /// Camera at the origin, object 3000 units before it, scales 1, shifts 0, no focal length.
    KEL_API kelMatGeneratorP();
    KEL_API ~kelMatGeneratorP(); ///< Frees the matrices.
    /// Sets the focal length, in matView.
    KEL_API void setMatView(float f);
    /// Focal length drawn uniformly between a and b, by rand().
    KEL_API void setMatViewRandom(float a, float b);
    /// Sets matViewScale.
    KEL_API void setMatViewScale(float s);
    /// Sets the principal point, in matViewShift.
    KEL_API void setMatViewShift(float u, float v);
    /// Rotation by setDataRotationMatrix_XYZ_3x3() angles in degrees, then translation.
    KEL_API void setMatCamera(float rx, float ry, float rz, float tx, float ty, float tz);
    /// setMatCamera() with each value drawn uniformly between its pair of bounds, in argument order, by rand().
    KEL_API void setMatCameraRandom(float rx_a, float rx_b, float ry_a, float ry_b, float rz_a, float rz_b, float tx_a,
                                    float tx_b, float ty_a, float ty_b, float tz_a, float tz_b);
    /// As setMatCamera(), for the object.
    KEL_API void setMatObject(float rx, float ry, float rz, float tx, float ty, float tz);
    /// As setMatCameraRandom(), for the object.
    KEL_API void setMatObjectRandom(float rx_a, float rx_b, float ry_a, float ry_b, float rz_a, float rz_b, float tx_a,
                                    float tx_b, float ty_a, float ty_b, float tz_a, float tz_b);
    /// Sets matObjectScale.
    KEL_API void setMatObjectScale(float s);
    /// Sets matObjectShift.
    KEL_API void setMatObjectShift(float x, float y, float z);
    /// The 3x4 product; zero until a focal length is set.
    KEL_API void getMat(kelMat& out);
};

#endif
