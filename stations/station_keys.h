// The walk over the store's station keys: their names in the registry's order, and the
// stations the folder lists, with the keys it leaves out counted for one line in the log.
#pragma once

#include <windows.h>

#include <string>
#include <string_view>
#include <unordered_set>

#include "stations/portable/station_names.h"
#include "support/unique_resource.h"

// Registry key names are at most 255 characters.
inline constexpr DWORD kStationKeyNameCapacity = 260;

// The "Name" value as the listing takes it: read as LoadStationValues reads it, but a text with
// more than NULs after its first NUL ("Site", NUL, "North") is refused, since it would be listed
// under the name before the NUL, another station's name.
[[nodiscard]] LONG ReadStationName(HKEY key, std::wstring& name) noexcept;

// Hands each subkey name, in the registry's order, to visit until it answers true; true when it
// did. The end of the list and any enumeration failure end the walk.
template <typename Visit>
bool VisitSubkeyNames(HKEY key, Visit&& visit) {
    for (DWORD index = 0;; ++index) {
        wchar_t subkeyName[kStationKeyNameCapacity];
        DWORD length = kStationKeyNameCapacity;
        if (::RegEnumKeyExW(key, index, subkeyName, &length, nullptr, nullptr, nullptr, nullptr) !=
            ERROR_SUCCESS) {
            return false;
        }
        if (visit(std::wstring_view(subkeyName, length)))
            return true;
    }
}

// Station keys whose "Name" is there but cannot be listed as itself.
struct LeftOutStations {
    size_t count = 0;
    std::wstring firstKey;
};

// Hands each listed station key (see ListStationNames), in the registry's order, to visit until
// it answers true; true when it did. Keys with a name that cannot be listed are counted in
// leftOut; keys without a "Name" value (half made) are passed over silently.
template <typename Visit>
bool VisitListedStations(HKEY stations, REGSAM access, LeftOutStations& leftOut, Visit&& visit) {
    return VisitSubkeyNames(stations, [&](std::wstring_view subkeyName) {
        UniqueRegKey subkey;
        std::wstring name;
        const std::wstring keyName(subkeyName);
        if (::RegOpenKeyExW(stations, keyName.c_str(), 0, access, subkey.put()) != ERROR_SUCCESS)
            return false;
        const LONG status = ReadStationName(subkey.get(), name);
        if (status == ERROR_FILE_NOT_FOUND)
            return false;
        if (status != ERROR_SUCCESS || !IsListableStationName(name)) {
            if (leftOut.count++ == 0)
                leftOut.firstKey = keyName;
            return false;
        }
        return visit(subkeyName, subkey.get(), name);
    });
}

// One line per listing, however many stations it left out.
void LogLeftOutStations(const LeftOutStations& leftOut, const wchar_t* function) noexcept;

// Registry key names compare without regard to case: the name folded as they compare.
std::wstring KeyNameFolded(std::wstring name);

// The subkeys' names, folded, from one walk.
std::unordered_set<std::wstring> SubkeyNamesFolded(HKEY stations);
