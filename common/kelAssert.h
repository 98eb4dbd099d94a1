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
    (__builtin_expect(!(__VA_ARGS__), 0) ? __assert_fail(#__VA_ARGS__, __FILE__, __LINE__, KEL_SIGNATURE) : (void)0)

// Signatures as GCC spells them: "const kelImage_t*", where clang has a blank before the star.
#ifdef __clang__
namespace kel {
template <unsigned long N> struct Signature {
    char text[N] = {};
    constexpr Signature(const char (&from)[N]) {
        for (unsigned long i = 0, n = 0; i < N; ++i)
            if (from[i] != ' ' || (from[i + 1] != '*' && from[i + 1] != '&'))
                text[n++] = from[i];
    }
};
} // namespace kel
#define KEL_SIGNATURE                                                                                                          \
    ({                                                                                                                         \
        static constexpr kel::Signature<sizeof __PRETTY_FUNCTION__> signature(__PRETTY_FUNCTION__);                            \
        signature.text;                                                                                                        \
    })
#else
#define KEL_SIGNATURE __PRETTY_FUNCTION__
#endif

#endif
