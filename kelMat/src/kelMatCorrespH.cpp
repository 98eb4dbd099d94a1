// Sets of pairs of 2-D points and their normalisation, and the homography of the unit square.
#include "kelMatCorresp_Private.h"

namespace {

kel::Sequences<2> sequences(kelMatCorrespH& set) {
    return {&set.m_SrcX, &set.m_SrcY, &set.m_DstX, &set.m_DstY};
}

} // namespace

kelMatCorrespH::kelMatCorrespH() : m_Num(0) {}

kelMatCorrespH::~kelMatCorrespH() {}

void kelMatCorrespH::add(float x1, float y1, float x2, float y2) {
    if (m_Num >= KEL_CORRESP_MAX) // callers rely on the silence
        return;
    kel::append(sequences(*this), {x1, y1, x2, y2});
    ++m_Num;
}

void kelMatCorrespH::normalize(kelMatCorrespH& out, kelMat& T1, kelMat& T2) {
    kel::normalize<2>(sequences(*this), m_Num, sequences(out), out.m_Num, T1, T2);
}

// The homography of the unit square's corners 0 .. 3:
//
//     (0,1) 1 +-----+ 2 (1,1)        | h0 h1 h2 |
//             |     |            H = | h3 h4 h5 |
//     (0,0) 0 +-----+ 3 (1,0)        | h6 h7 1  |
//
// Every product is that of its factors from left to right, every sum runs from left to right.
void UnitSquareProjection(float x0, float y0, float x1, float y1, float x2, float y2, float x3, float y3, float* h) {
    const float x0x2 = x0 * x2, x0y1 = x0 * y1, x0y2 = x0 * y2, x0y3 = x0 * y3, x1x3 = x1 * x3, x1y0 = x1 * y0, x1y3 = x1 * y3,
                x2y0 = x2 * y0, x2y1 = x2 * y1, x2y3 = x2 * y3, x3x0 = x3 * x0, x3y1 = x3 * y1, x1y2 = x1 * y2, x3y2 = x3 * y2,
                y0y1 = y0 * y1, y0y2 = y0 * y2, y1y2 = y1 * y2, y1y3 = y1 * y3, y2y3 = y2 * y3, x3y0 = x3 * y0;
    const float r = 1.0f / (x3y1 - x3y2 - x2y1 + x2y3 - x1y3 + x1y2);
    h[0] = -(x0y3 * x2 - x0x2 * y1 + x0y2 * x1 - x0y3 * x1 - x2y0 * x3 + x1y0 * x3 - x1x3 * y2 + x2y1 * x3) * r;
    h[1] = (x0x2 * y1 - x0y3 * x2 - x3x0 * y1 + x3x0 * y2 + x1y0 * x3 - x1y0 * x2 + x2y3 * x1 - x1x3 * y2) * r;
    h[2] = x0;
    h[3] = (x0y1 * y3 - x0y3 * y2 + x2y0 * y1 - y0y1 * x3 + y0y2 * x3 - y0y2 * x1 + y2y3 * x1 - y1y3 * x2) * r;
    h[4] = (x0y1 * y2 - x0y1 * y3 - x2y3 * y0 + y0y2 * x3 - y0y2 * x1 + x1y3 * y0 + y1y3 * x2 - y1y2 * x3) * r;
    h[5] = y0;
    h[6] = (x0y1 - x0y2 + x2y0 - x1y0 + x3y2 - x3y1 - x2y3 + x1y3) * r;
    h[7] = (x0y2 - x0y3 + x3y0 - x2y0 + x1y3 - x1y2 - x3y1 + x2y1) * r;
}
