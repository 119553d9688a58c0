// The DLL loaded, used, let go and freed again and again: what it keeps, what it leaks, and what
// still works when it is let go but not freed.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <thread>
#include <vector>

#include "namespace/icon_lists.h"
#include "namespace/pidl_manager.h"
#include "tests/server/extension_module.h"
#include "tests/server/stored_display_settings.h"
#include "tests/stations/station_builders.h"
#include "tests/support/registry_override.h"

using Microsoft::WRL::ComPtr;

namespace {

// The folder made through the module's exports, as the shell makes it.
// The folder is always the top folder, whatever list it is given (the folder tests pass none).
ComPtr<IShellFolder> CreateFolder(const ExtensionModule& module) {
    ComPtr<IClassFactory> factory;
    ComPtr<IShellFolder> folder;
    ComPtr<IPersistFolder> persist;
    if (module.GetClassObject(kShellFolderClassId, IID_PPV_ARGS(&factory)) != S_OK ||
        factory->CreateInstance(nullptr, IID_PPV_ARGS(&folder)) != S_OK ||
        folder.As(&persist) != S_OK || persist->Initialize(nullptr) != S_OK) {
        ADD_FAILURE() << "the top folder was not made";
        return nullptr;
    }
    return folder;
}

// Lists a folder, and each station's folder in it, extracting both icons of every item as the
// shell does when it shows them; the items' icon indexes.
void ListAndExtractIcons(IShellFolder* folder, std::vector<int>& indexes) {
    ComPtr<IEnumIDList> items;
    EXPECT_EQ(S_OK, folder->EnumObjects(nullptr, SHCONTF_FOLDERS | SHCONTF_NONFOLDERS, &items));
    PITEMID_CHILD item = nullptr;
    while (items && items->Next(1, &item, nullptr) == S_OK) {
        UniqueChildPidl owned(item);
        ComPtr<IExtractIconW> extract;
        // MinGW declares no __uuidof for this interface: its IID is passed by name.
        EXPECT_EQ(S_OK, folder->GetUIObjectOf(nullptr, 1, const_cast<PCUITEMID_CHILD*>(&item),
                                              IID_IExtractIconW, nullptr, &extract));
        if (!extract)
            continue;
        int index = -1;
        UINT flags = 0;
        wchar_t location[MAX_PATH] = {};
        EXPECT_EQ(S_OK, extract->GetIconLocation(GIL_FORSHELL, location, MAX_PATH, &index, &flags));
        HICON large = nullptr, small = nullptr;
        EXPECT_EQ(S_OK, extract->Extract(L"", index, &large, &small, MAKELONG(32, 16)));
        UniqueHIcon largeIcon(large), smallIcon(small);
        EXPECT_TRUE(largeIcon && smallIcon) << "icon " << index;
        indexes.push_back(index);
        if (index == kStationIconIndex) {
            ComPtr<IShellFolder> station;
            EXPECT_EQ(S_OK, folder->BindToObject(item, nullptr, IID_PPV_ARGS(&station)));
            if (station)
                ListAndExtractIcons(station.Get(), indexes);
        }
    }
}

// The top folder made through the module and listed down to the stations' files; the icon
// indexes met, sorted.
std::vector<int> ListAndExtractIcons(const ExtensionModule& module) {
    std::vector<int> indexes;
    if (ComPtr<IShellFolder> folder = CreateFolder(module))
        ListAndExtractIcons(folder.Get(), indexes);
    std::sort(indexes.begin(), indexes.end());
    return indexes;
}

struct ResourceCounts {
    DWORD handles = 0;
    DWORD gdiObjects = 0;
    DWORD userObjects = 0;
    DWORD lowestFreeTlsSlot = 0;  // rises with every slot a load leaves allocated
};

// Wine answers 0 to GetProcessHandleCount and GetGuiResources. Its handles are counted here by
// asking each handle value in turn (it hands out the lowest free value, so a test process has
// none beyond the bound), and its GDI objects by asking each index of its GDI handle table,
// whose entries it finds by index alone when the high word is 0. Windows counts them itself.
DWORD HandlesCountedOneByOne() {
    constexpr ULONG_PTR kHighestHandleValue = 0x10000;
    DWORD count = 0;
    for (ULONG_PTR value = 4; value <= kHighestHandleValue; value += 4) {
        DWORD flags = 0;
        if (::GetHandleInformation(reinterpret_cast<HANDLE>(value), &flags))
            ++count;
    }
    return count;
}

DWORD WineGdiObjectsCountedOneByOne() {
    DWORD count = 0;
    for (ULONG_PTR index = 1; index <= 0xFFFF; ++index) {
        if (::GetObjectType(reinterpret_cast<HGDIOBJ>(index)) != 0)
            ++count;
    }
    return count;
}

ResourceCounts CurrentResourceCounts() {
    ResourceCounts counts;
    EXPECT_TRUE(::GetProcessHandleCount(::GetCurrentProcess(), &counts.handles));
    if (counts.handles == 0)
        counts.handles = HandlesCountedOneByOne();
    counts.gdiObjects = ::GetGuiResources(::GetCurrentProcess(), GR_GDIOBJECTS);
    if (counts.gdiObjects == 0)
        counts.gdiObjects = WineGdiObjectsCountedOneByOne();
    // Wine has no such count, and no way to ask for USER objects of every kind: 0 there.
    counts.userObjects = ::GetGuiResources(::GetCurrentProcess(), GR_USEROBJECTS);
    counts.lowestFreeTlsSlot = ::TlsAlloc();
    if (counts.lowestFreeTlsSlot != TLS_OUT_OF_INDEXES) {
        EXPECT_TRUE(::TlsFree(counts.lowestFreeTlsSlot));
    }
    return counts;
}

class ModuleReloadTest : public ::testing::Test {
protected:
    void SetUp() override { AddStationOfModel(L"North"); }

    // The station "North" and its file.
    const std::vector<int> expectedIcons_ = {kStationIconIndex, kFileIconIndex};
    RegistryOverride registry_;
};

TEST_F(ModuleReloadTest, AHundredLoadsKeepTheStoredWidthsAndLeakNothing) {
    // The eight-byte form that the module itself never writes: any write at all, at use or at
    // unload, would turn it into the twelve-byte form.
    const Bytes written = {44, 1, 0, 0, 150, 0, 0, 0};  // 300 and 150
    WriteDisplaySettings(written);

    { ExtensionModule module; }  // loaded and freed, never started: nothing to write either
    // One cycle before counting: the system libraries the module loads allocate what they keep
    // for the process on first use, not on every load.
    {
        ExtensionModule module;
        EXPECT_EQ(expectedIcons_, ListAndExtractIcons(module));
        EXPECT_EQ(S_OK, module.CanUnloadNow());
    }
    const ResourceCounts before = CurrentResourceCounts();

    constexpr int kLoads = 100;
    for (int load = 0; load < kLoads; ++load) {
        {
            ExtensionModule module;
            ASSERT_EQ(expectedIcons_, ListAndExtractIcons(module)) << "load " << load;
            ASSERT_EQ(S_OK, module.CanUnloadNow()) << "load " << load;
            // Let go but not freed: the module starts up again on the next class object.
            ASSERT_EQ(expectedIcons_, ListAndExtractIcons(module)) << "load " << load;
            ASSERT_EQ(S_OK, module.CanUnloadNow()) << "load " << load;
        }
        ASSERT_EQ(written, StoredDisplaySettings()) << "load " << load;
    }

    const ResourceCounts after = CurrentResourceCounts();
    std::printf(
        "handles %lu -> %lu, GDI objects %lu -> %lu, USER objects %lu -> %lu, "
        "lowest free TLS slot %lu -> %lu\n",
        before.handles, after.handles, before.gdiObjects, after.gdiObjects, before.userObjects,
        after.userObjects, before.lowestFreeTlsSlot, after.lowestFreeTlsSlot);
    // A leak per load grows a count by at least kLoads. The allowance is for system libraries
    // that make something of their own once, later than the first cycle: far below kLoads.
    constexpr DWORD kOnceOnlyAllowance = 5;
    EXPECT_LE(after.handles, before.handles + kOnceOnlyAllowance);
    // Two image lists per load that were never destroyed would show among the GDI objects. Wine
    // reports no USER objects (0 before and after); Windows does.
    EXPECT_LE(after.gdiObjects, before.gdiObjects + kOnceOnlyAllowance);
    EXPECT_LE(after.userObjects, before.userObjects + kOnceOnlyAllowance);
    // A process has about a thousand slots: a slot left per load would end the host in a crash.
    EXPECT_LE(after.lowestFreeTlsSlot, before.lowestFreeTlsSlot + kOnceOnlyAllowance);
}

TEST_F(ModuleReloadTest, TearDownNeverRacesAClassObjectOnAnotherThread) {
    // Each question that finds the module unused tears it down; each class object starts it
    // again. An icon extracted between the two finds the lists of a started module.
    ExtensionModule module;
    constexpr int kRounds = 300;
    int answeredUnused = 0;
    // Asks until it is stopped, or goes out of scope on any path out of the test.
    std::jthread asker([&](std::stop_token stop) {
        while (!stop.stop_requested()) {
            if (module.CanUnloadNow() == S_OK)
                ++answeredUnused;
        }
    });
    int extracted = 0;
    for (int round = 0; round < kRounds; ++round) {
        ComPtr<IClassFactory> factory;
        ASSERT_EQ(S_OK, module.GetClassObject(kExtractIconClassId, IID_PPV_ARGS(&factory)));
        ComPtr<IExtractIconW> extract;
        ASSERT_EQ(S_OK, factory->CreateInstance(nullptr, IID_IExtractIconW, &extract));
        factory.Reset();
        HICON large = nullptr, small = nullptr;
        if (extract->Extract(L"", kStationIconIndex, &large, &small, MAKELONG(32, 16)) == S_OK &&
            large && small)
            ++extracted;
        UniqueHIcon largeIcon(large), smallIcon(small);
    }
    asker.request_stop();
    asker.join();
    EXPECT_EQ(kRounds, extracted);
    EXPECT_EQ(S_OK, module.CanUnloadNow());
    std::printf("%d of the other thread's questions found the module unused\n", answeredUnused);
}

}  // namespace
