// The per-user station store in the registry: one subkey of "Stations" per station, found by its
// "Name" value. Every call opens its own keys and looks at the registry afresh: nothing is
// cached between calls, so another process's changes are seen at once.
#pragma once

#include <windows.h>

#include <string>
#include <vector>

#include "stations/portable/station.h"

std::wstring StationRootKeyPath();
std::wstring StationsKeyPath();

// A record with the defaults; Model is the first model's current text.
Station DefaultStation();

// Looks the station up by station.Name (exact, case-sensitive; the first match in registry
// order) and overwrites the record with it. When keyName and keyNameCapacity are both given,
// the station's subkey name is copied out (at most *keyNameCapacity characters) and
// *keyNameCapacity set to its length plus one. S_OK when found; E_FAIL when not found or the
// store cannot be opened.
[[nodiscard]] HRESULT FindStation(Station& station, wchar_t* keyName = nullptr,
                                  DWORD* keyNameCapacity = nullptr);

// Writes the station under the lowest free "Station %d". E_INVALIDARG when the name is taken;
// E_FAIL when the store cannot be opened or a key cannot be created.
[[nodiscard]] HRESULT AddStation(const Station& station);

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

// The names of the stored stations in the registry's own order (as the folder lists them);
// station keys without a readable "Name" are left out. One walk over the keys.
std::vector<std::wstring> ListStationNames();

// The base itself, else "base (2)", "base (3)", …: the first name no station has.
std::wstring MakeUniqueStationName(const std::wstring& base);
// The name a pasted station gets: "Copy of " put in front until no station has it.
std::wstring MakePastedStationName(const std::wstring& name);
