// Random integers over the platform's rand(); seeding it is the application's business.
#include <stdlib.h>

#include "kelAssert.h"
#include "kelImage.h"

extern "C" {

int KEL_RAND(int x) {
    KEL_ASSERT(0<x);
    return rand() % x;
}

int KEL_RAND_NORMAL(int x) {
    int sum = 0;
    for (int draw = 0; draw < 12; ++draw)
        sum += rand() % (x + 1);
    return sum - 6 * x;
}

} // extern "C"
