// The matrix class: storage, arithmetic, points, rotations, decompositions. The iterative kernels are in kelMatAlgorithm.cpp,
// determinants and inverses in files of their own.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>

#include "kelAssert.h"
#include "kelMat_Private.h"

namespace {

size_t elements(const kelMat& M) {
    return static_cast<size_t>(M.m_Height) * static_cast<size_t>(M.m_Width);
}

void markEmpty(kelMat& M) {
    M.m_Width = 0;
    M.m_Height = 0;
    M.m_Data = nullptr;
    M.m_IsCreated = false;
}

// Gives storage to an empty matrix, if the size is positive.
void allocate(kelMat& M, int height, int width) {
    if (width < 1 || height < 1)
        return;
    M.m_Height = height;
    M.m_Width = width;
    M.m_Data = static_cast<float*>(malloc(elements(M) * sizeof(float)));
    M.m_IsCreated = true;
}

void copyElements(kelMat& to, const kelMat& from) {
    std::copy_n(from.m_Data, elements(from), to.m_Data);
}

} // namespace

// ---- storage ---------------------------------------------------------------------------------------------------------------

kelMat::kelMat(int height, int width, bool zero) {
    markEmpty(*this);
    allocate(*this, height, width);
    if (zero)
        setDataZero();
}

kelMat::kelMat(const kelMat& M) {
    markEmpty(*this);
    allocate(*this, M.m_Height, M.m_Width);
    copyElements(*this, M);
}

kelMat::~kelMat() {
    free(m_Data);
}

float* kelMat::create(int height, int width, bool zero) {
    free(m_Data);
    markEmpty(*this);
    allocate(*this, height, width);
    if (zero)
        setDataZero();
    return m_Data;
}

void kelMat::release() {
    free(m_Data);
    markEmpty(*this);
}

void kelMat::resize(int height, int width, bool zero) {
    kelMat before(*this);
    create(height, width, zero);
    setData(before);
}

kelMat& kelMat::operator=(const kelMat& M) {
    create(M.m_Height, M.m_Width, false);
    copyElements(*this, M);
    return *this;
}

// ---- elements --------------------------------------------------------------------------------------------------------------

float* kelMat::operator[](int row) const {
    return m_Data + static_cast<ptrdiff_t>(row) * m_Width;
}

void kelMat::setData(int y, int x, float value) {
    KEL_ASSERT(0<=x && x<this->m_Width && 0<=y && y<this->m_Height);
    (*this)[y][x] = value;
}

void kelMat::setData(float* src) {
    std::copy_n(src, elements(*this), m_Data);
}

void kelMat::setData(float** src) {
    for (int r = 0; r < m_Height; ++r)
        std::copy_n(src[r], m_Width, (*this)[r]);
}

void kelMat::setData(kelMat& M2) {
    const int height = std::min(m_Height, M2.m_Height), width = std::min(m_Width, M2.m_Width);
    for (int r = 0; r < height; ++r)
        std::copy_n(M2[r], width, (*this)[r]);
}

void kelMat::setDataZero() {
    std::fill_n(m_Data, elements(*this), 0.0f);
}

void kelMat::setDataIdentity(float value) {
    setDataZero();
    for (int i = 0; i < std::min(m_Height, m_Width); ++i)
        (*this)[i][i] = value;
}

void kelMat::setDataUnitize() {
    if (!m_IsCreated)
        return;
    const size_t n = elements(*this);
    const float s = 1.0f / m_Data[n - 1];
    for (size_t i = 0; i < n; ++i)
        m_Data[i] *= s;
}

void kelMat::print(const char* name) {
    if (name)
        printf("<mat name=\"%s\">\n", name);
    else
        puts("<mat>");
    for (int r = 0; r < m_Height; ++r) {
        for (int c = 0; c < m_Width; ++c)
            printf("%8.3f ", static_cast<double>((*this)[r][c]));
        putchar('\n');
    }
    puts("</mat>");
}

// ---- arithmetic ------------------------------------------------------------------------------------------------------------

namespace {

// The matrix of f(a) for the elements a of A.
template <class F> kelMat elementwise(const kelMat& A, F f) {
    kelMat R(A.m_Height, A.m_Width, false);
    std::transform(A.m_Data, A.m_Data + elements(A), R.m_Data, f);
    return R;
}

// The matrix of f(a, b) for the elements of A and B, which have one size.
template <class F> kelMat elementwise(const kelMat& A, const kelMat& B, F f) {
    kelMat R(A.m_Height, A.m_Width, false);
    std::transform(A.m_Data, A.m_Data + elements(A), B.m_Data, R.m_Data, f);
    return R;
}

bool bothCreated(const kelMat& A, const kelMat& B) {
    return A.m_IsCreated && B.m_IsCreated;
}

} // namespace

kelMat kelMat::operator+(float v) const {
    return elementwise(*this, [v](float a) { return a + v; });
}

kelMat kelMat::operator-(float v) const {
    return elementwise(*this, [v](float a) { return a - v; });
}

kelMat kelMat::operator*(float v) const {
    return elementwise(*this, [v](float a) { return a * v; });
}

kelMat kelMat::operator/(float v) const {
    return *this * (1.0f / v); // callers rely on the reciprocal: a true division differs in the last bit
}

kelMat kelMat::operator+(const kelMat& M) const {
    if (!bothCreated(*this, M))
        return kelMat();
    KEL_ASSERT(this->m_Width == M.m_Width && this->m_Height == M.m_Height);
    return elementwise(*this, M, [](float a, float b) { return a + b; });
}

kelMat kelMat::operator-(const kelMat& M) const {
    if (!bothCreated(*this, M))
        return kelMat();
    KEL_ASSERT(this->m_Width == M.m_Width && this->m_Height == M.m_Height);
    return elementwise(*this, M, [](float a, float b) { return a - b; });
}

kelMat kelMat::operator*(const kelMat& M) const {
    kelMat R;
    if (!bothCreated(*this, M))
        return R;
    KEL_ASSERT(this->m_Width == M.m_Height);
    R.create(m_Height, M.m_Width, false);
    kel::multiply(R.m_Data, m_Data, M.m_Data, m_Height, m_Width, M.m_Width);
    return R;
}

kelMat kelMat::operator|(const kelMat& M) const {
    kelMat R;
    if (!bothCreated(*this, M))
        return R;
    KEL_ASSERT(this->m_Height == M.m_Height);
    R.create(m_Height, m_Width + M.m_Width, false);
    for (int r = 0; r < m_Height; ++r)
        std::copy_n(M[r], M.m_Width, std::copy_n((*this)[r], m_Width, R[r]));
    return R;
}

float kelMat::operator,(const kelMat&M) const {
    KEL_ASSERT(this->m_Width == M.m_Width && this->m_Height == M.m_Height);
    float sum = 0.0f;
    for (size_t i = 0, n = elements(M); i < n; ++i)
        sum += m_Data[i] * M.m_Data[i];
    return sum;
}

bool kelMat::getTransposedMatrix(kelMat& T) const {
    T.create(m_Width, m_Height, false);
    kel::transpose(T.m_Data, m_Data, m_Height, m_Width);
    return true;
}

kelMat kelMat::getTransposedMatrix() const {
    kelMat T;
    getTransposedMatrix(T);
    return T;
}

float kelMat::getNorm() const {
    float sum = 0.0f;
    for (size_t i = 0, n = elements(*this); i < n; ++i)
        sum += m_Data[i] * m_Data[i];
    return sqrtf(sum);
}

float kelMat::getTrace() const {
    KEL_ASSERT(this->m_Height == this->m_Width);
    float sum = 0.0f; // of squares: callers rely on the length of the diagonal, not on its sum
    for (size_t i = 0, n = elements(*this); i < n; i += m_Width + 1)
        sum += m_Data[i] * m_Data[i];
    return sqrtf(sum);
}

// ---- points ----------------------------------------------------------------------------------------------------------------

namespace {

float rowTimes(const float* row, float x, float y) {
    return (x * row[0] + y * row[1]) + row[2];
}

float rowTimes(const float* row, float x, float y, float z) {
    return ((x * row[0] + y * row[1]) + z * row[2]) + row[3];
}

// Halves up, but negative values toward zero (-1.7 gives -1); callers rely on it. Beyond the range of int: INT_MIN.
int rounded(float f) {
    return kel::truncated(static_cast<double>(f) + 0.5);
}

} // namespace

void kelMat::cvtPoint(float x, float y, float* u, float* v) {
    KEL_ASSERT(this->m_Width == 3 && this->m_Height == 3);
    const float s = 1.0f / rowTimes(m_Data + 6, x, y);
    *u = rowTimes(m_Data, x, y) * s;
    *v = rowTimes(m_Data + 3, x, y) * s;
}

void kelMat::cvtPoint(float x, float y, float z, float* u, float* v) {
    KEL_ASSERT(this->m_Width == 4 && this->m_Height == 3);
    const float s = 1.0f / rowTimes(m_Data + 8, x, y, z);
    *u = rowTimes(m_Data, x, y, z) * s;
    *v = rowTimes(m_Data + 4, x, y, z) * s;
}

void kelMat::cvtPoint(float x, float y, float z, float* X, float* Y, float* Z) {
    KEL_ASSERT(this->m_Width == 4 && this->m_Height == 4);
    const float s = 1.0f / rowTimes(m_Data + 12, x, y, z);
    *X = rowTimes(m_Data, x, y, z) * s;
    *Y = rowTimes(m_Data + 4, x, y, z) * s;
    *Z = rowTimes(m_Data + 8, x, y, z) * s;
}

void kelMat::cvtPoint(int x, int y, int* u, int* v) {
    float fu, fv;
    cvtPoint(static_cast<float>(x), static_cast<float>(y), &fu, &fv);
    *u = rounded(fu);
    *v = rounded(fv);
}

void kelMat::cvtPoint(int x, int y, int z, int* u, int* v) {
    float fu, fv;
    cvtPoint(static_cast<float>(x), static_cast<float>(y), static_cast<float>(z), &fu, &fv);
    *u = rounded(fu);
    *v = rounded(fv);
}

void kelMat::cvtPoint(int x, int y, int z, int* X, int* Y, int* Z) {
    float fX, fY, fZ;
    cvtPoint(static_cast<float>(x), static_cast<float>(y), static_cast<float>(z), &fX, &fY, &fZ);
    *X = rounded(fX);
    *Y = rounded(fY);
    *Z = rounded(fZ);
}

// ---- builders --------------------------------------------------------------------------------------------------------------

namespace {

constexpr float kPi = 3.1415927f;
constexpr float kHalfPi = 1.5707964f;

struct SineCosine {
    float s, c;
    explicit SineCosine(float degrees) { sincosf(degrees * kPi / 180.0f, &s, &c); }
};

float degrees(float radians) {
    return radians * 180.0f / kPi;
}

void fill3x3(kelMat& M, float m00, float m01, float m02, float m10, float m11, float m12, float m20, float m21, float m22) {
    const float values[] = {m00, m01, m02, m10, m11, m12, m20, m21, m22};
    M.create(3, 3, false);
    std::copy_n(values, 9, M.m_Data);
}

} // namespace

void kelMat::setDataRotationMatrix_X_3x3(float a) {
    const SineCosine A(a);
    fill3x3(*this, 1.0f, 0.0f, 0.0f, //
            0.0f, A.c, -A.s,         //
            0.0f, A.s, A.c);
}

void kelMat::setDataRotationMatrix_Y_3x3(float a) {
    const SineCosine A(a);
    fill3x3(*this, A.c, 0.0f, A.s, //
            0.0f, 1.0f, 0.0f,      //
            -A.s, 0.0f, A.c);
}

void kelMat::setDataRotationMatrix_Z_3x3(float a) {
    const SineCosine A(a);
    fill3x3(*this, A.c, -A.s, 0.0f, //
            A.s, A.c, 0.0f,         //
            0.0f, 0.0f, 1.0f);
}

void kelMat::setDataRotationMatrix_XYZ_3x3(float x, float y, float z) {
    const SineCosine X(x), Y(y), Z(z);
    const float czsy = Z.c * Y.s, szsy = Z.s * Y.s;
    fill3x3(*this, Z.c * Y.c, X.s * czsy - Z.s * X.c, czsy * X.c + Z.s * X.s, //
            Z.s * Y.c, X.s * szsy + Z.c * X.c, szsy * X.c - Z.c * X.s,        //
            -Y.s, Y.c * X.s, Y.c * X.c);
}

void kelMat::setDataRotationMatrix_ZYX_3x3(float x, float y, float z) {
    const SineCosine X(x), Y(y), Z(z);
    const float sxsy = X.s * Y.s, cxsy = X.c * Y.s;
    fill3x3(*this, Y.c * Z.c, -Y.c * Z.s, Y.s,                          //
            X.c * Z.s + Z.c * sxsy, X.c * Z.c - sxsy * Z.s, -X.s * Y.c, //
            X.s * Z.s - Z.c * cxsy, X.s * Z.c + cxsy * Z.s, X.c * Y.c);
}

namespace {

// Rz(last) Ry(tilt) Rz(first).
void fillZYZ(kelMat& M, float st, float ct, float sFirst, float cFirst, float sLast, float cLast) {
    const float cc = cLast * ct, sc = sLast * ct;
    fill3x3(M, cc * cFirst - sLast * sFirst, -cc * sFirst - sLast * cFirst, cLast * st, //
            sc * cFirst + cLast * sFirst, cLast * cFirst - sc * sFirst, sLast * st,     //
            -st * cFirst, st * sFirst, ct);
}

} // namespace

void kelMat::setDataRotationMatrix_ZYZ_3x3(float t, float p, float q) {
    const SineCosine T(t), P(p), Q(q);
    fillZYZ(*this, T.s, T.c, P.s, P.c, Q.s, Q.c);
}

void kelMat::setDataRotationMatrix_ZZYZ_3x3(float t, float p, float q) {
    const SineCosine T(t), P(p), Q(q);
    const float sine = Q.s * P.c - Q.c * P.s, cosine = Q.c * P.c + Q.s * P.s; // of q - p
    fillZYZ(*this, T.s, T.c, sine, cosine, P.s, P.c);
}

void kelMat::setDataIntrinsicMatrix_3x3(float fx, float fy, float cx, float cy, float skew) {
    fill3x3(*this, fx, skew, cx, //
            0.0f, fy, cy,        //
            0.0f, 0.0f, 1.0f);
}

void kelMat::setDataTranslationMatrix_3x1(float x, float y, float z) {
    create(3, 1, false);
    m_Data[0] = x;
    m_Data[1] = y;
    m_Data[2] = z;
}

// ---- angles ----------------------------------------------------------------------------------------------------------------

namespace {

constexpr double kGimbalCosine = 1e-6f; // below it the second angle counts as +-90 degrees

float clamped(float v) {
    return v > 1.0f ? 1.0f : v < -1.0f ? -1.0f : v;
}

// In double and rounded once: the float function differs in the last bit every few angles.
float angleOf(float sine, float cosine) {
    return static_cast<float>(atan2(static_cast<double>(sine), static_cast<double>(cosine)));
}

// The same for a sine and cosine that carry a factor c.
float angleOf(float sine, float cosine, double c) {
    return angleOf(clamped(static_cast<float>(sine / c)), clamped(static_cast<float>(cosine / c)));
}

// Sine and cosine of an angle, or both times one factor.
struct Turn {
    float sine, cosine;
};

// Angles in degrees from the middle one, y, and from x and z with the cosine of y as their factor; where that is zero, x takes both
// from `locked`.
void extractAngles(Turn aboutY, Turn aboutX, Turn aboutZ, Turn locked, float& x, float& y, float& z) {
    const float radY = angleOf(clamped(aboutY.sine), std::min(aboutY.cosine, 1.0f));
    const double c = cos(static_cast<double>(radY));
    const bool isLocked = !(c > kGimbalCosine);
    const float radX =
        isLocked ? angleOf(clamped(locked.sine), clamped(locked.cosine)) : angleOf(aboutX.sine, aboutX.cosine, c);
    const float radZ = isLocked ? 0.0f : angleOf(aboutZ.sine, aboutZ.cosine, c);
    x = degrees(radX);
    y = degrees(radY);
    z = degrees(radZ);
}

// The angle of a sine and cosine that may lie a little outside [-1, 1], tested in this order.
float saturatedAngleOf(float sine, float cosine) {
    if (cosine > 1.0f)
        return 0.0f;
    if (cosine < -1.0f)
        return kPi;
    if (sine > 1.0f)
        return kHalfPi;
    if (sine < -1.0f)
        return -kHalfPi;
    const float angle = acosf(cosine);
    return sine < 0.0f ? -angle : angle;
}

} // namespace

bool kelMat::getAngleFromRotationMatrix_XYZ_3x3(float& x, float& y, float& z) {
    KEL_ASSERT(this->m_Width == 3 && this->m_Height == 3);
    const kelMat& R = *this;
    const Turn aboutY = {-R[2][0], sqrtf(R[2][2] * R[2][2] + R[2][1] * R[2][1])};
    extractAngles(aboutY, {R[2][1], R[2][2]}, {R[1][0], R[0][0]}, {-R[1][2], R[1][1]}, x, y, z);
    return true;
}

bool kelMat::getAngleFromRotationMatrix_ZYX_3x3(float& x, float& y, float& z) {
    KEL_ASSERT(this->m_Width == 3 && this->m_Height == 3);
    const kelMat& R = *this;
    const Turn aboutY = {R[0][2], sqrtf(R[0][0] * R[0][0] + R[0][1] * R[0][1])};
    extractAngles(aboutY, {-R[1][2], R[2][2]}, {-R[0][1], R[0][0]}, {R[2][1], R[1][1]}, x, y, z);
    return true;
}

// Inverts setDataRotationMatrix_ZZYZ_3x3, not a ZZYX order; callers rely on the name as it is.
bool kelMat::getAngleFromRotationMatrix_ZZYX_3x3(float& t, float& p, float& q) {
    KEL_ASSERT(this->m_Width == 3 && this->m_Height == 3);
    constexpr float kSineOfPi = -8.742278e-8f; // of the float pi
    constexpr double kNoTilt = 1e-6;
    const kelMat& R = *this;
    const bool upsideDown = R[2][2] < -1.0f;
    float azimuth = 0.0f, roll; // outputs last: they may be elements of the matrix
    const float tilt = R[2][2] > 1.0f ? 0.0f : upsideDown ? kPi : acosf(R[2][2]);
    if (static_cast<double>(fabsf(tilt)) < kNoTilt) {
        roll = saturatedAngleOf(R[1][0], R[0][0]);
        t = 0.0f;
    } else {
        const float sine = upsideDown ? kSineOfPi : sinf(tilt);
        const float horizontal = R[0][2] * R[0][2] + R[1][2] * R[1][2];
        const float cosineRoll = -(R[0][2] * R[2][0] + R[1][2] * R[2][1]) / horizontal;
        const float sineRoll = (R[2][1] * R[0][2] - R[2][0] * R[1][2]) / horizontal;
        azimuth = saturatedAngleOf(R[1][2] / sine, R[0][2] / sine);
        roll = saturatedAngleOf(sineRoll, cosineRoll);
        t = degrees(tilt);
    }
    p = degrees(azimuth);
    q = degrees(roll);
    return true;
}

bool kelMat::getAngleFromRotationMatrix_ZYZ_3x3(float&, float&, float&) {
    return true;
}

// ---- decompositions --------------------------------------------------------------------------------------------------------

namespace {

float dot3(const float* x, const float* y) {
    return (x[0] * y[0] + x[1] * y[1]) + x[2] * y[2];
}

} // namespace

bool kelMat::getDecomposedMatrix_ART_3x4(kelMat& A, kelMat& R, kelMat& T) const {
    KEL_ASSERT(this->m_Width == 4 && this->m_Height == 3);
    float Q[3][4]; // P, with its sign chosen so that the translation lies before the camera
    const float sign = (*this)[2][3] < 0.0f ? -1.0f : 1.0f;
    for (int i = 0; i < 12; ++i)
        Q[i / 4][i % 4] = m_Data[i] * sign;
    A.create(3, 3, true);
    R.create(3, 3, true);
    T.create(3, 1, true);

    //               | a00 a01 a02 |
    // Q ~ A [R | T],|     a11 a12 |: the rows of R from the last to the first by Gram-Schmidt
    //               |         a22 |
    A[2][2] = sqrtf(dot3(Q[2], Q[2]));
    const float s = 1.0f / A[2][2];
    for (int c = 0; c < 3; ++c)
        R[2][c] = s * Q[2][c];
    T[2][0] = s * Q[2][3];

    A[0][2] = dot3(R[2], Q[0]);
    A[1][2] = dot3(R[2], Q[1]);
    float rest[3];
    for (int c = 0; c < 3; ++c)
        rest[c] = Q[1][c] - A[1][2] * R[2][c];
    A[1][1] = sqrtf(dot3(rest, rest));
    for (int c = 0; c < 3; ++c)
        R[1][c] = rest[c] / A[1][1];

    A[0][1] = dot3(R[1], Q[0]);
    for (int c = 0; c < 3; ++c)
        rest[c] = Q[0][c] - A[0][1] * R[1][c] - A[0][2] * R[2][c];
    A[0][0] = sqrtf(dot3(rest, rest));
    for (int c = 0; c < 3; ++c)
        R[0][c] = rest[c] / A[0][0];

    T[1][0] = (Q[1][3] - A[1][2] * T[2][0]) / A[1][1];
    T[0][0] = (Q[0][3] - A[0][1] * T[1][0] - A[0][2] * T[2][0]) / A[0][0];
    for (int i = 0; i < 9; ++i)
        A.m_Data[i] *= s;
    return true;
}

bool kelMat::getDecomposedMatrix_ART_3x3(kelMat& A, kelMat& R, kelMat& T) const {
    KEL_ASSERT(this->m_Width == 3 && this->m_Height == 3);
    float H[3][3];
    std::copy_n(m_Data, 9, H[0]);
    A.create(3, 3, true);
    R.create(3, 3, true);
    T.create(3, 1, true);

    const float first = H[0][0] * H[0][0] + H[1][0] * H[1][0], second = H[0][1] * H[0][1] + H[1][1] * H[1][1];
    const float x = (first - second) / (H[2][1] * H[2][1] - H[2][0] * H[2][0]); // f squared
    const float f = sqrtf(x), g = 1.0f / f;
    A[0][0] = f;
    A[1][1] = f; // A[2][2] stays 0, and s below is not the root: callers rely on both
    const float s = x / (H[2][0] * H[2][0] * x + first);

    for (int c = 0; c < 2; ++c) {
        R[0][c] = H[0][c] * s * g;
        R[1][c] = H[1][c] * s * g;
        R[2][c] = H[2][c] * s;
    }
    R[0][2] = R[1][0] * R[2][1] - R[1][1] * R[2][0];
    R[1][2] = R[2][0] * R[0][1] - R[2][1] * R[0][0];
    R[2][2] = R[0][0] * R[1][1] - R[0][1] * R[1][0];
    T[0][0] = H[0][2] * s * g;
    T[1][0] = H[1][2] * s * g;
    T[2][0] = H[2][2] * s;
    return true;
}

bool kelMat::getDecomposedMatrix_LU(kelMat& L, kelMat& U) const {
    KEL_ASSERT(this->m_Width == this->m_Height);
    const int n = m_Width;
    kel::LUCopy lu(*this);
    L.create(n, n, true);
    L.setDataIdentity(1.0f);
    U.create(n, n, true);
    const float* row = lu.a.data();
    for (int r = 0; r < n; ++r, row += n) {
        std::copy_n(row, r, L[r]);
        std::copy(row + r, row + n, U[r] + r);
    }
    return lu.ok;
}

bool kelMat::getDecomposedrixMat_QR(kelMat&, kelMat&) const {
    return true;
}

bool kelMat::getDecomposedMatrix_SV(kelMat& U, kelMat& W, kelMat& V) const {
    return nr_svdcmp(*this, U, W, V);
}

bool kelMat::getEigenValue(kelMat& d, kelMat& v) {
    const int n = m_Width;
    kel::SquareScratch copy(elements(*this));
    std::copy_n(m_Data, elements(*this), copy.data());
    int rotations;
    d.create(n, 1, false);
    v.create(n, n, false);
    kel::jacobi(copy.data(), n, d.m_Data, v.m_Data, &rotations);
    return true;
}

// With B = L L^T the problem becomes C y = lambda y, C = L^-1 A L^-T, and x = L^-T y.
bool kelMat::getGeneralizedEigenValue(kelMat& B, kelMat& d, kelMat& X) {
    const int n = B.m_Width;
    if (B.m_Height != n || n < 2)
        B.getInversedMatrix(); // stops the process on the size
    const size_t square = elements(B);
    kel::SquareScratch L(square), M(square), N(square), C(square);
    std::copy_n(B.m_Data, square, L.data());
    kel::decomposeCholesky(L.data(), n);
    kel::transpose(C.data(), L.data(), n, n);
    if (!m_IsCreated || !kel::invert(C.data(), n, M.data())) {
        d.release();
        X.release();
        return true;
    }
    if (m_Height != n || m_Width != n)
        (void)(kelMat(n, n) * *this * kelMat(n, n)); // so does this
    kel::transpose(N.data(), M.data(), n, n);
    kel::multiply(L.data(), N.data(), m_Data, n, n, n);
    kel::multiply(C.data(), L.data(), M.data(), n, n, n);
    int rotations;
    d.create(n, 1, false);
    kel::jacobi(C.data(), n, d.m_Data, N.data(), &rotations);
    X.create(n, n, false);
    kel::multiply(X.m_Data, M.data(), N.data(), n, n, n);
    return true;
}

// ---- determinant and inverse -----------------------------------------------------------------------------------------------

float kelMat::getDeterminant() const {
    KEL_ASSERT(this->m_Width == this->m_Height);
    KEL_ASSERT(2 <= this->m_Width);
    switch (m_Width) {
    case 2:
        return kel_getDeterminant_2x2(*this);
    case 3:
        return kel_getDeterminant_3x3(*this);
    default:
        return kel_getDeterminant_NxN(*this);
    }
}

bool kelMat::getInversedMatrix(kelMat& R) const {
    KEL_ASSERT(this->m_Width == this->m_Height);
    KEL_ASSERT(2 <= this->m_Width);
    switch (m_Width) {
    case 2:
        return kel_getInversedMatrix_2x2(*this, R);
    case 3:
        return kel_getInversedMatrix_3x3(*this, R);
    default:
        return kel_getInversedMatrix_NxN(*this, R);
    }
}

kelMat kelMat::getInversedMatrix() const {
    kelMat R;
    getInversedMatrix(R);
    return R;
}

bool kelMat::getInversedMatrix_Pseudo(kelMat& R) const {
    return kel_getInversedMatrix_NxM(*this, R);
}

kelMat kelMat::getInversedMatrix_Pseudo() const {
    kelMat R;
    getInversedMatrix_Pseudo(R);
    return R;
}
