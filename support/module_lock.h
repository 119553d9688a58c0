// The module's one lock count: live COM objects plus server locks. DllCanUnloadNow reads it.
#pragma once

#include <windows.h>

void LockModule() noexcept;
void UnlockModule() noexcept;
LONG ModuleLockCount() noexcept;
