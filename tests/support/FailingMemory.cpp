#include "tests/support/FailingMemory.h"

#include <cstdlib>
#include <new>

int test::failingAllocation = 0;
void (*test::onAllocation)() = nullptr;

// All forms of new whose memory the delete below may get: those of the sanitizers give memory that
// free() doesn't take back.

[[gnu::noinline]] void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    if (test::onAllocation != nullptr) test::onAllocation();
    const bool fails = test::failingAllocation > 0 && --test::failingAllocation == 0;
    return fails ? nullptr : std::malloc(size);
}

[[gnu::noinline]] void* operator new(std::size_t size) {
    void* memory = operator new(size, std::nothrow);
    if (memory == nullptr) throw std::bad_alloc();
    return memory;
}

[[gnu::noinline]] void operator delete(void* memory) noexcept {
    std::free(memory);
}

[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}
