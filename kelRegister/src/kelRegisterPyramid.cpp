// Levels of a picture: halved until it is of working size, then two chains of halves, the second reduced by the root of 2
// first; and squeezed views. Smoothing, halving and responses are libkel's.
#include <algorithm>
#include <cmath>

#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr int kSmallestLevel = 40; // pixels on the shorter side
constexpr int kMostOctaves = 4;

// Of a picture of which every second pixel is taken.
int halved(int size) {
    return (size + 1) / 2;
}

Level blankLevel(int width, int height, double scale, double offset) {
    return {create(width + 2 * kBorder, height + 2 * kBorder, KEL_PIXEL_TYPE_U8G), Image(), scale, offset};
}

void addChain(std::vector<Level>& levels, int width, int height, double scale, double offset) {
    for (int octave = 0; octave < kMostOctaves && std::min(width, height) >= kSmallestLevel; ++octave) {
        levels.push_back(blankLevel(width, height, scale, offset));
        width = halved(width);
        height = halved(height);
        scale *= 2;
    }
}

// Both chains, blank, of an image of working size.
void addChains(Pyramid& pyramid, int width, int height) {
    const double scale = pyramid.workingScale, root = std::sqrt(2.0);
    pyramid.firstWorking = pyramid.levels.size();
    addChain(pyramid.levels, width, height, scale, 0);
    // Pixel centres map to pixel centres at p * root + (root - 1) / 2; halving keeps even pixels, and so the offset.
    if (pyramid.levels.size() > pyramid.firstWorking)
        addChain(pyramid.levels, static_cast<int>(width / root), static_cast<int>(height / root), scale * root,
                 scale * (root - 1) / 2);
}

// Fills a level from its image; returns that of the level half as large.
Image fill(Level& level, const Image& image, bool withCross) {
    const int width = level.smooth->width, height = level.smooth->height;
    Image scratch = create(width, height, KEL_PIXEL_TYPE_U8G), half = create(halved(width), halved(height), KEL_PIXEL_TYPE_U8G);
    resizeKelImageEnborder(level.smooth.get(), image.get(), kBorder);
    applyKelFilterGaussian7X7_downsampling(level.smooth.get(), half.get(), level.smooth.get(), scratch.get());
    if (withCross) {
        level.cross = create(width, height, KEL_PIXEL_TYPE_S16G);
        applyKelFilterLaplacian3X3(level.cross.get(), level.smooth.get());
    }
    Image next = create(half->width - kBorder, half->height - kBorder, KEL_PIXEL_TYPE_U8G);
    resizeKelImageDeborder(next.get(), half.get(), kBorder / 2);
    return next;
}

// Fills the chain that begins with level i; returns where the next one begins.
size_t fillChain(std::vector<Level>& levels, size_t i, Image image) {
    do
        image = fill(levels[i], image, true);
    while (++i < levels.size() && levels[i].scale == 2 * levels[i - 1].scale);
    return i;
}

void fillChains(Pyramid& pyramid, Image image) {
    std::vector<Level>& levels = pyramid.levels;
    if (pyramid.firstWorking == levels.size())
        return;
    const size_t second = fillChain(levels, pyramid.firstWorking, std::move(image));
    if (second == levels.size())
        return;
    Image between = create(levels[second].width(), levels[second].height(), KEL_PIXEL_TYPE_U8G);
    const float r = static_cast<float>(std::sqrt(2.0));
    rotateKelImageHomography(between.get(), levels[pyramid.firstWorking].smooth.get(), r, 0, kBorder, 0, r, kBorder, 0, 0, 1);
    fillChain(levels, second, std::move(between));
}

} // namespace

bool canBeHalved(int width, int height, int times) {
    for (; times > 0; --times) {
        if (std::min(width, height) < 2 * kSmallestLevel)
            return false;
        width = halved(width);
        height = halved(height);
    }
    return times == 0;
}

Pyramid blankPyramid(int width, int height, int halvings) {
    Pyramid pyramid;
    pyramid.width = width;
    pyramid.height = height;
    for (int i = 0; i < halvings; ++i) {
        pyramid.levels.push_back(blankLevel(width, height, pyramid.workingScale, 0));
        width = halved(width);
        height = halved(height);
        pyramid.workingScale *= 2;
    }
    pyramid.working = create(width, height, KEL_PIXEL_TYPE_U8G);
    addChains(pyramid, width, height);
    return pyramid;
}

Pyramid makePyramid(Image grey, int workingSize) {
    int halvings = 0;
    for (int longer = std::max(grey->width, grey->height);
         longer > workingSize && canBeHalved(grey->width, grey->height, halvings + 1); longer = halved(longer))
        ++halvings;
    Pyramid pyramid = blankPyramid(grey->width, grey->height, halvings);
    for (int i = 0; i < halvings; ++i)
        grey = fill(pyramid.levels[static_cast<size_t>(i)], grey, false);
    pyramid.working = grey.clone();
    fillChains(pyramid, std::move(grey));
    return pyramid;
}

// Means of two neighbours along x or y; the other axis keeps its sharpness.
static Image squeezedAlongAxis(const kelImage_t* from, bool alongX) {
    Image image = create(alongX ? from->width / 2 : from->width, alongX ? from->height : from->height / 2, KEL_PIXEL_TYPE_U8G);
    for (int y = 0; y < image->height; ++y) {
        uint8_t* const to = image.row(y);
        const uint8_t* const a = rowOf(from, alongX ? y : 2 * y);
        const uint8_t* const b = alongX ? a + 1 : a + from->step;
        for (int x = 0; x < image->width; ++x)
            to[x] = static_cast<uint8_t>((a[alongX ? 2 * x : x] + b[alongX ? 2 * x : x] + 1) / 2);
    }
    return image;
}

View makeView(const Pyramid& picture, int eighths) {
    const double scale = picture.workingScale, root = std::sqrt(0.5);
    const kelImage_t* const from = picture.working.get();
    View view;
    view.direction = eighths * 3.14159265358979 / 4;
    view.pyramid.workingScale = scale;
    Image image;
    if (eighths % 2 == 0) {
        const bool alongX = eighths == 0;
        image = squeezedAlongAxis(from, alongX);
        view.turned = 0;
        view.toPicture = alongX ? Map{{2, 0, scale / 2, 0, 1, 0, 0, 0, 1}} : Map{{1, 0, 0, 0, 2, scale / 2, 0, 0, 1}};
    } else { // turned, so that the squeeze is along the view's x axis, about the middle
        const double side = root * (from->width + from->height), c = eighths == 1 ? root : -root, s = root;
        image = create(static_cast<int>(side / 2), static_cast<int>(side), KEL_PIXEL_TYPE_U8G);
        const double x = (from->width - 1) / 2.0 - c * side / 2 + s * side / 2;
        const double y = (from->height - 1) / 2.0 - s * side / 2 - c * side / 2;
        const Map working = {{2 * c, -s, x, 2 * s, c, y, 0, 0, 1}};
        // The library goes from pixel centres at halves to the squares that hold them; levels have a border.
        const Map centres =
            Map{{1, 0, kBorder + 0.5, 0, 1, kBorder + 0.5, 0, 0, 1}} * working * Map{{1, 0, -0.5, 0, 1, -0.5, 0, 0, 1}};
        float h[9];
        std::copy_n(centres.m, 9, h);
        rotateKelImageHomography(image.get(), picture.levels[picture.firstWorking].smooth.get(), h[0], h[1], h[2], h[3], h[4],
                                 h[5], h[6], h[7], h[8]);
        view.turned = view.direction;
        view.toPicture = {{working.m[0], working.m[1], scale * x, working.m[3], working.m[4], scale * y, 0, 0, 1}};
    }
    view.pyramid.width = static_cast<int>(image->width * scale);
    view.pyramid.height = static_cast<int>(image->height * scale);
    addChains(view.pyramid, image->width, image->height);
    fillChains(view.pyramid, std::move(image));
    return view;
}

} // namespace kelRegister
