// Gradients of a level, and what they tell about the neighbourhood of a pixel.
#ifndef KEL_REGISTER_DESCRIPTION_H
#define KEL_REGISTER_DESCRIPTION_H

#include "kelRegisterKernels.h"
#include "kelRegister_Private.h"

namespace kelRegister {

// Strength and direction of each pixel of a level, a byte each; zero at its very edge.
class Gradients {
public:
    explicit Gradients(const Level& level);
    const uint16_t* at(int x, int y) const { return m_values.data() + static_cast<ptrdiff_t>(y) * m_step + x; }
    ptrdiff_t step() const { return m_step; }

private:
    ptrdiff_t m_step;
    std::vector<uint16_t> m_values;
};

// Directions and descriptions, with the tables that they need.
class Describer {
public:
    Describer();
    // The prevailing directions round a pixel, radians: the highest peak of a histogram and any other that comes near it.
    void prevailingAngles(const Gradients& gradients, int x, int y, std::vector<float>& angles) const;
    // Describes the neighbourhood of (x, y), turned by `angle`; kDescription bytes.
    void describe(const Gradients& gradients, float x, float y, float angle, uint8_t* description) const;

private:
    struct Sample {
        int dx, dy, weight;
    };
    const Kernels& m_kernels;
    std::vector<Sample> m_disc;
    float m_directions[256][kDirections]; // shares of the cells' directions in each of 256
    float m_weights[kPatch * kPatch];
};

} // namespace kelRegister

#endif
