// For the tests of lvstations export and import: an isolated store on a computer with COM1 and
// COM3, scratch files, the commands' printed lines, and the store's every value with its type.
#pragma once

#include <windows.h>

#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "stations/station_store.h"
#include "support/unique_resource.h"
#include "tests/support/registry_override.h"
#include "tools/lvstations/station_file_commands.h"

// Key name → value name → (registry type, bytes): everything the store holds, nothing read
// through the store's own load.
using StoreSnapshot =
    std::map<std::wstring, std::map<std::wstring, std::pair<DWORD, std::vector<BYTE>>>>;

inline StoreSnapshot SnapshotStore() {
    StoreSnapshot snapshot;
    UniqueRegKey stations;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ,
                        stations.put()) != ERROR_SUCCESS) {
        return snapshot;
    }
    for (DWORD index = 0;; ++index) {
        wchar_t keyName[256];
        DWORD keyLength = ARRAYSIZE(keyName);
        if (::RegEnumKeyExW(stations.get(), index, keyName, &keyLength, nullptr, nullptr, nullptr,
                            nullptr) != ERROR_SUCCESS) {
            break;
        }
        UniqueRegKey key;
        EXPECT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(stations.get(), keyName, 0, KEY_READ, key.put()));
        auto& values = snapshot[keyName];
        for (DWORD valueIndex = 0;; ++valueIndex) {
            wchar_t valueName[256];
            DWORD nameLength = ARRAYSIZE(valueName);
            DWORD type = 0;
            std::vector<BYTE> data(4096);
            DWORD size = static_cast<DWORD>(data.size());
            if (::RegEnumValueW(key.get(), valueIndex, valueName, &nameLength, nullptr, &type,
                                data.data(), &size) != ERROR_SUCCESS) {
                break;
            }
            data.resize(size);
            values[valueName] = {type, data};
        }
    }
    return snapshot;
}

class StationFileCommands : public testing::Test {
protected:
    void SetUp() override { registry_.SetSerialPorts({L"COM1", L"COM3"}); }

    void TearDown() override {
        for (const std::wstring& path : files_)
            (void)::DeleteFileW(path.c_str());  // a file a test never wrote is not there
    }

    // A file name in the temporary folder, removed after the test.
    std::wstring ScratchFile(const std::wstring& name) {
        wchar_t folder[MAX_PATH];
        EXPECT_NE(0u, ::GetTempPathW(MAX_PATH, folder));
        files_.push_back(std::wstring(folder) + L"lvstations-test-" +
                         std::to_wstring(::GetCurrentProcessId()) + L"-" + name);
        return files_.back();
    }

    std::wstring FileWith(const std::string& bytes, const std::wstring& name = L"in.txt") {
        const std::wstring path = ScratchFile(name);
        UniqueFileHandle file(::CreateFileW(path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS,
                                            FILE_ATTRIBUTE_NORMAL, nullptr));
        DWORD written = 0;
        EXPECT_TRUE(file && ::WriteFile(file.get(), bytes.data(), static_cast<DWORD>(bytes.size()),
                                        &written, nullptr));
        EXPECT_EQ(bytes.size(), written);
        return path;
    }

    int Import(const std::wstring& path, bool replace = false) {
        lines_.clear();
        return ImportStations(path, replace, Printer());
    }

    int Export(const std::wstring& path) {
        lines_.clear();
        return ExportStations(path, Printer());
    }

    // The printed lines that contain every one of the fragments.
    std::vector<std::wstring> LinesWith(std::initializer_list<std::wstring> fragments) const {
        std::vector<std::wstring> found;
        for (const std::wstring& line : lines_) {
            bool all = true;
            for (const std::wstring& fragment : fragments)
                all = all && line.find(fragment) != std::wstring::npos;
            if (all)
                found.push_back(line);
        }
        return found;
    }

    std::wstring AllLines() const {
        std::wstring all;
        for (const std::wstring& line : lines_)
            all += line + L"\n";
        return all;
    }

    RegistryOverride registry_{RegistryOverride::Hives::CurrentUserAndLocalMachine};
    std::vector<std::wstring> lines_;

private:
    PrintLine Printer() {
        return [this](const std::wstring& line) { lines_.push_back(line); };
    }

    std::vector<std::wstring> files_;
};
