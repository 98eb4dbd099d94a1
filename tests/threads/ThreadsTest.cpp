// Every operation of the lists from eight threads at once, each on objects of its own: results equal those of one thread, and the
// thread sanitizer has something to look at.
#include <algorithm>
#include <array>
#include <cstring>
#include <gtest/gtest.h>
#include <kel/kelRegister.h>
#include <thread>
#include <vector>

#include "ImageScene.h"
#include "MatOperations.h"
#include "Random.h"
#include "Warps.h"

namespace {

using namespace kel_test;

using Result = std::vector<unsigned char>;

Result resultOf(const ImageOperation& o) {
    Setting setting = {{64, 48}, o.parameters[0]};
    setting.half = o.half ? 16 : -1;
    const Scene images(o, setting, o.from);
    images.apply(o.call);
    Result bytes;
    images.forEach([&](const Image& image) { bytes.insert(bytes.end(), image.data(), image.data() + image.size()); });
    return o.draws ? Result() : bytes; // draws from rand() are shared out among the threads
}

Result resultOf(const MatOperation& o) {
    std::mt19937 random = generator(5);
    kelMat A(9, 9), B(9, 9);
    for (int i = 0; i < 81; ++i) {
        A.m_Data[i] = static_cast<float>(random() % 2001) / 500 - 2;
        B.m_Data[i] = static_cast<float>(random() % 2001) / 500 - 2;
    }
    const Floats floats = o.call(A + A.getTransposedMatrix(), B * B.getTransposedMatrix());
    Result bytes(floats.size() * sizeof(float));
    std::memcpy(bytes.data(), floats.data(), bytes.size());
    return bytes;
}

Result resultOfKeypoints() {
    const Image grey(64, 48, KEL_PIXEL_TYPE_U8G), response(64, 48, KEL_PIXEL_TYPE_S16G);
    kelKeypoint2DF32_t keypoints[200];
    const int count = applyKelDetectorKeypointYape(keypoints, 200, grey.get(), response.get());
    Result bytes(static_cast<size_t>(count) * sizeof keypoints[0]);
    std::memcpy(bytes.data(), keypoints, bytes.size());
    return bytes;
}

// Fits draw from rand(), so that they take part and are not compared.
Result resultOfFits() {
    kelMatCorrespH plane;
    kelMatCorrespP space;
    kelMatGeneratorP generator;
    generator.setMatViewRandom(500, 600);
    kelMat P;
    generator.getMat(P);
    for (int i = 0; i < 30; ++i) {
        const float x = static_cast<float>(i * 37 % 101), y = static_cast<float>(i * 53 % 97),
                    z = static_cast<float>(i * 29 % 89);
        float u, v;
        P.cvtPoint(x, y, z, &u, &v);
        plane.add(x, y, x + 1, y - 2);
        space.add(x, y, z, u, v);
    }
    kelMatEstimatorH H;
    kelMatEstimatorP Q;
    EXPECT_TRUE(H.estimate_byRANSAC_fine(plane, 2, nullptr));
    EXPECT_TRUE(Q.estimate_byRANSAC_fine(space, 2));
    EXPECT_TRUE(H.estimate_byTaubin(plane));
    return {};
}

std::vector<Result> everything() {
    std::vector<Result> all = {resultOfKeypoints(), resultOfFits()};
    for (const ImageOperation& o : imageOperations())
        all.push_back(resultOf(o));
    for (const MatOperation& o : matOperations())
        all.push_back(resultOf(o));
    return all;
}

// The draws of the fits are shared out between the threads as it happens; everything else is the same in all of them.
TEST(Threads, RegistrationOfDistinctPictures) {
    constexpr size_t kThreads = 4;
    const kel::Image scene = drawnScene(240, 180, 3);
    Plane H;
    const kel::Image view = warped(scene.get(), {1.2, 20, 30, 0.9}, 400, H);
    std::array<kelRegister::Result, kThreads> results;
    std::vector<std::thread> threads;
    for (kelRegister::Result& result : results)
        threads.emplace_back([&] { result = kelRegister::registerPictures(scene.get(), view.get()); });
    for (std::thread& thread : threads)
        thread.join();
    const std::vector<kelRegister::Feature> features = kelRegister::findFeatures(scene.get());
    for (const kelRegister::Result& result : results) {
        EXPECT_TRUE(result.found) << result.reason;
        ASSERT_EQ(result.first.size(), features.size());
        for (size_t i = 0; i < features.size(); ++i)
            EXPECT_EQ(std::memcmp(result.first[i].descriptor, features[i].descriptor, sizeof features[i].descriptor), 0);
        EXPECT_EQ(kelRegister::matchFeatures(result.first, result.second).size(), result.matches.size());
    }
}

} // namespace

TEST(Threads, ShareNothing) {
    const std::vector<Result> expected = everything();
    std::vector<std::vector<Result>> results(8);
    std::vector<std::thread> threads;
    for (auto& result : results)
        threads.emplace_back([&] { result = everything(); });
    for (std::thread& thread : threads)
        thread.join();
    for (const auto& result : results)
        EXPECT_EQ(result, expected);
}
