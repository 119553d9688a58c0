// The DLL's class objects, its lock count and its start-up and unload, through its exports; and
// what start-up reads, in this process.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <utility>

#include "server/module_app.h"
#include "stations/display_settings.h"
#include "support/module_instance.h"
#include "tests/server/extension_module.h"
#include "tests/server/stored_display_settings.h"
#include "tests/support/registry_override.h"

using Microsoft::WRL::ComPtr;

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

// The context menu's class is carried but not available, nor is an unknown one. (Aggregation and
// unknown interfaces are refused by the one class factory of every class: com_base tests.)
TEST(ComServer, EachCreatableClassAnswersItsInterfaceAndNoOtherClassIsAvailable) {
    ExtensionModule module;
    const std::pair<CLSID, IID> classes[] = {{kShellFolderClassId, IID_IShellFolder},
                                             {kEnumIdListClassId, IID_IEnumIDList},
                                             {kExtractIconClassId, IID_IExtractIconW},
                                             {kQueryInfoClassId, IID_IQueryInfo}};
    for (const auto& [classId, iid] : classes) {
        ComPtr<IClassFactory> factory;
        ASSERT_EQ(S_OK, module.GetClassObject(classId, IID_PPV_ARGS(&factory)));
        ComPtr<IUnknown> object;
        EXPECT_EQ(S_OK, factory->CreateInstance(nullptr, iid, &object));
        EXPECT_NE(nullptr, object.Get());
    }
    for (const CLSID& classId : {kContextMenuClassId, IID_IShellFolder}) {
        ComPtr<IClassFactory> factory;
        EXPECT_EQ(CLASS_E_CLASSNOTAVAILABLE,
                  module.GetClassObject(classId, IID_PPV_ARGS(&factory)));
        EXPECT_EQ(nullptr, factory.Get());
    }
    EXPECT_EQ(S_OK, module.CanUnloadNow());
}

TEST(ComServer, CanUnloadNowOnlyAfterTheLastInterfaceOfTheLastObjectIsGone) {
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
}

TEST(ComServer, StartUpBuildsTheIconListsThatItemIconsComeFrom) {
    ExtensionModule module;
    ComPtr<IClassFactory> factory;
    ASSERT_EQ(S_OK, module.GetClassObject(kExtractIconClassId, IID_PPV_ARGS(&factory)));
    ComPtr<IExtractIconW> extract;
    // MinGW declares no __uuidof for this interface: its IID is passed by name.
    ASSERT_EQ(S_OK, factory->CreateInstance(nullptr, IID_IExtractIconW, &extract));
    for (UINT index = 0; index < 3; ++index) {
        HICON large = nullptr, small = nullptr;
        ASSERT_EQ(S_OK, extract->Extract(L"", index, &large, &small, MAKELONG(32, 16)));
        UniqueHIcon largeIcon(large), smallIcon(small);
        EXPECT_TRUE(largeIcon && smallIcon) << index;
    }
}

// The width a details view starts from is what start-up read: each start, also one after a
// tear-down in a library that was never freed, reads what was stored before it.
TEST(ComServer, EachStartUpReadsTheStoredColumnWidths) {
    const RegistryOverride registry;
    for (const BYTE width : {BYTE{210}, BYTE{180}}) {
        WriteDisplaySettings({width, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0});
        {
            const CModuleApp::StartedScope started = CModuleApp::EnsureStarted(ThisModule());
            EXPECT_EQ(width, DisplayColumnWidth(0));
        }
        EXPECT_EQ(S_OK, CModuleApp::CanUnloadNow());
    }
}
