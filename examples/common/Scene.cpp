// The scene: a picture larger than the views, of shapes and grain, warped into either view by the library.
#include "Scene.h"

#include <algorithm>
#include <cmath>
#include <random>

#include "Warp.h"

namespace kel_examples {

namespace {

constexpr int kWidth = 640, kHeight = 480, kMargin = 240;

// Independent of rand(), whose draws belong to the fit.
class Numbers {
public:
    explicit Numbers(unsigned seed) : m_engine(seed) {}
    float between(float lo, float hi) { return lo + (hi - lo) * static_cast<float>(m_engine() % 65536) / 65535.0f; }

private:
    std::mt19937 m_engine;
};

// Ellipses and turned boxes of random colours, many small ones over few large ones.
Image renderWall(Numbers& numbers) {
    constexpr int kShapes = 900;
    Image wall(kWidth + 2 * kMargin, kHeight + 2 * kMargin, KEL_PIXEL_TYPE_U8ZYX);
    for (int i = 0; i < wall->size; ++i)
        wall->data[i] = static_cast<uint8_t>(150 + 40 * ((i % 3) - 1));
    for (int shape = 0; shape < kShapes; ++shape) {
        const float largest = 160 * std::pow(0.995f, static_cast<float>(shape)) + 8;
        const float cx = numbers.between(0, static_cast<float>(wall->width)),
                    cy = numbers.between(0, static_cast<float>(wall->height));
        const float a = numbers.between(5, largest), b = numbers.between(5, largest), angle = numbers.between(0, 3.14159f);
        const float c = std::cos(angle), s = std::sin(angle), reach = a + b;
        const bool box = numbers.between(0, 1) < 0.5f;
        const uint8_t colour[3] = {static_cast<uint8_t>(numbers.between(20, 240)),
                                   static_cast<uint8_t>(numbers.between(20, 240)),
                                   static_cast<uint8_t>(numbers.between(20, 240))};
        for (int y = std::max(0, static_cast<int>(cy - reach)); y < std::min(wall->height, static_cast<int>(cy + reach)); ++y)
            for (int x = std::max(0, static_cast<int>(cx - reach)); x < std::min(wall->width, static_cast<int>(cx + reach));
                 ++x) {
                const float dx = static_cast<float>(x) - cx, dy = static_cast<float>(y) - cy;
                const float u = (c * dx + s * dy) / a, v = (c * dy - s * dx) / b;
                if (box ? std::max(std::fabs(u), std::fabs(v)) < 0.7f : u * u + v * v < 1)
                    std::copy_n(colour, 3, wall->data + 3 * (static_cast<ptrdiff_t>(y) * wall->step + x));
            }
    }
    return wall;
}

// Grain, and a change of brightness.
void expose(Image& view, float brightness, Numbers& numbers) {
    for (int i = 0; i < view->size; ++i) {
        const float value = brightness * static_cast<float>(view->data[i]) + numbers.between(-6, 6);
        view->data[i] = static_cast<uint8_t>(std::clamp(value, 0.0f, 255.0f));
    }
}

} // namespace

Scene renderScene(unsigned seed) {
    Numbers numbers(seed);
    const Image wall = renderWall(numbers);
    kelMat toFirst(3, 3, true), around(3, 3, true), turn, look(3, 3, true);
    toFirst.setDataIdentity(1);
    toFirst[0][2] = toFirst[1][2] = -static_cast<float>(kMargin);
    // About the middle of the view: a turn, a scale, a tilt.
    around.setDataIdentity(1);
    around[0][2] = kWidth / 2;
    around[1][2] = kHeight / 2;
    turn.setDataRotationMatrix_Z_3x3(numbers.between(-25, 25));
    look.setDataIdentity(numbers.between(0.8f, 1.25f));
    look[2][2] = 1;
    look[0][1] = numbers.between(-0.1f, 0.1f);
    look[0][2] = numbers.between(-40, 40);
    look[1][2] = numbers.between(-30, 30);
    look[2][0] = numbers.between(-4e-4f, 4e-4f);
    look[2][1] = numbers.between(-4e-4f, 4e-4f);

    Scene scene;
    scene.H = around * look * turn * around.getInversedMatrix();
    scene.H.setDataUnitize();
    scene.first = warpPicture(wall, toFirst, {kWidth, kHeight});
    scene.second = warpPicture(wall, scene.H * toFirst, {kWidth, kHeight});
    expose(scene.first, 1, numbers);
    expose(scene.second, 0.85f, numbers);
    return scene;
}

} // namespace kel_examples
