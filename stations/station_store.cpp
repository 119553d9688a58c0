// The station store: every call opens its own keys under HKEY_CURRENT_USER; nothing is cached.
#include "stations/station_store.h"

#include <algorithm>
#include <cstring>
#include <cwchar>
#include <string_view>

#include "stations/portable/station_list_format.h"
#include "namespace/portable/item_id_layout.h"
#include "stations/portable/station_names.h"
#include "support/registry_value.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"

int g_displayColumnWidths[2] = {100, 100};

namespace {

constexpr DWORD kNameValueBytes = 520;  // names of up to 259 characters
constexpr DWORD kKeyNameCapacity = 260;

UniqueRegKey OpenStationsKey() {
    UniqueRegKey key;
    if (::RegCreateKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, nullptr,
                          REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr, key.put(),
                          nullptr) != ERROR_SUCCESS) {
        return {};
    }
    return key;
}

LONG ReadText(HKEY key, const wchar_t* name, std::wstring& field) {
    return ReadStringValue(key, name, kNameValueBytes, field);
}

LONG ReadNumber(HKEY key, const wchar_t* name, uint32_t& field) {
    DWORD value = 0;
    const LONG status = ReadDwordValue(key, name, value);
    if (status == ERROR_SUCCESS)
        field = value;
    return status;
}

// Hands each station key that has a readable "Name", in the registry's order, to visit until it
// answers true; true when it did. The end of the list and any enumeration failure end the walk.
template <typename Visit>
bool VisitStationKeys(HKEY stations, REGSAM access, Visit&& visit) {
    for (DWORD index = 0;; ++index) {
        wchar_t subkeyName[kKeyNameCapacity];
        DWORD length = kKeyNameCapacity;
        if (::RegEnumKeyExW(stations, index, subkeyName, &length, nullptr, nullptr, nullptr,
                            nullptr) != ERROR_SUCCESS) {
            return false;
        }
        UniqueRegKey subkey;
        std::wstring name;
        if (::RegOpenKeyExW(stations, subkeyName, 0, access, subkey.put()) != ERROR_SUCCESS ||
            ReadText(subkey.get(), L"Name", name) != ERROR_SUCCESS) {
            continue;
        }
        if (visit(std::wstring_view(subkeyName, length), subkey.get(), name))
            return true;
    }
}

bool IsStationNameTaken(const std::wstring& name) {
    Station probe;
    probe.Name = name;
    return FindStation(probe) == S_OK;
}

}  // namespace

std::wstring StationRootKeyPath() {
    return L"Software\\Quorvel\\Shell Extensions\\Quorvel LV View";
}

std::wstring StationsKeyPath() {
    return StationRootKeyPath() + L"\\Stations";
}

Station DefaultStation() {
    Station station;
    station.Model = LoadUiText(IDS_MODEL_LV10);
    return station;
}

HRESULT FindStation(Station& station, wchar_t* keyName, DWORD* keyNameCapacity) {
    UniqueRegKey stations = OpenStationsKey();
    if (!stations)
        return E_FAIL;
    const bool found = VisitStationKeys(
        stations.get(), KEY_ALL_ACCESS,
        [&](std::wstring_view subkeyName, HKEY subkey, const std::wstring& name) {
            if (name != station.Name)
                return false;
            // The load's own status is not passed on: a half-written station is still found.
            (void)LoadStationValues(station, subkey);
            if (keyName && keyNameCapacity && *keyNameCapacity > 0) {
                const size_t copied = std::min<size_t>(subkeyName.size(), *keyNameCapacity - 1);
                wmemcpy(keyName, subkeyName.data(), copied);
                keyName[copied] = L'\0';
                *keyNameCapacity = static_cast<DWORD>(copied + 1);
            }
            return true;
        });
    return found ? S_OK : E_FAIL;
}

HRESULT AddStation(const Station& station) {
    Station existing;
    existing.Name = station.Name;
    if (FindStation(existing) == S_OK)
        return E_INVALIDARG;

    UniqueRegKey stations = OpenStationsKey();
    if (!stations)
        return E_FAIL;

    // The lowest free "Station %d" is taken, so a deleted station's number is reused.
    for (unsigned index = 0;; ++index) {
        wchar_t subkeyName[32];
        swprintf(subkeyName, ARRAYSIZE(subkeyName), L"Station %u", index);
        UniqueRegKey subkey;
        DWORD disposition = 0;
        const LONG status =
            ::RegCreateKeyExW(stations.get(), subkeyName, 0, nullptr, REG_OPTION_NON_VOLATILE,
                              KEY_ALL_ACCESS, nullptr, subkey.put(), &disposition);
        // A key that cannot be created at all would make the probe run forever.
        if (status != ERROR_SUCCESS)
            return E_FAIL;
        if (disposition == REG_CREATED_NEW_KEY) {
            SaveStationValues(station, subkey.get());
            return S_OK;
        }
    }
}

HRESULT UpdateStation(const std::wstring& oldName, const Station& station) {
    Station current;
    current.Name = oldName;
    wchar_t subkeyName[kKeyNameCapacity] = {};
    DWORD capacity = kKeyNameCapacity;
    if (FindStation(current, subkeyName, &capacity) != S_OK)
        return E_INVALIDARG;
    if (subkeyName[0] == L'\0')
        return E_FAIL;

    UniqueRegKey stations;
    LONG status = ::RegCreateKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, nullptr,
                                    REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr,
                                    stations.put(), nullptr);
    if (status != ERROR_SUCCESS)
        return status;  // the raw registry error is the result

    UniqueRegKey subkey;
    DWORD disposition = 0;
    status = ::RegCreateKeyExW(stations.get(), subkeyName, 0, nullptr, REG_OPTION_NON_VOLATILE,
                               KEY_ALL_ACCESS, nullptr, subkey.put(), &disposition);
    if (status != ERROR_SUCCESS)
        return status;
    // A key that vanished since the look-up is re-created empty and the update still reports
    // success; callers have always relied on that answer.
    if (disposition == REG_OPENED_EXISTING_KEY)
        SaveStationValues(station, subkey.get());
    return S_OK;
}

HRESULT DeleteStation(const Station& station) {
    Station current;
    current.Name = station.Name;
    wchar_t subkeyName[kKeyNameCapacity] = {};
    DWORD capacity = kKeyNameCapacity;
    if (FindStation(current, subkeyName, &capacity) != S_OK)
        return E_INVALIDARG;
    if (subkeyName[0] == L'\0')
        return E_FAIL;

    UniqueRegKey stations = OpenStationsKey();
    if (!stations)
        return E_FAIL;
    return DeleteKeyRecursive(stations.get(), subkeyName);  // a raw registry error on failure
}

LONG LoadStationValues(Station& station, HKEY stationKey) {
    LONG status = ReadText(stationKey, L"Name", station.Name);
    if (status != ERROR_SUCCESS)
        return status;

    status = ReadText(stationKey, L"Port", station.Port);
    if (status != ERROR_SUCCESS)
        return status;
    std::vector<std::wstring> ports;
    if (EnumerateSerialPorts(ports) > 0 &&
        std::find(ports.begin(), ports.end(), station.Port) == ports.end()) {
        station.Port = ports.front();
    }

    for (auto [name, field] :
         {std::pair{L"StopBits", &station.StopBits}, std::pair{L"BaudRate", &station.BaudRate},
          std::pair{L"Parity", &station.Parity}, std::pair{L"Parity", &station.Parity},
          std::pair{L"DataBits", &station.DataBits}}) {
        status = ReadNumber(stationKey, name, *field);
        if (status != ERROR_SUCCESS)
            return status;
    }

    status = ReadText(stationKey, L"Manufacturer", station.Manufacturer);
    if (status != ERROR_SUCCESS)
        return status;

    status = ReadText(stationKey, L"Model", station.Model);
    if (status != ERROR_SUCCESS)
        return status;
    if (station.Model != LoadUiText(IDS_MODEL_LV20) &&
        station.Model != LoadUiText(IDS_MODEL_LV30)) {
        station.Model = LoadUiText(IDS_MODEL_LV10);
    }

    status = ReadText(stationKey, L"Software", station.Software);
    if (status != ERROR_SUCCESS)
        return status;

    // Protocol and Flow came later than the other values; keys written before them still load.
    (void)ReadNumber(stationKey, L"Protocol", station.Protocol);
    (void)ReadNumber(stationKey, L"Flow", station.Flow);
    return ReadNumber(stationKey, L"CheckSum", station.CheckSum);
}

void SaveStationValues(const Station& station, HKEY stationKey) {
    // Stops at the first failed write; callers are not told, as a half-written station still
    // loads up to its first missing value.
    (void)(WriteStringValue(stationKey, L"Name", station.Name) == ERROR_SUCCESS &&
           WriteStringValue(stationKey, L"Port", station.Port) == ERROR_SUCCESS &&
           WriteDwordValue(stationKey, L"BaudRate", station.BaudRate) == ERROR_SUCCESS &&
           WriteDwordValue(stationKey, L"StopBits", station.StopBits) == ERROR_SUCCESS &&
           WriteDwordValue(stationKey, L"Parity", station.Parity) == ERROR_SUCCESS &&
           WriteDwordValue(stationKey, L"DataBits", station.DataBits) == ERROR_SUCCESS &&
           WriteStringValue(stationKey, L"Manufacturer", station.Manufacturer) == ERROR_SUCCESS &&
           WriteStringValue(stationKey, L"Model", station.Model) == ERROR_SUCCESS &&
           WriteStringValue(stationKey, L"Software", station.Software) == ERROR_SUCCESS &&
           WriteDwordValue(stationKey, L"Protocol", station.Protocol) == ERROR_SUCCESS &&
           WriteDwordValue(stationKey, L"Flow", station.Flow) == ERROR_SUCCESS &&
           WriteDwordValue(stationKey, L"CheckSum", station.CheckSum) == ERROR_SUCCESS);
}

std::wstring MakeUniqueStationName(const std::wstring& base) {
    return MakeUniqueName(base, IsStationNameTaken);
}

std::vector<std::wstring> ListStationNames() {
    std::vector<std::wstring> names;
    UniqueRegKey stations;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ,
                        stations.put()) != ERROR_SUCCESS) {
        return names;
    }
    VisitStationKeys(stations.get(), KEY_READ,
                     [&](std::wstring_view, HKEY, const std::wstring& name) {
                         names.push_back(name);
                         return false;
                     });
    return names;
}

std::wstring MakePastedStationName(const std::wstring& name) {
    return MakePastedName(name, LoadUiText(IDS_COPY_OF), IsStationNameTaken);
}

size_t EnumerateSerialPorts(std::vector<std::wstring>& ports) {
    ports.clear();
    UniqueRegKey key;
    if (::RegOpenKeyExW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DEVICEMAP\\SERIALCOMM", 0, KEY_READ,
                        key.put()) != ERROR_SUCCESS) {
        return 0;
    }
    for (DWORD index = 0;; ++index) {
        wchar_t valueName[64] = {};
        wchar_t data[64] = {};  // 128 bytes
        DWORD nameLength = ARRAYSIZE(valueName);
        DWORD dataBytes = sizeof(data);
        DWORD type = 0;
        if (::RegEnumValueW(key.get(), index, valueName, &nameLength, nullptr, &type,
                            reinterpret_cast<BYTE*>(data), &dataBytes) != ERROR_SUCCESS ||
            type != REG_SZ) {
            break;
        }
        ports.emplace_back(data, BoundedLength(data, dataBytes / sizeof(wchar_t)));
    }
    return ports.size();
}

HGLOBAL SerializeStationList(const std::vector<Station>& stations) {
    try {
        const std::vector<uint8_t> bytes = SerializeStationRecords(stations);
        UniqueHGlobal block(
            ::GlobalAlloc(GMEM_MOVEABLE | GMEM_ZEROINIT | GMEM_SHARE, bytes.size()));
        if (!block)
            return nullptr;
        {
            GlobalLockGuard lock(block.get());
            if (!lock.data())
                return nullptr;
            memcpy(lock.data(), bytes.data(), bytes.size());
        }
        return block.release();
    } catch (...) {
        return nullptr;  // out of memory: the caller sees no block
    }
}

HRESULT ParseStationList(HGLOBAL block, std::vector<Station>& stations) {
    GlobalLockGuard lock(block);
    try {
        stations = ParseStationRecords(static_cast<const uint8_t*>(lock.data()), lock.size());
    } catch (...) {
        // Out of memory while decoding: keep the result contract and report an empty list.
        stations.clear();
    }
    return S_OK;
}

bool LoadDisplaySettings() {
    g_displayColumnWidths[0] = 100;
    g_displayColumnWidths[1] = 100;
    UniqueRegKey root;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0, KEY_READ, root.put()) !=
        ERROR_SUCCESS) {
        return false;
    }
    BYTE data[16] = {};
    DWORD size = sizeof(data);
    DWORD type = REG_NONE;
    // A value too short, too long for the buffer, or not binary at all is not ours to read:
    // text read as widths would give columns millions of pixels wide.
    if (::RegQueryValueExW(root.get(), L"Display Settings", nullptr, &type, data, &size) !=
            ERROR_SUCCESS ||
        type != REG_BINARY || size < 8) {
        return false;
    }
    memcpy(&g_displayColumnWidths[0], data, 4);
    memcpy(&g_displayColumnWidths[1], data + 4, 4);
    return true;
}

bool SaveDisplaySettings() {
    UniqueRegKey root;
    if (::RegCreateKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0, nullptr,
                          REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr, root.put(),
                          nullptr) != ERROR_SUCCESS) {
        return false;
    }
    BYTE data[12] = {};  // the last four bytes carry nothing
    memcpy(data, &g_displayColumnWidths[0], 4);
    memcpy(data + 4, &g_displayColumnWidths[1], 4);
    return ::RegSetValueExW(root.get(), L"Display Settings", 0, REG_BINARY, data, sizeof(data)) ==
           ERROR_SUCCESS;
}

std::wstring ModelInstructionText(const std::wstring& model) {
    if (model == LoadUiText(IDS_MODEL_LV20))
        return LoadUiText(IDS_INSTRUCTIONS_LV20);
    if (model == LoadUiText(IDS_MODEL_LV30))
        return LoadUiText(IDS_INSTRUCTIONS_LV30);
    return LoadUiText(IDS_INSTRUCTIONS_LV10);
}

bool IsExternalLibraryModel(const std::wstring& model) {
    return model == LoadUiText(IDS_MODEL_LV20) || model == LoadUiText(IDS_MODEL_LV30);
}

std::wstring StationNameFromPath(const std::wstring& path) {
    const std::vector<std::wstring> components = SplitPathComponents(path);
    return components.size() > 1 ? components[1] : std::wstring();
}

std::wstring StationFileName(const std::wstring& model) {
    return IsExternalLibraryModel(model) ? L"file1.hvr" : L"file1.lv";
}
