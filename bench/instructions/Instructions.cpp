// Calls every operation once, for an emulator to count what the processor executes; with an argument names the operations instead, each
// after the number of pixels or calls that it stands for.
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <kel/kelRegister.h>
#include <vector>

#include "ImageScene.h"
#include "MatInputs.h"

namespace {

using namespace kel_test;
using Body = std::function<void()>;

constexpr Size kSize = {640, 48};
constexpr int kOrder = 24, kPairs = 1000;

struct Line {
    std::string name;
    int units; // pixels where there are many
    std::function<Body()> prepare;
};

Body onImages(const ImageOperation& o) {
    Setting setting = {kSize, o.parameters[o.parameters.size() > 1]};
    if (o.name.find("rotateKelImageHomography") == 0) // of any size
        setting.dst = kSize;
    const auto scene = std::make_shared<Scene>(o, setting, o.from);
    return [=] { scene->apply(o.call); };
}

Body onMatrices(const MatOperation& o) {
    const kelMat factor = randomMatrix(kOrder, kOrder + 3, 51), definite = factor * factor.getTransposedMatrix();
    const kelMat A = o.form == MatOperation::Symmetric ? randomSymmetric(kOrder, 52) : randomMatrix(kOrder, kOrder, 52);
    return [=] { o.call(A, definite); };
}

Body keypoints() {
    const auto grey = std::make_shared<kel::Image>(kSize.width, kSize.height, KEL_PIXEL_TYPE_U8G),
               smooth = std::make_shared<kel::Image>(kSize.width, kSize.height, KEL_PIXEL_TYPE_U8G),
               tmp = std::make_shared<kel::Image>(kSize.width, kSize.height, KEL_PIXEL_TYPE_U8G),
               response = std::make_shared<kel::Image>(kSize.width, kSize.height, KEL_PIXEL_TYPE_S16G);
    const Bytes bytes = filled(static_cast<size_t>((*grey)->size), Fill::Random, 3);
    std::copy(bytes.begin(), bytes.end(), (*grey)->data);
    applyKelFilterGaussian7X7(smooth->get(), grey->get(), tmp->get());
    applyKelFilterLaplacian3X3(response->get(), smooth->get());
    return [=] {
        static kelKeypoint2DF32_t found[1000];
        applyKelDetectorKeypointYape(found, 1000, smooth->get(), response->get());
    };
}

Body robustFit() {
    kelMatCorrespH pairs;
    std::mt19937 random = generator(4);
    for (int i = 0; i < kPairs; ++i) {
        const float x = static_cast<float>(random() % 1000), y = static_cast<float>(random() % 1000);
        pairs.add(x, y, x + 20 + static_cast<float>(random() % 100) / 100, i % 5 ? y - 7 : static_cast<float>(random() % 1000));
    }
    return [=]() mutable {
        kelMatEstimatorH H;
        std::srand(1);
        H.estimate_byRANSAC_fine(pairs, 2, nullptr);
    };
}

// Blocks of random grey, and the same a little further on.
Body registration() {
    constexpr int kWidth = 200, kHeight = 150, kBlock = 7;
    const auto first = std::make_shared<kel::Image>(kWidth, kHeight, KEL_PIXEL_TYPE_U8G),
               second = std::make_shared<kel::Image>(kWidth, kHeight, KEL_PIXEL_TYPE_U8G);
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) {
            const auto grey = [&](int u, int v) {
                return static_cast<uint8_t>((u / kBlock * 2654435761u + v / kBlock * 40503u) * 2246822519u >> 24);
            };
            first->row(y)[x] = grey(x, y);
            second->row(y)[x] = grey(x + 4, y + 3);
        }
    return [=] {
        std::srand(1);
        kelRegister::registerPictures(first->get(), second->get());
    };
}

// Names that lead to what others do, and types that differ from others in their number alone.
bool isAnotherName(const std::string& name) {
    const auto has = [&](const char* part) { return name.find(part) != std::string::npos; };
    return has("convertKelImage ") || has("SSE") || has("Image_U8G") || has("Adaptive_U8G") || has(" 24") || has(" 32");
}

std::vector<Line> lines() {
    std::vector<Line> all;
    for (const ImageOperation& o : imageOperations())
        if (!isAnotherName(o.name))
            all.push_back({o.name, kSize.width * kSize.height, [&] { return onImages(o); }});
    all.push_back({"applyKelDetectorKeypointYape", kSize.width * kSize.height, keypoints});
    for (const MatOperation& o : matOperations())
        all.push_back({std::string(o.name) + ", order " + std::to_string(kOrder), 1, [&] { return onMatrices(o); }});
    all.push_back({"estimate_byRANSAC_fine, " + std::to_string(kPairs) + " pairs", 1, robustFit});
    all.push_back({"registerPictures, 200x150", 1, registration});
    return all;
}

} // namespace

// What is between these two is counted, by their names.
extern "C" {
__attribute__((noinline)) void kelCountFrom();
__attribute__((noinline)) void kelCountTo();
void kelCountFrom() {
    __asm__ volatile("");
}
void kelCountTo() {
    __asm__ volatile("");
}
}

int main(int argc, char**) {
    for (const Line& line : lines()) {
        if (argc > 1) { // only their names
            std::printf("%d\t%s\n", line.units, line.name.c_str());
            continue;
        }
        const Body body = line.prepare();
        kelCountFrom();
        body();
        kelCountTo();
    }
}
