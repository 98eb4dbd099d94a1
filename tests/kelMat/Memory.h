// The test program's own malloc and free, which the library uses, too: counted, and on demand with every block flush against
// a protected page, or refused. Where it is not in use the scopes do nothing.
#ifndef KEL_TESTS_MEMORY_H
#define KEL_TESTS_MEMORY_H

#include <cstddef>
#include <valgrind/memcheck.h>

namespace kel_test {

// Whether it is: sanitizers and valgrind bring theirs.
inline bool ownMalloc() {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    return false;
#else
    return !RUNNING_ON_VALGRIND;
#endif
}

// Counts this thread's blocks while it lives.
class CountedMemory {
public:
    CountedMemory();
    ~CountedMemory();
    int allocated() const;  // calls of malloc
    int held() const;       // less calls of free
    size_t largest() const; // bytes of the largest block
};

enum class Protect { Behind, Before };

// While it lives, this thread's call of malloc number `number`, from 0, and all behind it find no memory.
class ScarceMemory {
public:
    explicit ScarceMemory(int number);
    ~ScarceMemory();
};

// While it lives, blocks end (to within 15 bytes, for alignment) or begin at a protected page. Not to be nested.
class ProtectedMemory {
public:
    explicit ProtectedMemory(Protect side);
    ~ProtectedMemory();
};

} // namespace kel_test

#endif
