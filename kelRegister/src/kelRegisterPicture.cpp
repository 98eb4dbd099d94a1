// The working picture: what can be used, and its grey values spread over the whole range.
#include <algorithm>
#include <cstring>

#include "kelRegister_Private.h"

namespace kelRegister {

namespace {

constexpr int kLeastSide = 40, kMostSide = 32767;
constexpr double kMostPixels = 134217728; // so that no intermediate picture reaches 2^31 bytes

// Each row's padding repeats its last pixel: contrast stretching takes the padding in.
void fillPadding(Image& grey) {
    for (int y = 0; y < grey->height; ++y) {
        uint8_t* const row = grey.row(y);
        std::memset(row + grey->width, row[grey->width - 1], static_cast<size_t>(grey->step - grey->width));
    }
}

// 16-bit values spread linearly from their least to their greatest.
void spread(Image& grey, const kelImage_t* picture) {
    const auto row = [picture](int y) { return reinterpret_cast<const int16_t*>(rowOf(picture, y)); };
    int least = INT16_MAX, greatest = INT16_MIN;
    for (int y = 0; y < picture->height; ++y)
        for (int x = 0; x < picture->width; ++x) {
            least = std::min<int>(least, row(y)[x]);
            greatest = std::max<int>(greatest, row(y)[x]);
        }
    const int extent = std::max(1, greatest - least);
    for (int y = 0; y < picture->height; ++y)
        for (int x = 0; x < picture->width; ++x)
            grey.row(y)[x] = static_cast<uint8_t>((255 * (row(y)[x] - least) + extent / 2) / extent);
}

} // namespace

std::string whyUnusable(const kelImage_t* picture, const char* name) {
    const std::string the = std::string("the ") + name + " picture ";
    if (!picture->data)
        return the + "has no pixels";
    switch (picture->type) {
    case KEL_PIXEL_TYPE_U8G:
    case KEL_PIXEL_TYPE_S16G:
    case KEL_PIXEL_TYPE_U8XYZ:
    case KEL_PIXEL_TYPE_U8XYZA:
    case KEL_PIXEL_TYPE_U8ZYX:
    case KEL_PIXEL_TYPE_U8ZYXA:
    case KEL_PIXEL_TYPE_U8YUV:
        break;
    default:
        return the + "has pixel type " + std::to_string(picture->type) + ", which cannot be registered";
    }
    return whyUnusable(picture->width, picture->height, name);
}

std::string whyUnusable(int width, int height, const char* name) {
    const std::string the = std::string("the ") + name + " picture ";
    const std::string size = std::to_string(width) + " x " + std::to_string(height);
    if (std::min(width, height) < kLeastSide)
        return the + "is too small: " + size + " pixels, at least " + std::to_string(kLeastSide) + " either way are needed";
    if (std::max(width, height) > kMostSide || static_cast<double>(width) * height > kMostPixels)
        return the + "is too large: " + size + " pixels";
    return std::string();
}

Image greyOf(const kelImage_t* picture) {
    Image grey = create(picture->width, picture->height, KEL_PIXEL_TYPE_U8G);
    if (picture->type == KEL_PIXEL_TYPE_S16G) {
        spread(grey, picture);
    } else if (picture->channels == 4) { // straight to grey would write three times as much
        Image colours = create(picture->width, picture->height, KEL_PIXEL_TYPE_U8XYZ);
        convertKelImage_U8XYZA_to_U8XYZ(colours.get(), picture);
        convertKelImage(grey.get(), colours.get());
    } else if (picture->type == KEL_PIXEL_TYPE_U8G) {
        loadKelImageData(grey.get(), picture->data, picture->width, picture->height, picture->step);
    } else if (picture->type == KEL_PIXEL_TYPE_U8YUV) { // libkel's converter takes rows to be as far apart as in `grey`
        for (int y = 0; y < grey->height; ++y) {
            const uint8_t* const from = rowOf(picture, y);
            uint8_t* const to = grey.row(y);
            for (int x = 0; x < grey->width; ++x)
                to[x] = from[2 * x + 1];
        }
    } else {
        convertKelImage(grey.get(), picture);
    }
    fillPadding(grey);
    adjustKelImage(grey.get(), grey.get());
    return grey;
}

} // namespace kelRegister
