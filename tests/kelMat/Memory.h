// The test program's own malloc and free, which the library uses, too: counted, and on demand with every block flush against
// a protected page. Under a sanitizer both scopes do nothing.
#ifndef KEL_TESTS_MEMORY_H
#define KEL_TESTS_MEMORY_H

namespace kel_test {

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kOwnMalloc = false;
#else
constexpr bool kOwnMalloc = true;
#endif

// Counts this thread's blocks while it lives.
class CountedMemory {
public:
    CountedMemory();
    ~CountedMemory();
    int allocated() const; // calls of malloc
    int held() const;      // less calls of free
};

enum class Protect { Behind, Before };

// While it lives, blocks end (to within 15 bytes, for alignment) or begin at a protected page. Not to be nested.
class ProtectedMemory {
public:
    explicit ProtectedMemory(Protect side);
    ~ProtectedMemory();
};

} // namespace kel_test

#endif
