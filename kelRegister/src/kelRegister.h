/**
 * @file kelRegister.h
 * Registration of two pictures: the homography from the first to the second, judged by the pictures themselves, or the reason
 * why there is none. A library of its own, libkelRegister, over the two halves of kel.
 *
 * Compiles as C++11. Throughout
 *  - coordinates are pixels of the picture as it was given, (0, 0) being the centre of its first pixel;
 *  - pictures are only read; padding behind their rows has no part in any result;
 *  - nothing stops the process, whatever a picture holds: what cannot be registered is told in words. The one exception
 *    thrown is std::bad_alloc;
 *  - no state is kept: calls on any pictures may run in several threads at a time. Robust fits draw from rand(), which is never
 *    seeded here: the same srand() before gives the same bits.
 */
#ifndef KEL_REGISTER_H
#define KEL_REGISTER_H

#include <cstddef>
#include <kel/kelImage.h>
#include <kel/kelMat.h>
#include <memory>
#include <string>
#include <vector>

namespace kelRegister {

/**
 * What a registration may be told; the defaults suit photographs. One out of its range is refused in words, also where it does
 * not count.
 */
struct Options {
    float threshold;  ///< Inlier distance in pixels of the coarser working picture, 0.1 to 100; 3.
    int mostFeatures; ///< Most keypoints of a picture, 50 to 5000; 1200. Each gives a feature for every prevailing direction.
    /// Pictures are halved until their longer side is at most this, or the shorter one is below 80 pixels; 200 to 8000; 1000.
    int workingSize;
    bool views; ///< Whether squeezed views of both are tried where the first attempt is refused (steep tilts); true.

    Options() : threshold(3), mostFeatures(1200), workingSize(1000), views(true) {}
};

/**
 * A keypoint with the description of its neighbourhood. Point (u, v) of the upright, unit-size frame of a feature lies in the
 * picture at (x, y) + R(direction) diag(squeeze, 1) R(-direction) R(angle) scale (u, v), R being a turn from the x axis to the
 * y axis.
 */
struct Feature {
    float x, y;
    float scale;     ///< Pixels of the picture per pixel of the level on which it was found, 1 or more.
    float angle;     ///< Of a prevailing gradient, radians, from the x axis to the y axis.
    float squeeze;   ///< By how much the view was squeezed in which it was found; 1 for the picture itself.
    float direction; ///< Of that squeeze, radians.
    int score;       ///< Of the detector.
    /// 4 x 4 cells of 8 gradient directions, row by row: roots of each one's share of the whole. Compare by sums of absolute
    /// differences.
    unsigned char descriptor[128];
};

/** Features first and second, indices into the two sets, of what may be the same place. */
struct Match {
    int first, second;
    bool inlier; ///< Whether the homography takes one to the other within the threshold; false without a homography.
};

/** All that a registration finds out. */
struct Result {
    bool found;
    std::string reason; ///< Why nothing was found; empty otherwise.
    kelMat H;           ///< 3x3, (x2, y2, 1) ~ H (x1, y1, 1), H[2][2] = 1; empty where nothing was found.
    int tested;         ///< Patches of one picture that were compared with the other one through the homography.
    int agreeing;       ///< Those that look alike there, and lie where the homography says.
    float share;        ///< agreeing / tested, 0 where nothing was tested; see registerPictures().
    /// What error is to be expected of H where the pictures overlap, in pixels of the second one: the root mean square that the
    /// spread of the agreeing patches allows. A scene that is no plane is not known to it.
    float expectedError;
    std::vector<Feature> first, second; ///< Features of both pictures.
    std::vector<Match> matches;         ///< Tentative pairs of these.

    Result() : found(false), tested(0), agreeing(0), share(0), expectedError(0) {}
};

/**
 * Features of a picture of type U8G, S16G, U8XYZ, U8XYZA, U8ZYX, U8ZYXA or U8YUV: YAPE keypoints over two chains of halves, the
 * strongest of every region, each described once for every prevailing direction of the gradients round it (after D. Lowe,
 * "Distinctive image features from scale-invariant keypoints", 2004; roots of shares after R. Arandjelovic and A. Zisserman,
 * "Three things everyone should know to improve object retrieval", 2012).
 *
 * Colours count by their unweighted mean; values of S16G are spread from their least to their greatest over 0 .. 255. Of the
 * options, mostFeatures and workingSize count. A picture without features gives none; where the picture or an option cannot be
 * used, `reason`, unless it is null, receives why, and is left alone otherwise.
 */
KEL_API std::vector<Feature> findFeatures(const kelImage_t* picture, const Options& options = Options(),
                                          std::string* reason = nullptr);

/**
 * Pairs of features that are each other's nearest by the sum of absolute differences, nearer than 0.95 times the next one at
 * another place, seen from either side; where places overlap in a chain, their order decides which is another. Of several pairs
 * that join the same two places the nearest is kept. Marks nothing as inlier.
 */
KEL_API std::vector<Match> matchFeatures(const std::vector<Feature>& first, const std::vector<Feature>& second);

/**
 * Finds the homography that takes the first picture to the second one.
 *
 * Matched features propose it (robust fits, M. Fischler and R. Bolles, "Random sample consensus", 1981); then patches of the
 * coarser picture are looked for in the other one, brought to the same scale and shape by the homography, by normalised
 * correlation, and the homography is fitted anew to where they were found. At least 12 places and 35 % of the patches must
 * agree in the end. Sharp pictures of one plane reach 60 % and more, chance far less; a lower share tells that the scene is no plane, that it
 * moved, or that the pictures are of very different light or sharpness.
 *
 * The same types as findFeatures(); the two may differ in type and size. Neither picture may be null.
 */
KEL_API Result registerPictures(const kelImage_t* first, const kelImage_t* second, const Options& options = Options());

/**
 * A picture made ready once for several registrations: its levels and its features, which take half of the time. A video
 * registers every frame to the one before and moves it along. Nothing of the picture itself is kept, nor pointed to.
 */
class Prepared {
public:
    KEL_API explicit Prepared(const kelImage_t* picture, const Options& options = Options());
    KEL_API Prepared(Prepared&& other) noexcept;
    KEL_API Prepared& operator=(Prepared&& other) noexcept;
    KEL_API ~Prepared();
    /** Why the picture or an option cannot be used, or the bytes of restored(); empty otherwise. */
    KEL_API const std::string& reason() const;
    /**
     * The bytes from which restored() makes the same again, for a file or another machine: about three for each pixel of the
     * working picture, what a larger picture has above that, and 156 for each feature. Empty where there is a reason().
     *
     * All numbers are little-endian: "kelReady"; 32-bit integers: 1 for this form, width, height, how many times the picture was
     * halved, the most features, how many there are; one byte a pixel, row by row, of the working picture and of every
     * smoothed level with its border; the features as in Feature; the FNV-1a hash, by words of 64 bits (zeros fill the
     * last one), of all that stands before it.
     */
    KEL_API std::vector<unsigned char> store() const;
    /**
     * What store() gave these `size` bytes of, on any processor; it registers to the bit as that does. Bytes that are cut,
     * changed, of another form or no such bytes at all make one with a reason().
     */
    KEL_API static Prepared restored(const void* bytes, size_t size);

private:
    friend Result registerPictures(const Prepared& first, const Prepared& second, const Options& options);
    struct Body;
    explicit Prepared(std::unique_ptr<Body> body);
    std::unique_ptr<Body> m_body;
};

/** As registerPictures() on the two pictures, each prepared with its own options; of these here, threshold and views count. */
KEL_API Result registerPictures(const Prepared& first, const Prepared& second, const Options& options = Options());

} // namespace kelRegister

#endif
