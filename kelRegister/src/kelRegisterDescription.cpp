// Prevailing directions and descriptions, from the bytes of the gradients.
#include <algorithm>
#include <cmath>

#include "kelRegisterDescription.h"

namespace kelRegister {

namespace {

constexpr float kPi = 3.14159265f;
constexpr int kRadius = 11;      // of the disc that directions are taken from
constexpr float kSigma = 5.5f;   // of its weights
constexpr int kBins = 32;        // of their histogram
constexpr float kNearly = 0.85f; // of the highest peak
constexpr float kSpacing = 2;    // level pixels between samples of a description

} // namespace

Describer::Describer() : m_kernels(kernels()) {
    for (int dy = -kRadius; dy <= kRadius; ++dy)
        for (int dx = -kRadius; dx <= kRadius; ++dx) {
            const int square = dx * dx + dy * dy;
            if (square <= kRadius * kRadius)
                m_disc.push_back(
                    {dx, dy, static_cast<int>(256 * std::exp(-0.5f * static_cast<float>(square) / (kSigma * kSigma)))});
        }
    for (int i = 0; i < 256; ++i) {
        std::fill_n(m_directions[i], kDirections, 0.0f);
        const int below = i / 32;
        const float share = static_cast<float>(i % 32) / 32;
        m_directions[i][below] += 1 - share;
        m_directions[i][(below + 1) % kDirections] += share;
    }
    for (int j = 0; j < kPatch; ++j)
        for (int i = 0; i < kPatch; ++i) {
            const float u = (static_cast<float>(i) - 7.5f) / 8, v = (static_cast<float>(j) - 7.5f) / 8;
            m_weights[j * kPatch + i] = 1 - 0.3f * (u * u + v * v);
        }
}

void Describer::prevailingAngles(const Gradients& gradients, int x, int y, std::vector<float>& angles) const {
    int histogram[kBins] = {}, smooth[kBins];
    const uint16_t* const centre = gradients.at(x, y);
    for (const Sample& s : m_disc) {
        const int value = centre[s.dy * gradients.step() + s.dx];
        histogram[value >> 11] += s.weight * (value & 255);
    }
    const auto bin = [&](int i) { return histogram[i & (kBins - 1)] >> 4; };
    for (int i = 0; i < kBins; ++i)
        smooth[i] = bin(i - 2) + bin(i + 2) + 4 * (bin(i - 1) + bin(i + 1)) + 6 * bin(i);
    const int peak = *std::max_element(smooth, smooth + kBins);
    angles.clear();
    for (int i = 0; i < kBins; ++i) {
        const int left = smooth[(i + kBins - 1) % kBins], middle = smooth[i], right = smooth[(i + 1) % kBins];
        if (static_cast<float>(middle) >= kNearly * static_cast<float>(peak) && middle > left && middle >= right) {
            const float shift = 0.5f * static_cast<float>(left - right) / static_cast<float>(left - 2 * middle + right);
            angles.push_back((static_cast<float>(i) + 0.5f + shift) * (2 * kPi / kBins));
        }
    }
}

void Describer::describe(const Gradients& gradients, float x, float y, float angle, uint8_t* description) const {
    const float c = std::cos(angle) * kSpacing, s = std::sin(angle) * kSpacing;
    const int turned = static_cast<int>(angle * (256 / (2 * kPi)) + 0.5f);
    const float left = x - 7.5f * (c - s) + 0.5f, top = y - 7.5f * (s + c) + 0.5f; // of the first sample, for truncation
    uint8_t grid[kPatch * kPatch];
    float strengths[kPatch * kPatch];
    for (int j = 0, k = 0; j < kPatch; ++j)
        for (int i = 0; i < kPatch; ++i, ++k) {
            const float u = static_cast<float>(i), v = static_cast<float>(j);
            const int value = *gradients.at(static_cast<int>(left + c * u - s * v), static_cast<int>(top + s * u + c * v));
            grid[k] = static_cast<uint8_t>((value >> 8) - turned);
            strengths[k] = static_cast<float>(value & 255) * m_weights[k];
        }
    float cells[kDescription] = {};
    m_kernels.describe(cells, strengths, grid, m_directions);
    float sum = 1e-6f;
    for (const float cell : cells)
        sum += cell;
    // Roots of the shares of the whole: differences of weak directions count as much as those of strong ones.
    const float scale = 600 / std::sqrt(sum);
    for (int i = 0; i < kDescription; ++i)
        description[i] = static_cast<uint8_t>(std::min(255.0f, scale * std::sqrt(cells[i])));
}

} // namespace kelRegister
