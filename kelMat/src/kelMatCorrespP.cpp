// Sets of pairs of a 3-D object point and its 2-D image point, and their normalisation.
#include "kelMatCorresp_Private.h"

kelMatCorrespP::kelMatCorrespP() : m_Num(0) {}

kelMatCorrespP::~kelMatCorrespP() {}

void kelMatCorrespP::add(float X, float Y, float Z, float x, float y) {
    if (m_Num >= KEL_CORRESP_MAX) // callers rely on the silence
        return;
    m_ObjX.push_back(X);
    m_ObjY.push_back(Y);
    m_ObjZ.push_back(Z);
    m_ImgX.push_back(x);
    m_ImgY.push_back(y);
    ++m_Num;
}

void kelMatCorrespP::normalize(kelMatCorrespP& out, kelMat& T1, kelMat& T2) {
    const int n = m_Num;
    for (const std::vector<float>* values : {&m_ObjX, &m_ObjY, &m_ObjZ, &m_ImgX, &m_ImgY})
        kel::requireValues(*values, n);

    float cX = 0, cY = 0, cZ = 0, cx = 0, cy = 0;
    for (int i = 0; i < n; ++i) {
        cX += m_ObjX[i];
        cY += m_ObjY[i];
        cZ += m_ObjZ[i];
        cx += m_ImgX[i];
        cy += m_ImgY[i];
    }
    const float count = static_cast<float>(n);
    cX /= count;
    cY /= count;
    cZ /= count;
    cx /= count;
    cy /= count;

    float objDistances = 0, imgDistances = 0;
    for (int i = 0; i < n; ++i) {
        const float dX = m_ObjX[i] - cX, dY = m_ObjY[i] - cY, dZ = m_ObjZ[i] - cZ, dx = m_ImgX[i] - cx, dy = m_ImgY[i] - cy;
        objDistances = kel::plusDistance(objDistances, dX * dX + dY * dY + dZ * dZ);
        imgDistances = kel::plusDistance(imgDistances, dx * dx + dy * dy);
    }
    // Object points, too, get a mean distance of sqrt 2, not sqrt 3: callers rely on it.
    const float s1 = kel::scaleOf(n, objDistances), s2 = kel::scaleOf(n, imgDistances);

    const int room = kel::roomFor(n, out.m_Num);
    kel::appendCentred(out.m_ObjX, m_ObjX, cX, room);
    kel::appendCentred(out.m_ObjY, m_ObjY, cY, room);
    kel::appendCentred(out.m_ObjZ, m_ObjZ, cZ, room);
    kel::appendCentred(out.m_ImgX, m_ImgX, cx, room);
    kel::appendCentred(out.m_ImgY, m_ImgY, cy, room);
    out.m_Num += room;
    for (std::vector<float>* values : {&out.m_ObjX, &out.m_ObjY, &out.m_ObjZ})
        kel::scaleValues(*values, s1, n);
    kel::scaleValues(out.m_ImgX, s2, n);
    kel::scaleValues(out.m_ImgY, s2, n);

    T1.create(4, 4, true);
    for (int i = 0; i < 3; ++i)
        T1[i][i] = s1;
    T1[0][3] = cX * -s1;
    T1[1][3] = cY * -s1;
    T1[2][3] = cZ * -s1;
    T1[3][3] = 1.0f;
    kel::fillInverseNormaliser(T2, s2, cx, cy);
}
