// The walk over the store's station keys.
#include "stations/station_keys.h"

#include <algorithm>

#include "stations/portable/registry_data.h"
#include "stations/portable/station_values.h"
#include "stations/registry_station_values.h"
#include "support/error_log.h"
#include "support/portable/wide_text.h"

LONG ReadStationName(HKEY key, std::wstring& name) noexcept try {
    // Read as LoadStationValues reads every text, with one more refusal.
    RegistryStationValues values(key);
    RegistryValueType type = RegistryValueType::kNone;
    std::vector<uint8_t> data;
    ValueReadStatus status = values.ReadValue(L"Name", kStationTextValueBytes, type, data);
    if (status == ValueReadStatus::kRead)
        status = DecodeTextValue(type, data, kStationTextValueBytes, name);
    if (status != ValueReadStatus::kRead)
        return values.CodeOf(status);
    return HasTextAfterItsEnd(data) ? ERROR_INVALID_DATA : ERROR_SUCCESS;
} catch (...) {
    return ERROR_NOT_ENOUGH_MEMORY;  // the buffer and the name's copy are all that allocate
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
