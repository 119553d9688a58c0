// Per-item objects from GetUIObjectOf: icon extractor and info tip; the shared icon lists.
#include "tests/shell_folder/shell_folder_fixture.h"

#include <cwchar>

#include "namespace/icon_lists.h"
#include "support/unique_resource.h"

namespace {

LONG IconWidth(HICON icon) {
    ICONINFO info{};
    if (!::GetIconInfo(icon, &info))
        return 0;
    BITMAP bitmap{};
    ::GetObjectW(info.hbmColor ? info.hbmColor : info.hbmMask, sizeof(bitmap), &bitmap);
    ::DeleteObject(info.hbmColor);  // either may be null, which DeleteObject ignores
    ::DeleteObject(info.hbmMask);
    return bitmap.bmWidth;
}

}  // namespace

TEST_F(ShellFolderTest, UIObjectsNeedExactlyOneItem) {
    UniqueChildPidl first = StationItem(L"A");
    UniqueChildPidl second = StationItem(L"B");
    PCUITEMID_CHILD items[] = {first.get(), second.get()};
    for (REFIID iid :
         {IID_IExtractIconW, IID_IQueryInfo, IID_IDataObject, IID_IDropTarget, IID_IUnknown}) {
        void* object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_FAIL, root_->GetUIObjectOf(nullptr, 2, items, iid, nullptr, &object));
        EXPECT_EQ(nullptr, object);
        EXPECT_EQ(E_FAIL, root_->GetUIObjectOf(nullptr, 0, items, iid, nullptr, &object));
    }
    // An item menu is not handed out.
    for (REFIID iid : {IID_IContextMenu, IID_IExtractIconA}) {
        void* object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_NOINTERFACE, UIObject(root_.Get(), first, iid, &object));
        EXPECT_EQ(nullptr, object);
    }
}

TEST_F(ShellFolderTest, InfoTipIsThePathOfTheFullIdentifier) {
    UniqueChildPidl station = StationItem(L"Station 1");
    ComPtr<IQueryInfo> info;
    ASSERT_EQ(S_OK, UIObject(root_.Get(), station, IID_IQueryInfo, &info));
    PWSTR tip = nullptr;
    ASSERT_EQ(S_OK, info->GetInfoTip(QITIPF_DEFAULT, &tip));
    EXPECT_STREQ(L"Quorvel Digital Level\\Station 1", tip);
    ::CoTaskMemFree(tip);
    DWORD flags = 0;
    EXPECT_EQ(E_NOTIMPL, info->GetInfoFlags(&flags));

    ComPtr<IShellFolder> stationFolder = Bind(root_.Get(), station);
    ASSERT_TRUE(stationFolder);
    UniqueChildPidl file = FileItem(L"file1.hvr");
    ASSERT_EQ(S_OK, UIObject(stationFolder.Get(), file, IID_IQueryInfo, &info));
    // The folder's own copy of the list is gone; the tip object keeps its own.
    file.reset();
    ASSERT_EQ(S_OK, info->GetInfoTip(0, &tip));
    EXPECT_STREQ(L"Quorvel Digital Level\\Station 1\\file1.hvr", tip);
    ::CoTaskMemFree(tip);
}

TEST_F(ShellFolderTest, IconLocationByKindOfTheLastItem) {
    UniqueChildPidl station = StationItem(L"Station 1");
    UniqueChildPidl rootItem = manager_.CreateRootPidl();
    ComPtr<IShellFolder> stationFolder = Bind(root_.Get(), station);
    ASSERT_TRUE(stationFolder);
    UniqueChildPidl file = FileItem(L"file1.lv");

    const std::tuple<IShellFolder*, const UniqueChildPidl*, int> cases[] = {
        {root_.Get(), &station, 0}, {stationFolder.Get(), &file, 2}, {root_.Get(), &rootItem, 1}};
    for (const auto& [folder, item, expectedIndex] : cases) {
        ComPtr<IExtractIconW> icon;
        ASSERT_EQ(S_OK, UIObject(folder, *item, IID_IExtractIconW, &icon));
        wchar_t location[MAX_PATH];
        wmemset(location, L'x', MAX_PATH);  // no terminator until the extractor writes one
        int index = -1;
        UINT flags = 0;
        ASSERT_EQ(S_OK, icon->GetIconLocation(GIL_FORSHELL, location, MAX_PATH, &index, &flags));
        EXPECT_EQ(static_cast<UINT>(GIL_NOTFILENAME), flags);
        EXPECT_EQ(expectedIndex, index);
        EXPECT_STREQ(L"", location) << "the shell reads the location whatever the flags say";
    }
}

TEST_F(ShellFolderTest, SharedIconListsFeedTheExtractorAndAreNotBuiltFromAModuleWithoutIcons) {
    ComPtr<IExtractIconW> extractor;
    ASSERT_EQ(S_OK,
              UIObject(root_.Get(), StationItem(L"Station 1"), IID_IExtractIconW, &extractor));

    // kernel32 holds none of the group icons 101, 102 and 104: no partial, shifted list is left.
    DestroySharedIconLists();
    EXPECT_FALSE(BuildSharedIconLists(::GetModuleHandleW(L"kernel32.dll")));
    EXPECT_EQ(nullptr, SmallIconList());
    EXPECT_EQ(nullptr, LargeIconList());
    HICON large = reinterpret_cast<HICON>(1), small = reinterpret_cast<HICON>(1);
    EXPECT_EQ(E_FAIL, extractor->Extract(L"", 0, &large, &small, 0)) << "no lists, no icons";
    EXPECT_EQ(nullptr, large);
    EXPECT_EQ(nullptr, small);

    // The test executable carries the module's resources, icons included.
    ASSERT_TRUE(BuildSharedIconLists(::GetModuleHandleW(nullptr)));
    for (UINT index : {0u, 1u, 2u}) {
        ASSERT_EQ(S_OK, extractor->Extract(L"", index, &large, &small, MAKELONG(48, 16)));
        UniqueHIcon ownedLarge(large), ownedSmall(small);
        EXPECT_EQ(::GetSystemMetrics(SM_CXICON), IconWidth(large)) << "requested size ignored";
        EXPECT_EQ(::GetSystemMetrics(SM_CXSMICON), IconWidth(small));
    }
    // An index past the lists (the shell passes back whatever GetIconLocation gave, but nothing
    // stops another caller) makes no icon rather than reading past them.
    for (UINT index : {3u, 0x7FFFFFFFu}) {
        large = small = reinterpret_cast<HICON>(1);
        EXPECT_EQ(S_OK, extractor->Extract(L"", index, &large, &small, 0));
        EXPECT_EQ(nullptr, large) << index;
        EXPECT_EQ(nullptr, small) << index;
    }
    DestroySharedIconLists();
}
