// The station keys' values as the registry holds them, for export and for checking an import:
// unlike the store's own load, no port or model is replaced by what this computer offers.
#pragma once

#include <windows.h>

#include <string>
#include <vector>

#include "stations/portable/station_file.h"

struct StoredStation {
    std::wstring keyName;             // "Station 3"
    StationFileSection section;       // the values the key has; those it lacks are listed missing
    std::vector<std::wstring> notes;  // why a value is missing or will not come back byte for byte
};

// Every station key with a readable "Name" (the stations the folder shows), ordered by the number
// in its key name, so that importing the file into an empty store gives the same key names when
// the numbers have no gaps. Empty when there is no store. Keys without a name are counted in
// keysWithoutName.
std::vector<StoredStation> ReadStoredStations(size_t& keysWithoutName);

// Whether the key holds every value exactly as the store writes this station: texts as REG_SZ
// with one terminating zero, numbers as REG_DWORD.
bool HoldsExactly(HKEY stationKey, const Station& station);
