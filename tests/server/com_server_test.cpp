// The DLL's class objects, its lock count and its start-up and unload, through its exports.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <cstring>

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
    EXPECT_EQ(S_OK, module.CanUnloadNow()) << "cached factories do not keep the module";
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
    EXPECT_EQ(S_OK, module.CanUnloadNow());

    ComPtr<IShellFolder> folder;
    ASSERT_EQ(S_OK, factory->CreateInstance(nullptr, IID_PPV_ARGS(&folder)));
    ComPtr<IPersistFolder> sameObject;
    ASSERT_EQ(S_OK, folder.As(&sameObject));
    EXPECT_EQ(S_FALSE, module.CanUnloadNow());
    folder.Reset();
    EXPECT_EQ(S_FALSE, module.CanUnloadNow()) << "a second interface still holds the object";
    sameObject.Reset();
    EXPECT_EQ(S_OK, module.CanUnloadNow());

    ASSERT_EQ(S_OK, factory->LockServer(TRUE));
    EXPECT_EQ(S_FALSE, module.CanUnloadNow());
    ASSERT_EQ(S_OK, factory->LockServer(FALSE));
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

TEST(ComServer, LoadReadsTheDisplaySettingsAndUnloadSavesThem) {
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
    ExtensionModule module;
    ASSERT_TRUE(module.get());
    module.Unload();

    UniqueRegKey root;
    ASSERT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0,
                                             KEY_READ, root.put()));
    BYTE data[32] = {};
    DWORD size = sizeof data, type = 0;
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegQueryValueExW(root.get(), L"Display Settings", nullptr, &type, data, &size));
    // The module rewrote the value in its own 12-byte form with the widths it had loaded.
    EXPECT_EQ(12u, size);
    DWORD widths[2] = {};
    std::memcpy(widths, data, sizeof widths);
    EXPECT_EQ(300u, widths[0]);
    EXPECT_EQ(150u, widths[1]);
}
