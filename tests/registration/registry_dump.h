// Reads a registry subtree into comparable lines: "path|value name|type|data".
#pragma once

#include <windows.h>

#include <set>
#include <string>

#include "support/unique_resource.h"

using RegistryLines = std::set<std::wstring>;

inline std::wstring FormatValueData(DWORD type, const BYTE* data, DWORD size) {
    if (type == REG_SZ) {
        std::wstring text(reinterpret_cast<const wchar_t*>(data), size / sizeof(wchar_t));
        while (!text.empty() && text.back() == L'\0')
            text.pop_back();
        return L"REG_SZ|" + text;
    }
    if (type == REG_DWORD && size == 4)
        return L"REG_DWORD|" + std::to_wstring(*reinterpret_cast<const DWORD*>(data));
    std::wstring hex = type == REG_BINARY ? L"REG_BINARY|" : L"TYPE" + std::to_wstring(type) + L"|";
    static const wchar_t digits[] = L"0123456789ABCDEF";
    for (DWORD index = 0; index < size; ++index) {
        if (index)
            hex += L' ';
        hex += digits[data[index] >> 4];
        hex += digits[data[index] & 15];
    }
    return hex;
}

// Every key of the subtree gives a line "path|" (so that empty keys show), every value a line
// "path|name|type|data". Paths are relative to the dumped key; its own is "".
inline void DumpRegistryTree(HKEY parent, const std::wstring& subkey, const std::wstring& relative,
                             RegistryLines& lines) {
    UniqueRegKey key;
    if (::RegOpenKeyExW(parent, subkey.c_str(), 0, KEY_READ, key.put()) != ERROR_SUCCESS)
        return;
    lines.insert(relative + L"|");
    for (DWORD index = 0;; ++index) {
        wchar_t name[16384];
        DWORD nameLength = ARRAYSIZE(name), type = 0;
        BYTE data[4096];
        DWORD size = sizeof data;
        if (::RegEnumValueW(key.get(), index, name, &nameLength, nullptr, &type, data, &size) !=
            ERROR_SUCCESS)
            break;
        lines.insert(relative + L"|" + std::wstring(name, nameLength) + L"|" +
                     FormatValueData(type, data, size));
    }
    for (DWORD index = 0;; ++index) {
        wchar_t name[256];
        DWORD nameLength = ARRAYSIZE(name);
        if (::RegEnumKeyExW(key.get(), index, name, &nameLength, nullptr, nullptr, nullptr,
                            nullptr) != ERROR_SUCCESS)
            break;
        const std::wstring child(name, nameLength);
        DumpRegistryTree(key.get(), child, relative.empty() ? child : relative + L"\\" + child,
                         lines);
    }
}

inline RegistryLines DumpRegistryTree(HKEY root, const std::wstring& path) {
    RegistryLines lines;
    DumpRegistryTree(root, path, L"", lines);
    return lines;
}
