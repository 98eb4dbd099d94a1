// What the stages share: images, plane maps in double precision, and the levels of a picture.
#ifndef KEL_REGISTER_PRIVATE_H
#define KEL_REGISTER_PRIVATE_H

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include <kel/kelImage.hpp>
#include <kel/kelRegister.h>

namespace kelRegister {

using kel::Image;

// A new image of zeros, padding included: no stage reads what nobody wrote.
inline Image create(int width, int height, int type) {
    Image image(width, height, type);
    clearKelImage(image.get());
    return image;
}

// For libkel's functions that only read a source but do not say so.
inline kelImage_t* toRead(const Image& image) {
    return const_cast<kelImage_t*>(image.get());
}

inline uint8_t* rowOf(const kelImage_t* image, int y) {
    return image->data + static_cast<ptrdiff_t>(y) * image->step * image->channels * image->depth;
}

struct Point {
    double x, y;
};

// By a root, which every processor rounds correctly; std::hypot differs in the last bit between them.
inline double distance(Point a, Point b) {
    return std::sqrt((a.x - b.x) * (a.x - b.x) + (a.y - b.y) * (a.y - b.y));
}

// A homography in double precision, row by row.
struct Map {
    double m[9];

    double weight(Point p) const { return m[6] * p.x + m[7] * p.y + m[8]; }
    Point at(Point p) const {
        const double w = weight(p);
        return {(m[0] * p.x + m[1] * p.y + m[2]) / w, (m[3] * p.x + m[4] * p.y + m[5]) / w};
    }
    // Determinant of the derivative at p: the area that a pixel there becomes, negative where the map mirrors.
    double areaAt(Point p) const {
        const double w = weight(p);
        return determinant() / (w * w * w);
    }
    double determinant() const;
    Map inverse() const; // up to scale
    Map operator*(const Map& other) const;
};

// A smoothed level of a picture with a border all round. Level pixel p (without its border) is picture pixel p * scale +
// offset.
constexpr int kBorder = 32; // so that no neighbourhood leaves it
struct Level {
    Image smooth;
    Image cross; // the response that the detector wants; empty where nothing is to be detected
    double scale, offset;

    double x(double picture) const { return (picture - offset) / scale + kBorder; }
    int width() const { return smooth->width - 2 * kBorder; }
    int height() const { return smooth->height - 2 * kBorder; }
};

// All levels of a picture. Those before `firstWorking` are finer than the working picture.
struct Pyramid {
    int width = 0, height = 0; // of the picture
    double workingScale = 1;   // picture pixels to a pixel of the working picture
    size_t firstWorking = 0;
    Image working; // what views are made of; empty in a view
    std::vector<Level> levels;
};

// ---- kelRegisterPicture.cpp, kelRegisterPyramid.cpp ----

// Why a picture cannot be used, or nothing. `name` stands in the text.
std::string whyUnusable(const kelImage_t* picture, const char* name);
std::string whyUnusable(int width, int height, const char* name);
// The picture in grey, U8G, spread over 0 .. 255; its padding repeats each row's last pixel.
Image greyOf(const kelImage_t* picture);
// The levels of greyOf()'s result, which it takes over.
Pyramid makePyramid(Image grey, int workingSize);
// What makePyramid() makes of a picture of this size that it halves so many times, with zeros for pixels.
Pyramid blankPyramid(int width, int height, int halvings);
// Whether it may be halved so many times.
bool canBeHalved(int width, int height, int times);
// The levels of the picture squeezed by 2 along a direction, and where its pixels lie in the picture.
struct View {
    double direction; // radians
    double turned;    // what directions in the view fall short of those in the picture
    Pyramid pyramid;
    Map toPicture;
};
// In eighths of a turn: along x, down to the right, along y, up to the right.
constexpr int kViews = 4;
View makeView(const Pyramid& picture, int eighths);

// ---- kelRegisterFeatures.cpp ----

// At most `most` keypoints with their descriptions, in coordinates of the picture (of the view, where it is one).
std::vector<Feature> findFeatures(const Pyramid& pyramid, int most);

// A picture ready for registration, or why it is not.
struct Ready {
    std::string reason;
    Pyramid pyramid; // without responses
    std::vector<Feature> features;
    int mostFeatures = 0;
};

// ---- kelRegisterStorage.cpp ----

// The bytes of a picture, which has no reason; and back. What cannot be read has one.
std::vector<unsigned char> store(const Ready& ready);
Ready restored(const unsigned char* bytes, size_t size);

struct Pair {
    Point first, second;
};

// A distance in either picture, in pixels.
struct Bound {
    double first, second;
};

// ---- kelRegisterSupport.cpp ----

// Whether two others within `reach` pixels of the first picture lie where a match's own two frames predict them, give or take
// `slack` pixels of the second and a share of the distance.
std::vector<bool> supported(const std::vector<Feature>& first, const std::vector<Feature>& second,
                            const std::vector<Match>& matches, double reach, double slack);

// ---- kelRegisterFit.cpp ----

// The best of several robust fits to the one set, polished by least squares on those of the other that agree. Of the two bounds
// the wider one holds. False where there is none that is plausible.
bool fitRobustly(const std::vector<Pair>& proposing, const std::vector<Pair>& polishing, Bound bound, Map& H);
// Marks the pairs that a homography takes to each other within either bound, there or back.
std::vector<bool> agreeing(const Map& H, const std::vector<Pair>& pairs, Bound bound);
// Places among the marked pairs in cells of so many pixels, counted in the picture where they are fewer.
int differentPlaces(const std::vector<Pair>& pairs, const std::vector<bool>& marked, Bound cell);

// ---- kelRegisterRefinement.cpp ----

constexpr double kLeastShare = 0.35; // of the patches, from which pictures agree

// What the pictures say about a homography.
struct Judgement {
    int tested = 0, agreeing = 0, places = 0;
    std::vector<Pair> pairs; // that agree
    double repeating = 0;    // share of them that look like many other places as well
    double share() const { return tested ? static_cast<double>(agreeing) / tested : 0; }
};

// Fits H anew to where at most so many patches about the keypoints of the coarser picture are found in the other one.
Judgement refine(const Pyramid& first, const Pyramid& second, const std::vector<Feature>& ofFirst,
                 const std::vector<Feature>& ofSecond, double threshold, int mostPatches, Map& H);

// ---- kelRegisterTrust.cpp ----

// The error that a homography fitted to these pairs is to be expected to have, in pixels of the second picture: the root of the
// mean square over the part of the first picture that falls into the second one.
double expectedError(const Map& H, const std::vector<Pair>& pairs, const Pyramid& first, const Pyramid& second);

} // namespace kelRegister

#endif
