// Checks that a call stops the process, with an assertion report that names text, source file and signature or by a division.
#ifndef KEL_TESTS_STOPS_H
#define KEL_TESTS_STOPS_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <string>

#include "Valgrind.h"

namespace kel_test {

// `file` is the path below the project's root; the line number is any.
inline testing::Matcher<const std::string&> report(const std::string& text, const std::string& file,
                                                   const std::string& signature) {
    return testing::AllOf(testing::HasSubstr(" " + file + ":"),
                          testing::HasSubstr(": " + signature + ": Assertion `" + text + "' failed."));
}

} // namespace kel_test

// Not under valgrind: it would follow each child, which ends with all its memory in hand.
#define EXPECT_STOPS(statement, text, file, signature)                                                                         \
    if (RUNNING_ON_VALGRIND) {                                                                                                 \
    } else                                                                                                                     \
        EXPECT_EXIT(statement, testing::KilledBySignal(SIGABRT), kel_test::report(text, file, signature))

// That a call divides an integer by zero, which ends the process on every processor; sanitizers report it.
#ifdef __SANITIZE_ADDRESS__
#define EXPECT_DIVISION_BY_ZERO(statement) EXPECT_DEATH(statement, "division by zero|FPE")
#else
#define EXPECT_DIVISION_BY_ZERO(statement) EXPECT_EXIT(statement, testing::KilledBySignal(SIGFPE), "")
#endif

#endif
