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

// Every status-returning operation answers with an HRESULT: S_OK, or a failure that is either an
// answer about the names asked for (E_FAIL not found, E_INVALIDARG as listed below), which is
// normal and not logged, or a failure of the registry (HRESULT_FROM_WIN32 of its code, so that
// access denied reads as a failure, E_OUTOFMEMORY when memory ran out), which is logged where it
// happens. Nothing throws.

// Looks the station up by station.Name (exact, case-sensitive; the first match in registry
// order, among the stations that are listed: see ListStationNames) and overwrites the record with
// it. When keyName and keyNameCapacity are both given,
// the station's subkey name is copied out (at most *keyNameCapacity characters) and
// *keyNameCapacity set to its length plus one. S_OK when found; E_FAIL, not logged, when not
// found (no store yet included: a free name is an answer MakeUniqueStationName and the sheet
// ask for); the registry's error when the store is there but cannot be read. Reading needs no
// write access: a store that refuses changes is still searched.
[[nodiscard]] HRESULT FindStation(Station& station, wchar_t* keyName = nullptr,
                                  DWORD* keyNameCapacity = nullptr) noexcept;

// Writes the station under the lowest free "Station %d". E_INVALIDARG when the name is taken or
// is one the store could not keep (CheckStationName); the registry's error when the store cannot
// be opened or the station cannot be written whole (a station written in part is removed again).
[[nodiscard]] HRESULT AddStation(const Station& station) noexcept;

// Writes the stations, in order, under the lowest free "Station %d" keys, passing over the key
// names of one reading of the store; the names are the caller's to choose (no uniqueness check,
// as in UpdateStation). All or nothing: E_INVALIDARG, with nothing written, when a name is one the
// store could not keep; when a key cannot be created or a value written, the keys this call made
// are deleted again and the registry's error comes back.
[[nodiscard]] HRESULT AddStations(std::span<const Station> stations) noexcept;

// Rewrites the station now called oldName (this is also the rename); no uniqueness check.
// E_INVALIDARG when there is no such station, also when its key vanished between the look-up and
// the write (deleted in another view: there is nothing left to edit, and no empty key is made in
// its place); the registry's error when the key cannot be opened or a value not written.
[[nodiscard]] HRESULT UpdateStation(const std::wstring& oldName, const Station& station) noexcept;

// E_INVALIDARG when there is no such station (also when it went since the look-up); the
// registry's error when the store refuses the delete.
[[nodiscard]] HRESULT DeleteStation(const Station& station) noexcept;

// Reads the twelve values of one open station key in their fixed order, stopping at the first
// failing read; S_OK, or the HRESULT of that read's registry code. A value that is missing, too
// long or of the wrong type is an answer about the data (callers go on with the fields read so
// far) and is not logged; a read the registry refuses is.
[[nodiscard]] HRESULT LoadStationValues(Station& station, HKEY stationKey) noexcept;
// Writes them in the same order, stopping at the first failing write, whose error it returns.
[[nodiscard]] HRESULT SaveStationValues(const Station& station, HKEY stationKey) noexcept;

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
    std::vector<std::wstring> names;      // the names AddStations was asked to store them under
};

// Stores pasted stations (at most kMaximumPastedStations): one reading of the stored names, the
// names chosen by ChoosePastedNames with this copy prefix, then one AddStations. E_OUTOFMEMORY,
// logged, when memory ran out before the stations were stored.
[[nodiscard]] PasteOutcome AddPastedStations(std::vector<Station> stations,
                                             const std::wstring& copyPrefix) noexcept;
