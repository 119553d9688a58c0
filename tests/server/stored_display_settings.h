// The "Display Settings" value of the isolated store, read and written as raw bytes.
#pragma once

#include <windows.h>

#include <gtest/gtest.h>

#include <vector>

#include "stations/station_store.h"
#include "support/unique_resource.h"

using Bytes = std::vector<BYTE>;

// The value as it is stored; empty when there is none or it is not binary.
inline Bytes StoredDisplaySettings() {
    UniqueRegKey root;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0, KEY_READ, root.put()) !=
        ERROR_SUCCESS)
        return {};
    Bytes data(32);
    DWORD size = static_cast<DWORD>(data.size()), type = 0;
    if (::RegQueryValueExW(root.get(), L"Display Settings", nullptr, &type, data.data(), &size) !=
            ERROR_SUCCESS ||
        type != REG_BINARY)
        return {};
    data.resize(size);
    return data;
}

inline void WriteDisplaySettings(const Bytes& data) {
    UniqueRegKey root;
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegCreateKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0, nullptr, 0,
                                KEY_ALL_ACCESS, nullptr, root.put(), nullptr));
    ASSERT_EQ(ERROR_SUCCESS, ::RegSetValueExW(root.get(), L"Display Settings", 0, REG_BINARY,
                                              data.data(), static_cast<DWORD>(data.size())));
}
