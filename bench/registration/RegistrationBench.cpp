// How far registration can be relied on, beside chains of ORB and of SIFT: pairs of photographs with known homographies, exact
// warps of pictures, and pictures that do not belong together. Prints a table for Markdown, a row for each kind of pair.
#include <CLI/CLI.hpp>
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iostream>
#include <map>
#include <random>
#include <set>

#include <kel/kelRegister.h>
#include <opencv2/calib3d.hpp>
#include <opencv2/features2d.hpp>
#include <opencv2/imgproc.hpp>

#include "common/Picture.h"
#include "common/Scene.h"
#include "support/Warps.h"

using namespace kel_examples;
using namespace kel_test;

namespace {

constexpr int kMostPixels = 1000;        // of a warped picture, either way
constexpr double kFound = 5, kWrong = 6; // mean error in pixels: below the one found, from the other on wrong

struct Case {
    std::string kind, name;
    const kelImage_t *first, *second;
    Plane truth; // of pictures that belong together
    bool belongs;
};

struct Answer {
    bool found;
    Plane H;
    double share, expected;
    std::string reason;
};

using Method = std::function<Answer(const Case&)>;

Answer byKel(const Case& c) {
    const kelRegister::Result r = kelRegister::registerPictures(c.first, c.second);
    Answer answer = {r.found, Plane::scale(1, 1), r.share, r.expectedError, r.reason};
    if (r.found)
        std::copy_n(r.H.m_Data, 9, answer.H.m);
    return answer;
}

cv::Mat matOf(const kelImage_t* image) {
    return cv::Mat(image->height, image->width, CV_8U, image->data, static_cast<size_t>(image->step));
}

// The usual chain: nearest neighbours, their ratio, a robust fit, and at least twelve inliers.
Answer byChain(const cv::Ptr<cv::Feature2D>& detector, int norm, const Case& c) {
    std::vector<cv::KeyPoint> first, second;
    cv::Mat ofFirst, ofSecond;
    detector->detectAndCompute(matOf(c.first), cv::noArray(), first, ofFirst);
    detector->detectAndCompute(matOf(c.second), cv::noArray(), second, ofSecond);
    Answer answer = {false, Plane::scale(1, 1), 0, 0, ""};
    if (first.size() < 2 || second.size() < 2)
        return answer;
    std::vector<std::vector<cv::DMatch>> matches;
    cv::BFMatcher(norm).knnMatch(ofFirst, ofSecond, matches, 2);
    std::vector<cv::Point2f> from, to;
    for (const std::vector<cv::DMatch>& m : matches)
        if (m[0].distance < 0.8f * m[1].distance) {
            from.push_back(first[m[0].queryIdx].pt);
            to.push_back(second[m[0].trainIdx].pt);
        }
    if (from.size() < 4)
        return answer;
    cv::Mat inliers;
    const cv::Mat H = cv::findHomography(from, to, cv::RANSAC, 3, inliers);
    if (H.empty() || cv::countNonZero(inliers) < 12)
        return answer;
    answer.found = true;
    std::copy_n(H.ptr<double>(), 9, answer.H.m);
    return answer;
}

// ---- cases ------------------------------------------------------------------------------------------------------------------

class Cases {
public:
    std::vector<Case> all;
    const kelImage_t* keep(Image image) {
        m_images.push_back(std::move(image));
        return m_images.back().get();
    }
    const std::vector<std::pair<std::string, const kelImage_t*>>& bases() const { return m_bases; }
    void addBase(const std::string& name, const kelImage_t* image) { m_bases.emplace_back(name, image); }
    void both(const std::string& kind, const std::string& name, const kelImage_t* first, const kelImage_t* second,
              const Plane& H) {
        all.push_back({kind, name, first, second, H, true});
        all.push_back({kind, name + " back", second, first, H.inverse(), true});
    }

private:
    std::vector<Image> m_images;
    std::vector<std::pair<std::string, const kelImage_t*>> m_bases;
};

std::string fileOf(const std::filesystem::path& folder, const std::string& name) {
    for (const char* extension : {".pgm", ".ppm", ".png", ".jpg"})
        if (std::filesystem::exists(folder / (name + extension)))
            return (folder / (name + extension)).string();
    throw Error(folder.string() + ": there is no picture " + name);
}

// Every NAME1_to_NAME2.txt of a folder with its two pictures.
void addPairs(Cases& cases, const std::string& folder) {
    std::vector<std::filesystem::path> files;
    for (const auto& entry : std::filesystem::directory_iterator(folder))
        if (entry.path().extension() == ".txt" && entry.path().stem().string().find("_to_") != std::string::npos)
            files.push_back(entry.path());
    std::sort(files.begin(), files.end());
    for (const std::filesystem::path& file : files) {
        const std::string stem = file.stem().string();
        const size_t middle = stem.find("_to_");
        Plane H;
        std::ifstream stream(file);
        for (double& value : H.m)
            if (!(stream >> value))
                throw Error(file.string() + ": does not hold nine numbers");
        const std::string a = stem.substr(0, middle), b = stem.substr(middle + 4);
        const kelImage_t* const first = cases.keep(greyOf(readPicture(fileOf(folder, a))));
        const kelImage_t* const second = cases.keep(greyOf(readPicture(fileOf(folder, b))));
        cases.addBase(a, first);
        cases.both("photographs", stem, first, second, H);
    }
}

void addScenes(Cases& cases) {
    for (const unsigned seed : {1u, 2u, 3u}) {
        const Scene scene = renderScene(seed);
        cases.addBase("scene" + std::to_string(seed), cases.keep(greyOf(scene.first)));
    }
}

void addWarps(Cases& cases, int each) {
    std::mt19937 numbers(7);
    const auto between = [&](double lo, double hi) { return lo + (hi - lo) * (numbers() % 65536) / 65535.0; };
    const auto add = [&](const std::string& kind, const std::pair<std::string, const kelImage_t*>& base, double tilt,
                         double direction, double turned, double scale) {
        Plane H;
        char name[100];
        std::snprintf(name, sizeof name, "%s tilt %.2f by %.0f turn %.0f scale %.2f", base.first.c_str(), tilt, direction,
                      turned, scale);
        const kelImage_t* const image = cases.keep(warped(base.second, {tilt, direction, turned, scale}, kMostPixels, H));
        cases.both(kind, name, base.second, image, H);
    };
    for (const auto& base : cases.bases())
        for (int i = 0; i < each; ++i) {
            add("turn", base, 1, 0, between(-180, 180), between(0.95, 1.05));
            add("scale to 4", base, 1, 0, between(-180, 180), std::pow(2, between(-2, 2)));
            add("scale 1/4", base, 1, 0, between(-180, 180), 0.25);
            add("scale 4", base, 1, 0, between(-180, 180), 4);
            add("tilt to 2", base, between(1, 2), between(0, 180), between(-180, 180), between(0.8, 1.25));
            add("tilt 2 to 3", base, between(2, 3), between(0, 180), between(-180, 180), between(0.9, 1.5));
            add("tilt 3", base, 3, between(0, 180), between(-180, 180), between(0.9, 1.5));
            add("tilt 4 axes", base, 4, 90 * (numbers() % 2), 0, between(1, 1.5));
        }
}

// Photographs made harder: the second one blurred, darkened, noisy, partly hidden, and seen from yet another side.
void addHarder(Cases& cases, int each) {
    std::mt19937 numbers(11);
    const auto between = [&](double lo, double hi) { return lo + (hi - lo) * (numbers() % 65536) / 65535.0; };
    const std::vector<Case> plain = cases.all;
    for (const Case& c : plain)
        for (int i = 0; i < each && c.kind == "photographs"; ++i) {
            Plane H;
            Image image =
                warped(c.second, {between(1, 1.6), between(0, 180), between(-180, 180), between(0.6, 1.3)}, kMostPixels, H);
            cv::Mat view = matOf(image.get());
            cv::Mat(view).copyTo(view);
            const double gamma = between(0.5, 2), gain = between(0.5, 1.1), noise = between(0, 8);
            for (int y = 0; y < view.rows; ++y)
                for (int x = 0; x < view.cols; ++x) {
                    uint8_t& p = view.at<uint8_t>(y, x);
                    p = cv::saturate_cast<uint8_t>(255 * gain * std::pow(p / 255.0, gamma) + between(-noise, noise));
                }
            for (int hidden = 0; hidden < 3; ++hidden) { // a grey board
                const int x = static_cast<int>(between(0, view.cols * 0.8)), y = static_cast<int>(between(0, view.rows * 0.8));
                for (int v = y; v < y + view.rows / 5; ++v)
                    std::fill_n(view.ptr<uint8_t>(v) + x, view.cols / 5, static_cast<uint8_t>(90));
            }
            const kelImage_t* const kept = cases.keep(greyOf(image));
            cases.all.push_back({"harder", c.name + " " + std::to_string(i), c.first, kept, H * c.truth, true});
            cases.all.push_back(
                {"harder", c.name + " " + std::to_string(i) + " back", kept, c.first, (H * c.truth).inverse(), true});
        }
}

// The same picture out of focus, turned a little.
void addBlurred(Cases& cases) {
    for (const auto& base : cases.bases())
        for (const double sigma : {2.0, 3.0, 4.0, 5.0, 6.0}) {
            Plane H;
            Image image = warped(base.second, {1.1, 20, 10 * sigma, 0.9}, kMostPixels, H);
            cv::Mat view = matOf(image.get());
            cv::GaussianBlur(view, view, cv::Size(), sigma);
            cases.both("blurred", base.first + " by " + std::to_string(sigma), base.second, cases.keep(greyOf(image)), H);
        }
}

// Pictures of nothing in particular.
void addTextures(Cases& cases, std::vector<std::pair<std::string, const kelImage_t*>>& strangers) {
    std::mt19937 numbers(3);
    const auto texture = [&](const char* name, const std::function<int(int, int)>& value) {
        Image image(640, 480, KEL_PIXEL_TYPE_U8G);
        for (int y = 0; y < 480; ++y)
            for (int x = 0; x < image->step; ++x)
                image->data[y * image->step + x] = static_cast<uint8_t>(value(x, y));
        strangers.emplace_back(name, cases.keep(std::move(image)));
    };
    texture("flat", [](int, int) { return 128; });
    texture("noise", [&](int, int) { return static_cast<int>(numbers() % 256); });
    texture("other noise", [&](int, int) { return static_cast<int>(numbers() % 256); });
    texture("checks of 40", [](int x, int y) { return (x / 40 + y / 40) % 2 ? 220 : 40; });
    texture("checks of 16", [](int x, int y) { return (x / 16 + y / 16) % 2 ? 200 : 60; });
    texture("bricks", [&](int x, int y) {
        return y % 24 < 3 || (x + y / 24 % 2 * 32) % 64 < 3 ? 200 : 90 + static_cast<int>(numbers() % 30);
    });
    texture("stripes", [](int x, int) { return static_cast<int>(128 + 100 * std::sin(x * 0.2)); });
    texture("dots", [](int x, int y) { return std::hypot(x % 32 - 16, y % 32 - 16) < 8 ? 240 : 20; });
    texture("ramp", [](int x, int y) { return (x + y) * 255 / 1120; });
}

// All bases, textures and warps of bases against each other, where they are of different origin.
void addStrangers(Cases& cases, int most) {
    std::vector<std::pair<std::string, const kelImage_t*>> strangers = cases.bases();
    addTextures(cases, strangers);
    std::mt19937 numbers(5);
    for (const auto& base : cases.bases()) {
        Plane H;
        strangers.emplace_back(base.first, cases.keep(warped(base.second,
                                                             {1 + numbers() % 3 * 0.5, 1.0 * (numbers() % 180),
                                                              1.0 * (numbers() % 360), 0.5 + 0.25 * (numbers() % 4)},
                                                             kMostPixels, H)));
    }
    std::vector<Case> pairs;
    for (const auto& a : strangers)
        for (const auto& b : strangers)
            if (a.first != b.first)
                pairs.push_back({"strangers", a.first + " and " + b.first, a.second, b.second, Plane::scale(1, 1), false});
    std::shuffle(pairs.begin(), pairs.end(), numbers);
    pairs.resize(std::min(pairs.size(), static_cast<size_t>(most)));
    cases.all.insert(cases.all.end(), pairs.begin(), pairs.end());
}

// ---- measuring --------------------------------------------------------------------------------------------------------------

struct Row {
    int pairs = 0, found = 0, wrong = 0, refused = 0;
    std::vector<double> errors, milliseconds;
    double leastShare = 1, mostShare = 0; // of what was found, of what was refused
};

double processorTime() {
    return 1e3 * static_cast<double>(std::clock()) / CLOCKS_PER_SEC;
}

double median(std::vector<double> values) {
    if (values.empty())
        return 0;
    std::nth_element(values.begin(), values.begin() + static_cast<ptrdiff_t>(values.size() / 2), values.end());
    return values[values.size() / 2];
}

void measure(const char* name, const Method& method, const Cases& cases, const std::set<std::string>& kinds, int seeds,
             bool verbose) {
    std::map<std::string, Row> rows;
    std::vector<std::string> order;
    for (const Case& c : cases.all) {
        if (!kinds.empty() && !kinds.count(c.kind))
            continue;
        if (!rows.count(c.kind))
            order.push_back(c.kind);
        Row& row = rows[c.kind];
        const int repeats = c.kind == "photographs" || c.kind == "harder" ? seeds : 1;
        for (int seed = 1; seed <= repeats; ++seed) {
            std::srand(static_cast<unsigned>(seed));
            cv::setRNGSeed(seed);
            const double begin = processorTime();
            const Answer answer = method(c);
            const double time = processorTime() - begin;
            const double error = !answer.found ? -1 : c.belongs ? meanError(answer.H, c.truth, c.first, c.second) : 1000;
            ++row.pairs;
            row.milliseconds.push_back(time);
            row.refused += !answer.found;
            row.found += answer.found && error < kFound;
            row.wrong += answer.found && error >= kWrong;
            if (answer.found) {
                row.errors.push_back(error);
                row.leastShare = std::min(row.leastShare, answer.share);
            } else {
                row.mostShare = std::max(row.mostShare, answer.share);
            }
            const bool bad = c.belongs ? !answer.found || error >= kFound : answer.found;
            if (verbose || (bad && seed == 1 && std::string(name) == "kel"))
                std::printf("  %s: %s, seed %d: %s, error %.2f, expected %.2f, share %.2f, %.0f ms %s\n", c.kind.c_str(),
                            c.name.c_str(), seed, answer.found ? "found" : "refused", error, answer.expected, answer.share,
                            time, answer.reason.c_str());
        }
    }
    std::printf(
        "\n| %s | pairs | found | wrong | refused | median error, px | largest | ms, mean | most | found share | refused share "
        "|\n|---|---:|---:|---:|---:|---:|---:|---:|---:|---:|---:|\n",
        name);
    for (const std::string& kind : order) {
        const Row& r = rows[kind];
        double sum = 0;
        for (const double ms : r.milliseconds)
            sum += ms;
        const bool any = !r.errors.empty();
        std::printf("| %s | %d | %d | %d | %d | %.2f | %.2f | %.0f | %.0f | %.2f | %.2f |\n", kind.c_str(), r.pairs, r.found,
                    r.wrong, r.refused, median(r.errors), any ? *std::max_element(r.errors.begin(), r.errors.end()) : 0,
                    sum / r.pairs, *std::max_element(r.milliseconds.begin(), r.milliseconds.end()), any ? r.leastShare : 0,
                    r.mostShare);
    }
    std::fflush(stdout);
}

} // namespace

int main(int argc, char** argv) {
    std::string folder;
    int seeds = 3, warps = 1, strangers = 400, harder = 1;
    bool peers = false, verbose = false;
    std::set<std::string> kinds;
    CLI::App app("Measures registration and prints a table for Markdown; what kel misses is listed before it.",
                 "kel_registration_bench");
    app.add_option("folder", folder, "with pictures NAME1 and NAME2 and their homography NAME1_to_NAME2.txt");
    app.add_option("--seeds", seeds, "for each pair of photographs")->capture_default_str();
    app.add_option("--warps", warps, "of each kind for each picture")->capture_default_str();
    app.add_option("--harder", harder, "variants of each pair of photographs")->capture_default_str();
    app.add_option("--strangers", strangers, "pairs of pictures that do not belong together")->capture_default_str();
    app.add_option("--kind", kinds, "only the row of this name; may be repeated")->allow_extra_args(false);
    app.add_flag("--peers", peers, "beside chains of ORB and SIFT");
    app.add_flag("--verbose", verbose, "a line for every pair");
    CLI11_PARSE(app, argc, argv);
    cv::setNumThreads(1);
    try {
        Cases cases;
        if (!folder.empty())
            addPairs(cases, folder);
        addHarder(cases, harder);
        addScenes(cases);
        addWarps(cases, warps);
        addBlurred(cases);
        addStrangers(cases, strangers);
        measure("kel", byKel, cases, kinds, seeds, verbose);
        if (peers) {
            const cv::Ptr<cv::Feature2D> orb = cv::ORB::create(2000), sift = cv::SIFT::create();
            measure(
                "ORB", [&](const Case& c) { return byChain(orb, cv::NORM_HAMMING, c); }, cases, kinds, seeds, false);
            measure(
                "SIFT", [&](const Case& c) { return byChain(sift, cv::NORM_L2, c); }, cases, kinds, seeds, false);
        }
    } catch (const std::exception& error) {
        std::cerr << "kel_registration_bench: " << error.what() << '\n';
        return 1;
    }
}
