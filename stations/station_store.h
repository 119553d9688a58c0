// The per-user station store in the registry, the serial-port list and the view's display settings.
#pragma once

#include <windows.h>

#include <string>
#include <vector>

#include "res/resource.h"
#include "stations/portable/station.h"

std::wstring StationRootKeyPath();
std::wstring StationsKeyPath();

// A record with the defaults; Model is the first model's current text.
Station DefaultStation();

// Looks the station up by station.Name (exact, case-sensitive) and overwrites the record with it.
// When keyName and keyNameCapacity are both given, the station's subkey name is copied out (at
// most *keyNameCapacity characters) and *keyNameCapacity set to its length plus one.
// S_OK when found; E_FAIL when not found or the store cannot be opened.
HRESULT FindStation(Station& station, wchar_t* keyName = nullptr, DWORD* keyNameCapacity = nullptr);

// E_INVALIDARG when the name is taken; E_FAIL when the store cannot be opened.
HRESULT AddStation(const Station& station);

// Rewrites the station now called oldName (this is also the rename).
HRESULT UpdateStation(const std::wstring& oldName, const Station& station);

HRESULT DeleteStation(const Station& station);

// Reads the twelve values of one open station key in their fixed order, stopping at the first
// failing read; returns that registry error (or the status of the last read).
LONG LoadStationValues(Station& station, HKEY stationKey);
void SaveStationValues(const Station& station, HKEY stationKey);

std::wstring MakeUniqueStationName(const std::wstring& base);

// The names of the stored stations in the registry's own order (as the folder lists them);
// station keys without a readable "Name" are left out.
std::vector<std::wstring> ListStationNames();

// The name a pasted station gets: "Copy of " put in front until no station has it.
std::wstring MakePastedStationName(const std::wstring& name);

// Port names of HKEY_LOCAL_MACHINE\HARDWARE\DEVICEMAP\SERIALCOMM in enumeration order.
size_t EnumerateSerialPorts(std::vector<std::wstring>& ports);

// A movable, zero-initialised, shareable block that the receiver owns; null on failure.
HGLOBAL SerializeStationList(const std::vector<Station>& stations);
// Never reads past the block's real size (GlobalSize). S_OK in every case.
HRESULT ParseStationList(HGLOBAL block, std::vector<Station>& stations);

// Widths of the view's first two columns, for the module's life.
extern int g_displayColumnWidths[2];
bool LoadDisplaySettings();
bool SaveDisplaySettings();

std::wstring ModelInstructionText(const std::wstring& model);

// True when the model is one of the two served by the external communication library.
bool IsExternalLibraryModel(const std::wstring& model);

// The station's name in a namespace path (its second non-empty component, after the root's
// name); empty when the path names no station.
std::wstring StationNameFromPath(const std::wstring& path);

// The file a station's folder shows: "file1.hvr" for the models of the external library,
// "file1.lv" for every other model.
std::wstring StationFileName(const std::wstring& model);
