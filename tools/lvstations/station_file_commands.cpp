// Export and import of station files: the file read or written whole, the store asked through
// its own operations, every imported station read back value by value.
#include "tools/lvstations/station_file_commands.h"

#include <windows.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "res/resource.h"
#include "stations/portable/station_file.h"
#include "stations/serial_ports.h"
#include "stations/station_store.h"
#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/read_only_file.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"
#include "tools/lvstations/station_key_values.h"

namespace {

StationFileRules ThisComputersRules() {
    return {{LoadUiText(IDS_MODEL_LV10), LoadUiText(IDS_MODEL_LV20), LoadUiText(IDS_MODEL_LV30)},
            ListSerialPorts()};
}

std::wstring Quoted(const std::wstring& text) {
    return L"\"" + text + L"\"";
}

std::wstring SystemText(HRESULT result) {
    const std::wstring text = SystemMessageText(static_cast<DWORD>(result));
    return text.empty() ? L"error " + std::to_wstring(result) : text;
}

// At most kMaximumStationFileSize + 1 bytes: enough for the reader to refuse a larger file.
[[nodiscard]] HRESULT ReadFileStart(const std::wstring& path,
                                    std::vector<uint8_t>& bytes) noexcept {
    try {
        UniqueFileHandle file;
        uint64_t size = 0;
        if (const HRESULT opened = OpenReadOnlyFile(path, file, size); FAILED(opened))
            return opened;
        bytes.resize(static_cast<size_t>(std::min<uint64_t>(size, kMaximumStationFileSize + 1)));
        size_t done = 0;
        while (done < bytes.size()) {
            DWORD read = 0;
            if (!::ReadFile(file.get(), bytes.data() + done,
                            static_cast<DWORD>(bytes.size() - done), &read, nullptr)) {
                return HRESULT_FROM_WIN32(::GetLastError());
            }
            if (read == 0)
                break;  // the file shrank since its size was taken
            done += read;
        }
        bytes.resize(done);
        return S_OK;
    }
    CATCH_RETURN()
}

// Writes the whole file or, on any failure, removes what was written: no half file is left.
[[nodiscard]] HRESULT WriteWholeFile(const std::wstring& path, const std::string& bytes) noexcept {
    UniqueFileHandle file(::CreateFileW(path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS,
                                        FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!file)
        return HRESULT_FROM_WIN32(::GetLastError());
    HRESULT result = S_OK;
    DWORD written = 0;
    if (!::WriteFile(file.get(), bytes.data(), static_cast<DWORD>(bytes.size()), &written,
                     nullptr) ||
        !::FlushFileBuffers(file.get())) {
        result = HRESULT_FROM_WIN32(::GetLastError());
    } else if (written != bytes.size()) {
        result = HRESULT_FROM_WIN32(ERROR_DISK_FULL);
    }
    file.reset();
    if (FAILED(result))
        (void)::DeleteFileW(path.c_str());  // best effort: the failure itself is what is reported
    return result;
}

std::wstring PortWarning(const std::wstring& path, const StationFileWarning& warning,
                         const std::vector<std::wstring>& ports) {
    std::wstring text = L"warning: " + path + L", line " + std::to_wstring(warning.line) + L": " +
                        Quoted(warning.station) + L" uses the port " + Quoted(warning.port) + L", ";
    if (ports.empty())
        return text + L"and this computer lists no serial ports; stored as written.";
    // As the store reads it back: the one port a computer has stands in for an absent one;
    // among several, none is guessed.
    if (ports.size() == 1) {
        return text +
               L"which this computer does not list; stored as written (until the port exists, "
               L"the folder uses the computer's only port, " +
               ports.front() + L").";
    }
    return text +
           L"which this computer does not list; stored as written (the download names the "
           L"ports present until the port exists).";
}

// Whether the store now holds the station exactly as the file gave it.
bool StoredExactly(const Station& station) {
    Station found;
    found.Name = station.Name;
    wchar_t keyName[260] = {};
    DWORD capacity = ARRAYSIZE(keyName);
    if (FindStation(found, keyName, &capacity) != S_OK)
        return false;
    UniqueRegKey key;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, (StationsKeyPath() + L"\\" + keyName).c_str(), 0,
                        KEY_READ, key.put()) != ERROR_SUCCESS) {
        return false;
    }
    return HoldsExactly(key.get(), station);
}

}  // namespace

int ExportStations(const std::wstring& path, const PrintLine& print) {
    size_t keysWithoutName = 0;
    const std::vector<StoredStation> stored = ReadStoredStations(keysWithoutName);
    bool allAsStored = true;
    if (keysWithoutName != 0) {
        print(L"warning: " + std::to_wstring(keysWithoutName) +
              L" station key(s) without a readable Name, which the folder does not show either, "
              L"are not exported.");
        allAsStored = false;
    }
    if (stored.empty()) {
        print(L"No stations to export; nothing was written.");
        return kExitNotAllDone;
    }
    std::vector<StationFileSection> sections;
    for (const StoredStation& station : stored) {
        for (const std::wstring& note : station.notes) {
            print(L"warning: " + Quoted(station.section.station.Name) + L" (" + station.keyName +
                  L"): " + note + L".");
            allAsStored = false;
        }
        sections.push_back(station.section);
    }
    const std::string text = WriteStationFile(sections);

    // Read back as an import on this computer would: a value the import refuses is named now.
    const StationFileContents check = ReadStationFile(reinterpret_cast<const uint8_t*>(text.data()),
                                                      text.size(), ThisComputersRules());
    if (check.error) {
        print(L"warning: the file will not import as it stands (" +
              DescribeStationFileError(*check.error) + L"); correct it, or the station, first.");
        allAsStored = false;
    }
    const HRESULT written = WriteWholeFile(path, text);
    if (FAILED(written)) {
        print(L"error: " + path + L" cannot be written: " + SystemText(written));
        return kExitReadOrWriteFailed;
    }
    print(L"Exported " + std::to_wstring(sections.size()) + L" station(s) to " + path + L".");
    return allAsStored ? kExitDone : kExitNotAllDone;
}

int ImportStations(const std::wstring& path, bool replace, const PrintLine& print) {
    std::vector<uint8_t> bytes;
    const HRESULT read = ReadFileStart(path, bytes);
    if (FAILED(read)) {
        print(L"error: " + path + L" cannot be read: " + SystemText(read) +
              L" Nothing was imported.");
        return kExitReadOrWriteFailed;
    }
    const StationFileRules rules = ThisComputersRules();
    const StationFileContents contents = ReadStationFile(bytes.data(), bytes.size(), rules);
    if (contents.error) {
        print(L"error: " + path + L", " + DescribeStationFileError(*contents.error) +
              L". Nothing was imported.");
        return kExitFileRefused;
    }
    for (const StationFileWarning& warning : contents.warnings)
        print(PortWarning(path, warning, rules.ports));

    size_t added = 0, replaced = 0, skipped = 0;
    for (const StationFileEntry& entry : contents.stations) {
        const Station& station = entry.station;
        const std::wstring where =
            Quoted(station.Name) + L" (line " + std::to_wstring(entry.line) + L")";
        HRESULT result = AddStation(station);
        bool replacing = false;
        if (result == E_INVALIDARG) {  // the name is taken
            if (!replace) {
                print(L"Skipped " + where +
                      L": a station of that name exists; --replace "
                      L"overwrites it.");
                ++skipped;
                continue;
            }
            replacing = true;
            result = UpdateStation(station.Name, station);
        }
        // The store reports a refused write; reading the values back also catches a value that
        // the registry took but does not give back as written.
        if (FAILED(result) || !StoredExactly(station)) {
            print(L"error: " + where + L" could not be stored" +
                  (FAILED(result) ? L" (" + SystemText(result) + L")" : std::wstring()) +
                  L"; the " + std::to_wstring(added + replaced) +
                  L" station(s) before it in the file were added or replaced.");
            return kExitReadOrWriteFailed;
        }
        print((replacing ? L"Replaced " : L"Added ") + Quoted(station.Name) + L".");
        ++(replacing ? replaced : added);
    }
    print(std::to_wstring(added) + L" added, " + std::to_wstring(replaced) + L" replaced, " +
          std::to_wstring(skipped) + L" skipped.");
    return skipped == 0 ? kExitDone : kExitNotAllDone;
}
