// The walk over the store's station keys.
#include "stations/station_keys.h"

#include <algorithm>

#include "stations/portable/station_values.h"
#include "support/error_log.h"
#include "support/portable/wide_text.h"

LONG ReadStationName(HKEY key, std::wstring& name) noexcept try {
    // The buffer LoadStationValues reads texts with: names of up to 259 characters.
    wchar_t buffer[kStationTextValueBytes / sizeof(wchar_t)];
    DWORD type = 0;
    DWORD size = sizeof buffer;
    const LONG status =
        ::RegQueryValueExW(key, L"Name", nullptr, &type, reinterpret_cast<BYTE*>(buffer), &size);
    if (status != ERROR_SUCCESS)
        return status;
    if (type != REG_SZ && type != REG_EXPAND_SZ)
        return ERROR_UNSUPPORTED_TYPE;
    const size_t units = std::min<size_t>(size, sizeof buffer) / sizeof(wchar_t);
    const size_t length = BoundedLength(buffer, units);
    if (std::any_of(buffer + length, buffer + units, [](wchar_t unit) { return unit != 0; }))
        return ERROR_INVALID_DATA;
    name.assign(buffer, length);
    return ERROR_SUCCESS;
} catch (...) {
    return ERROR_NOT_ENOUGH_MEMORY;  // the name's copy is all that allocates
}

void LogLeftOutStations(const LeftOutStations& leftOut, const wchar_t* function) noexcept {
    if (leftOut.count == 0)
        return;
    try {
        const std::wstring text =
            std::to_wstring(leftOut.count) +
            L" station key(s) left out of the listing: the \"Name\" is too long, not text, "
            L"empty, or holds a backslash or a NUL, so the station could not be listed as itself "
            L"(first: \"" +
            leftOut.firstKey + L"\")";
        ReportError(L"StationStore", HRESULT_FROM_WIN32(ERROR_INVALID_DATA), function, __LINE__,
                    text.c_str());
    } catch (...) {
        // Out of memory for the text: the listing itself is what matters.
    }
}

std::wstring KeyNameFolded(std::wstring name) {
    if (!name.empty())
        ::CharLowerBuffW(name.data(), static_cast<DWORD>(name.size()));
    return name;
}

std::unordered_set<std::wstring> SubkeyNamesFolded(HKEY stations) {
    std::unordered_set<std::wstring> names;
    VisitSubkeyNames(stations, [&](std::wstring_view subkeyName) {
        names.insert(KeyNameFolded(std::wstring(subkeyName)));
        return false;
    });
    return names;
}
