// Homography estimation beside OpenCV's findHomography in all its methods and beside least squares by normal equations.
#include "Bench.h"

#include <cmath>
#include <cstdlib>
#include <kel/kelMat.h>
#include <random>

#if KEL_BENCH_OPENCV
#include <opencv2/calib3d.hpp>
#endif
#if KEL_BENCH_EIGEN
#include <Eigen/Dense>
#endif

namespace {

using namespace kel_bench;

// Pairs under one homography, half a pixel of noise, some of them anywhere.
struct Pairs {
    kelMatCorrespH set;
#if KEL_BENCH_OPENCV
    std::vector<cv::Point2f> first, second;
#endif
};

std::shared_ptr<Pairs> makePairs(int n, double outliers) {
    auto pairs = std::make_shared<Pairs>();
    std::mt19937 random(7);
    std::uniform_real_distribution<float> x(0, 640), y(0, 480), share(0, 1), noise(-0.8f, 0.8f);
    for (int i = 0; i < n; ++i) {
        const float px = x(random), py = y(random), w = 1e-4f * px - 5e-5f * py + 1;
        float u = (0.9f * px - 0.2f * py + 60) / w + noise(random), v = (0.15f * px + 1.1f * py - 30) / w + noise(random);
        if (share(random) < outliers) {
            u = x(random);
            v = y(random);
        }
        pairs->set.add(px, py, u, v);
#if KEL_BENCH_OPENCV
        pairs->first.emplace_back(px, py);
        pairs->second.emplace_back(u, v);
#endif
    }
    return pairs;
}

#if KEL_BENCH_OPENCV
Run opencv(int n, double outliers, int method, const std::string& name, const std::string& differs) {
    return {name,
            [=] {
                return Body(
                    [pairs = makePairs(n, outliers), method] { cv::findHomography(pairs->first, pairs->second, method, 2.0); });
            },
            differs};
}
#endif

#if KEL_BENCH_EIGEN
// Normalised direct linear transformation through the 9x9 normal equations: less exact, and the least work there is.
void normalEquations(const kelMatCorrespH& s) {
    const int n = s.m_Num;
    float centre[4] = {}, distance[2] = {};
    const float* const values[4] = {s.m_SrcX.data(), s.m_SrcY.data(), s.m_DstX.data(), s.m_DstY.data()};
    for (int k = 0; k < 4; ++k) {
        for (int i = 0; i < n; ++i)
            centre[k] += values[k][i];
        centre[k] /= static_cast<float>(n);
    }
    for (int i = 0; i < n; ++i)
        for (int k = 0; k < 2; ++k)
            distance[k] += std::hypot(values[2 * k][i] - centre[2 * k], values[2 * k + 1][i] - centre[2 * k + 1]);
    const float s1 = std::sqrt(2.0f) * static_cast<float>(n) / distance[0],
                s2 = std::sqrt(2.0f) * static_cast<float>(n) / distance[1];
    Eigen::Matrix<float, 9, 9> M = Eigen::Matrix<float, 9, 9>::Zero();
    for (int i = 0; i < n; ++i) {
        const float x = (values[0][i] - centre[0]) * s1, y = (values[1][i] - centre[1]) * s1;
        const float u = (values[2][i] - centre[2]) * s2, v = (values[3][i] - centre[3]) * s2;
        Eigen::Matrix<float, 9, 1> a, b;
        a << x, y, 1, 0, 0, 0, -u * x, -u * y, -u;
        b << 0, 0, 0, x, y, 1, -v * x, -v * y, -v;
        M.noalias() += a * a.transpose() + b * b.transpose();
    }
    volatile float sink = Eigen::SelfAdjointEigenSolver<Eigen::Matrix<float, 9, 9>>(M).eigenvectors()(0, 0);
    (void)sink;
}
#endif

void addLines() {
    for (const int n : {100, 1000, 10000})
        for (const double outliers : {0.2, 0.5}) {
            std::vector<Run> runs = {{"kel", [=] {
                                          return Body([pairs = makePairs(n, outliers)] {
                                              kelMatEstimatorH H;
                                              H.estimate_byRANSAC_fine(pairs->set, 2, nullptr);
                                          });
                                      }}};
#if KEL_BENCH_OPENCV
            runs.push_back(opencv(n, outliers, cv::RANSAC, "OpenCV RANSAC", "another sampling and refinement"));
            runs.push_back(opencv(n, outliers, cv::RHO, "OpenCV RHO", "another sampling and refinement"));
            runs.push_back(opencv(n, outliers, cv::USAC_DEFAULT, "OpenCV USAC", "another sampling and refinement"));
            runs.push_back(opencv(n, outliers, cv::USAC_FAST, "OpenCV USAC_FAST", "another sampling and refinement"));
            runs.push_back(opencv(n, outliers, cv::USAC_MAGSAC, "OpenCV USAC_MAGSAC", "another sampling and refinement"));
#endif
            add("RANSAC homography, " + std::to_string(static_cast<int>(100 * outliers)) + " % outliers",
                "n=" + std::to_string(n), {0, 0}, runs);
        }
    for (const int n : {10, 100, 1000, 10000}) {
        std::vector<Run> runs = {{"kel", [=] {
                                      return Body([pairs = makePairs(n, 0)] {
                                          kelMatEstimatorH H;
                                          H.estimate_byLSM_fine(pairs->set);
                                      });
                                  }}};
        std::vector<Run> plain = runs;
#if KEL_BENCH_OPENCV
        runs.push_back(opencv(n, 0, 0, "OpenCV", "refines by Levenberg-Marquardt"));
#endif
        add("Least-squares homography", "n=" + std::to_string(n), {0, 0}, runs);
#if KEL_BENCH_EIGEN
        plain.push_back({"normal equations", [=] { return Body([pairs = makePairs(n, 0)] { normalEquations(pairs->set); }); },
                         "squares the condition number"});
        add("Least-squares homography, beside normal equations", "n=" + std::to_string(n), {0, 0}, plain);
#endif
    }
}

const Lines lines(addLines);

} // namespace
