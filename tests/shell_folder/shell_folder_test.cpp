// The folder's set-up, folder paths, parsing, binding and the objects it refuses to make.
#include "tests/shell_folder/shell_folder_fixture.h"

#include <cwchar>

namespace {

std::wstring FolderPath(const CLVShellFolder& folder, bool withPrefix) {
    wchar_t buffer[260] = {};
    EXPECT_TRUE(folder.GetFolderPath(buffer, ARRAYSIZE(buffer), withPrefix));
    return buffer;
}

}  // namespace

TEST_F(ShellFolderTest, RootAndStationFolderPathsWithAndWithoutPrefix) {
    auto root = MakeComObject<CLVShellFolder>();
    ASSERT_EQ(S_OK, root->Initialize(nullptr));
    EXPECT_EQ(L"\\Quorvel Digital Level", FolderPath(*root.Get(), false));
    EXPECT_EQ(kPrefix, FolderPath(*root.Get(), true));
    // Whatever identifier the shell passes, the folder it initialises is the root.
    auto elsewhere = MakeComObject<CLVShellFolder>();
    UniquePidl other = StationItem(L"Elsewhere");
    ASSERT_EQ(S_OK, elsewhere->Initialize(reinterpret_cast<PCIDLIST_ABSOLUTE>(other.get())));
    EXPECT_EQ(L"\\Quorvel Digital Level", FolderPath(*elsewhere.Get(), false));

    auto station = MakeComObject<CLVShellFolder>();
    UniquePidl item = StationItem(L"Station 1");
    ASSERT_EQ(S_OK, station->SetUp(root.Get(), Child(item)));
    EXPECT_EQ(L"\\Quorvel Digital Level\\Station 1", FolderPath(*station.Get(), false));
    EXPECT_EQ(std::wstring(kPrefix) + L"\\Station 1", FolderPath(*station.Get(), true));

    // Too small a buffer: the path fails and the buffer keeps what it had.
    wchar_t small[30];
    wcscpy(small, L"untouched");
    EXPECT_FALSE(root->GetFolderPath(small, 10, true));
    EXPECT_FALSE(station->GetFolderPath(small, ARRAYSIZE(small), false));
    EXPECT_EQ(std::wstring(L"\\Quorvel Digital Level"), small) << "the parent's part stays";
}

TEST_F(ShellFolderTest, ParseDisplayNameInTheRoot) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl list;
    ASSERT_EQ(S_OK, Parse(folder.Get(), L"Station 1", list));
    EXPECT_EQ(1u, manager_.GetItemCount(list.get()));
    EXPECT_EQ(static_cast<DWORD>(PT_STATION), manager_.GetLastItemKind(list.get()));
    EXPECT_EQ(L"Station 1", manager_.GetItemName(list.get()));

    ASSERT_EQ(S_OK, Parse(folder.Get(), L"A\\B", list));
    ASSERT_EQ(2u, manager_.GetItemCount(list.get()));
    EXPECT_EQ(static_cast<uint32_t>(PT_STATION), ItemKind(reinterpret_cast<uint8_t*>(list.get())));
    EXPECT_EQ(L"A", manager_.GetItemName(list.get()));
    EXPECT_EQ(static_cast<DWORD>(PT_FILE), manager_.GetLastItemKind(list.get()));
    EXPECT_EQ(L"B", manager_.GetItemName(manager_.GetLastItem(list.get())));

    ASSERT_EQ(S_OK, Parse(folder.Get(), L"\\\\Station 2\\", list));
    EXPECT_EQ(L"Station 2", manager_.GetItemName(list.get())) << "extra separators name nothing";
    // The longest name that still fits after "\Quorvel Digital Level\".
    ASSERT_EQ(S_OK, Parse(folder.Get(), std::wstring(259 - 23, L'n'), list));
    EXPECT_EQ(std::wstring(259 - 23, L'n'), manager_.GetItemName(list.get()));

    for (const std::wstring& bad :
         {std::wstring(), std::wstring(L"\\"), std::wstring(L"\\\\\\"), std::wstring(L"A\\B\\C"),
          std::wstring(260 - 23, L'n'), std::wstring(300, L'x')}) {
        EXPECT_EQ(E_INVALIDARG, Parse(folder.Get(), bad, list)) << testing::PrintToString(bad);
        EXPECT_FALSE(list) << "out list is null on failure";
    }
}

TEST_F(ShellFolderTest, BindToStationThenParseAndNameItsFile) {
    ComPtr<IShellFolder> root = CreateRootFolder();
    ComPtr<IShellFolder> stationFolder = Bind(root.Get(), StationItem(L"Station 1"));
    ASSERT_TRUE(stationFolder);
    // The station folder keeps its parent alive: the shell may release the root first.
    root.Reset();

    UniquePidl file;
    ASSERT_EQ(S_OK, Parse(stationFolder.Get(), L"file1.lv", file));
    ASSERT_EQ(1u, manager_.GetItemCount(file.get()));
    EXPECT_TRUE(manager_.IsFile(file.get()));
    std::wstring text;
    ASSERT_EQ(S_OK, DisplayName(stationFolder.Get(), file, SHGDN_FORPARSING, text));
    EXPECT_EQ(std::wstring(kPrefix) + L"\\Station 1\\file1.lv", text);
    ASSERT_EQ(S_OK, DisplayName(stationFolder.Get(), file, SHGDN_NORMAL, text));
    EXPECT_EQ(L"file1.lv", text);

    // Two names in a station folder: the station itself and a file named by the first, the rest
    // ignored (the whole path can hold a root, a station and a file, nothing more).
    UniquePidl pair;
    ASSERT_EQ(S_OK, Parse(stationFolder.Get(), L"A\\B", pair));
    ASSERT_EQ(2u, manager_.GetItemCount(pair.get()));
    EXPECT_EQ(L"Station 1", manager_.GetItemName(pair.get()));
    EXPECT_EQ(static_cast<DWORD>(PT_FILE), manager_.GetLastItemKind(pair.get()));
    EXPECT_EQ(L"A", manager_.GetItemName(manager_.GetLastItem(pair.get())));
}

TEST_F(ShellFolderTest, RefusedObjectsComeBackNull) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    UniquePidl file = FileItem(L"file1.lv");
    UniquePidl station = StationItem(L"S");
    void* object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_INVALIDARG, folder->BindToObject(Child(file), nullptr, IID_IShellFolder, &object));
    EXPECT_EQ(nullptr, object);
    // The new station folder is released again (the fixture counts the module's locks).
    object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_NOINTERFACE, folder->BindToObject(Child(station), nullptr, IID_IStream, &object));
    EXPECT_EQ(nullptr, object);
    object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_NOTIMPL, folder->BindToStorage(Child(station), nullptr, IID_IStream, &object));
    EXPECT_EQ(nullptr, object);
    // The folder makes views and background menus only; the drop target does not exist yet.
    for (REFIID iid : {IID_IDropTarget, IID_IShellFolder}) {
        object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_NOINTERFACE, folder->CreateViewObject(nullptr, iid, &object));
        EXPECT_EQ(nullptr, object);
    }
    PITEMID_CHILD renamed = reinterpret_cast<PITEMID_CHILD>(1);
    EXPECT_EQ(E_NOTIMPL, folder->SetNameOf(nullptr, Child(station), L"T", SHGDN_NORMAL, &renamed));
    EXPECT_EQ(nullptr, renamed);
}
