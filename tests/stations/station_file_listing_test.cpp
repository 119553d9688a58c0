// Twenty stations imported from one file, then listed by the shell as Explorer lists the folder:
// the extension registered in the private prefix, the store isolated.
#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "tests/server/extension_module.h"
#include "tests/support/registry_override.h"
#include "tools/lvstations/station_file_commands.h"

using Microsoft::WRL::ComPtr;

namespace {

const std::wstring kFolderPath =
    L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

class ImportedStationsInTheShell : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(S_OK, ::CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED));
        // Only the user's hive: registration goes to the prefix's own classes.
        registry_ = std::make_unique<RegistryOverride>();
        module_ = std::make_unique<ExtensionModule>();
        ASSERT_EQ(S_OK, module_->Register());
    }

    void TearDown() override {
        EXPECT_EQ(S_OK, module_->CanUnloadNow()) << "a reference left over";
        EXPECT_EQ(S_OK, module_->Unregister());
        module_.reset();
        registry_.reset();
        (void)::DeleteFileW(file_.c_str());  // absent when the test failed before writing it
        ::CoUninitialize();
    }

    std::wstring WriteFile(const std::string& text) {
        wchar_t folder[MAX_PATH];
        EXPECT_NE(0u, ::GetTempPathW(MAX_PATH, folder));
        file_ = std::wstring(folder) + L"lvstations-listing-" +
                std::to_wstring(::GetCurrentProcessId()) + L".txt";
        UniqueFileHandle file(::CreateFileW(file_.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS,
                                            FILE_ATTRIBUTE_NORMAL, nullptr));
        DWORD written = 0;
        EXPECT_TRUE(file && ::WriteFile(file.get(), text.data(), static_cast<DWORD>(text.size()),
                                        &written, nullptr));
        return file_;
    }

    // The folder's items, by their in-folder names, found through the desktop.
    static std::vector<std::wstring> ListedByTheShell() {
        std::vector<std::wstring> names;
        ComPtr<IShellFolder> desktop, folder;
        EXPECT_EQ(S_OK, ::SHGetDesktopFolder(&desktop));
        std::wstring path = kFolderPath;
        PIDLIST_RELATIVE list = nullptr;
        EXPECT_EQ(S_OK, desktop->ParseDisplayName(nullptr, nullptr, path.data(), nullptr, &list,
                                                  nullptr));
        const UniqueCoTaskMem listOwner(list);
        if (!list || FAILED(desktop->BindToObject(list, nullptr, IID_PPV_ARGS(&folder))))
            return names;
        ComPtr<IEnumIDList> items;
        EXPECT_EQ(S_OK, folder->EnumObjects(nullptr, SHCONTF_FOLDERS | SHCONTF_NONFOLDERS, &items));
        PITEMID_CHILD item = nullptr;
        while (items && items->Next(1, &item, nullptr) == S_OK) {
            const UniqueCoTaskMem itemOwner(item);
            STRRET text{};
            wchar_t* name = nullptr;
            if (SUCCEEDED(folder->GetDisplayNameOf(item, SHGDN_INFOLDER, &text)) &&
                SUCCEEDED(::StrRetToStrW(&text, item, &name))) {
                const UniqueCoTaskMem nameOwner(name);
                names.emplace_back(name);
            }
        }
        return names;
    }

    std::unique_ptr<RegistryOverride> registry_;
    std::unique_ptr<ExtensionModule> module_;
    std::wstring file_;
};

}  // namespace

TEST_F(ImportedStationsInTheShell, TwentyImportedStationsAreListedByTheShell) {
    std::string text = "; twenty levels for the survey crew\n";
    std::vector<std::wstring> expected;
    for (int i = 1; i <= 20; ++i) {
        const std::string number = (i < 10 ? "0" : "") + std::to_string(i);
        text += "\n[Crew level " + number + "]\nPort = COM1\nBaudRate = 4800\nModel = Quorvel LV-" +
                (i % 2 ? "10" : "30") + "\n";
        expected.push_back(L"Crew level " + std::wstring(number.begin(), number.end()));
    }
    std::vector<std::wstring> printed;
    ASSERT_EQ(kExitDone, ImportStations(WriteFile(text), false, [&](const std::wstring& line) {
                  printed.push_back(line);
              }));
    ASSERT_FALSE(printed.empty());
    EXPECT_EQ(L"20 added, 0 replaced, 0 skipped.", printed.back());

    std::vector<std::wstring> listed = ListedByTheShell();
    std::sort(listed.begin(), listed.end());
    EXPECT_EQ(expected, listed);
}
