// Calibrates a random camera from noisy pairs of points in space and in the picture, and compares the result with the truth.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <kel/kelMat.h>
#include <vector>

#include "common/Draw.h"
#include "common/Program.h"

using namespace kel_examples;

namespace {

constexpr int kWidth = 640, kHeight = 480;
constexpr Colour kUsed = {0, 230, 60}, kLeftOut = {230, 40, 40}, kEstimate = {230, 230, 230};

struct Options {
    int pairs = 200;
    float noise = 0.5f, outliers = 0.2f;
    unsigned seed = 1;
    std::string output = "kel-out";
};

float between(float lo, float hi) {
    return lo + (hi - lo) * static_cast<float>(rand()) / static_cast<float>(RAND_MAX);
}

// Nearly normal, with standard deviation 1.
float normal() {
    return static_cast<float>(KEL_RAND_NORMAL(1000)) / 1000;
}

// A camera before an object that is turned any way, 3000 units off.
kelMat randomCamera() {
    kelMatGeneratorP generator;
    generator.setMatViewRandom(900, 1300);
    generator.setMatViewShift(kWidth / 2 + between(-20, 20), kHeight / 2 + between(-20, 20));
    generator.setMatObjectRandom(-40, 40, -60, 60, -170, 170, -150, 150, -100, 100, 2700, 3300);
    kelMat P;
    generator.getMat(P);
    P.setDataUnitize();
    return P;
}

void addPairs(kelMatCorrespP& pairs, std::vector<bool>& spoilt, kelMat P, const Options& options) {
    while (pairs.m_Num < options.pairs) {
        const float X = between(-500, 500), Y = between(-500, 500), Z = between(-500, 500);
        float x, y;
        P.cvtPoint(X, Y, Z, &x, &y);
        spoilt.push_back(between(0, 1) < options.outliers);
        if (spoilt.back()) {
            x = between(0, kWidth);
            y = between(0, kHeight);
        } else {
            x += options.noise * normal();
            y += options.noise * normal();
        }
        pairs.add(X, Y, Z, x, y);
    }
}

// Names and values of what a projection decomposes into.
struct Parameter {
    const char *name, *unit;
    float value;
};

std::vector<Parameter> parametersOf(const kelMat& P) {
    kelMat A, R, T;
    P.getDecomposedMatrix_ART_3x4(A, R, T);
    float rx, ry, rz;
    R.getAngleFromRotationMatrix_XYZ_3x3(rx, ry, rz);
    return {{"focal length x", "px", A[0][0]},
            {"focal length y", "px", A[1][1]},
            {"principal point x", "px", A[0][2]},
            {"principal point y", "px", A[1][2]},
            {"skew", "px", A[0][1]},
            {"rotation x", "deg", rx},
            {"rotation y", "deg", ry},
            {"rotation z", "deg", rz},
            {"translation x", "units", T[0][0]},
            {"translation y", "units", T[1][0]},
            {"translation z", "units", T[2][0]}};
}

void printTable(const kelMat& truth, const kelMat& estimate) {
    const std::vector<Parameter> expected = parametersOf(truth), found = parametersOf(estimate);
    std::printf("%-18s %-6s %12s %12s %12s\n", "parameter", "unit", "truth", "estimate", "error");
    for (size_t i = 0; i < expected.size(); ++i) {
        float error = found[i].value - expected[i].value;
        if (std::string(expected[i].unit) == "deg") // angles meet again after a full turn
            error = std::remainder(error, 360.0f);
        std::printf("%-18s %-6s %12.4f %12.4f %12.4f\n", expected[i].name, expected[i].unit,
                    static_cast<double>(expected[i].value), static_cast<double>(found[i].value), static_cast<double>(error));
    }
}

// Measured points as crosses, green for inliers and red for others; circles where the estimate takes the points in space.
Image drawReprojection(const kelMatCorrespP& pairs, kelMat P, const std::vector<bool>& inlier) {
    Image picture(kWidth, kHeight, KEL_PIXEL_TYPE_U8ZYX);
    std::fill_n(picture->data, picture->size, static_cast<unsigned char>(24));
    for (int i = 0; i < pairs.m_Num; ++i) {
        const float x = pairs.m_ImgX[i], y = pairs.m_ImgY[i];
        const Colour colour = inlier[i] ? kUsed : kLeftOut;
        drawLine(picture, x - 3, y, x + 3, y, colour);
        drawLine(picture, x, y - 3, x, y + 3, colour);
        float u, v;
        P.cvtPoint(pairs.m_ObjX[i], pairs.m_ObjY[i], pairs.m_ObjZ[i], &u, &v);
        if (std::fabs(u) < 1e5f && std::fabs(v) < 1e5f)
            drawCircle(picture, u, v, 5, kEstimate);
    }
    drawText(picture, 8, 8, "USED", kUsed);
    drawText(picture, 8, 28, "LEFT OUT", kLeftOut);
    drawText(picture, 8, 48, "ESTIMATE", kEstimate);
    return picture;
}

int calibrate(const Options& options) {
    srand(options.seed);
    const kelMat truth = randomCamera();
    kelMatCorrespP pairs;
    std::vector<bool> spoilt;
    addPairs(pairs, spoilt, truth, options);

    const float threshold = std::max(2.0f, 4 * options.noise);
    kelMatEstimatorP estimate;
    const bool fitted = estimate.estimate_byRANSAC_fine(pairs, threshold) &&
                        std::all_of(estimate.m_Data, estimate.m_Data + 12, [](float v) { return std::isfinite(v); });
    std::vector<bool> inlier(static_cast<size_t>(pairs.m_Num));
    const int inliers = fitted ? judgeInliers(estimate, pairs, inlier, threshold) : 0;
    if (inliers < 2 * 6 && inliers < pairs.m_Num) {
        std::cerr << "calibrate: no reliable projection among " << pairs.m_Num << " pairs\n";
        return 2;
    }
    float sum = 0;
    for (int i = 0; i < pairs.m_Num; ++i)
        if (inlier[i]) {
            float x, y;
            estimate.cvtPoint(pairs.m_ObjX[i], pairs.m_ObjY[i], pairs.m_ObjZ[i], &x, &y);
            sum += std::hypot(x - pairs.m_ImgX[i], y - pairs.m_ImgY[i]);
        }
    makeFolder(options.output);
    printTable(truth, estimate);
    std::printf("%d of %d pairs fit (%d were spoilt), mean reprojection error %.3f px\n", inliers, pairs.m_Num,
                static_cast<int>(std::count(spoilt.begin(), spoilt.end(), true)),
                static_cast<double>(sum / static_cast<float>(inliers)));
    flushResults();
    writePicture(options.output + "/reprojection.png", drawReprojection(pairs, estimate, inlier));
    std::printf("wrote %s/reprojection.png\n", options.output.c_str());
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    Options options;
    CLI::App app("Works on rendered points: makes a random camera and noisy pairs of points, some of them spoilt, fits the "
                 "projection robustly and splits it into "
                 "intrinsics, rotation and translation. Exit status: 0 fitted, 1 bad input, 2 no reliable projection.",
                 "calibrate");
    app.add_option("--pairs", options.pairs, "number of pairs")
        ->check(CLI::Range(6, int(KEL_CORRESP_MAX)))
        ->capture_default_str();
    app.add_option("--noise", options.noise, "standard deviation of the image points in pixels")
        ->check(numberIn(0, 50))
        ->capture_default_str();
    app.add_option("--outliers", options.outliers, "share of spoilt pairs")->check(numberIn(0, 1))->capture_default_str();
    app.add_option("--seed", options.seed, "of everything random")->capture_default_str();
    app.add_option("--output", options.output, "folder for reprojection.png")->capture_default_str();
    return runProgram(app, argc, argv, [&] { return calibrate(options); });
}
