// Synthetic camera projections, composed from object, camera and view, fixed or random.
#include <cstdlib>

#include "kelMat.h"

namespace {

// Uniform between a and b in either order, by the runtime's generator, in single precision throughout.
float rand(float a, float b) {
    const float lo = a > b ? b : a, hi = a > b ? a : b;
    const float r = static_cast<float>(::rand());
    return ((hi - lo) * r) * 4.656612873077393e-10f + lo;
}

// [R t; 0 0 0 1].
void fillPose(kelMat& pose, float rx, float ry, float rz, float tx, float ty, float tz) {
    kelMat R(3, 3, true);
    R.setDataRotationMatrix_XYZ_3x3(rx, ry, rz);
    const float t[3] = {tx, ty, tz};
    for (int r = 0; r < 3; ++r) {
        for (int c = 0; c < 3; ++c)
            pose[r][c] = R[r][c];
        pose[r][3] = t[r];
        pose[3][r] = 0.0f;
    }
    pose[3][3] = 1.0f;
}

// diag(s, s, s, 1).
void fillScale(kelMat& scale, float s) {
    scale.setDataIdentity(s);
    scale[3][3] = 1.0f;
}

} // namespace

kelMatGeneratorP::kelMatGeneratorP()
    : matView(3, 4, true), matViewScale(4, 4, true), matViewShift(3, 3, true), matCamera(4, 4, true),
      matCameraInverse(4, 4, true), matObject(4, 4, true), matObjectScale(4, 4, true), matObjectShift(4, 4, true) {
    setMatViewScale(1.0f);
    setMatViewShift(0.0f, 0.0f);
    setMatCamera(0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 0.0f);
    setMatObject(0.0f, 0.0f, 0.0f, 0.0f, 0.0f, 3000.0f);
    setMatObjectScale(1.0f);
    setMatObjectShift(0.0f, 0.0f, 0.0f);
}

kelMatGeneratorP::~kelMatGeneratorP() {}

void kelMatGeneratorP::setMatView(float f) {
    matView.setDataZero();
    matView[0][0] = f;
    matView[1][1] = f;
    matView[2][2] = 1.0f;
}

void kelMatGeneratorP::setMatViewRandom(float a, float b) {
    setMatView(rand(a, b));
}

void kelMatGeneratorP::setMatViewScale(float s) {
    fillScale(matViewScale, s);
}

void kelMatGeneratorP::setMatViewShift(float u, float v) {
    matViewShift.setDataIdentity(1.0f);
    matViewShift[0][2] = u;
    matViewShift[1][2] = v;
}

void kelMatGeneratorP::setMatCamera(float rx, float ry, float rz, float tx, float ty, float tz) {
    fillPose(matCamera, rx, ry, rz, tx, ty, tz);
    matCameraInverse = matCamera.getInversedMatrix();
}

void kelMatGeneratorP::setMatCameraRandom(float rx_a, float rx_b, float ry_a, float ry_b, float rz_a, float rz_b, float tx_a,
                                          float tx_b, float ty_a, float ty_b, float tz_a, float tz_b) {
    // Into variables first: the order in which arguments are evaluated is no one's promise.
    const float rx = rand(rx_a, rx_b), ry = rand(ry_a, ry_b), rz = rand(rz_a, rz_b);
    const float tx = rand(tx_a, tx_b), ty = rand(ty_a, ty_b), tz = rand(tz_a, tz_b);
    setMatCamera(rx, ry, rz, tx, ty, tz);
}

void kelMatGeneratorP::setMatObject(float rx, float ry, float rz, float tx, float ty, float tz) {
    fillPose(matObject, rx, ry, rz, tx, ty, tz);
}

void kelMatGeneratorP::setMatObjectRandom(float rx_a, float rx_b, float ry_a, float ry_b, float rz_a, float rz_b, float tx_a,
                                          float tx_b, float ty_a, float ty_b, float tz_a, float tz_b) {
    const float rx = rand(rx_a, rx_b), ry = rand(ry_a, ry_b), rz = rand(rz_a, rz_b);
    const float tx = rand(tx_a, tx_b), ty = rand(ty_a, ty_b), tz = rand(tz_a, tz_b);
    setMatObject(rx, ry, rz, tx, ty, tz);
}

void kelMatGeneratorP::setMatObjectScale(float s) {
    fillScale(matObjectScale, 1.0f / s); // the reciprocal, unlike the view's: callers rely on it
}

void kelMatGeneratorP::setMatObjectShift(float x, float y, float z) {
    matObjectShift.setDataIdentity(1.0f);
    matObjectShift[0][3] = x;
    matObjectShift[1][3] = y;
    matObjectShift[2][3] = z;
}

void kelMatGeneratorP::getMat(kelMat& out) {
    out = matViewShift * matView * matViewScale * matCameraInverse * matObject * matObjectScale * matObjectShift;
}
