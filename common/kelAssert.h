// The assertion macro of the whole library: active in every build type, whatever NDEBUG says, and reported the way the
// platform reports assertions.
#ifndef KEL_ASSERT_H
#define KEL_ASSERT_H

#include <assert.h>

// The C library's own report; <assert.h> declares it only where NDEBUG is not set.
extern "C" void __assert_fail(const char* text, const char* file, unsigned int line, const char* function) noexcept
    __attribute__((__noreturn__));

// Two steps, so that a macro in the condition appears expanded in the report (NULL as "__null"). Callers match these texts.
#define KEL_ASSERT(...) KEL_ASSERT_EXPANDED(__VA_ARGS__)
#define KEL_ASSERT_EXPANDED(...)                                                                                               \
    (__builtin_expect(!(__VA_ARGS__), 0) ? __assert_fail(#__VA_ARGS__, __FILE__, __LINE__, __PRETTY_FUNCTION__) : (void)0)

#endif
