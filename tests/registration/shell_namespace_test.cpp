// The folder as Explorer reaches it: registered in the private prefix, created through COM and
// found through the desktop folder and My Computer, over an isolated station store.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "res/resource.h"
#include "stations/station_store.h"
#include "support/text_lookup.h"
#include "tests/server/extension_module.h"
#include "tests/support/registry_override.h"

using Microsoft::WRL::ComPtr;

namespace {

const wchar_t kFolderPath[] =
    L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

struct ItemList {
    ItemList() = default;
    ItemList(const ItemList&) = delete;
    ~ItemList() { ::CoTaskMemFree(list); }
    PIDLIST_RELATIVE list = nullptr;
    PCUITEMID_CHILD child() const { return reinterpret_cast<PCUITEMID_CHILD>(list); }
};

class ShellNamespace : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(S_OK, ::CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED));
        registry_ = std::make_unique<RegistryOverride>();
        module_ = std::make_unique<ExtensionModule>();
        ASSERT_EQ(S_OK, module_->Register());
        AddStation(L"Station 1", IDS_MODEL_LV10);
        AddStation(L"Station 2", IDS_MODEL_LV30);
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

    static void AddStation(const std::wstring& name, UINT modelId) {
        Station station = DefaultStation();
        station.Name = name;
        station.Model = LoadUiText(modelId);
        ASSERT_EQ(S_OK, ::AddStation(station));
    }

    // The folder under My Computer, bound through the desktop as Explorer does.
    static ComPtr<IShellFolder> BindPath(const wchar_t* path) {
        ComPtr<IShellFolder> desktop;
        EXPECT_EQ(S_OK, ::SHGetDesktopFolder(&desktop));
        ItemList list;
        std::wstring name = path;
        EXPECT_EQ(S_OK, desktop->ParseDisplayName(nullptr, nullptr, name.data(), nullptr,
                                                  &list.list, nullptr));
        ComPtr<IShellFolder> folder;
        if (list.list) {
            EXPECT_EQ(S_OK, desktop->BindToObject(list.list, nullptr, IID_PPV_ARGS(&folder)));
        }
        return folder;
    }

    static std::wstring NameOf(IShellFolder* folder, PCUITEMID_CHILD item, SHGDNF flags) {
        STRRET text{};
        if (FAILED(folder->GetDisplayNameOf(item, flags, &text)))
            return L"<failed>";
        EXPECT_EQ(static_cast<UINT>(STRRET_WSTR), text.uType);
        std::wstring name = text.pOleStr;
        ::CoTaskMemFree(text.pOleStr);
        return name;
    }

    struct Listed {
        std::wstring name;
        SFGAOF attributes;
    };

    static std::vector<Listed> List(IShellFolder* folder, SHCONTF flags) {
        std::vector<Listed> items;
        ComPtr<IEnumIDList> enumerator;
        EXPECT_EQ(S_OK, folder->EnumObjects(nullptr, flags, &enumerator));
        if (!enumerator)
            return items;
        for (;;) {
            ItemList item;
            ULONG fetched = 0;
            if (enumerator->Next(1, reinterpret_cast<PITEMID_CHILD*>(&item.list), &fetched) != S_OK)
                break;
            SFGAOF attributes = SFGAO_FOLDER | SFGAO_CANCOPY;
            PCUITEMID_CHILD child = item.child();
            EXPECT_EQ(S_OK, folder->GetAttributesOf(1, &child, &attributes));
            items.push_back({NameOf(folder, child, SHGDN_INFOLDER), attributes});
        }
        return items;
    }

    std::unique_ptr<RegistryOverride> registry_;
    std::unique_ptr<ExtensionModule> module_;
};

}  // namespace

TEST_F(ShellNamespace, CoCreateInstanceMakesTheFolderWhichHoldsTheModule) {
    ComPtr<IShellFolder> folder;
    ASSERT_EQ(S_OK, ::CoCreateInstance(kShellFolderClassId, nullptr, CLSCTX_INPROC_SERVER,
                                       IID_PPV_ARGS(&folder)));
    ComPtr<IPersistFolder> persist;
    ASSERT_EQ(S_OK, folder.As(&persist));
    CLSID classId{};
    EXPECT_EQ(S_OK, persist->GetClassID(&classId));
    EXPECT_TRUE(::IsEqualCLSID(kShellFolderClassId, classId));
    EXPECT_EQ(S_FALSE, module_->CanUnloadNow());
}

TEST_F(ShellNamespace, TheDesktopFindsTheFolderUnderMyComputerAndItListsTheStations) {
    ComPtr<IShellFolder> root = BindPath(kFolderPath);
    ASSERT_TRUE(root);
    const std::vector<Listed> stations = List(root.Get(), SHCONTF_FOLDERS | SHCONTF_NONFOLDERS);
    ASSERT_EQ(2u, stations.size());
    EXPECT_EQ(L"Station 1", stations[0].name);
    EXPECT_EQ(L"Station 2", stations[1].name);
    for (const Listed& station : stations)
        EXPECT_EQ(static_cast<SFGAOF>(SFGAO_FOLDER | SFGAO_DROPTARGET), station.attributes);
    EXPECT_EQ(S_FALSE, module_->CanUnloadNow());
}

TEST_F(ShellNamespace, TheDesktopParsesAStationAndBindsIntoItsOneFile) {
    const std::wstring station1 = std::wstring(kFolderPath) + L"\\Station 1";
    ComPtr<IShellFolder> folder = BindPath(station1.c_str());
    ASSERT_TRUE(folder);
    std::vector<Listed> files = List(folder.Get(), SHCONTF_NONFOLDERS);
    ASSERT_EQ(1u, files.size());
    EXPECT_EQ(L"file1.lv", files[0].name);
    EXPECT_EQ(static_cast<SFGAOF>(SFGAO_CANCOPY), files[0].attributes);
    EXPECT_TRUE(List(folder.Get(), SHCONTF_FOLDERS).empty());
}

TEST_F(ShellNamespace, ADeletedStationFailsOnlyWhenValidated) {
    ComPtr<IShellFolder> root = BindPath(kFolderPath);
    ASSERT_TRUE(root);
    ItemList station;
    std::wstring name = L"Station 2";
    ASSERT_EQ(S_OK, root->ParseDisplayName(nullptr, nullptr, name.data(), nullptr, &station.list,
                                           nullptr));
    EXPECT_EQ(L"::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}\\Station 2",
              NameOf(root.Get(), station.child(), SHGDN_FORPARSING));
    Station deleted = DefaultStation();
    deleted.Name = L"Station 2";
    ASSERT_EQ(S_OK, DeleteStation(deleted));
    PCUITEMID_CHILD stale = station.child();
    SFGAOF attributes = SFGAO_VALIDATE | SFGAO_FOLDER;
    EXPECT_EQ(E_FAIL, root->GetAttributesOf(1, &stale, &attributes));
    attributes = SFGAO_FOLDER;
    EXPECT_EQ(S_OK, root->GetAttributesOf(1, &stale, &attributes));
    EXPECT_EQ(static_cast<SFGAOF>(SFGAO_FOLDER | SFGAO_DROPTARGET), attributes);
}

TEST_F(ShellNamespace, OverlongAndSeparatorOnlyNamesFailCleanly) {
    ComPtr<IShellFolder> root = BindPath(kFolderPath);
    ASSERT_TRUE(root);
    for (std::wstring name : {std::wstring(300, L'x'), std::wstring(L"\\\\\\"), std::wstring()}) {
        ItemList list;
        EXPECT_TRUE(FAILED(
            root->ParseDisplayName(nullptr, nullptr, name.data(), nullptr, &list.list, nullptr)))
            << name.size();
        EXPECT_EQ(nullptr, list.list);
    }
    ComPtr<IShellFolder> desktop;
    ASSERT_EQ(S_OK, ::SHGetDesktopFolder(&desktop));
    std::wstring overlong = std::wstring(kFolderPath) + L"\\" + std::wstring(300, L'y');
    ItemList list;
    EXPECT_TRUE(FAILED(desktop->ParseDisplayName(nullptr, nullptr, overlong.data(), nullptr,
                                                 &list.list, nullptr)));
}
