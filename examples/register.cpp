// Registers two pictures: finds the homography from the first to the second, and shows what it found.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <iostream>

#include <kel/kelRegister.h>

#include "common/Draw.h"
#include "common/Program.h"
#include "common/Report.h"
#include "common/Scene.h"
#include "common/Warp.h"

using namespace kel_examples;
using kelRegister::Feature;
using kelRegister::Match;
using kelRegister::Result;

namespace {

struct Options {
    std::vector<std::string> pictures;
    std::string output, command;
    kelRegister::Options registration;
    unsigned seed = 1;
    bool json = false;
};

struct Timed {
    Result result;
    int inliers;
    double milliseconds;
};

Timed run(const Image& first, const Image& second, const Options& options) {
    showProgress("registering");
    const auto begin = std::chrono::steady_clock::now();
    std::srand(options.seed);
    Timed timed{kelRegister::registerPictures(first.get(), second.get(), options.registration), 0, 0};
    timed.milliseconds = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - begin).count();
    const std::vector<Match>& matches = timed.result.matches;
    timed.inliers = static_cast<int>(std::count_if(matches.begin(), matches.end(), [](const Match& m) { return m.inlier; }));
    showProgress("");
    return timed;
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

template <class... Values> std::string text(const char* format, Values... values) {
    char line[400];
    std::snprintf(line, sizeof line, format, values...);
    return line;
}

std::string numbersOf(const kelMat& H, const char* between) {
    std::string numbers;
    for (int i = 0; i < 9; ++i)
        numbers += text("%s%.9g", i ? between : "", static_cast<double>(H.m_Data[i]));
    return numbers;
}

std::string countsOf(const Timed& t) {
    return text("%zu keypoints, %zu matches, %d inliers, %.1f milliseconds", t.result.first.size() + t.result.second.size(),
                t.result.matches.size(), t.inliers, t.milliseconds);
}

std::string agreementOf(const Result& r) {
    return text("%d of %d patches agree (%.0f %%), expected error %.2f pixels", r.agreeing, r.tested,
                100 * static_cast<double>(r.share), static_cast<double>(r.expectedError));
}

// ---- JSON -------------------------------------------------------------------------------------------------------------------

void printFeatures(const char* name, const std::vector<Feature>& features) {
    std::printf(",\n\"%s\": [", name);
    const char* between = "\n";
    for (const Feature& f : features) {
        std::printf("%s{\"x\": %.9g, \"y\": %.9g, \"scale\": %.9g, \"angle\": %.9g, \"squeeze\": %.9g, \"direction\": %.9g, "
                    "\"score\": %d, \"descriptor\": \"",
                    between, static_cast<double>(f.x), static_cast<double>(f.y), static_cast<double>(f.scale),
                    static_cast<double>(f.angle), static_cast<double>(f.squeeze), static_cast<double>(f.direction), f.score);
        for (const unsigned char byte : f.descriptor)
            std::printf("%02x", byte);
        std::printf("\"}");
        between = ",\n";
    }
    std::printf("]");
}

// The library's reasons are plain words, without anything that JSON would have to escape.
void printJson(const Timed& t) {
    const Result& r = t.result;
    std::printf("{\"found\": %s,\n\"reason\": \"%s\",\n\"homography\": ", r.found ? "true" : "false", r.reason.c_str());
    std::printf("%s", r.found ? ("[" + numbersOf(r.H, ", ") + "]").c_str() : "null");
    std::printf(",\n\"tested\": %d,\n\"agreeing\": %d,\n\"share\": %.9g,\n\"expectedError\": ", r.tested, r.agreeing,
                static_cast<double>(r.share));
    std::printf(std::isfinite(r.expectedError) ? "%.9g" : "null", static_cast<double>(r.expectedError));
    std::printf(",\n\"milliseconds\": %.9g,\n\"matches\": [", t.milliseconds);
    for (size_t i = 0; i < r.matches.size(); ++i)
        std::printf("%s{\"first\": %d, \"second\": %d, \"inlier\": %s}", i ? ",\n" : "\n", r.matches[i].first,
                    r.matches[i].second, r.matches[i].inlier ? "true" : "false");
    std::printf("]");
    printFeatures("first", r.first);
    printFeatures("second", r.second);
    std::printf("}\n");
}

// ---- pictures ---------------------------------------------------------------------------------------------------------------

// Names of the files that were written, the page first.
std::vector<std::string> writePictures(const Image& first, const Image& second, const Timed& t, const Options& options) {
    showProgress("drawing pictures");
    const Result& r = t.result;
    const auto file = [&](const char* name) { return options.output + "/" + name; };
    const Image keypoints = drawKeypoints(first, second, r), matches = drawMatches(first, second, r);
    Image warped, mosaic;
    Report report;
    report.command = options.command;
    report.verdict = r.found ? "The homography from the first picture to the second" : "No reliable homography: " + r.reason;
    report.facts = {{"result", countsOf(t)}, {"agreement", agreementOf(r)}};
    std::vector<std::string> written = {file("report.html"), file("keypoints.png"), file("matches.png")};
    writePicture(file("keypoints.png"), keypoints);
    writePicture(file("matches.png"), matches);
    if (r.found) {
        warped = warpPicture(first, r.H, sizeOf(second));
        mosaic = drawMosaic(first, second, r.H);
        writePicture(file("warped.png"), warped);
        writePicture(file("mosaic.png"), mosaic);
        written.insert(written.end(), {file("warped.png"), file("mosaic.png")});
        report.facts.emplace_back("homography", numbersOf(r.H, " "));
        report.second = &second;
        report.warped = &warped;
        report.pictures.emplace_back("Both as one, in the second one's frame", &mosaic);
    } else { // pictures of an earlier run would mislead
        removeOutdated(file("warped.png"));
        removeOutdated(file("mosaic.png"));
    }
    report.pictures.emplace_back(r.found ? "Matches: a sample of the inliers in colour, others in grey" : "Matches: a sample",
                                 &matches);
    report.pictures.emplace_back("Keypoints", &keypoints);
    writeReport(file("report.html"), report);
    showProgress("");
    return written;
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
    if (!options.output.empty())
        makeFolder(options.output);
    const Timed t = run(first, second, options);
    if (!t.result.found)
        std::cerr << "register: no reliable homography: " << t.result.reason << '\n';
    if (options.json) {
        printJson(t);
    } else if (t.result.found) {
        std::printf("%s\n%s\n%s\n", numbersOf(t.result.H, " ").c_str(), countsOf(t).c_str(), agreementOf(t.result).c_str());
        if (truth.m_IsCreated)
            std::printf("mean error against the truth: %.2f pixels\n",
                        static_cast<double>(meanError(t.result.H, truth, sizeOf(first), sizeOf(second))));
    }
    flushResults();
    if (!options.output.empty())
        for (const std::string& name : writePictures(first, second, t, options))
            if (t.result.found && !options.json)
                std::printf("wrote %s\n", name.c_str());
    return t.result.found ? 0 : 2;
}

} // namespace

int main(int argc, char** argv) {
    Options options;
    kelRegister::Options& registration = options.registration;
    for (int i = 0; i < argc; ++i)
        options.command += std::string(i ? " " : "") + argv[i];
    CLI::App app(
        "Finds the homography from a first picture to a second one; without pictures, in a rendered scene. Prints its nine "
        "numbers row by row, then keypoints, matches, inliers and milliseconds, then how far the pictures agree. Exit status: "
        "0 found, 1 bad input, 2 no reliable homography.",
        "register");
    app.add_option("pictures", options.pictures, "FIRST SECOND: PNG, JPEG, binary PGM or PPM")->expected(0, 2);
    app.add_option("--output", options.output,
                   "folder for report.html, a page to look at, and keypoints.png, matches.png, warped.png and mosaic.png");
    app.add_flag("--json", options.json, "print everything that was found as one JSON object instead");
    app.add_option("--threshold", registration.threshold, "inlier distance in pixels")
        ->check(numberIn(0.1, 100))
        ->capture_default_str();
    app.add_option("--features", registration.mostFeatures, "most keypoints of a picture")
        ->check(CLI::Range(50, 5000))
        ->capture_default_str();
    app.add_option("--working-size", registration.workingSize, "pictures are halved until no side is longer, in pixels")
        ->check(CLI::Range(200, 8000))
        ->capture_default_str();
    app.add_flag("!--no-views", registration.views, "give up where steep tilts would have to be tried");
    app.add_option("--seed", options.seed, "of the random samples, and of the rendered scene")->capture_default_str();
    return runProgram(app, argc, argv, [&] {
        if (options.pictures.size() == 1)
            throw Error("two pictures are needed, FIRST and SECOND");
        return registerPictures(options);
    });
}
