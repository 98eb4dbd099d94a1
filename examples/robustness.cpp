// Measures the robust homography fit on sets of tentative matches with known validation pairs: a table over many seeds.
//
// A set is a file NAME_pts.txt with lines "xA yA 1 xB yB 1 label": label 0 for a tentative match, 1 for a validation pair.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <kel/kelMat.h>
#include <sstream>
#include <vector>

#include "common/Program.h"

namespace {

long draws = 0;

} // namespace

// Counts the draws of the fit: the library draws from rand(), which here passes on to the same generator.
extern "C" int rand() noexcept {
    ++draws;
    return static_cast<int>(random());
}

namespace {

using kel_examples::Error;

struct Options {
    std::string folder;
    float threshold = 3, success = 5;
    int seeds = 500;
    bool swapped = false;
};

struct Sets {
    kelMatCorrespH matches, validation;
};

Sets readSets(const std::filesystem::path& path, bool swapped) {
    std::ifstream in(path);
    if (!in)
        throw Error(path.string() + ": cannot be opened");
    Sets sets;
    std::string line;
    while (std::getline(in, line)) {
        std::istringstream fields(line);
        float x1, y1, w1, x2, y2, w2;
        int label;
        if (!(fields >> x1 >> y1 >> w1 >> x2 >> y2 >> w2 >> label))
            throw Error(path.string() + ": not a line of seven numbers: " + line);
        kelMatCorrespH& set = label ? sets.validation : sets.matches;
        if (swapped)
            set.add(x2, y2, x1, y1);
        else
            set.add(x1, y1, x2, y2);
    }
    if (sets.validation.m_Num == 0)
        throw Error(path.string() + ": holds no validation pairs");
    return sets;
}

float meanDistance(kelMat H, const kelMatCorrespH& pairs) {
    float sum = 0;
    for (int i = 0; i < pairs.m_Num; ++i) {
        float u, v;
        H.cvtPoint(pairs.m_SrcX[i], pairs.m_SrcY[i], &u, &v);
        sum += std::hypot(u - pairs.m_DstX[i], v - pairs.m_DstY[i]);
    }
    return sum / static_cast<float>(pairs.m_Num);
}

void printRow(const std::string& name, Sets& sets, const Options& options) {
    std::vector<float> errors;
    double inlierSum = 0;
    int successes = 0;
    draws = 0;
    for (int seed = 1; seed <= options.seeds; ++seed) {
        std::srand(static_cast<unsigned>(seed));
        kelMatEstimatorH H;
        int inliers = 0;
        if (!H.estimate_byRANSAC_fine(sets.matches, options.threshold, &inliers))
            continue;
        errors.push_back(meanDistance(H, sets.validation));
        inlierSum += inliers;
        successes += errors.back() < options.success;
    }
    std::sort(errors.begin(), errors.end());
    kel_examples::showProgress("");
    const double n = options.seeds, found = std::max<double>(1, static_cast<double>(errors.size()));
    std::printf("| %s | %d | %.0f | %s | %.1f %% | %.1f %% | %.0f |\n", name.c_str(), sets.matches.m_Num, inlierSum / found,
                errors.empty() ? "-" : std::to_string(errors[errors.size() / 2]).substr(0, 5).c_str(),
                100 * static_cast<double>(successes) / n, 100 * (n - static_cast<double>(errors.size())) / n,
                static_cast<double>(draws) / n);
}

int measure(const Options& options) {
    std::vector<std::filesystem::path> files;
    std::error_code code;
    for (const auto& entry : std::filesystem::directory_iterator(options.folder, code))
        if (entry.path().filename().string().find("_pts.txt") != std::string::npos)
            files.push_back(entry.path());
    if (code)
        throw Error(options.folder + ": " + code.message());
    if (files.empty())
        throw Error(options.folder + ": holds no file NAME_pts.txt");
    std::sort(files.begin(), files.end());
    std::printf("| set | pairs | inliers | median error, px | within %.3g px | refused | draws of rand() "
                "|\n|---|---:|---:|---:|---:|---:|---:|\n",
                static_cast<double>(options.success));
    for (const auto& file : files) {
        kel_examples::flushResults();
        kel_examples::showProgress(file.filename().string());
        Sets sets = readSets(file, options.swapped);
        const std::string name = file.filename().string();
        printRow(name.substr(0, name.find("_pts.txt")), sets, options);
    }
    return 0;
}

} // namespace

int main(int argc, char** argv) {
    Options options;
    CLI::App app(
        "Fits homographies to sets of tentative matches (FOLDER/NAME_pts.txt) for many seeds and prints a table: pairs, mean "
        "inliers, "
        "median over the seeds of the mean error on the validation pairs, share of seeds within --success pixels, share of "
        "refusals, mean number of draws.",
        "robustness");
    app.add_option("folder", options.folder, "with the sets")->required();
    app.add_option("--threshold", options.threshold, "inlier distance in pixels")
        ->check(kel_examples::numberIn(0.1, 100))
        ->capture_default_str();
    app.add_option("--success", options.success, "largest mean error of a success in pixels")
        ->check(kel_examples::numberIn(0, 1e6))
        ->capture_default_str();
    app.add_option("--seeds", options.seeds, "number of seeds")->check(CLI::Range(1, 100000))->capture_default_str();
    app.add_flag("--swapped", options.swapped, "fit from the second points to the first");
    return kel_examples::runProgram(app, argc, argv, [&] { return measure(options); });
}
