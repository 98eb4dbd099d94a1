// Registers two pictures: finds the homography from the first to the second and shows what it found.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <iostream>

#include "common/Draw.h"
#include "common/Program.h"
#include "common/Registration.h"
#include "common/Scene.h"

using namespace kel_examples;

namespace {

constexpr int kMostFeatures = 1200;

struct Options {
    std::vector<std::string> pictures;
    std::string output = "kel-out";
    float threshold = 3;
    unsigned seed = 1;
};

struct Result {
    std::vector<Feature> first, second;
    std::vector<Match> matches;
    Registration registration;
    double milliseconds;
};

Size sizeOf(const Image& image) {
    return {image->width, image->height};
}

Result run(const Image& first, const Image& second, const Options& options) {
    const auto begin = std::chrono::steady_clock::now();
    Result r;
    showProgress("finding keypoints in the first picture");
    r.first = findFeatures(greyOf(first), kMostFeatures);
    showProgress("finding keypoints in the second picture");
    r.second = findFeatures(greyOf(second), kMostFeatures);
    showProgress("matching them");
    r.matches = matchFeatures(r.first, r.second);
    showProgress("fitting a homography");
    std::srand(options.seed);
    r.registration = fitHomography(r.first, r.second, r.matches, sizeOf(first), sizeOf(second), options.threshold);
    r.milliseconds = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - begin).count();
    return r;
}

// Mean distance between where two homographies take the points of a grid over the first picture that fall into the second.
float meanError(kelMat H, kelMat truth, Size first, Size second) {
    float sum = 0;
    int count = 0;
    for (int y = 0; y < first.height; y += 8)
        for (int x = 0; x < first.width; x += 8) {
            float u, v, s, t;
            truth.cvtPoint(static_cast<float>(x), static_cast<float>(y), &u, &v);
            if (u < 0 || v < 0 || u >= static_cast<float>(second.width) || v >= static_cast<float>(second.height))
                continue;
            H.cvtPoint(static_cast<float>(x), static_cast<float>(y), &s, &t);
            sum += std::hypot(s - u, t - v);
            ++count;
        }
    return count ? sum / static_cast<float>(count) : 0;
}

void writePictures(const Image& first, const Image& second, const Result& r, const std::string& folder) {
    showProgress("drawing pictures");
    writePicture(folder + "/keypoints.png", drawKeypoints(first, second, r.first, r.second));
    writePicture(folder + "/matches.png", drawMatches(first, second, r.first, r.second, r.matches, r.registration.inlier));
    if (!r.registration.H.m_IsCreated) { // pictures of an earlier run would mislead
        removeOutdated(folder + "/warped.png");
        removeOutdated(folder + "/mosaic.png");
    } else {
        writePicture(folder + "/warped.png", warpPicture(first, r.registration.H, sizeOf(second)));
        writePicture(folder + "/mosaic.png", drawMosaic(first, second, r.registration.H));
    }
}

void printResult(const Result& r, const kelMat& truth, Size first, Size second) {
    for (int i = 0; i < 9; ++i)
        std::printf(i < 8 ? "%.9g " : "%.9g\n", static_cast<double>(r.registration.H.m_Data[i]));
    std::printf("%zu keypoints, %zu matches, %d inliers, %.1f milliseconds\n", r.first.size() + r.second.size(),
                r.matches.size(), r.registration.inliers, r.milliseconds);
    if (truth.m_IsCreated)
        std::printf("mean error against the truth: %.2f pixels\n",
                    static_cast<double>(meanError(r.registration.H, truth, first, second)));
    flushResults();
}

int registerPictures(const Options& options) {
    Image first, second;
    kelMat truth;
    if (options.pictures.empty()) {
        const Scene scene = renderScene(options.seed);
        first = scene.first.clone();
        second = scene.second.clone();
        truth = scene.H;
    } else {
        first = readPicture(options.pictures[0]);
        second = readPicture(options.pictures[1]);
    }
    makeFolder(options.output);
    const Result r = run(first, second, options);
    showProgress("");
    if (!r.registration.H.m_IsCreated) {
        std::cerr << "register: no reliable homography: " << r.registration.refusal << '\n';
        writePictures(first, second, r, options.output);
        return 2;
    }
    printResult(r, truth, sizeOf(first), sizeOf(second));
    writePictures(first, second, r, options.output);
    showProgress("");
    if (options.pictures.empty())
        for (const char* name : {"keypoints", "matches", "warped", "mosaic"})
            std::printf("wrote %s/%s.png\n", options.output.c_str(), name);
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    Options options;
    CLI::App app(
        "Finds the homography from a first picture to a second one; without pictures, in a rendered scene. Prints its nine "
        "numbers row by row, then keypoints, matches, inliers and milliseconds. Exit status: 0 found, 1 bad input, "
        "2 no reliable homography.",
        "register");
    app.add_option("pictures", options.pictures, "FIRST SECOND: PNG, JPEG, binary PGM or PPM")->expected(0, 2);
    app.add_option("--output", options.output, "folder for keypoints.png, matches.png, warped.png and mosaic.png")
        ->capture_default_str();
    app.add_option("--threshold", options.threshold, "inlier distance in pixels")
        ->check(numberIn(0.1, 100))
        ->capture_default_str();
    app.add_option("--seed", options.seed, "of the random samples, and of the rendered scene")->capture_default_str();
    return runProgram(app, argc, argv, [&] {
        if (options.pictures.size() == 1)
            throw Error("two pictures are needed, FIRST and SECOND");
        return registerPictures(options);
    });
}
