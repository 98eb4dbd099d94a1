// What sweeps over widths and rounding modes have in common.
#ifndef KEL_TESTS_SWEEP_H
#define KEL_TESTS_SWEEP_H

#include <cfenv>
#include <vector>

namespace kel_test {

// Widths around every block boundary, and the degenerate ones.
inline std::vector<int> widths() {
    std::vector<int> all = {-3, 0};
    for (int width = 1; width <= 70; ++width)
        all.push_back(width);
    for (int width : {95, 96, 97, 127, 128, 129, 200, 255, 256, 257, 331})
        all.push_back(width);
    return all;
}

struct RoundingMode {
    const char* name;
    int mode; // of fesetround()
};
constexpr RoundingMode kRoundingModes[] = {
    {"nearest", FE_TONEAREST}, {"down", FE_DOWNWARD}, {"up", FE_UPWARD}, {"zero", FE_TOWARDZERO}};

} // namespace kel_test

#endif
