// Division of integers where callers rely on how it fails.
#ifndef KEL_DIVISION_H
#define KEL_DIVISION_H

#ifdef __aarch64__
#include <csignal>
#include <cstdlib>
#endif

namespace kel {

// The divisor itself. Division by 0 stops the process by SIGFPE on x86; AArch64 would go on with 0, so there it is stopped here.
template <class T> inline T divisor(T d) {
#ifdef __aarch64__
    if (d == 0) {
        std::raise(SIGFPE);
        std::abort();
    }
#endif
    return d;
}

} // namespace kel

#endif
