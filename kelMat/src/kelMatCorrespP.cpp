// Sets of pairs of a 3-D object point and its 2-D image point, and their normalisation.
#include "kelMatCorresp_Private.h"

namespace {

kel::Sequences<3> sequences(kelMatCorrespP& set) {
    return {&set.m_ObjX, &set.m_ObjY, &set.m_ObjZ, &set.m_ImgX, &set.m_ImgY};
}

} // namespace

kelMatCorrespP::kelMatCorrespP() : m_Num(0) {}

kelMatCorrespP::~kelMatCorrespP() {}

void kelMatCorrespP::add(float X, float Y, float Z, float x, float y) {
    if (m_Num >= KEL_CORRESP_MAX) // callers rely on the silence
        return;
    kel::append(sequences(*this), {X, Y, Z, x, y});
    ++m_Num;
}

void kelMatCorrespP::normalize(kelMatCorrespP& out, kelMat& T1, kelMat& T2) {
    kel::normalize<3>(sequences(*this), m_Num, sequences(out), out.m_Num, T1, T2);
}
