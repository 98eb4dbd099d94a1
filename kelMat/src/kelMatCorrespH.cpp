// Sets of pairs of 2-D points and their normalisation, and the homography of the unit square.
#include "kelMatCorresp_Private.h"

kelMatCorrespH::kelMatCorrespH() : m_Num(0) {}

kelMatCorrespH::~kelMatCorrespH() {}

void kelMatCorrespH::add(float x1, float y1, float x2, float y2) {
    if (m_Num >= KEL_CORRESP_MAX) // callers rely on the silence
        return;
    m_SrcX.push_back(x1);
    m_SrcY.push_back(y1);
    m_DstX.push_back(x2);
    m_DstY.push_back(y2);
    ++m_Num;
}

void kelMatCorrespH::normalize(kelMatCorrespH& out, kelMat& T1, kelMat& T2) {
    const int n = m_Num;
    for (const std::vector<float>* values : {&m_SrcX, &m_SrcY, &m_DstX, &m_DstY})
        kel::requireValues(*values, n);

    float cx1 = 0, cy1 = 0, cx2 = 0, cy2 = 0; // four sums in step: each has to wait for its last addition
    for (int i = 0; i < n; ++i) {
        cx1 += m_SrcX[i];
        cy1 += m_SrcY[i];
        cx2 += m_DstX[i];
        cy2 += m_DstY[i];
    }
    const float count = static_cast<float>(n);
    cx1 /= count;
    cy1 /= count;
    cx2 /= count;
    cy2 /= count;

    float distances1 = 0, distances2 = 0;
    for (int i = 0; i < n; ++i) {
        const float dx1 = m_SrcX[i] - cx1, dy1 = m_SrcY[i] - cy1, dx2 = m_DstX[i] - cx2, dy2 = m_DstY[i] - cy2;
        distances1 = kel::plusDistance(distances1, dx1 * dx1 + dy1 * dy1);
        distances2 = kel::plusDistance(distances2, dx2 * dx2 + dy2 * dy2);
    }
    const float s1 = kel::scaleOf(n, distances1), s2 = kel::scaleOf(n, distances2);

    const int room = kel::roomFor(n, out.m_Num);
    kel::appendCentred(out.m_SrcX, m_SrcX, cx1, room);
    kel::appendCentred(out.m_SrcY, m_SrcY, cy1, room);
    kel::appendCentred(out.m_DstX, m_DstX, cx2, room);
    kel::appendCentred(out.m_DstY, m_DstY, cy2, room);
    out.m_Num += room;
    kel::scaleValues(out.m_SrcX, s1, n);
    kel::scaleValues(out.m_SrcY, s1, n);
    kel::scaleValues(out.m_DstX, s2, n);
    kel::scaleValues(out.m_DstY, s2, n);

    T1.create(3, 3, true);
    T1[0][0] = s1;
    T1[0][2] = cx1 * -s1;
    T1[1][1] = s1;
    T1[1][2] = -s1 * cy1;
    T1[2][2] = 1.0f;
    kel::fillInverseNormaliser(T2, s2, cx2, cy2);
}

// Each sum runs from left to right.
void UnitSquareProjection(float x0, float y0, float x1, float y1, float x2, float y2, float x3, float y3, float* h) {
    const float r = 1.0f / (y1 * x3 - y2 * x3 - x2 * y1 + x2 * y3 - y3 * x1 + y2 * x1);
    h[0] = -(x0 * y3 * x2 - x0 * x2 * y1 + x0 * y2 * x1 - x0 * y3 * x1 - x2 * y0 * x3 + x1 * y0 * x3 - x1 * x3 * y2 +
             x2 * y1 * x3) *
           r;
    h[1] = (x0 * x2 * y1 - x0 * y3 * x2 - x3 * x0 * y1 + x3 * x0 * y2 + x1 * y0 * x3 - x1 * y0 * x2 + x2 * y3 * x1 -
            x1 * x3 * y2) *
           r;
    h[2] = x0;
    h[3] = (x0 * y1 * y3 - x0 * y3 * y2 + x2 * y0 * y1 - y1 * y0 * x3 + y2 * y0 * x3 - y2 * y0 * x1 + y2 * y3 * x1 -
            y1 * y3 * x2) *
           r;
    h[4] = (x0 * y1 * y2 - x0 * y1 * y3 - x2 * y3 * y0 + y2 * y0 * x3 - y2 * y0 * x1 + x1 * y3 * y0 + y1 * y3 * x2 -
            y2 * y1 * x3) *
           r;
    h[5] = y0;
    h[6] = (x0 * y1 - x0 * y2 + x2 * y0 - x1 * y0 + y2 * x3 - y1 * x3 - x2 * y3 + y3 * x1) * r;
    h[7] = (x0 * y2 - x0 * y3 + y0 * x3 - x2 * y0 + y3 * x1 - y2 * x1 - y1 * x3 + x2 * y1) * r;
}
