// Gradients of a whole level.
#include "kelRegisterDescription.h"

namespace kelRegister {

Gradients::Gradients(const Level& level) : m_step(level.smooth->step) {
    constexpr int kSpare = 8; // what a row may be written beyond its end
    const kelImage_t* const image = level.smooth.get();
    m_values.resize(static_cast<size_t>(m_step) * image->height + kSpare);
    // A block at a row's end may read up to eight pixels behind it: rows end where another one follows.
    for (int y = 1; y < image->height - 2; ++y)
        kernels().gradients(m_values.data() + y * m_step + 1, rowOf(image, y) + 1, image->step, image->width - 2);
}

} // namespace kelRegister
