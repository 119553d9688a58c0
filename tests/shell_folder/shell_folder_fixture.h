// Shared set-up for the shell object tests: an isolated store, a root folder, item IDs as the
// shell would hand them back, and a check that every object was released.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "namespace/pidl_manager.h"
#include "server/lv_shell_folder.h"
#include "support/class_factory.h"
#include "support/module_lock.h"
#include "tests/stations/station_builders.h"
#include "tests/support/registry_override.h"

using Microsoft::WRL::ComPtr;

inline constexpr wchar_t kPrefix[] = L"::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

class ShellFolderTest : public ::testing::Test {
protected:
    using Items = std::vector<std::pair<DWORD, std::wstring>>;

    // The root folder as the shell makes it: through the class's creation function, then
    // IPersistFolder::Initialize.
    void SetUp() override {
        ASSERT_EQ(S_OK, CreateComInstance<CLVShellFolder>(IID_PPV_ARGS(&root_)));
        ComPtr<IPersistFolder> persist;
        ASSERT_EQ(S_OK, root_.As(&persist));
        ASSERT_EQ(S_OK, persist->Initialize(nullptr));
    }

    void TearDown() override {
        root_.Reset();
        // Every other object made by a test is a local of the test body and gone by now: a lock
        // left over is a reference leaked by the code under test.
        EXPECT_EQ(0, ModuleLockCount());
    }

    static ComPtr<IShellFolder> Bind(IShellFolder* parent, const UniqueChildPidl& item) {
        ComPtr<IShellFolder> folder;
        EXPECT_EQ(S_OK, parent->BindToObject(item.get(), nullptr, IID_PPV_ARGS(&folder)));
        return folder;
    }

    UniqueChildPidl StationItem(const std::wstring& name) const {
        return manager_.CreateItemPidl((L"Quorvel Digital Level\\" + name).c_str());
    }
    UniqueChildPidl FileItem(const std::wstring& name) const {
        const UniqueRelativePidl full =
            manager_.CreatePidlFromPath((L"Quorvel Digital Level\\S\\" + name).c_str());
        return manager_.CopyItem(manager_.GetLastItem(full.get()));
    }

    // ParseDisplayName of a (writable copy of the) name; the list is null after a failure.
    static HRESULT Parse(IShellFolder* folder, std::wstring name, UniqueRelativePidl& list) {
        PIDLIST_RELATIVE parsed = reinterpret_cast<PIDLIST_RELATIVE>(1);
        const HRESULT result =
            folder->ParseDisplayName(nullptr, nullptr, name.data(), nullptr, &parsed, nullptr);
        list.reset(parsed);
        return result;
    }

    static HRESULT DisplayName(IShellFolder* folder, const UniqueChildPidl& item, SHGDNF flags,
                               std::wstring& name) {
        STRRET text{};
        const HRESULT result = folder->GetDisplayNameOf(item.get(), flags, &text);
        if (SUCCEEDED(result)) {
            EXPECT_EQ(static_cast<UINT>(STRRET_WSTR), text.uType);
            name = text.pOleStr;
            ::CoTaskMemFree(text.pOleStr);
        }
        return result;
    }

    static HRESULT UIObject(IShellFolder* folder, const UniqueChildPidl& item, REFIID iid,
                            void** object) {
        PCUITEMID_CHILD child = item.get();
        return folder->GetUIObjectOf(nullptr, 1, &child, iid, nullptr, object);
    }

    // Kind and name of every item of a list; none for no list.
    Items ItemsOf(const UniqueRelativePidl& list) const {
        Items items;
        for (PCUIDLIST_RELATIVE item = list.get(); item && item->mkid.cb;
             item = manager_.GetNextItem(item)) {
            items.emplace_back(ItemKind(reinterpret_cast<const uint8_t*>(item)),
                               manager_.GetItemName(item));
        }
        return items;
    }

    // Kind and name of every item the folder lists for the flags.
    Items Enumerate(IShellFolder* folder, SHCONTF flags) {
        Items items;
        ComPtr<IEnumIDList> enumerator;
        EXPECT_EQ(S_OK, folder->EnumObjects(nullptr, flags, &enumerator));
        PITEMID_CHILD item = nullptr;
        while (enumerator && enumerator->Next(1, &item, nullptr) == S_OK) {
            UniqueChildPidl owned(item);
            items.emplace_back(manager_.GetLastItemKind(owned.get()),
                               manager_.GetItemName(owned.get()));
        }
        return items;
    }

    RegistryOverride registry_;
    CPidlMgr manager_;
    ComPtr<IShellFolder> root_;
};
