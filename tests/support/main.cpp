// Entry of the test programs: prints the seed that every generator of the tests derives from (KEL_TEST_SEED, default 1).
#include <cstdio>
#include <gtest/gtest.h>

#include "Random.h"

int main(int argc, char** argv) {
    testing::InitGoogleTest(&argc, argv);
    std::printf("KEL_TEST_SEED=%u\n", kel_test::testSeed());
    return RUN_ALL_TESTS();
}
