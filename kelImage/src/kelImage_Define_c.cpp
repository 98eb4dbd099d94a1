// Random integers over the platform's rand(); seeding it is the application's business.
#include <cstdint>
#include <cstdlib>

#include "kelAssert.h"
#include "kelDivision.h"
#include "kelImage.h"

extern "C" {

int KEL_RAND(int x) {
    KEL_ASSERT(0<x);
    return rand() % x;
}

int KEL_RAND_NORMAL(int x) {
    int64_t sum = 0; // twelve draws of a large x do not fit into an int
    for (int draw = 0; draw < 12; ++draw)
        sum += rand() % kel::divisor(int64_t(x) + 1);
    return static_cast<int>(sum - 6 * int64_t(x));
}

} // extern "C"
