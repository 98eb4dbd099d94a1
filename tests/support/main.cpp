// Entry of the test programs: prints the seed that every generator of the tests derives from (KEL_TEST_SEED, default 1).
#include <cstdio>
#include <gtest/gtest.h>

#include "Random.h"

// The sanitizers ask for their options here: allocations that are refused are part of what is tested.
extern "C" const char* __asan_default_options();
extern "C" const char* __asan_default_options() {
    return "allocator_may_return_null=1";
}
extern "C" const char* __tsan_default_options();
extern "C" const char* __tsan_default_options() {
    return "allocator_may_return_null=1";
}
extern "C" const char* __ubsan_default_options();
extern "C" const char* __ubsan_default_options() {
    return "print_stacktrace=1";
}

int main(int argc, char** argv) {
    testing::InitGoogleTest(&argc, argv);
    std::printf("KEL_TEST_SEED=%u\n", kel_test::testSeed());
    return RUN_ALL_TESTS();
}
