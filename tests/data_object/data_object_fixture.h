// The data-object fixture: an isolated station store with three stations, data objects over
// items given by their namespace paths, and dialogs answered without a display.
#pragma once

#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include "download/dialog_station_downloader.h"
#include "download/station_downloader.h"
#include "download/win32_serial_port.h"
#include "namespace/pidl_manager.h"
#include "stations/station_list_block.h"
#include "stations/station_store.h"
#include "support/clipboard_formats.h"
#include "support/module_lock.h"
#include "support/registered_messages.h"
#include "support/unique_resource.h"
#include "support/user_interface.h"
#include "tests/stations/station_builders.h"
#include "tests/support/registry_override.h"
#include "view/lv_data_object.h"

constexpr wchar_t kNorthFile[] = L"Quorvel Digital Level\\North\\file1.lv";
constexpr wchar_t kSouthFile[] = L"Quorvel Digital Level\\South\\file1.hvr";  // an LV-30's
// What a download writes in the tests that play one.
constexpr char kContent[] = "A,01,Z\r\n1,0.000,12.5,!,\r\n";

// Answers every modal dialog at once without showing it, and counts the runs; message boxes
// are recorded and answered OK.
class ScriptedDialogs : public UserInterface {
public:
    explicit ScriptedDialogs(INT_PTR answer) : answer_(answer) {}
    int ShowMessageBox(HWND, const std::wstring& text, const std::wstring&, UINT) override {
        messages.push_back(text);
        return IDOK;
    }
    std::vector<std::wstring> messages;
    INT_PTR RunModalDialog(HINSTANCE, UINT, HWND, DLGPROC, LPARAM) override {
        ++runs;
        return answer_;
    }
    int runs = 0;

private:
    INT_PTR answer_;
};

inline FORMATETC Request(const wchar_t* name, DWORD tymed, LONG index = -1) {
    return {RegisteredClipboardFormat(name), nullptr, DVASPECT_CONTENT, index, tymed};
}

// A stream read a few bytes at a time, up to the short read that ends it.
inline std::string ReadToEnd(IStream* stream) {
    std::string content;
    char buffer[7];
    ULONG got = 0;
    do {
        EXPECT_EQ(S_OK, stream->Read(buffer, sizeof buffer, &got));
        content.append(buffer, got);
    } while (got == sizeof buffer);
    return content;
}

inline bool FileExists(const std::wstring& path) {
    return ::GetFileAttributesW(path.c_str()) != INVALID_FILE_ATTRIBUTES;
}

inline std::string ContentOf(const std::filesystem::path& path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

// The files in a folder, by name; none when there is no such folder.
inline std::vector<std::wstring> FilesIn(const std::filesystem::path& folder) {
    std::vector<std::wstring> names;
    std::error_code missing;
    for (const auto& entry : std::filesystem::directory_iterator(folder, missing))
        names.push_back(entry.path().filename().wstring());
    std::sort(names.begin(), names.end());
    return names;
}

// The downloads ("QRV" files) in the temporary folder.
inline std::vector<std::wstring> TemporaryDownloads() {
    std::vector<std::wstring> names = FilesIn(std::filesystem::temp_directory_path());
    std::erase_if(names, [](const std::wstring& name) { return !name.starts_with(L"QRV"); });
    return names;
}

// The content written as the external library writes its file, shared with readers: a download
// target may already hold the file for reading.
inline void WriteAsTheLibraryDoes(const std::wstring& path, const std::string& content) {
    UniqueFileHandle file(::CreateFileW(path.c_str(), GENERIC_WRITE, FILE_SHARE_READ, nullptr,
                                        OPEN_ALWAYS, 0, nullptr));
    DWORD written = 0;
    ASSERT_TRUE(::WriteFile(file.get(), content.data(), static_cast<DWORD>(content.size()),
                            &written, nullptr));
}

// The content written as the serial driver writes its output: through its own receive file.
inline void WriteAsTheDriverDoes(const std::wstring& path, const std::string& content) {
    Win32ReceiveFile file(path);
    ASSERT_EQ(static_cast<uint32_t>(ERROR_SUCCESS), file.Create());
    ASSERT_EQ(static_cast<uint32_t>(ERROR_SUCCESS),
              file.Write(reinterpret_cast<const uint8_t*>(content.data()), content.size()));
    ASSERT_EQ(static_cast<uint32_t>(ERROR_SUCCESS), file.Close());
}

class DataObject : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(SUCCEEDED(::OleInitialize(nullptr)));
        RegisterWindowMessages();  // the progress dialogs' messages
        AddStationOfModel(L"North");
        AddStationOfModel(L"South", IDS_MODEL_LV30);
        AddStationOfModel(L"East");
        // Download records (kept copies, journal) go to a folder of the test's own, never the
        // prefix user's.
        records_ = std::filesystem::temp_directory_path() /
                   (L"lvrecords-" + std::to_wstring(::GetCurrentProcessId()));
        std::filesystem::remove_all(records_);
        std::filesystem::create_directories(records_);
        ::SetEnvironmentVariableW(L"LVSHELLEXT_DOWNLOADS_DIR", records_.c_str());
    }

    void TearDown() override {
        ::SetEnvironmentVariableW(L"LVSHELLEXT_DOWNLOADS_DIR", nullptr);
        std::error_code ignored;  // a file still held shows in the test that held it
        std::filesystem::remove_all(records_, ignored);
        ::OleUninitialize();
        EXPECT_EQ(0, ModuleLockCount()) << "a reference was leaked";
    }

    // A data object over items given by their paths inside the namespace; its downloads run the
    // progress dialogs unless a downloader is given.
    Microsoft::WRL::ComPtr<IDataObject> Over(
        std::initializer_list<const wchar_t*> paths,
        std::shared_ptr<StationDownloader> downloader = nullptr) {
        auto object = downloader ? MakeComObject<CLVDataObject>(std::move(downloader))
                                 : MakeComObject<CLVDataObject>(MakeDialogStationDownloader());
        for (const wchar_t* path : paths) {
            UniqueRelativePidl list = manager_.CreatePidlFromPath(path);
            EXPECT_EQ(S_OK, object->SetItem(list.get()));
        }
        Microsoft::WRL::ComPtr<IDataObject> data;
        EXPECT_EQ(S_OK, object.As(&data));
        return data;
    }

    static HRESULT Get(IDataObject* data, const wchar_t* format, DWORD tymed,
                       UniqueStgMedium& medium, LONG index = -1) {
        FORMATETC request = Request(format, tymed, index);
        return data->GetData(&request, medium.put());
    }

    // "FileContents" of one file item: its download, through whatever user interface is set.
    HRESULT DownloadFile(const wchar_t* item, UniqueStgMedium& medium) {
        return Get(Over({item}).Get(), CFSTR_FILECONTENTS, TYMED_ISTREAM, medium, 0);
    }

    static std::vector<Station> StationsIn(IDataObject* data) {
        UniqueStgMedium medium;
        std::vector<Station> stations;
        EXPECT_EQ(S_OK, Get(data, kStationListFormatName, TYMED_HGLOBAL, medium));
        EXPECT_EQ(S_OK, ParseStationList(medium.get().hGlobal, stations));
        return stations;
    }

    // The local machine too: the prefix's serial ports would replace the stored ones.
    RegistryOverride registry_{RegistryOverride::Hives::CurrentUserAndLocalMachine};
    CPidlMgr manager_;
    std::filesystem::path records_;
};
