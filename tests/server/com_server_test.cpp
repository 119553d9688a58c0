// The DLL's class objects, its lock count and its start-up and unload, through its exports.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "stations/station_store.h"
#include "tests/server/extension_module.h"
#include "tests/support/registry_override.h"

using Microsoft::WRL::ComPtr;

TEST(ComServer, TheContextMenuAndUnknownClassesAreNotAvailable) {
    ExtensionModule module;
    ComPtr<IClassFactory> factory;
    EXPECT_EQ(CLASS_E_CLASSNOTAVAILABLE,
              module.GetClassObject(kContextMenuClassId, IID_PPV_ARGS(&factory)));
    EXPECT_EQ(nullptr, factory.Get());
    EXPECT_EQ(CLASS_E_CLASSNOTAVAILABLE,
              module.GetClassObject(IID_IShellFolder, IID_PPV_ARGS(&factory)));
    EXPECT_EQ(nullptr, factory.Get());
}

TEST(ComServer, EachClassHasOneCachedFactory) {
    ExtensionModule module;
    ComPtr<IClassFactory> first, second, other;
    ASSERT_EQ(S_OK, module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&first)));
    ASSERT_EQ(S_OK, module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&second)));
    ASSERT_EQ(S_OK, module.GetClassObject(kExtractIconClassId, IID_PPV_ARGS(&other)));
    EXPECT_EQ(first.Get(), second.Get());
    EXPECT_NE(first.Get(), other.Get());

    ComPtr<IStream> stream;
    EXPECT_EQ(E_NOINTERFACE, module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&stream)));
    EXPECT_EQ(S_FALSE, module.CanUnloadNow()) << "a factory in a client's hands keeps the module";
    first.Reset();
    second.Reset();
    other.Reset();
    EXPECT_EQ(S_OK, module.CanUnloadNow()) << "the cache alone does not";
}

TEST(ComServer, EachCreatableClassAnswersItsInterface) {
    ExtensionModule module;
    struct Case {
        const CLSID& classId;
        const IID& iid;
    } const cases[] = {{kShellFolderClassId, IID_IShellFolder},
                       {kEnumIdListClassId, IID_IEnumIDList},
                       {kExtractIconClassId, IID_IExtractIconW},
                       {kQueryInfoClassId, IID_IQueryInfo}};
    for (const Case& item : cases) {
        ComPtr<IClassFactory> factory;
        ASSERT_EQ(S_OK, module.GetClassObject(item.classId, IID_PPV_ARGS(&factory)));
        ComPtr<IUnknown> object;
        EXPECT_EQ(S_OK, factory->CreateInstance(nullptr, item.iid, &object));
        EXPECT_NE(nullptr, object.Get());
        ComPtr<IUnknown> outer = object;
        ComPtr<IUnknown> aggregated;
        EXPECT_EQ(CLASS_E_NOAGGREGATION,
                  factory->CreateInstance(outer.Get(), IID_PPV_ARGS(&aggregated)));
        ComPtr<IStream> wrong;
        EXPECT_EQ(E_NOINTERFACE, factory->CreateInstance(nullptr, IID_PPV_ARGS(&wrong)));
    }
}

TEST(ComServer, CanUnloadNowOnlyAfterTheLastObjectAndServerLockAreGone) {
    ExtensionModule module;
    ComPtr<IClassFactory> factory;
    ASSERT_EQ(S_OK, module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&factory)));
    ComPtr<IShellFolder> folder;
    ASSERT_EQ(S_OK, factory->CreateInstance(nullptr, IID_PPV_ARGS(&folder)));
    ComPtr<IPersistFolder> sameObject;
    ASSERT_EQ(S_OK, folder.As(&sameObject));
    factory.Reset();
    EXPECT_EQ(S_FALSE, module.CanUnloadNow());
    folder.Reset();
    EXPECT_EQ(S_FALSE, module.CanUnloadNow()) << "a second interface still holds the object";
    sameObject.Reset();
    EXPECT_EQ(S_OK, module.CanUnloadNow());

    ASSERT_EQ(S_OK, module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&factory)));
    ASSERT_EQ(S_OK, factory->LockServer(TRUE));
    factory.Reset();
    EXPECT_EQ(S_FALSE, module.CanUnloadNow()) << "the server lock outlives the factory reference";
    ASSERT_EQ(S_OK, module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&factory)));
    ASSERT_EQ(S_OK, factory->LockServer(FALSE));
    factory.Reset();
    EXPECT_EQ(S_OK, module.CanUnloadNow());
}

TEST(ComServer, StartUpBuildsTheIconListsThatItemIconsComeFrom) {
    ExtensionModule module;
    ComPtr<IClassFactory> factory;
    ASSERT_EQ(S_OK, module.GetClassObject(kExtractIconClassId, IID_PPV_ARGS(&factory)));
    ComPtr<IExtractIconW> extract;
    // MinGW declares no __uuidof for this interface: its IID is passed by name.
    ASSERT_EQ(S_OK, factory->CreateInstance(nullptr, IID_IExtractIconW,
                                            reinterpret_cast<void**>(extract.GetAddressOf())));
    for (UINT index = 0; index < 3; ++index) {
        HICON large = nullptr, small = nullptr;
        ASSERT_EQ(S_OK, extract->Extract(L"", index, &large, &small, MAKELONG(32, 16)));
        UniqueHIcon largeIcon(large), smallIcon(small);
        EXPECT_TRUE(largeIcon && smallIcon) << index;
    }
}

namespace {

// The "Display Settings" value as it is stored; empty when there is none.
std::vector<BYTE> StoredDisplaySettings() {
    UniqueRegKey root;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0, KEY_READ,
                        root.put()) != ERROR_SUCCESS) {
        return {};
    }
    std::vector<BYTE> data(32);
    DWORD size = static_cast<DWORD>(data.size()), type = 0;
    if (::RegQueryValueExW(root.get(), L"Display Settings", nullptr, &type, data.data(), &size) !=
            ERROR_SUCCESS ||
        type != REG_BINARY) {
        return {};
    }
    data.resize(size);
    return data;
}

}  // namespace

TEST(ComServer, StartUpWaitsForTheFirstClassObjectAndUnloadSavesWhatItLoaded) {
    RegistryOverride registry;
    {
        UniqueRegKey root;
        ASSERT_EQ(ERROR_SUCCESS,
                  ::RegCreateKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0, nullptr, 0,
                                    KEY_ALL_ACCESS, nullptr, root.put(), nullptr));
        const DWORD widths[2] = {300, 150};
        ASSERT_EQ(ERROR_SUCCESS,
                  ::RegSetValueExW(root.get(), L"Display Settings", 0, REG_BINARY,
                                   reinterpret_cast<const BYTE*>(widths), sizeof widths));
    }
    const std::vector<BYTE> written = StoredDisplaySettings();
    ASSERT_EQ(8u, written.size());
    {
        // Loading alone does nothing under the loader lock, so unloading has nothing to save.
        ExtensionModule module;
        ASSERT_TRUE(module.get());
    }
    EXPECT_EQ(written, StoredDisplaySettings());

    {
        ExtensionModule module;
        ComPtr<IClassFactory> factory;
        ASSERT_EQ(S_OK, module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&factory)));
    }
    // The module rewrote the value in its own 12-byte form with the widths it had loaded.
    const std::vector<BYTE> saved = StoredDisplaySettings();
    ASSERT_EQ(12u, saved.size());
    DWORD widths[2] = {};
    std::memcpy(widths, saved.data(), sizeof widths);
    EXPECT_EQ(300u, widths[0]);
    EXPECT_EQ(150u, widths[1]);
}
