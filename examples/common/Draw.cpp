// Lines, circles, pictures side by side, and mosaics.
#include "Draw.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <map>
#include <set>
#include <utility>
#include <vector>

#include "Warp.h"

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

namespace {

using kelRegister::Feature;
using kelRegister::Match;
using kelRegister::Result;

// Some of many, spread evenly over a picture: the first of every cell of a grid, as many cells as are asked for, about.
std::vector<const Match*> spreadOut(const Result& r, Size size, bool inliers, int most) {
    const float cell = std::sqrt(static_cast<float>(size.width) * static_cast<float>(size.height) / static_cast<float>(most));
    std::set<std::pair<int, int>> taken;
    std::vector<const Match*> some;
    for (const Match& match : r.matches) {
        const Feature& f = r.first[match.first];
        if (match.inlier == inliers && taken.emplace(static_cast<int>(f.x / cell), static_cast<int>(f.y / cell)).second)
            some.push_back(&match);
    }
    return some;
}

Colour colourAt(float share) {
    const uint8_t* const c = KEL_COLOR_TABLE_PSEUDO[std::clamp(static_cast<int>(10 + 44 * share), 0, 63)];
    return {c[0], c[1], c[2]};
}

// A canvas that holds the second picture and the first one's corners; a strong perspective may throw a corner far away, and so
// the canvas ends at three times the second's size.
struct Canvas {
    int left, top;
    Size size;
    Canvas(const Image& first, const Image& second, kelMat H) {
        constexpr float kMostTimes = 3;
        float x0 = 0, y0 = 0, x1 = static_cast<float>(second->width), y1 = static_cast<float>(second->height);
        const float limitX = kMostTimes * x1, limitY = kMostTimes * y1;
        for (const float x : {0.0f, static_cast<float>(first->width - 1)})
            for (const float y : {0.0f, static_cast<float>(first->height - 1)}) {
                float u, v;
                H.cvtPoint(x, y, &u, &v);
                x0 = std::min(x0, std::max(u, -limitX));
                y0 = std::min(y0, std::max(v, -limitY));
                x1 = std::max(x1, std::min(u + 1, limitX));
                y1 = std::max(y1, std::min(v + 1, limitY));
            }
        left = static_cast<int>(std::ceil(-x0));
        top = static_cast<int>(std::ceil(-y0));
        size = {static_cast<int>(x1) + left, static_cast<int>(y1) + top};
    }
};

// How far each pixel is from the picture's edge, 1 .. 255 in the middle; warped, 0 tells where there is no picture.
Image distancesToEdge(Size size) {
    Image distances(size.width, size.height, KEL_PIXEL_TYPE_U8G);
    const int scale = std::max(1, std::min(size.width, size.height) / 2);
    for (int y = 0; y < size.height; ++y)
        for (int x = 0; x < size.width; ++x) {
            const int distance = std::min({x, y, size.width - 1 - x, size.height - 1 - y});
            distances.row(y)[x] = static_cast<uint8_t>(1 + 254 * distance / scale);
        }
    return distances;
}

// What the first picture's channels are to be multiplied with to be as bright as the second's where both are.
std::array<float, 3> gains(const Image& first, const Image& ofFirst, const Image& second, const Image& ofSecond) {
    std::array<double, 3> sumFirst{1, 1, 1}, sumSecond{1, 1, 1};
    for (int y = 0; y < first->height; ++y)
        for (int x = 0; x < first->width; ++x)
            if (ofFirst.row(y)[x] && ofSecond.row(y)[x])
                for (size_t c = 0; c < 3; ++c) {
                    sumFirst[c] += first.row(y)[3 * x + static_cast<int>(c)];
                    sumSecond[c] += second.row(y)[3 * x + static_cast<int>(c)];
                }
    std::array<float, 3> gain;
    for (size_t c = 0; c < 3; ++c)
        gain[c] = static_cast<float>(std::clamp(sumSecond[c] / sumFirst[c], 0.25, 4.0));
    return gain;
}

} // namespace

Image drawKeypoints(const Image& first, const Image& second, const Result& result) {
    Image both = sideBySide(first, second);
    const auto draw = [&](const Feature& f, float left) {
        const float radius = 3 * f.scale;
        const Colour colour = colourAt(std::log2(f.scale) / 4);
        drawCircle(both, left + f.x, f.y, radius, colour);
        drawLine(both, left + f.x, f.y, left + f.x + radius * std::cos(f.angle), f.y + radius * std::sin(f.angle), colour);
    };
    for (const Feature& f : result.first)
        draw(f, 0);
    for (const Feature& f : result.second)
        draw(f, static_cast<float>(first->width));
    return both;
}

Image drawMatches(const Image& first, const Image& second, const Result& result) {
    constexpr int kInliers = 60, kOthers = 25;
    Image both = sideBySide(first, second);
    for (int i = 0; i < both->size; ++i)
        both->data[i] = static_cast<uint8_t>(both->data[i] * 3 / 4); // so that the lines stand out
    const float left = static_cast<float>(first->width), width = static_cast<float>(first->width);
    for (const bool inliers : {false, true}) // inliers over the others
        for (const Match* match : spreadOut(result, sizeOf(first), inliers, inliers ? kInliers : kOthers)) {
            const Feature &a = result.first[match->first], &b = result.second[match->second];
            const Colour colour = inliers ? colourAt(a.x / width) : Colour{120, 120, 120};
            drawLine(both, a.x, a.y, left + b.x, b.y, colour);
            for (const float radius : {3.0f, 4.0f}) {
                drawCircle(both, a.x, a.y, radius, colour);
                drawCircle(both, left + b.x, b.y, radius, colour);
            }
        }
    return both;
}

Image drawMosaic(const Image& first, const Image& second, const kelMat& H) {
    const Canvas canvas(first, second, H);
    kelMat shift(3, 3, true);
    shift.setDataIdentity(1);
    shift[0][2] = static_cast<float>(canvas.left);
    shift[1][2] = static_cast<float>(canvas.top);
    const Image a = warpPicture(first, shift * H, canvas.size),
                ofA = warpPicture(distancesToEdge(sizeOf(first)), shift * H, canvas.size);
    const Image ofB = warpPicture(distancesToEdge(sizeOf(second)), shift, canvas.size);
    Image mosaic(canvas.size.width, canvas.size.height, KEL_PIXEL_TYPE_U8ZYX);
    clearKelImage(mosaic.get());
    place(mosaic, second, canvas.left, canvas.top);
    const std::array<float, 3> gain = gains(a, ofA, mosaic, ofB);
    for (int y = 0; y < canvas.size.height; ++y)
        for (int x = 0; x < canvas.size.width; ++x) {
            const float weightA = ofA.row(y)[x], weightB = ofB.row(y)[x];
            if (weightA == 0)
                continue;
            for (int c = 0; c < 3; ++c) {
                uint8_t& to = mosaic.row(y)[3 * x + c];
                const float evened = std::min(255.0f, gain[static_cast<size_t>(c)] * a.row(y)[3 * x + c]);
                to = static_cast<uint8_t>((weightA * evened + weightB * to) / (weightA + weightB) + 0.5f);
            }
        }
    return mosaic;
}

} // namespace kel_examples
