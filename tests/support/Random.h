// Random numbers of the tests: every generator starts from the one seed of the run.
#ifndef KEL_TESTS_RANDOM_H
#define KEL_TESTS_RANDOM_H

#include <cstdint>
#include <cstdlib>
#include <random>

namespace kel_test {

inline uint32_t testSeed() {
    const char* const text = std::getenv("KEL_TEST_SEED");
    return text ? static_cast<uint32_t>(std::strtoul(text, nullptr, 10)) : 1;
}

// A generator for one place of the tests; `salt` tells places apart.
inline std::mt19937 generator(uint32_t salt) {
    return std::mt19937(testSeed() * 2654435761u + salt);
}

} // namespace kel_test

#endif
