// The kernels of every instruction set against plain loops, byte for byte, over every length round their blocks.
#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <gtest/gtest.h>
#include <random>
#include <vector>

#include "kelRegisterKernels.h"

using namespace kelRegister;

namespace {

struct Set { // of instructions
    const char* name;
    const Kernels* kernels;
    bool (*isHere)();
};
#ifdef __aarch64__
const Set kSets[] = {{"Neon", &kKernelsNeon, [] { return true; }}};
#else
const Set kSets[] = {{"Sse", &kKernelsSse, [] { return true; }},
                     {"Avx2", &kKernelsAvx2, [] { return __builtin_cpu_supports("avx2") != 0; }}};
#endif

class RegisterKernels : public ::testing::TestWithParam<Set> {
protected:
    void SetUp() override {
        if (!GetParam().isHere())
            GTEST_SKIP() << "this processor has no " << GetParam().name;
    }
    const Kernels& kernels() const { return *GetParam().kernels; }
    int number(int end) { return static_cast<int>(m_numbers() % static_cast<unsigned>(end)); }
    std::vector<uint8_t> bytes(size_t count, int end = 256) {
        std::vector<uint8_t> all(count);
        for (uint8_t& byte : all)
            byte = static_cast<uint8_t>(number(end));
        return all;
    }
    std::mt19937 m_numbers{1};
};

TEST_P(RegisterKernels, GradientsHaveStrengthAndDirection) {
    constexpr int kStep = 64;
    for (int width = 1; width <= 40; ++width)
        for (const int end : {256, 2, 12}) {
            const std::vector<uint8_t> image = bytes(4 * kStep, end);
            std::vector<uint16_t> out(kStep, 0xeeee);
            kernels().gradients(out.data(), image.data() + kStep + 8, kStep, width);
            for (int x = 0; x < width; ++x) {
                const uint8_t* const p = image.data() + kStep + 8 + x;
                const double gx = p[1] - p[-1], gy = p[kStep] - p[-kStep];
                ASSERT_EQ(out[x] & 255, std::min(255, static_cast<int>(2 * std::sqrt(gx * gx + gy * gy) + 0.5)));
                const double turn = std::atan2(gy, gx) * (128 / 3.14159265358979), off = (out[x] >> 8) + 0.5 - turn;
                ASSERT_TRUE((gx == 0 && gy == 0) || std::fabs(off - 256 * std::round(off / 256)) < 0.6) << gx << ' ' << gy;
            }
            for (int x = width + 7; x < kStep; ++x)
                ASSERT_EQ(out[x], 0xeeee);
        }
}

TEST_P(RegisterKernels, DifferencesAndWhichAreBelowALimit) {
    const std::vector<uint8_t> own = bytes(kDescription);
    for (int count = 0; count <= 40; count += 4) {
        const std::vector<uint8_t> others = bytes(static_cast<size_t>(count) * kDescription);
        std::vector<int> limits, expected, found(static_cast<size_t>(count) + 1), sums(static_cast<size_t>(count) + 1);
        const int limit = 10500;
        for (int j = 0; j < count; ++j) {
            limits.push_back(number(22000));
            int sum = 0;
            for (int i = 0; i < kDescription; ++i)
                sum += std::abs(own[i] - others[j * kDescription + i]);
            if (sum < limit || sum < limits.back())
                expected.push_back(j);
            sums[j] = sum;
        }
        std::vector<int> actual(sums.size(), 0);
        const int n =
            kernels().differences(found.data(), actual.data(), own.data(), others.data(), limits.data(), limit, count);
        found.resize(static_cast<size_t>(n));
        EXPECT_EQ(found, expected);
        EXPECT_EQ(actual, sums);
    }
}

TEST_P(RegisterKernels, CorrelationSumsProducts) {
    constexpr int kStep = 48;
    const std::vector<uint8_t> window = bytes(kPatch * kStep);
    std::vector<int16_t> patch(kPatch * kPatch);
    for (const int extent : {8161, 1}) { // the greatest values have either sign
        for (int16_t& value : patch)
            value = static_cast<int16_t>(extent == 1 ? 4080 : number(extent) - 4080);
        for (int left = 0; left <= 32; ++left) {
            int sum = 0;
            for (int y = 0; y < kPatch; ++y)
                for (int x = 0; x < kPatch; ++x)
                    sum += patch[y * kPatch + x] * window[y * kStep + left + x];
            ASSERT_EQ(kernels().correlate(patch.data(), window.data() + left, kStep), sum);
        }
    }
}

// Each sample is shared by its distance, in cells, from the cells' centres, in a plain loop in double precision.
TEST_P(RegisterKernels, DescriptionsShareSamplesBetweenCells) {
    const std::vector<uint8_t> grid = bytes(kPatch * kPatch);
    std::vector<float> strengths(kPatch * kPatch);
    for (float& strength : strengths)
        strength = static_cast<float>(number(256));
    static float directions[256][kDirections];
    for (auto& row : directions)
        for (float& share : row)
            share = static_cast<float>(number(100)) / 100;
    std::vector<float> cells(kDescription);
    kernels().describe(cells.data(), strengths.data(), grid.data(), directions);
    for (int cy = 0; cy < kCells; ++cy)
        for (int cx = 0; cx < kCells; ++cx)
            for (int d = 0; d < kDirections; ++d) {
                double sum = 0;
                for (int i = 0; i < kPatch * kPatch; ++i) {
                    const double wx = 1 - std::fabs((i % kPatch - 1.5) / 4 - cx),
                                 wy = 1 - std::fabs((i / kPatch - 1.5) / 4 - cy);
                    sum += std::max(0.0, wx) * std::max(0.0, wy) * strengths[i] * directions[grid[i]][d];
                }
                ASSERT_NEAR(cells[(cy * kCells + cx) * kDirections + d], sum, 1e-4 * sum);
            }
    std::vector<float> plain(kDescription); // and the same bits from every set
    kSets[0].kernels->describe(plain.data(), strengths.data(), grid.data(), directions);
    EXPECT_EQ(cells, plain);
}

INSTANTIATE_TEST_SUITE_P(Sets, RegisterKernels, ::testing::ValuesIn(kSets), [](const auto& info) { return info.param.name; });

} // namespace
