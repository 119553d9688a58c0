// Fault injection for tests: operator new throws std::bad_alloc on this thread while a
// ScopedAllocationFailure lives, so that a test can show a COM method turning an allocation
// failure into E_OUTOFMEMORY instead of letting the exception cross the interface.
#pragma once

class ScopedAllocationFailure {
public:
    ScopedAllocationFailure() noexcept;
    ScopedAllocationFailure(const ScopedAllocationFailure&) = delete;
    ScopedAllocationFailure& operator=(const ScopedAllocationFailure&) = delete;
    ~ScopedAllocationFailure();
};
