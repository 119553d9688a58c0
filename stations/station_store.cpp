// The station store: every call opens its own keys under HKEY_CURRENT_USER; nothing is cached.
// Operations that try many names or key numbers read the store once per call and decide on
// that one reading, so that they stay linear in the number of stations.
#include "stations/station_store.h"

#include <algorithm>
#include <cwchar>
#include <string_view>
#include <unordered_set>

#include "res/resource.h"
#include "stations/portable/station_names.h"
#include "stations/serial_ports.h"
#include "stations/station_models.h"
#include "support/registry_value.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"

namespace {

constexpr DWORD kNameValueBytes = 520;  // names of up to 259 characters
constexpr DWORD kKeyNameCapacity = 260;

// Opens the "Stations" key for writing, creating it when missing; the registry's status.
[[nodiscard]] LONG OpenStationsKey(UniqueRegKey& key) {
    return ::RegCreateKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, nullptr,
                             REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr, key.put(), nullptr);
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

// Hands each subkey name, in the registry's order, to visit until it answers true; true when it
// did. The end of the list and any enumeration failure end the walk.
template <typename Visit>
bool VisitSubkeyNames(HKEY key, Visit&& visit) {
    for (DWORD index = 0;; ++index) {
        wchar_t subkeyName[kKeyNameCapacity];
        DWORD length = kKeyNameCapacity;
        if (::RegEnumKeyExW(key, index, subkeyName, &length, nullptr, nullptr, nullptr,
                            nullptr) != ERROR_SUCCESS) {
            return false;
        }
        if (visit(std::wstring_view(subkeyName, length)))
            return true;
    }
}

// Hands each station key that has a readable "Name", in the registry's order, to visit until it
// answers true; true when it did.
template <typename Visit>
bool VisitStationKeys(HKEY stations, REGSAM access, Visit&& visit) {
    return VisitSubkeyNames(stations, [&](std::wstring_view subkeyName) {
        UniqueRegKey subkey;
        std::wstring name;
        const std::wstring keyName(subkeyName);
        if (::RegOpenKeyExW(stations, keyName.c_str(), 0, access, subkey.put()) != ERROR_SUCCESS ||
            ReadText(subkey.get(), L"Name", name) != ERROR_SUCCESS) {
            return false;
        }
        return visit(subkeyName, subkey.get(), name);
    });
}

// Registry key names compare without regard to case.
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

// Whether a name is taken, by one reading of the store made when the predicate is built.
NameTakenPredicate TakenInStore() {
    const std::vector<std::wstring> stored = ListStationNames();
    return [taken = std::unordered_set<std::wstring>(stored.begin(), stored.end())](
               const WideString& name) { return taken.count(name) != 0; };
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
    station.Model = FirstModelText();
    return station;
}

HRESULT FindStation(Station& station, wchar_t* keyName, DWORD* keyNameCapacity) {
    UniqueRegKey stations;
    if (OpenStationsKey(stations) != ERROR_SUCCESS)
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

    UniqueRegKey stations;
    if (OpenStationsKey(stations) != ERROR_SUCCESS)
        return E_FAIL;

    // The lowest free "Station %d" is taken, so a deleted station's number is reused. Numbers
    // whose key exists are passed over on one reading of the key names; a key that appears in
    // between is not overwritten, as creation tells whether it was new.
    const std::unordered_set<std::wstring> existingKeys = SubkeyNamesFolded(stations.get());
    for (unsigned index = 0;; ++index) {
        wchar_t subkeyName[32];
        swprintf(subkeyName, ARRAYSIZE(subkeyName), L"Station %u", index);
        if (existingKeys.count(KeyNameFolded(subkeyName)) != 0)
            continue;
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

    // From here on a failure is the registry's own code, not an HRESULT (see the header).
    UniqueRegKey stations;
    LONG status = OpenStationsKey(stations);
    if (status != ERROR_SUCCESS)
        return status;

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

    UniqueRegKey stations;
    if (OpenStationsKey(stations) != ERROR_SUCCESS)
        return E_FAIL;
    return DeleteKeyRecursive(stations.get(), subkeyName);  // the registry's own code (header)
}

LONG LoadStationValues(Station& station, HKEY stationKey) {
    LONG status = ReadText(stationKey, L"Name", station.Name);
    if (status != ERROR_SUCCESS)
        return status;

    status = ReadText(stationKey, L"Port", station.Port);
    if (status != ERROR_SUCCESS)
        return status;
    // A port the computer no longer has becomes its first one; with no list, it stays.
    const std::vector<std::wstring> ports = ListSerialPorts();
    if (!ports.empty() && std::find(ports.begin(), ports.end(), station.Port) == ports.end())
        station.Port = ports.front();

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
    station.Model = KnownModelOrFirst(station.Model);

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

std::wstring MakeUniqueStationName(const std::wstring& base) {
    return MakeUniqueName(base, TakenInStore());
}

std::wstring MakePastedStationName(const std::wstring& name) {
    return MakePastedName(name, LoadUiText(IDS_COPY_OF), TakenInStore());
}
