// Interlocked module lock count, changed from any thread.
#include "support/module_lock.h"

namespace {
LONG g_moduleLockCount = 0;
}

void LockModule() noexcept {
    ::InterlockedIncrement(&g_moduleLockCount);
}

void UnlockModule() noexcept {
    ::InterlockedDecrement(&g_moduleLockCount);
}

LONG ModuleLockCount() noexcept {
    return ::InterlockedCompareExchange(&g_moduleLockCount, 0, 0);
}
