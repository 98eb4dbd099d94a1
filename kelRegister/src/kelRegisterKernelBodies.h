// Bodies of the kernels; included once in a file for each instruction set.
#ifndef KEL_REGISTER_KERNEL_BODIES_H
#define KEL_REGISTER_KERNEL_BODIES_H

#include "kelRegisterKernels.h"
#include "kelRegisterLanes.h"

namespace {

using namespace kelRegister;

// The arctangent of a ratio 0 .. 1 in 1/256 turns, to 0.07 of these: 32 r + r (1 - r) (9.970 + 2.7013 r).
Lanes::Floats turnOf(Lanes::Floats ratio) {
    using V = Lanes;
    const V::Floats bend = V::times(V::minus(V::all(1), ratio), V::plus(V::all(9.970f), V::times(V::all(2.7013f), ratio)));
    return V::times(ratio, V::plus(V::all(32), bend));
}

void gradients(uint16_t* out, const uint8_t* p, ptrdiff_t step, int width) {
    using V = Lanes;
    const V::Floats none = V::all(0);
    for (int x = 0; x < width; x += V::kFloats, p += V::kFloats, out += V::kFloats) {
        const V::Floats gx = V::toFloats(V::minus(V::loadWide(p + 1), V::loadWide(p - 1)));
        const V::Floats gy = V::toFloats(V::minus(V::loadWide(p + step), V::loadWide(p - step)));
        const V::Floats ax = V::magnitude(gx), ay = V::magnitude(gy);
        V::Floats turn = turnOf(V::over(V::least(ax, ay), V::plus(V::most(ax, ay), V::all(1e-9f))));
        turn = V::whereLess(ax, ay, V::minus(V::all(64), turn), turn);
        turn = V::whereLess(gx, none, V::minus(V::all(128), turn), turn);
        turn = V::whereLess(gy, none, V::minus(V::all(256), turn), turn);
        const V::Floats square = V::plus(V::times(gx, gx), V::times(gy, gy));
        const V::Ints strength = V::truncated(V::plus(V::times(V::root(square), V::all(2)), V::all(0.5f)));
        const V::Ints direction = V::both(V::truncated(turn), V::allInts(255));
        V::storeLowHalves(out, V::either(V::least(strength, V::allInts(255)), V::shiftedUp8(direction)));
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
    using V = Lanes;
    constexpr int kParts = kDescription / V::kBytes;
    V::Bytes own[kParts];
    for (int i = 0; i < kParts; ++i)
        own[i] = V::load(description + i * V::kBytes);
    int n = 0;
    for (int j = 0; j < count; j += 4, others += 4 * kDescription) {
        V::Ints sum[4];
        for (int k = 0; k < 4; ++k) {
            const uint8_t* const other = others + k * kDescription;
            sum[k] = V::differences(own[0], V::load(other));
            for (int i = 1; i < kParts; ++i)
                sum[k] = V::plus(sum[k], V::differences(own[i], V::load(other + i * V::kBytes)));
        }
        const __m128i four = V::totals(sum[0], sum[1], sum[2], sum[3]);
        storeFour(sums + j, four);
        for (int below = belowEither(four, limits + j, limit); below; below &= below - 1)
            found[n++] = j + __builtin_ctz(static_cast<unsigned>(below));
    }
    return n;
}

int correlate(const int16_t* patch, const uint8_t* window, ptrdiff_t step) {
    using V = Lanes;
    V::Ints sum = V::noInts();
    for (int y = 0; y < kPatch; ++y)
        sum = V::plus(sum, V::products(patch + y * kPatch, window + y * step));
    return V::sum(sum);
}

} // namespace

#endif
