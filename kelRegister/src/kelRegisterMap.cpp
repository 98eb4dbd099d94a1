// Plane maps: products and inverses.
#include "kelRegister_Private.h"

namespace kelRegister {

double Map::determinant() const {
    return m[0] * (m[4] * m[8] - m[5] * m[7]) - m[1] * (m[3] * m[8] - m[5] * m[6]) + m[2] * (m[3] * m[7] - m[4] * m[6]);
}

Map Map::inverse() const {
    return {{m[4] * m[8] - m[5] * m[7], m[2] * m[7] - m[1] * m[8], m[1] * m[5] - m[2] * m[4], //
             m[5] * m[6] - m[3] * m[8], m[0] * m[8] - m[2] * m[6], m[2] * m[3] - m[0] * m[5], //
             m[3] * m[7] - m[4] * m[6], m[1] * m[6] - m[0] * m[7], m[0] * m[4] - m[1] * m[3]}};
}

Map Map::operator*(const Map& other) const {
    Map product;
    for (int r = 0; r < 3; ++r)
        for (int c = 0; c < 3; ++c)
            product.m[3 * r + c] = m[3 * r] * other.m[c] + m[3 * r + 1] * other.m[3 + c] + m[3 * r + 2] * other.m[6 + c];
    return product;
}

} // namespace kelRegister
