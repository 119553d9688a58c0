// The view's column widths and their registry value.
#include "stations/display_settings.h"

#include <windows.h>

#include <algorithm>
#include <atomic>

#include "stations/station_store.h"
#include "support/error_handling.h"
#include "support/unique_resource.h"

namespace {

constexpr int kDefaultWidth = kDefaultDisplayColumnWidth;
std::atomic<int> g_widths[kDisplayColumnCount] = {kDefaultWidth, kDefaultWidth};

// Held from comparing the widths to writing them, so that two views ending a column drag at
// once cannot leave the older widths in the store. A slim lock needs no clean-up at unload.
SRWLOCK g_storeLock = SRWLOCK_INIT;
bool g_writeRefused = false;  // guarded by g_storeLock

class StoreLock {
public:
    StoreLock() noexcept { ::AcquireSRWLockExclusive(&g_storeLock); }
    StoreLock(const StoreLock&) = delete;
    StoreLock& operator=(const StoreLock&) = delete;
    ~StoreLock() { ::ReleaseSRWLockExclusive(&g_storeLock); }
};

[[nodiscard]] HRESULT WriteWidths() noexcept {
    try {
        UniqueRegKey root;
        RETURN_IF_WIN32_ERROR(::RegCreateKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0,
                                                nullptr, REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS,
                                                nullptr, root.put(), nullptr));
        DisplayColumnWidths widths{};
        for (size_t column = 0; column < kDisplayColumnCount; ++column)
            widths[column] = g_widths[column];
        const auto data = DisplaySettingsBytes(widths);
        RETURN_IF_WIN32_ERROR(::RegSetValueExW(root.get(), L"Display Settings", 0, REG_BINARY,
                                               data.data(), static_cast<DWORD>(data.size())));
        return S_OK;
    }
    CATCH_RETURN()
}

}  // namespace

int DisplayColumnWidth(size_t column) noexcept {
    return column < kDisplayColumnCount ? g_widths[column].load() : 0;
}

void SetDisplayColumnWidth(size_t column, int width) noexcept {
    if (column < kDisplayColumnCount)
        g_widths[column] = width;
}

bool LoadDisplaySettings() {
    for (std::atomic<int>& width : g_widths)
        width = kDefaultWidth;
    UniqueRegKey root;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0, KEY_READ, root.put()) !=
        ERROR_SUCCESS) {
        return false;
    }
    BYTE data[kDisplaySettingsReadBytes] = {};
    DWORD size = sizeof(data);
    DWORD type = REG_NONE;
    // A value longer than the buffer is refused by the registry; a short one, or one that is not
    // binary at all, by the parse.
    if (::RegQueryValueExW(root.get(), L"Display Settings", nullptr, &type, data, &size) !=
        ERROR_SUCCESS) {
        return false;
    }
    const std::optional<DisplayColumnWidths> widths =
        ParseDisplaySettings(static_cast<RegistryValueType>(type),
                             std::span<const uint8_t>(data, std::min<size_t>(size, sizeof(data))));
    if (!widths)
        return false;
    for (size_t column = 0; column < kDisplayColumnCount; ++column)
        g_widths[column] = (*widths)[column];
    return true;
}

bool SaveDisplaySettings() {
    return SUCCEEDED(WriteWidths());
}

HRESULT StoreDisplayColumnWidths(const int (&widths)[kDisplayColumnCount]) noexcept try {
    StoreLock guard;
    bool changed = g_writeRefused;
    for (size_t column = 0; column < kDisplayColumnCount; ++column) {
        if (g_widths[column].exchange(widths[column]) != widths[column])
            changed = true;
    }
    if (!changed)
        return S_OK;
    // Refused until written: a write that failed (or threw) is made again by the next call.
    g_writeRefused = true;
    RETURN_IF_FAILED(WriteWidths());
    g_writeRefused = false;
    return S_OK;
}
CATCH_RETURN()
