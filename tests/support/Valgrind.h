// Valgrind's part of a test's life: what would only add time under it, or makes no sense there, says so itself.
#ifndef KEL_TESTS_VALGRIND_H
#define KEL_TESTS_VALGRIND_H

#include <gtest/gtest.h>
#include <valgrind/memcheck.h>

// First in a test that valgrind is to pass over.
#define KEL_NOT_UNDER_VALGRIND(why)                                                                                            \
    if (RUNNING_ON_VALGRIND)                                                                                                   \
    GTEST_SKIP() << (why)

#endif
