#include "tests/support/FailingMemory.h"

#include <cstdlib>
#include <new>

int test::failingAllocation = 0;

[[gnu::noinline]] void* operator new(std::size_t size) {
    const bool fails = test::failingAllocation > 0 && --test::failingAllocation == 0;
    void* memory = fails ? nullptr : std::malloc(size);
    if (memory == nullptr) throw std::bad_alloc();
    return memory;
}

[[gnu::noinline]] void operator delete(void* memory) noexcept {
    std::free(memory);
}

[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}
