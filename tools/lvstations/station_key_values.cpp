// Station keys read value by value with their registry types, for export and for checking an
// import.
#include "tools/lvstations/station_key_values.h"

#include <algorithm>
#include <cstring>
#include <string_view>

#include "stations/station_store.h"
#include "support/registry_value.h"
#include "support/unique_resource.h"

namespace {

constexpr DWORD kNameValueBytes = 520;  // as the store reads a name
// Far beyond any text the store writes; a larger value is left out rather than read.
constexpr DWORD kLargestValueBytes = 64 * 1024;

struct RawValue {
    LONG status = ERROR_FILE_NOT_FOUND;
    DWORD type = REG_NONE;
    std::vector<BYTE> bytes;
};

RawValue ReadRawValue(HKEY key, const wchar_t* name) {
    RawValue value;
    DWORD size = 0;
    value.status = ::RegQueryValueExW(key, name, nullptr, &value.type, nullptr, &size);
    if (value.status != ERROR_SUCCESS)
        return value;
    if (size > kLargestValueBytes) {
        value.status = ERROR_MORE_DATA;
        return value;
    }
    value.bytes.resize(size);
    BYTE unused = 0;  // a value of no bytes still needs somewhere to be read into
    value.status = ::RegQueryValueExW(key, name, nullptr, &value.type,
                                      size ? value.bytes.data() : &unused, &size);
    value.bytes.resize(std::min<size_t>(size, value.bytes.size()));
    return value;
}

std::vector<BYTE> StoreBytesOf(const std::wstring& text) {
    const auto* first = reinterpret_cast<const BYTE*>(text.c_str());
    return std::vector<BYTE>(first, first + (text.size() + 1) * sizeof(wchar_t));
}

// The value as the store reads it into the record; a note when it cannot be read as the field's
// type, or when its bytes are not those the store would write for what it reads.
bool ReadField(HKEY key, const StationFieldInfo& info, Station& station, std::wstring& note) {
    const RawValue value = ReadRawValue(key, info.valueName);
    const std::wstring name = info.valueName;
    if (value.status == ERROR_FILE_NOT_FOUND) {
        note = name + L" is missing";
        return false;
    }
    if (value.status != ERROR_SUCCESS) {
        note = name + L" cannot be read (error " + std::to_wstring(value.status) + L")";
        return false;
    }
    if (info.number) {
        if (value.type != REG_DWORD || value.bytes.size() != sizeof(DWORD)) {
            note = name + L" is not a REG_DWORD number";
            return false;
        }
        DWORD number = 0;
        std::memcpy(&number, value.bytes.data(), sizeof number);
        station.*info.number = number;
        return true;
    }
    if (value.type != REG_SZ && value.type != REG_EXPAND_SZ) {
        note = name + L" is not a REG_SZ text";
        return false;
    }
    const size_t units = value.bytes.size() / sizeof(wchar_t);
    std::wstring text(units, L'\0');
    if (units != 0)
        std::memcpy(text.data(), value.bytes.data(), units * sizeof(wchar_t));
    text.resize(BoundedLength(text.c_str(), units));  // the store's reading ends at the first zero
    if (value.type != REG_SZ || value.bytes != StoreBytesOf(text)) {
        note = name +
               L" is stored in a form of its own (type or terminating zero); the import "
               L"writes it as the store does";
    }
    station.*info.text = std::move(text);
    return true;
}

// "Station 12" → 12, as the store names its keys; any other key name sorts after them all.
unsigned long long KeyNumber(const std::wstring& keyName) {
    constexpr std::wstring_view kPrefix = L"Station ";
    constexpr unsigned long long kOther = ~0ULL;
    if (keyName.size() <= kPrefix.size() || keyName.size() > kPrefix.size() + 10 ||
        keyName.compare(0, kPrefix.size(), kPrefix) != 0) {
        return kOther;
    }
    unsigned long long number = 0;
    for (size_t i = kPrefix.size(); i < keyName.size(); ++i) {
        if (keyName[i] < L'0' || keyName[i] > L'9')
            return kOther;
        number = number * 10 + static_cast<unsigned>(keyName[i] - L'0');
    }
    return number;
}

}  // namespace

std::vector<StoredStation> ReadStoredStations(size_t& keysWithoutName) {
    keysWithoutName = 0;
    std::vector<StoredStation> stations;
    UniqueRegKey store;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ, store.put()) !=
        ERROR_SUCCESS) {
        return stations;
    }
    for (DWORD index = 0;; ++index) {
        wchar_t keyName[256];
        DWORD length = ARRAYSIZE(keyName);
        if (::RegEnumKeyExW(store.get(), index, keyName, &length, nullptr, nullptr, nullptr,
                            nullptr) != ERROR_SUCCESS) {
            break;
        }
        UniqueRegKey key;
        StoredStation stored;
        stored.keyName.assign(keyName, length);
        Station& station = stored.section.station;
        // Listed exactly when the store lists it: a "Name" that its own reading accepts.
        if (::RegOpenKeyExW(store.get(), stored.keyName.c_str(), 0, KEY_READ, key.put()) !=
                ERROR_SUCCESS ||
            ReadStringValue(key.get(), L"Name", kNameValueBytes, station.Name) != ERROR_SUCCESS) {
            ++keysWithoutName;
            continue;
        }
        for (const StationFieldInfo& info : StationFields()) {
            std::wstring note;
            if (!ReadField(key.get(), info, station, note))
                stored.section.missing.push_back(info.field);
            if (!note.empty())
                stored.notes.push_back(note);
        }
        stations.push_back(std::move(stored));
    }
    std::stable_sort(stations.begin(), stations.end(),
                     [](const StoredStation& a, const StoredStation& b) {
                         const auto numberA = KeyNumber(a.keyName), numberB = KeyNumber(b.keyName);
                         return numberA != numberB ? numberA < numberB : a.keyName < b.keyName;
                     });
    return stations;
}

bool HoldsExactly(HKEY stationKey, const Station& station) {
    for (const StationFieldInfo& info : StationFields()) {
        const RawValue value = ReadRawValue(stationKey, info.valueName);
        if (value.status != ERROR_SUCCESS)
            return false;
        if (info.number) {
            DWORD number = station.*info.number;
            const auto* first = reinterpret_cast<const BYTE*>(&number);
            if (value.type != REG_DWORD ||
                value.bytes != std::vector<BYTE>(first, first + sizeof number)) {
                return false;
            }
        } else if (value.type != REG_SZ || value.bytes != StoreBytesOf(station.*info.text)) {
            return false;
        }
    }
    return true;
}
