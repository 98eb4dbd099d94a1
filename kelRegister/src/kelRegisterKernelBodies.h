// Bodies of the kernels; included once in a file for each instruction set.
#ifndef KEL_REGISTER_KERNEL_BODIES_H
#define KEL_REGISTER_KERNEL_BODIES_H

#include "kelRegisterKernels.h"
#include "kelRegisterLanes.h"

namespace {

using namespace kelRegister;

// The arctangent of a ratio 0 .. 1 in 1/256 turns, to 0.07 of these: 32 r + r (1 - r) (9.970 + 2.7013 r).
Floats turnOf(Floats ratio) {
    return ratio * (32.0f + (1.0f - ratio) * (9.970f + 2.7013f * ratio));
}

void gradients(uint16_t* out, const uint8_t* p, ptrdiff_t step, int width) {
    for (int x = 0; x < width; x += kFloats, p += kFloats, out += kFloats) {
        const Floats gx = toFloats(loadWide(p + 1) - loadWide(p - 1)), gy = toFloats(loadWide(p + step) - loadWide(p - step));
        const Floats ax = magnitude(gx), ay = magnitude(gy);
        Floats turn = turnOf(least(ax, ay) / (most(ax, ay) + 1e-9f));
        turn = ax < ay ? 64.0f - turn : turn;
        turn = gx < 0.0f ? 128.0f - turn : turn;
        turn = gy < 0.0f ? 256.0f - turn : turn;
        const Ints strength = truncated(root(gx * gx + gy * gy) * 2.0f + 0.5f), direction = truncated(turn) & 255;
        storeLowHalves(out, least(strength, Ints{} + 255) | direction << 8);
    }
}

// Samples 4k .. 4k+3 lie 0.625, 0.875, 1.125 and 1.375 cells behind the centre of cell k-1 (cells -1 and 4 do not exist): what
// they give to cells k-1, k and k+1.
struct Shares {
    Eight before, here, behind;
};
inline Shares shareFour(Eight a, Eight b, Eight c, Eight d) {
    return {a * 0.375f + b * 0.125f, (a * 0.625f + d * 0.625f) + (b * 0.875f + c * 0.875f), c * 0.125f + d * 0.375f};
}

inline Shares shareSamples(const float* strengths, const uint8_t* grid, const float (*directions)[kDirections]) {
    const auto sample = [&](int i) { return Eight::load(directions[grid[i]]) * strengths[i]; };
    return shareFour(sample(0), sample(1), sample(2), sample(3));
}

// A row of the grid: one value for each of the four cells.
inline void shareRow(Eight* row, const float* strengths, const uint8_t* grid, const float (*directions)[kDirections]) {
    const Shares a = shareSamples(strengths, grid, directions), b = shareSamples(strengths + 4, grid + 4, directions);
    const Shares c = shareSamples(strengths + 8, grid + 8, directions), d = shareSamples(strengths + 12, grid + 12, directions);
    row[0] = a.here + b.before;
    row[1] = (a.behind + b.here) + c.before;
    row[2] = (b.behind + c.here) + d.before;
    row[3] = c.behind + d.here;
}

void describe(float* cells, const float* strengths, const uint8_t* grid, const float (*directions)[kDirections]) {
    for (int k = 0; k < kCells; ++k) {
        Eight rows[4][kCells];
        for (int j = 0; j < 4; ++j)
            shareRow(rows[j], strengths + (4 * k + j) * kPatch, grid + (4 * k + j) * kPatch, directions);
        for (int x = 0; x < kCells; ++x) {
            const Shares shares = shareFour(rows[0][x], rows[1][x], rows[2][x], rows[3][x]);
            const Eight of[3] = {shares.before, shares.here, shares.behind};
            for (int y = 0; y < 3; ++y)
                if (k + y >= 1 && k + y <= kCells) {
                    float* const cell = cells + ((k + y - 1) * kCells + x) * kDirections;
                    (Eight::load(cell) + of[y]).store(cell);
                }
        }
    }
}

int differences(int* found, int* sums, const uint8_t* description, const uint8_t* others, const int* limits, int limit,
                int count) {
    constexpr int kParts = kDescription / kVector;
    Bytes own[kParts];
    for (int i = 0; i < kParts; ++i)
        own[i] = load<Bytes>(description + i * kVector);
    int n = 0;
    for (int j = 0; j < count; j += 4, others += 4 * kDescription) {
        Sums sum[4] = {};
        for (int k = 0; k < 4; ++k)
            for (int i = 0; i < kParts; ++i)
                sum[k] = plusDifferences(sum[k], own[i], load<Bytes>(others + k * kDescription + i * kVector));
        const FourInts four = totals(sum[0], sum[1], sum[2], sum[3]);
        store(sums + j, four);
        for (int below = bitsOf(four < most(load<FourInts>(limits + j), FourInts{} + limit)); below; below &= below - 1)
            found[n++] = j + __builtin_ctz(static_cast<unsigned>(below));
    }
    return n;
}

int correlate(const int16_t* patch, const uint8_t* window, ptrdiff_t step) {
    Products sums = {};
    for (int y = 0; y < kPatch; ++y)
        sums = plusProducts(sums, patch + y * kPatch, window + y * step);
    return total(sums);
}

} // namespace

#endif
