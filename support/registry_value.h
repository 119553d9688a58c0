// Bounded registry value reads and writes: a value of the wrong type or size is a failed read,
// never an overrun.
#pragma once

#include <windows.h>

#include <string>

// Reads a REG_SZ value of at most maxBytes bytes (terminator included). A value of another type
// gives ERROR_UNSUPPORTED_TYPE, a longer one ERROR_MORE_DATA; a stored text that lacks its
// terminator is cut at the value's end. ERROR_NOT_ENOUGH_MEMORY when the buffer cannot be had.
[[nodiscard]] LONG ReadStringValue(HKEY key, const wchar_t* name, DWORD maxBytes,
                                   std::wstring& text) noexcept;

// Reads a REG_DWORD value; any other type or size gives ERROR_UNSUPPORTED_TYPE.
[[nodiscard]] LONG ReadDwordValue(HKEY key, const wchar_t* name, DWORD& value) noexcept;

// Writes the text with its terminating zero.
[[nodiscard]] LONG WriteStringValue(HKEY key, const wchar_t* name,
                                    const std::wstring& text) noexcept;
[[nodiscard]] LONG WriteDwordValue(HKEY key, const wchar_t* name, DWORD value) noexcept;

// Deletes a key with all its subkeys, depth-first.
[[nodiscard]] LONG DeleteKeyRecursive(HKEY parent, const wchar_t* subkey) noexcept;
