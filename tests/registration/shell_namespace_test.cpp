// The folder as Explorer reaches it: registered in the private prefix, created through COM and
// found through the desktop folder and My Computer, over an isolated station store.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "tests/server/extension_module.h"
#include "tests/stations/station_builders.h"
#include "tests/support/registry_override.h"

using Microsoft::WRL::ComPtr;

namespace {

const std::wstring kFolderPath =
    L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

class ShellNamespace : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(S_OK, ::CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED));
        registry_ = std::make_unique<RegistryOverride>();
        module_ = std::make_unique<ExtensionModule>();
        ASSERT_EQ(S_OK, module_->Register());
        AddStationOfModel(L"Station 1", IDS_MODEL_LV10);
        AddStationOfModel(L"Station 2", IDS_MODEL_LV30);
    }

    void TearDown() override {
        // Every object of a test is a local of its body and released by now: a module lock left
        // over is a leaked reference.
        EXPECT_EQ(S_OK, module_->CanUnloadNow());
        EXPECT_EQ(S_OK, module_->Unregister());
        module_.reset();
        registry_.reset();
        ::CoUninitialize();
    }

    // A folder of the namespace, parsed and bound through the desktop as Explorer does.
    static ComPtr<IShellFolder> BindPath(std::wstring path) {
        ComPtr<IShellFolder> desktop, folder;
        EXPECT_EQ(S_OK, ::SHGetDesktopFolder(&desktop));
        PIDLIST_RELATIVE list = nullptr;
        EXPECT_EQ(S_OK, desktop->ParseDisplayName(nullptr, nullptr, path.data(), nullptr, &list,
                                                  nullptr));
        if (list) {
            EXPECT_EQ(S_OK, desktop->BindToObject(list, nullptr, IID_PPV_ARGS(&folder)));
        }
        ::CoTaskMemFree(list);
        return folder;
    }

    // The in-folder names of the items listed for the flags.
    static std::vector<std::wstring> ListedNames(IShellFolder* folder, SHCONTF flags) {
        std::vector<std::wstring> names;
        ComPtr<IEnumIDList> enumerator;
        EXPECT_EQ(S_OK, folder->EnumObjects(nullptr, flags, &enumerator));
        PITEMID_CHILD item = nullptr;
        while (enumerator && enumerator->Next(1, &item, nullptr) == S_OK) {
            STRRET text{};
            if (SUCCEEDED(folder->GetDisplayNameOf(item, SHGDN_INFOLDER, &text)) &&
                text.uType == STRRET_WSTR) {
                names.emplace_back(text.pOleStr);
                ::CoTaskMemFree(text.pOleStr);
            }
            ::CoTaskMemFree(item);
        }
        return names;
    }

    std::unique_ptr<RegistryOverride> registry_;
    std::unique_ptr<ExtensionModule> module_;
};

using Names = std::vector<std::wstring>;

}  // namespace

TEST_F(ShellNamespace, CoCreateInstanceAndTheDesktopReachTheFolderWhichHoldsTheModule) {
    ComPtr<IShellFolder> folder;
    ASSERT_EQ(S_OK, ::CoCreateInstance(kShellFolderClassId, nullptr, CLSCTX_INPROC_SERVER,
                                       IID_PPV_ARGS(&folder)));
    ComPtr<IPersistFolder> persist;
    ASSERT_EQ(S_OK, folder.As(&persist));
    CLSID classId{};
    EXPECT_EQ(S_OK, persist->GetClassID(&classId));
    EXPECT_TRUE(::IsEqualCLSID(kShellFolderClassId, classId));
    EXPECT_EQ(S_FALSE, module_->CanUnloadNow());
    folder.Reset();
    persist.Reset();

    // Found under My Computer, and bound into a station.
    ComPtr<IShellFolder> root = BindPath(kFolderPath);
    ASSERT_TRUE(root);
    EXPECT_EQ((Names{L"Station 1", L"Station 2"}),
              ListedNames(root.Get(), SHCONTF_FOLDERS | SHCONTF_NONFOLDERS));
    EXPECT_EQ(S_FALSE, module_->CanUnloadNow());
    ComPtr<IShellFolder> station = BindPath(kFolderPath + L"\\Station 2");
    ASSERT_TRUE(station);
    EXPECT_EQ(Names{L"file1.hvr"}, ListedNames(station.Get(), SHCONTF_NONFOLDERS));
}
