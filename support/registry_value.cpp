// Bounded registry value access.
#include "support/registry_value.h"

#include <algorithm>
#include <vector>

#include "support/portable/wide_text.h"
#include "support/unique_resource.h"

LONG ReadStringValue(HKEY key, const wchar_t* name, DWORD maxBytes,
                     std::wstring& text) noexcept try {
    // Exactly the bytes offered (a size with room added could wrap in a 32-bit build), and never
    // none: given a null buffer the registry reports the value's whole size as if it had read it.
    std::vector<BYTE> buffer(std::max<DWORD>(maxBytes, 1));
    DWORD type = 0;
    DWORD size = maxBytes;
    const LONG status = ::RegQueryValueExW(key, name, nullptr, &type, buffer.data(), &size);
    if (status != ERROR_SUCCESS)
        return status;
    if (type != REG_SZ && type != REG_EXPAND_SZ)
        return ERROR_UNSUPPORTED_TYPE;
    // Only what lies in the buffer: the text ends at its first NUL or its last whole unit.
    const auto* characters = reinterpret_cast<const wchar_t*>(buffer.data());
    text.assign(characters,
                BoundedLength(characters, std::min<DWORD>(size, maxBytes) / sizeof(wchar_t)));
    return ERROR_SUCCESS;
} catch (...) {
    return ERROR_NOT_ENOUGH_MEMORY;  // the buffer or the text: allocation is all that can throw
}

LONG ReadDwordValue(HKEY key, const wchar_t* name, DWORD& value) noexcept {
    DWORD type = 0;
    DWORD data = 0;
    DWORD size = sizeof(data);
    const LONG status =
        ::RegQueryValueExW(key, name, nullptr, &type, reinterpret_cast<BYTE*>(&data), &size);
    if (status != ERROR_SUCCESS)
        return status;
    if (type != REG_DWORD || size != sizeof(data))
        return ERROR_UNSUPPORTED_TYPE;
    value = data;
    return ERROR_SUCCESS;
}

LONG WriteStringValue(HKEY key, const wchar_t* name, const std::wstring& text) noexcept {
    return ::RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(text.c_str()),
                            static_cast<DWORD>((text.size() + 1) * sizeof(wchar_t)));
}

LONG WriteDwordValue(HKEY key, const wchar_t* name, DWORD value) noexcept {
    return ::RegSetValueExW(key, name, 0, REG_DWORD, reinterpret_cast<const BYTE*>(&value),
                            sizeof(value));
}

LONG DeleteKeyRecursive(HKEY parent, const wchar_t* subkey) noexcept {
    UniqueRegKey key;
    LONG status = ::RegOpenKeyExW(parent, subkey, 0, KEY_READ | KEY_WRITE, key.put());
    if (status != ERROR_SUCCESS)
        return status;
    // Always delete index 0: the remaining subkeys move up after each deletion.
    for (;;) {
        wchar_t child[256];
        DWORD length = ARRAYSIZE(child);
        status = ::RegEnumKeyExW(key.get(), 0, child, &length, nullptr, nullptr, nullptr, nullptr);
        if (status == ERROR_NO_MORE_ITEMS)
            break;
        if (status != ERROR_SUCCESS)
            return status;
        status = DeleteKeyRecursive(key.get(), child);
        if (status != ERROR_SUCCESS)
            return status;
    }
    key.reset();
    return ::RegDeleteKeyW(parent, subkey);
}
