// malloc and free of the test program.
#include "Memory.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <sys/mman.h>

namespace {

thread_local bool counting, protecting;
thread_local int allocations, releases, left = -1; // left: before memory is scarce, if it is not negative
thread_local size_t largestBlock;
thread_local kel_test::Protect side;

} // namespace

namespace kel_test {

CountedMemory::CountedMemory() {
    allocations = releases = 0;
    largestBlock = 0;
    counting = true;
}
CountedMemory::~CountedMemory() {
    counting = false;
}
int CountedMemory::allocated() const {
    return allocations;
}
int CountedMemory::held() const {
    return allocations - releases;
}

size_t CountedMemory::largest() const {
    return largestBlock;
}

ScarceMemory::ScarceMemory(int number) {
    left = number;
}
ScarceMemory::~ScarceMemory() {
    left = -1;
}

ProtectedMemory::ProtectedMemory(Protect where) {
    side = where;
    protecting = true;
}
ProtectedMemory::~ProtectedMemory() {
    protecting = false;
}

} // namespace kel_test

#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)

extern "C" void* __libc_malloc(size_t);
extern "C" void __libc_free(void*);

namespace {

constexpr size_t kPage = 4096;
constexpr int kBlocks = 256;

struct Block {
    void* user;
    void* base;
    size_t mapped;
};
thread_local Block blocks[kBlocks];
thread_local int protectedBlocks; // in use

// | protected | data, user part first or last | protected |
void* protectedBlock(size_t bytes) {
    for (Block& block : blocks)
        if (!block.user) {
            const size_t inner = (bytes + kPage) / kPage * kPage;
            block.mapped = inner + 2 * kPage;
            block.base = mmap(nullptr, block.mapped, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
            char* const open = static_cast<char*>(block.base) + kPage;
            if (block.base == MAP_FAILED || mprotect(open, inner, PROT_READ | PROT_WRITE) != 0)
                return nullptr;
            memset(open, 0xa5, inner);
            block.user = side == kel_test::Protect::Before ? open : open + (inner - bytes) / 16 * 16;
            ++protectedBlocks;
            return block.user;
        }
    return nullptr;
}

bool releasedProtected(void* user) {
    if (protectedBlocks == 0)
        return false;
    for (Block& block : blocks)
        if (block.user == user) {
            munmap(block.base, block.mapped);
            block.user = nullptr;
            --protectedBlocks;
            return true;
        }
    return false;
}

} // namespace

extern "C" void* malloc(size_t bytes) {
    if (left == 0)
        return nullptr;
    left -= left > 0;
    allocations += counting;
    largestBlock = bytes > largestBlock ? bytes : largestBlock;
    return protecting ? protectedBlock(bytes) : __libc_malloc(bytes);
}

extern "C" void free(void* block) {
    if (!block)
        return;
    releases += counting;
    if (!releasedProtected(block))
        __libc_free(block);
}

#endif
