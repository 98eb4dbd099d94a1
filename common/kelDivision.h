// Division of integers where callers rely on how it fails.
#ifndef KEL_DIVISION_H
#define KEL_DIVISION_H

#include <csignal>
#include <cstdlib>

namespace kel {

// The divisor itself. 0 stops the process by SIGFPE, as the instruction does on x86; AArch64 would go on with 0, and compilers leave
// out a division whose result they know otherwise.
template <class T> inline T divisor(T d) {
    if (d == 0) {
        std::raise(SIGFPE);
        std::abort();
    }
    return d;
}

} // namespace kel

#endif
