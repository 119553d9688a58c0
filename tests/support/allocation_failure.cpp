// The test executables' operator new, which can be told to fail. The linker takes it from the
// test support library before the C++ library's own, so it serves the whole test executable.
#include "tests/support/allocation_failure.h"

#include <cstdlib>
#include <new>

namespace {
thread_local bool t_failAllocations = false;
}

ScopedAllocationFailure::ScopedAllocationFailure() noexcept {
    t_failAllocations = true;
}

ScopedAllocationFailure::~ScopedAllocationFailure() {
    t_failAllocations = false;
}

void* operator new(std::size_t size) {
    if (t_failAllocations)
        throw std::bad_alloc();
    if (void* memory = std::malloc(size != 0 ? size : 1))
        return memory;
    throw std::bad_alloc();
}

void operator delete(void* memory) noexcept {
    std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}
