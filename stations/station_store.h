// The per-user station store in the registry: one subkey of "Stations" per station, found by its
// "Name" value. Every call opens its own keys and looks at the registry afresh: nothing is
// cached between calls, so another process's changes are seen at once.
#pragma once

#include <windows.h>

#include <optional>
#include <span>
#include <string>
#include <vector>

#include "stations/portable/pasted_stations.h"
#include "stations/portable/station.h"

std::wstring StationRootKeyPath();
std::wstring StationsKeyPath();

// A record with the defaults; Model is the first model's current text.
Station DefaultStation();

// Looks the station up by station.Name (exact, case-sensitive; the first match in registry
// order, among the stations that are listed: see ListStationNames) and overwrites the record with
// it. When keyName and keyNameCapacity are both given,
// the station's subkey name is copied out (at most *keyNameCapacity characters) and
// *keyNameCapacity set to its length plus one. S_OK when found; E_FAIL when not found or the
// store cannot be opened.
[[nodiscard]] HRESULT FindStation(Station& station, wchar_t* keyName = nullptr,
                                  DWORD* keyNameCapacity = nullptr);

// Writes the station under the lowest free "Station %d". E_INVALIDARG when the name is taken or
// is one the store could not keep (CheckStationName); E_FAIL when the store cannot be opened or
// the station cannot be written whole (a station written in part is removed again).
[[nodiscard]] HRESULT AddStation(const Station& station);

// Writes the stations, in order, under the lowest free "Station %d" keys, passing over the key
// names of one reading of the store; the names are the caller's to choose (no uniqueness check,
// as in UpdateStation). All or nothing: E_INVALIDARG, with nothing written, when a name is one the
// store could not keep; when a key cannot be created or a value written, the keys this call made
// are deleted again and the registry's error comes back as an HRESULT.
[[nodiscard]] HRESULT AddStations(std::span<const Station> stations);

// Update and delete pass the registry's own error code through as their result when the store
// refuses the change, as the store has always answered. Such a code is positive (5 for access
// denied) and so passes SUCCEEDED: callers compare the result with S_OK.
//
// Rewrites the station now called oldName (this is also the rename); no uniqueness check.
// E_INVALIDARG when there is no such station; the registry's code when its key cannot be
// opened; S_OK, with nothing saved, when the key vanished since the look-up.
[[nodiscard]] HRESULT UpdateStation(const std::wstring& oldName, const Station& station);

// E_INVALIDARG when there is no such station; otherwise the registry's code of the recursive
// delete (ERROR_SUCCESS, which is S_OK, when it went).
[[nodiscard]] HRESULT DeleteStation(const Station& station);

// Reads the twelve values of one open station key in their fixed order, stopping at the first
// failing read; returns that registry error (or the status of the last read).
[[nodiscard]] LONG LoadStationValues(Station& station, HKEY stationKey);
// Writes them in the same order, stopping at the first failure, which nobody is told of.
void SaveStationValues(const Station& station, HKEY stationKey);

// The names of the stored stations in the registry's own order (as the folder lists them); one
// walk over the keys. Station keys without a "Name" value are left out silently; those whose name
// cannot be listed as itself (unreadable, empty, with a backslash or a NUL inside, see
// IsListableStationName) are left out too, with one line in the error log per listing.
std::vector<std::wstring> ListStationNames();

// The listed stations, each read whole as FindStation reads it, in the same order; one walk.
std::vector<Station> ListStations();

// The base itself, else "base (2)", "base (3)", …: the first name no station has.
std::wstring MakeUniqueStationName(const std::wstring& base);

struct PasteOutcome {
    HRESULT result = S_OK;                // S_FALSE when refused; a failure of AddStations
    std::optional<PasteRefused> refused;  // set: nothing was written
};

// Stores pasted stations (at most kMaximumPastedStations): one reading of the stored names, the
// names chosen by ChoosePastedNames with this copy prefix, then one AddStations.
[[nodiscard]] PasteOutcome AddPastedStations(std::vector<Station> stations,
                                             const std::wstring& copyPrefix);
