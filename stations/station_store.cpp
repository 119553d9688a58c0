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
#include "stations/portable/station_values.h"
#include "stations/registry_station_values.h"
#include "stations/serial_ports.h"
#include "stations/station_keys.h"
#include "stations/station_models.h"
#include "support/error_handling.h"
#include "support/registry_value.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"

namespace {

constexpr DWORD kKeyNameCapacity = kStationKeyNameCapacity;

// Opens the "Stations" key for writing, creating it when missing.
[[nodiscard]] HRESULT OpenStationsKey(UniqueRegKey& key) noexcept try {
    RETURN_IF_WIN32_ERROR(::RegCreateKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0,
                                            nullptr, REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS,
                                            nullptr, key.put(), nullptr));
    return S_OK;
}
CATCH_RETURN()

// Looks the station up for a change: its subkey name, or E_INVALIDARG (not logged) when there is
// no such station.
[[nodiscard]] HRESULT FindStationKey(const std::wstring& name,
                                     wchar_t (&subkeyName)[kKeyNameCapacity]) noexcept try {
    Station current;
    current.Name = name;
    DWORD capacity = kKeyNameCapacity;
    const HRESULT found = FindStation(current, subkeyName, &capacity);
    if (found == E_FAIL)
        return E_INVALIDARG;
    RETURN_IF_FAILED(found);
    RETURN_HR_IF(E_FAIL, subkeyName[0] == L'\0');
    return S_OK;
}
CATCH_RETURN()

// Whether a name is taken, by one reading of the store made when the predicate is built.
NameTakenPredicate TakenInStore() {
    const std::vector<std::wstring> stored = ListStationNames();
    return [taken = std::unordered_set<std::wstring>(stored.begin(), stored.end())](
               const WideString& name) { return taken.count(name) != 0; };
}

// The twelve values in SaveStationValues' order; the first failing write's status.
[[nodiscard]] LONG WriteStationValues(const Station& station, HKEY stationKey) noexcept {
    LONG status = ERROR_SUCCESS;
    const auto text = [&](const wchar_t* name, const std::wstring& value) {
        if (status == ERROR_SUCCESS)
            status = WriteStringValue(stationKey, name, value);
    };
    const auto number = [&](const wchar_t* name, uint32_t value) {
        if (status == ERROR_SUCCESS)
            status = WriteDwordValue(stationKey, name, value);
    };
    text(L"Name", station.Name);
    text(L"Port", station.Port);
    number(L"BaudRate", station.BaudRate);
    number(L"StopBits", station.StopBits);
    number(L"Parity", station.Parity);
    number(L"DataBits", station.DataBits);
    text(L"Manufacturer", station.Manufacturer);
    text(L"Model", station.Model);
    text(L"Software", station.Software);
    number(L"Protocol", station.Protocol);
    number(L"Flow", station.Flow);
    number(L"CheckSum", station.CheckSum);
    return status;
}

// Creates the lowest "Station %d" from *next on that neither the reading of the key names nor
// the registry itself has; *next moves past it. A key made by someone else since the reading is
// never overwritten, as creation tells whether the key was new.
[[nodiscard]] HRESULT CreateFreeStationKey(HKEY stations,
                                           const std::unordered_set<std::wstring>& existingKeys,
                                           unsigned& next, std::wstring& keyName,
                                           UniqueRegKey& subkey) noexcept try {
    for (;; ++next) {
        wchar_t candidate[32];
        swprintf(candidate, ARRAYSIZE(candidate), L"Station %u", next);
        if (existingKeys.count(KeyNameFolded(candidate)) != 0)
            continue;
        DWORD disposition = 0;
        // A key that cannot be created at all would make the probe run forever.
        RETURN_IF_WIN32_ERROR(::RegCreateKeyExW(stations, candidate, 0, nullptr,
                                                REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr,
                                                subkey.put(), &disposition));
        if (disposition == REG_CREATED_NEW_KEY) {
            keyName = candidate;
            ++next;
            return S_OK;
        }
    }
}
CATCH_RETURN()

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

HRESULT FindStation(Station& station, wchar_t* keyName, DWORD* keyNameCapacity) noexcept try {
    UniqueRegKey stations;
    const LONG opened =
        ::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ, stations.put());
    // No store yet holds no station: an answer, not a failure.
    if (opened == ERROR_FILE_NOT_FOUND)
        return E_FAIL;
    RETURN_IF_WIN32_ERROR(opened);
    // Only the listed stations are found: the folder acts on no other (its listing logs them).
    LeftOutStations notListed;
    const bool found = VisitListedStations(
        stations.get(), KEY_READ, notListed,
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
    // Not found is the answer to a free name, asked for again and again: never logged.
    return found ? S_OK : E_FAIL;
}
CATCH_RETURN()

HRESULT AddStation(const Station& station) noexcept try {
    // A refused or taken name is the caller's to show, not a failure of the store.
    if (CheckStationName(station.Name) != StationNameProblem::kNone)
        return E_INVALIDARG;
    Station existing;
    existing.Name = station.Name;
    const HRESULT found = FindStation(existing);
    if (found == S_OK)
        return E_INVALIDARG;
    if (found != E_FAIL)
        RETURN_IF_FAILED(found);
    RETURN_IF_FAILED(AddStations({&station, 1}));
    return S_OK;
}
CATCH_RETURN()

HRESULT AddStations(std::span<const Station> stations) noexcept try {
    for (const Station& station : stations) {
        if (CheckStationName(station.Name) != StationNameProblem::kNone)
            return E_INVALIDARG;
    }
    UniqueRegKey stationsKey;
    RETURN_IF_FAILED(OpenStationsKey(stationsKey));

    // The lowest free numbers are taken, so deleted stations' numbers are reused. Numbers whose
    // key exists are passed over on one reading of the key names, and the probe goes on from the
    // last number taken: the batch costs the store's size plus its own, not their product.
    const std::unordered_set<std::wstring> existingKeys = SubkeyNamesFolded(stationsKey.get());
    std::vector<std::wstring> written;
    written.reserve(stations.size());
    unsigned next = 0;
    HRESULT result = S_OK;
    for (const Station& station : stations) {
        UniqueRegKey subkey;
        std::wstring keyName;
        result = CreateFreeStationKey(stationsKey.get(), existingKeys, next, keyName, subkey);
        if (FAILED(result))
            break;
        written.push_back(std::move(keyName));  // reserved: no allocation
        result = SaveStationValues(station, subkey.get());
        if (FAILED(result))
            break;
    }
    if (SUCCEEDED(result))
        return S_OK;
    // All or nothing: a store that refused the tenth station keeps none of the batch. A key that
    // will not go either is left for the listing, which shows what is stored.
    for (const std::wstring& keyName : written)
        (void)DeleteKeyRecursive(stationsKey.get(), keyName.c_str());
    RETURN_IF_FAILED(result);
    return S_OK;
}
CATCH_RETURN()

HRESULT UpdateStation(const std::wstring& oldName, const Station& station) noexcept try {
    wchar_t subkeyName[kKeyNameCapacity] = {};
    const HRESULT found = FindStationKey(oldName, subkeyName);
    if (found == E_INVALIDARG)
        return found;
    RETURN_IF_FAILED(found);

    UniqueRegKey stations;
    RETURN_IF_FAILED(OpenStationsKey(stations));
    // Opened, not created: a key deleted since the look-up is no station to rewrite, and making
    // it again would leave an empty key that lists nothing.
    UniqueRegKey subkey;
    const LONG opened =
        ::RegOpenKeyExW(stations.get(), subkeyName, 0, KEY_ALL_ACCESS, subkey.put());
    if (opened == ERROR_FILE_NOT_FOUND)
        return E_INVALIDARG;
    RETURN_IF_WIN32_ERROR(opened);
    RETURN_IF_FAILED(SaveStationValues(station, subkey.get()));
    return S_OK;
}
CATCH_RETURN()

HRESULT DeleteStation(const Station& station) noexcept try {
    wchar_t subkeyName[kKeyNameCapacity] = {};
    const HRESULT found = FindStationKey(station.Name, subkeyName);
    if (found == E_INVALIDARG)
        return found;
    RETURN_IF_FAILED(found);

    UniqueRegKey stations;
    RETURN_IF_FAILED(OpenStationsKey(stations));
    const LONG deleted = DeleteKeyRecursive(stations.get(), subkeyName);
    // Gone since the look-up (deleted in another view): no such station any more.
    if (deleted == ERROR_FILE_NOT_FOUND)
        return E_INVALIDARG;
    RETURN_IF_WIN32_ERROR(deleted);
    return S_OK;
}
CATCH_RETURN()

HRESULT LoadStationValues(Station& station, HKEY stationKey) noexcept try {
    RegistryStationValues values(stationKey);
    const StationReadRules rules{[] { return ListSerialPorts(); }, FirstModelText(),
                                 LoadUiText(IDS_MODEL_LV20), LoadUiText(IDS_MODEL_LV30)};
    const ValueReadStatus status = ReadStationValues(station, values, rules);
    // The registry's refusal is logged; what the data holds is an answer (a half-written station
    // loads up to its gap), returned without a log line, as every listing would write it again.
    if (status == ValueReadStatus::kFailed)
        RETURN_IF_WIN32_ERROR(values.CodeOf(status));
    return HRESULT_FROM_WIN32(values.CodeOf(status));
}
CATCH_RETURN()

HRESULT SaveStationValues(const Station& station, HKEY stationKey) noexcept {
    RETURN_IF_WIN32_ERROR(WriteStationValues(station, stationKey));
    return S_OK;
}

std::vector<std::wstring> ListStationNames() {
    std::vector<std::wstring> names;
    UniqueRegKey stations;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ,
                        stations.put()) != ERROR_SUCCESS) {
        return names;
    }
    LeftOutStations leftOut;
    VisitListedStations(stations.get(), KEY_READ, leftOut,
                        [&](std::wstring_view, HKEY, const std::wstring& name) {
                            names.push_back(name);
                            return false;
                        });
    LogLeftOutStations(leftOut, L"ListStationNames");
    return names;
}

std::vector<Station> ListStations() {
    std::vector<Station> listed;
    UniqueRegKey stations;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ,
                        stations.put()) != ERROR_SUCCESS) {
        return listed;
    }
    // Each record starts as FindStation's callers' do: a value that cannot be read keeps its
    // default.
    const Station defaults = DefaultStation();
    LeftOutStations leftOut;
    VisitListedStations(stations.get(), KEY_READ, leftOut,
                        [&](std::wstring_view, HKEY subkey, const std::wstring& name) {
                            Station station = defaults;
                            station.Name = name;
                            // As in FindStation: a half-written station is still listed.
                            (void)LoadStationValues(station, subkey);
                            listed.push_back(std::move(station));
                            return false;
                        });
    LogLeftOutStations(leftOut, L"ListStations");
    return listed;
}

std::wstring MakeUniqueStationName(const std::wstring& base) {
    return MakeUniqueName(base, TakenInStore());
}

PasteOutcome AddPastedStations(std::vector<Station> stations,
                               const std::wstring& copyPrefix) noexcept {
    PasteOutcome outcome;
    try {
        const std::vector<std::wstring> stored = ListStationNames();
        PastedNames chosen = ChoosePastedNames(
            stations, std::unordered_set<std::wstring>(stored.begin(), stored.end()), copyPrefix);
        if (chosen.refused) {
            outcome.result = S_FALSE;
            outcome.refused = std::move(chosen.refused);
            return outcome;
        }
        for (size_t index = 0; index < stations.size(); ++index)
            stations[index].Name = chosen.names[index];
        outcome.names = std::move(chosen.names);
    } catch (...) {
        outcome = PasteOutcome{};
        outcome.result = ResultFromCaughtException();
        LogFailure(outcome.result, __FILE__, __func__, __LINE__);
        return outcome;
    }
    outcome.result = AddStations(stations);
    return outcome;
}
