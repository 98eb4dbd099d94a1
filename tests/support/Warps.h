// Pictures seen through a homography that is known exactly, for tests and measurements of registration.
#ifndef KEL_TESTS_WARPS_H
#define KEL_TESTS_WARPS_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <random>

#include <kel/kelImage.hpp>
#include <kel/kelMat.h>

namespace kel_test {

struct Plane {
    double m[9];

    static Plane scale(double x, double y) { return {{x, 0, 0, 0, y, 0, 0, 0, 1}}; }
    static Plane shift(double x, double y) { return {{1, 0, x, 0, 1, y, 0, 0, 1}}; }
    static Plane turn(double degrees) {
        const double a = degrees * 3.14159265358979 / 180, c = std::cos(a), s = std::sin(a);
        return {{c, -s, 0, s, c, 0, 0, 0, 1}};
    }
    template <class Visit> void at(double x, double y, Visit visit) const {
        const double w = m[6] * x + m[7] * y + m[8];
        visit((m[0] * x + m[1] * y + m[2]) / w, (m[3] * x + m[4] * y + m[5]) / w);
    }
    Plane operator*(const Plane& other) const {
        Plane product;
        for (int i = 0; i < 9; ++i) {
            const double* const row = m + i / 3 * 3;
            product.m[i] = row[0] * other.m[i % 3] + row[1] * other.m[3 + i % 3] + row[2] * other.m[6 + i % 3];
        }
        return product;
    }
    Plane inverse() const { // up to scale: row r, column c is the cofactor of row c, column r
        Plane adjugate;
        for (int r = 0; r < 3; ++r)
            for (int c = 0; c < 3; ++c) {
                const int a = (c + 1) % 3, b = (c + 2) % 3, d = (r + 1) % 3, e = (r + 2) % 3;
                adjugate.m[3 * r + c] = m[3 * a + d] * m[3 * b + e] - m[3 * a + e] * m[3 * b + d];
            }
        return adjugate;
    }
};

inline Plane planeOf(const kelMat& H) {
    Plane plane;
    std::copy_n(H.m_Data, 9, plane.m);
    return plane;
}

// Mean distance between where two take a grid of points of a first picture that `truth` takes into the second one.
inline double meanError(const Plane& is, const Plane& truth, const kelImage_t* first, const kelImage_t* second) {
    double sum = 0;
    int count = 0;
    for (int y = 0; y < first->height; y += 8)
        for (int x = 0; x < first->width; x += 8)
            truth.at(x, y, [&](double u, double v) {
                if (u < 0 || v < 0 || u >= second->width || v >= second->height)
                    return;
                is.at(x, y, [&](double s, double t) { sum += std::min(1000.0, std::hypot(s - u, t - v)); });
                ++count;
            });
    return count ? sum / count : 0;
}

// A grey picture through `H`, every pixel the mean of 4 x 4 samples between the picture's pixels; 0 outside.
inline kel::Image rendered(const kelImage_t* picture, const Plane& H, int width, int height) {
    constexpr int kSamples = 4;
    const Plane back = H.inverse();
    kel::Image result(width, height, KEL_PIXEL_TYPE_U8G);
    clearKelImage(result.get());
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            double sum = 0;
            for (int k = 0; k < kSamples * kSamples; ++k)
                back.at(x + (k % kSamples + 0.5) / kSamples - 0.5, y + (k / kSamples + 0.5) / kSamples - 0.5,
                        [&](double u, double v) {
                            if (!(u >= 0 && v >= 0 && u < picture->width - 1 && v < picture->height - 1))
                                return;
                            const int iu = static_cast<int>(u), iv = static_cast<int>(v), step = picture->step;
                            const uint8_t* const p = picture->data + static_cast<ptrdiff_t>(iv) * step + iu;
                            const double fu = u - iu, fv = v - iv;
                            sum += (1 - fv) * (p[0] + fu * (p[1] - p[0])) + fv * (p[step] + fu * (p[step + 1] - p[step]));
                        });
            result.row(y)[x] = static_cast<uint8_t>(sum / (kSamples * kSamples) + 0.5);
        }
    return result;
}

// How a picture is looked at: tilted in a direction, turned, scaled; degrees.
struct Look {
    double tilt, direction, turn, scale;
};

// The picture so, as much of it as `most` pixels either way show; `H` receives the homography to it.
inline kel::Image warped(const kelImage_t* picture, const Look& look, int most, Plane& H) {
    const Plane shape = Plane::scale(look.scale, look.scale) * Plane::turn(look.turn) * Plane::scale(1 / look.tilt, 1) *
                        Plane::turn(look.direction);
    double left = 1e9, top = 1e9, right = -1e9, bottom = -1e9;
    for (const double x : {0.0, picture->width - 1.0})
        for (const double y : {0.0, picture->height - 1.0})
            shape.at(x, y, [&](double u, double v) {
                left = std::min(left, u);
                top = std::min(top, v);
                right = std::max(right, u);
                bottom = std::max(bottom, v);
            });
    const int width = std::min(most, static_cast<int>(right - left) + 2),
              height = std::min(most, static_cast<int>(bottom - top) + 2);
    H = Plane::shift(0.3 - (left + right - width) / 2, -0.4 - (top + bottom - height) / 2) * shape;
    return rendered(picture, H, width, height);
}

// Boxes of any size, turn and brightness over each other, and grain.
inline kel::Image drawnScene(int width, int height, unsigned seed) {
    std::mt19937 numbers(seed);
    const auto between = [&](double lo, double hi) { return lo + (hi - lo) * (numbers() % 65536) / 65535; };
    kel::Image scene(width, height, KEL_PIXEL_TYPE_U8G);
    for (int i = 0; i < scene->size; ++i)
        scene->data[i] = static_cast<uint8_t>(128 + numbers() % 8);
    for (int box = 0; box < width * height / 500; ++box) {
        const double x = between(0, width), y = between(0, height), a = between(2, 25), b = between(2, 25),
                     t = between(0, 3.14);
        const int value = static_cast<int>(between(10, 235));
        for (int v = std::max(0, static_cast<int>(y - a - b)); v < std::min<double>(height, y + a + b); ++v)
            for (int u = std::max(0, static_cast<int>(x - a - b)); u < std::min<double>(width, x + a + b); ++u) {
                const double dx = u - x, dy = v - y;
                if (std::fabs(std::cos(t) * dx + std::sin(t) * dy) < a && std::fabs(std::cos(t) * dy - std::sin(t) * dx) < b)
                    scene.row(v)[u] = static_cast<uint8_t>(value + numbers() % 8);
            }
    }
    return scene;
}

} // namespace kel_test

#endif
