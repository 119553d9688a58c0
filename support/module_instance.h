// The module that holds this code (the extension DLL, or the executable a test links it into),
// module paths and the system's message texts.
#pragma once

#include <windows.h>

#include <string>

HMODULE ThisModule() noexcept;

// Full path of a module's file, however long; empty on failure.
std::wstring ModuleFilePath(HMODULE module);
// Full path of this module's file; empty on failure.
std::wstring ThisModulePath();
// The system's text for a message number (a Win32 error or an HRESULT), with insert as its %1;
// line ends and trailing spaces removed; empty when the system has no text for it.
std::wstring SystemMessageText(DWORD code, const std::wstring& insert = std::wstring());
// The same for an HRESULT, also found under its bare Win32 code; its hexadecimal form (with the
// insert after it) when the system has no text.
std::wstring SystemResultText(HRESULT result, const std::wstring& insert = std::wstring());
