// The module that holds this code: the extension DLL, or the executable a test links it into.
#pragma once

#include <windows.h>

#include <string>

HMODULE ThisModule() noexcept;

// Full path of this module's file; empty on failure.
std::wstring ThisModulePath();
