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
    UniqueAbsoluteIdList elsewhereLocation;
    ASSERT_EQ(S_OK, ::SHGetSpecialFolderLocation(nullptr, CSIDL_DRIVES, elsewhereLocation.put()));
    ASSERT_EQ(S_OK, elsewhere->Initialize(elsewhereLocation.get()));
    EXPECT_EQ(L"\\Quorvel Digital Level", FolderPath(*elsewhere.Get(), false));

    auto station = MakeComObject<CLVShellFolder>();
    UniqueChildPidl item = StationItem(L"Station 1");
    ASSERT_EQ(S_OK, station->SetUp(root.Get(), item.get()));
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
    // The longest name that still fits after "\Quorvel Digital Level\".
    const std::wstring longest(259 - 23, L'n');
    const std::pair<std::wstring, Items> parsed[] = {
        {L"Station 1", {{PT_STATION, L"Station 1"}}},
        {L"A\\B", {{PT_STATION, L"A"}, {PT_FILE, L"B"}}},
        {L"\\\\Station 2\\", {{PT_STATION, L"Station 2"}}},  // extra separators name nothing
        {longest, {{PT_STATION, longest}}},
    };
    UniqueRelativePidl list;
    for (const auto& [name, items] : parsed) {
        ASSERT_EQ(S_OK, Parse(root_.Get(), name, list));
        EXPECT_EQ(items, ItemsOf(list));
    }
    for (const std::wstring& bad :
         {std::wstring(), std::wstring(L"\\"), std::wstring(L"\\\\\\"), std::wstring(L"A\\B\\C"),
          longest + L"n", std::wstring(300, L'x')}) {
        EXPECT_EQ(E_INVALIDARG, Parse(root_.Get(), bad, list)) << testing::PrintToString(bad);
        EXPECT_FALSE(list) << "out list is null on failure";
    }
}

TEST_F(ShellFolderTest, BindToStationThenParseAndNameItsFile) {
    ComPtr<IShellFolder> stationFolder = Bind(root_.Get(), StationItem(L"Station 1"));
    ASSERT_TRUE(stationFolder);
    // The station folder keeps its parent alive: the shell may release the root first.
    root_.Reset();

    UniqueRelativePidl file;
    ASSERT_EQ(S_OK, Parse(stationFolder.Get(), L"file1.lv", file));
    EXPECT_EQ((Items{{PT_FILE, L"file1.lv"}}), ItemsOf(file));
    // One item, as the shell then hands it back: a child.
    const UniqueChildPidl fileItem = manager_.CopyItem(file.get());
    std::wstring text;
    ASSERT_EQ(S_OK, DisplayName(stationFolder.Get(), fileItem, SHGDN_FORPARSING, text));
    EXPECT_EQ(std::wstring(kPrefix) + L"\\Station 1\\file1.lv", text);
    ASSERT_EQ(S_OK, DisplayName(stationFolder.Get(), fileItem, SHGDN_NORMAL, text));
    EXPECT_EQ(L"file1.lv", text);

    // Two names in a station folder: the station itself and a file named by the first, the rest
    // ignored (the whole path can hold a root, a station and a file, nothing more).
    UniqueRelativePidl pair;
    ASSERT_EQ(S_OK, Parse(stationFolder.Get(), L"A\\B", pair));
    EXPECT_EQ((Items{{PT_STATION, L"Station 1"}, {PT_FILE, L"A"}}), ItemsOf(pair));
}

TEST_F(ShellFolderTest, RefusedObjectsComeBackNull) {
    UniqueChildPidl file = FileItem(L"file1.lv");
    UniqueChildPidl station = StationItem(L"S");
    void* object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_INVALIDARG, root_->BindToObject(file.get(), nullptr, IID_IShellFolder, &object));
    EXPECT_EQ(nullptr, object);
    // The new station folder is released again (the fixture counts the module's locks).
    object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_NOINTERFACE, root_->BindToObject(station.get(), nullptr, IID_IStream, &object));
    EXPECT_EQ(nullptr, object);
    object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_NOTIMPL, root_->BindToStorage(station.get(), nullptr, IID_IStream, &object));
    EXPECT_EQ(nullptr, object);
    // The folder makes views and background menus only.
    for (REFIID iid : {IID_IDropTarget, IID_IShellFolder}) {
        object = reinterpret_cast<void*>(1);
        EXPECT_EQ(E_NOINTERFACE, root_->CreateViewObject(nullptr, iid, &object));
        EXPECT_EQ(nullptr, object);
    }
    PITEMID_CHILD renamed = reinterpret_cast<PITEMID_CHILD>(1);
    EXPECT_EQ(E_NOTIMPL, root_->SetNameOf(nullptr, station.get(), L"T", SHGDN_NORMAL, &renamed));
    EXPECT_EQ(nullptr, renamed);
}
