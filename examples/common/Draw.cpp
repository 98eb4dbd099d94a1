// Lines, circles, pictures side by side, and mosaics.
#include "Draw.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <map>

#include "Registration.h"

namespace kel_examples {

namespace {

uint8_t* pixelAt(const Image& picture, int x, int y) {
    return picture->data + 3 * (static_cast<ptrdiff_t>(y) * picture->step + x);
}

void plot(Image& picture, float x, float y, Colour colour) {
    const int ix = static_cast<int>(std::lround(x)), iy = static_cast<int>(std::lround(y));
    if (ix < 0 || iy < 0 || ix >= picture->width || iy >= picture->height)
        return;
    uint8_t* const p = pixelAt(picture, ix, iy);
    p[0] = colour.r;
    p[1] = colour.g;
    p[2] = colour.b;
}

// Copies `picture` into `canvas`, its top-left pixel to (left, top), where it fits.
void place(Image& canvas, const Image& picture, int left, int top) {
    for (int y = std::max(0, -top); y < picture->height && y + top < canvas->height; ++y) {
        const int skip = std::max(0, -left), width = std::min(picture->width, canvas->width - left) - skip;
        if (width > 0)
            std::memcpy(pixelAt(canvas, left + skip, y + top), pixelAt(picture, skip, y), static_cast<size_t>(3) * width);
    }
}

Image sideBySide(const Image& first, const Image& second) {
    Image both(first->width + second->width, std::max(first->height, second->height), KEL_PIXEL_TYPE_U8ZYX);
    clearKelImage(both.get());
    place(both, first, 0, 0);
    place(both, second, first->width, 0);
    return both;
}

} // namespace

void drawLine(Image& picture, float x0, float y0, float x1, float y1, Colour colour) {
    const int steps = std::max(1, static_cast<int>(std::ceil(std::max(std::fabs(x1 - x0), std::fabs(y1 - y0)))));
    for (int i = 0; i <= steps; ++i) {
        const float t = static_cast<float>(i) / static_cast<float>(steps);
        plot(picture, x0 + t * (x1 - x0), y0 + t * (y1 - y0), colour);
    }
}

void drawCircle(Image& picture, float x, float y, float radius, Colour colour) {
    const int steps = std::max(8, static_cast<int>(8 * radius));
    for (int i = 0; i < steps; ++i) {
        const float a = 6.2831853f * static_cast<float>(i) / static_cast<float>(steps);
        plot(picture, x + radius * std::cos(a), y + radius * std::sin(a), colour);
    }
}

void drawText(Image& picture, int x, int y, const std::string& text, Colour colour) {
    // Seven rows of five pixels a letter, the leftmost in the highest of five bits.
    static const std::map<char, std::array<int, 7>> letters = {
        {'A', {14, 17, 17, 31, 17, 17, 17}}, {'D', {30, 17, 17, 17, 17, 17, 30}}, {'E', {31, 16, 16, 30, 16, 16, 31}},
        {'F', {31, 16, 16, 30, 16, 16, 16}}, {'I', {14, 4, 4, 4, 4, 4, 14}},      {'L', {16, 16, 16, 16, 16, 16, 31}},
        {'M', {17, 27, 21, 21, 17, 17, 17}}, {'O', {14, 17, 17, 17, 17, 17, 14}}, {'R', {30, 17, 17, 30, 20, 18, 17}},
        {'S', {15, 16, 16, 14, 1, 1, 30}},   {'T', {31, 4, 4, 4, 4, 4, 4}},       {'U', {17, 17, 17, 17, 17, 17, 14}}};
    for (const char c : text) {
        const auto letter = letters.find(c);
        for (int row = 0; row < 7 && letter != letters.end(); ++row)
            for (int column = 0; column < 5; ++column)
                if (letter->second[static_cast<size_t>(row)] >> (4 - column) & 1)
                    for (const int dx : {0, 1}) // twice the size
                        for (const int dy : {0, 1})
                            plot(picture, static_cast<float>(x + 2 * column + dx), static_cast<float>(y + 2 * row + dy),
                                 colour);
        x += 12;
    }
}

Image drawKeypoints(const Image& first, const Image& second, const std::vector<Feature>& ofFirst,
                    const std::vector<Feature>& ofSecond) {
    Image both = sideBySide(first, second);
    const auto draw = [&](const Feature& f, float left) {
        const float radius = 3 * f.scale;
        const uint8_t* const c = KEL_COLOR_TABLE_PSEUDO[std::min(63, static_cast<int>(20 * std::log2(f.scale) + 12))];
        drawCircle(both, left + f.x, f.y, radius, {c[0], c[1], c[2]});
        drawLine(both, left + f.x, f.y, left + f.x + radius * std::cos(f.angle), f.y + radius * std::sin(f.angle),
                 {c[0], c[1], c[2]});
    };
    for (const Feature& f : ofFirst)
        draw(f, 0);
    for (const Feature& f : ofSecond)
        draw(f, static_cast<float>(first->width));
    return both;
}

Image drawMatches(const Image& first, const Image& second, const std::vector<Feature>& ofFirst,
                  const std::vector<Feature>& ofSecond, const std::vector<Match>& matches, const std::vector<bool>& inlier) {
    constexpr size_t kMost = 60; // of either kind: hundreds of lines would hide the pictures
    Image both = sideBySide(first, second);
    for (const bool pass : {false, true}) { // inliers over the others
        const size_t all = static_cast<size_t>(std::count(inlier.begin(), inlier.end(), pass)), shown = std::min(all, kMost);
        for (size_t i = 0, seen = 0; i < matches.size(); ++i) {
            if (inlier[i] != pass)
                continue;
            ++seen;
            if (seen * shown / all > (seen - 1) * shown / all) { // evenly from first to last
                const Feature &a = ofFirst[matches[i].first], &b = ofSecond[matches[i].second];
                const Colour colour = pass ? Colour{0, 230, 60} : Colour{230, 40, 40};
                drawLine(both, a.x, a.y, static_cast<float>(first->width) + b.x, b.y, colour);
            }
        }
    }
    return both;
}

Image drawMosaic(const Image& first, const Image& second, const kelMat& H) {
    constexpr float kMostTimes = 3; // a strong perspective may throw a corner far away: the canvas ends here
    float left = 0, top = 0, right = static_cast<float>(second->width), bottom = static_cast<float>(second->height);
    const float limitX = kMostTimes * right, limitY = kMostTimes * bottom;
    kelMat forward = H;
    for (const float x : {0.0f, static_cast<float>(first->width - 1)})
        for (const float y : {0.0f, static_cast<float>(first->height - 1)}) {
            float u, v;
            forward.cvtPoint(x, y, &u, &v);
            left = std::min(left, std::max(u, -limitX));
            top = std::min(top, std::max(v, -limitY));
            right = std::max(right, std::min(u + 1, limitX));
            bottom = std::max(bottom, std::min(v + 1, limitY));
        }
    const int shiftX = static_cast<int>(std::ceil(-left)), shiftY = static_cast<int>(std::ceil(-top));
    const Size size = {static_cast<int>(right) + shiftX, static_cast<int>(bottom) + shiftY};
    kelMat shift(3, 3, true);
    shift.setDataIdentity(1);
    shift[0][2] = static_cast<float>(shiftX);
    shift[1][2] = static_cast<float>(shiftY);

    Image canvas(size.width, size.height, KEL_PIXEL_TYPE_U8ZYX);
    clearKelImage(canvas.get());
    place(canvas, second, shiftX, shiftY);
    // A white picture warped alike tells where the first one lies.
    Image white(first->width, first->height, KEL_PIXEL_TYPE_U8ZYX);
    std::memset(white->data, 255, static_cast<size_t>(white->size));
    const Image warped = warpPicture(first, shift * H, size), covered = warpPicture(white, shift * H, size);
    for (int y = 0; y < size.height; ++y)
        for (int x = 0; x < size.width; ++x) {
            if (!*pixelAt(covered, x, y))
                continue;
            const bool both = x >= shiftX && y >= shiftY && x < shiftX + second->width && y < shiftY + second->height;
            const uint8_t* const from = pixelAt(warped, x, y);
            uint8_t* const to = pixelAt(canvas, x, y);
            for (int c = 0; c < 3; ++c)
                to[c] = both ? static_cast<uint8_t>((to[c] + from[c] + 1) / 2) : from[c];
        }
    return canvas;
}

} // namespace kel_examples
