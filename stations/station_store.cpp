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
#include "stations/serial_ports.h"
#include "stations/station_keys.h"
#include "stations/station_models.h"
#include "support/registry_value.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"

namespace {

constexpr DWORD kKeyNameCapacity = kStationKeyNameCapacity;

// Opens the "Stations" key for writing, creating it when missing; the registry's status.
[[nodiscard]] LONG OpenStationsKey(UniqueRegKey& key) {
    return ::RegCreateKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, nullptr,
                             REG_OPTION_NON_VOLATILE, KEY_ALL_ACCESS, nullptr, key.put(), nullptr);
}

// Whether a name is taken, by one reading of the store made when the predicate is built.
NameTakenPredicate TakenInStore() {
    const std::vector<std::wstring> stored = ListStationNames();
    return [taken = std::unordered_set<std::wstring>(stored.begin(), stored.end())](
               const WideString& name) { return taken.count(name) != 0; };
}

// The twelve values in SaveStationValues' order; the first failing write's status.
[[nodiscard]] LONG WriteStationValues(const Station& station, HKEY stationKey) {
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
[[nodiscard]] LONG CreateFreeStationKey(HKEY stations,
                                        const std::unordered_set<std::wstring>& existingKeys,
                                        unsigned& next, std::wstring& keyName,
                                        UniqueRegKey& subkey) {
    for (;; ++next) {
        wchar_t candidate[32];
        swprintf(candidate, ARRAYSIZE(candidate), L"Station %u", next);
        if (existingKeys.count(KeyNameFolded(candidate)) != 0)
            continue;
        DWORD disposition = 0;
        const LONG status =
            ::RegCreateKeyExW(stations, candidate, 0, nullptr, REG_OPTION_NON_VOLATILE,
                              KEY_ALL_ACCESS, nullptr, subkey.put(), &disposition);
        // A key that cannot be created at all would make the probe run forever.
        if (status != ERROR_SUCCESS)
            return status;
        if (disposition == REG_CREATED_NEW_KEY) {
            keyName = candidate;
            ++next;
            return ERROR_SUCCESS;
        }
    }
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
    // Only the listed stations are found: the folder acts on no other (its listing logs them).
    LeftOutStations notListed;
    const bool found = VisitListedStations(
        stations.get(), KEY_ALL_ACCESS, notListed,
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
    if (CheckStationName(station.Name) != StationNameProblem::kNone)
        return E_INVALIDARG;
    Station existing;
    existing.Name = station.Name;
    if (FindStation(existing) == S_OK)
        return E_INVALIDARG;
    return AddStations({&station, 1}) == S_OK ? S_OK : E_FAIL;
}

HRESULT AddStations(std::span<const Station> stations) {
    for (const Station& station : stations) {
        if (CheckStationName(station.Name) != StationNameProblem::kNone)
            return E_INVALIDARG;
    }
    UniqueRegKey stationsKey;
    if (OpenStationsKey(stationsKey) != ERROR_SUCCESS)
        return E_FAIL;

    // The lowest free numbers are taken, so deleted stations' numbers are reused. Numbers whose
    // key exists are passed over on one reading of the key names, and the probe goes on from the
    // last number taken: the batch costs the store's size plus its own, not their product.
    const std::unordered_set<std::wstring> existingKeys = SubkeyNamesFolded(stationsKey.get());
    std::vector<std::wstring> written;
    written.reserve(stations.size());
    unsigned next = 0;
    LONG status = ERROR_SUCCESS;
    for (const Station& station : stations) {
        UniqueRegKey subkey;
        std::wstring keyName;
        status = CreateFreeStationKey(stationsKey.get(), existingKeys, next, keyName, subkey);
        if (status != ERROR_SUCCESS)
            break;
        written.push_back(std::move(keyName));
        status = WriteStationValues(station, subkey.get());
        if (status != ERROR_SUCCESS)
            break;
    }
    if (status == ERROR_SUCCESS)
        return S_OK;
    // All or nothing: a store that refused the tenth station keeps none of the batch. A key that
    // will not go either is left for the listing, which shows what is stored.
    for (const std::wstring& keyName : written)
        (void)DeleteKeyRecursive(stationsKey.get(), keyName.c_str());
    return HRESULT_FROM_WIN32(status);
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

namespace {

// An open station key as the portable reader's source of values. It keeps the registry's own
// code of its last read, the one LoadStationValues passes on when that read was refused.
class RegistryStationValues final : public StationValueSource {
public:
    explicit RegistryStationValues(HKEY key) noexcept : key_(key) {}

    ValueReadStatus ReadValue(const wchar_t* name, size_t capacity, RegistryValueType& type,
                              std::vector<uint8_t>& data) override {
        // Never a null buffer: given none, the registry answers with the value's size instead.
        data.assign(std::max<size_t>(capacity, 1), 0);
        DWORD valueType = REG_NONE;
        DWORD size = static_cast<DWORD>(capacity);  // the reader's own small constants
        lastError_ = ::RegQueryValueExW(key_, name, nullptr, &valueType, data.data(), &size);
        if (lastError_ != ERROR_SUCCESS) {
            data.clear();
            switch (lastError_) {
                case ERROR_FILE_NOT_FOUND:
                    return ValueReadStatus::kMissing;
                case ERROR_MORE_DATA:
                    return ValueReadStatus::kTooLong;
                default:
                    return ValueReadStatus::kFailed;
            }
        }
        data.resize(std::min<size_t>(size, capacity));
        type = static_cast<RegistryValueType>(valueType);
        return ValueReadStatus::kRead;
    }

    [[nodiscard]] LONG LastError() const noexcept { return lastError_; }

private:
    HKEY key_;
    LONG lastError_ = ERROR_SUCCESS;
};

}  // namespace

LONG LoadStationValues(Station& station, HKEY stationKey) {
    RegistryStationValues values(stationKey);
    const StationReadRules rules{[] { return ListSerialPorts(); }, FirstModelText(),
                                 LoadUiText(IDS_MODEL_LV20), LoadUiText(IDS_MODEL_LV30)};
    // The read that failed is always the last one made, so a refusal is the registry's own code.
    switch (ReadStationValues(station, values, rules)) {
        case ValueReadStatus::kRead:
            return ERROR_SUCCESS;
        case ValueReadStatus::kMissing:
            return ERROR_FILE_NOT_FOUND;
        case ValueReadStatus::kTooLong:
            return ERROR_MORE_DATA;
        case ValueReadStatus::kWrongType:
            return ERROR_UNSUPPORTED_TYPE;
        case ValueReadStatus::kFailed:
            break;
    }
    return values.LastError();
}

void SaveStationValues(const Station& station, HKEY stationKey) {
    // Stops at the first failed write; callers are not told, as a half-written station still
    // loads up to its first missing value.
    (void)WriteStationValues(station, stationKey);
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

PasteOutcome AddPastedStations(std::vector<Station> stations, const std::wstring& copyPrefix) {
    PasteOutcome outcome;
    const std::vector<std::wstring> stored = ListStationNames();
    PastedNames chosen = ChoosePastedNames(
        stations, std::unordered_set<std::wstring>(stored.begin(), stored.end()), copyPrefix);
    if (chosen.refused) {
        outcome.result = S_FALSE;
        outcome.refused = std::move(chosen.refused);
        return outcome;
    }
    for (size_t index = 0; index < stations.size(); ++index)
        stations[index].Name = std::move(chosen.names[index]);
    outcome.result = AddStations(stations);
    return outcome;
}
