// The folder's set-up, folder paths, parsing, binding and the objects it refuses to make.
#include "tests/shell_folder/shell_folder_fixture.h"

#include <cstring>
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
    ASSERT_EQ(S_OK, station->SetUp(root.Get(), reinterpret_cast<PCUIDLIST_RELATIVE>(item.get())));
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
    auto parse = [&](const std::wstring& name, UniquePidl& list) {
        std::wstring writable = name;
        PIDLIST_RELATIVE parsed = reinterpret_cast<PIDLIST_RELATIVE>(1);
        const HRESULT result =
            folder->ParseDisplayName(nullptr, nullptr, writable.data(), nullptr, &parsed, nullptr);
        list.reset(reinterpret_cast<LPITEMIDLIST>(parsed));
        return result;
    };

    UniquePidl list;
    ASSERT_EQ(S_OK, parse(L"Station 1", list));
    EXPECT_EQ(static_cast<DWORD>(PT_STATION), manager_.GetLastItemKind(list.get()));

    ASSERT_EQ(S_OK, parse(L"A\\B", list));
    ASSERT_EQ(2u, manager_.GetItemCount(list.get()));
    EXPECT_EQ(static_cast<uint32_t>(PT_STATION), ItemKind(reinterpret_cast<uint8_t*>(list.get())));
    EXPECT_EQ(L"A", manager_.GetItemName(list.get()));
    EXPECT_EQ(static_cast<DWORD>(PT_FILE), manager_.GetLastItemKind(list.get()));
    EXPECT_EQ(L"B", manager_.GetItemName(manager_.GetLastItem(list.get())));

    // Extra separators name nothing more.
    ASSERT_EQ(S_OK, parse(L"\\\\Station 2\\", list));
    EXPECT_EQ(L"Station 2", manager_.GetItemName(list.get()));

    for (const wchar_t* bad : {L"", L"\\", L"\\\\\\", L"A\\B\\C"}) {
        EXPECT_EQ(E_INVALIDARG, parse(bad, list)) << "name: " << testing::PrintToString(bad);
        EXPECT_FALSE(list) << "out list is null on failure";
    }
    EXPECT_EQ(E_INVALIDARG, parse(std::wstring(300, L'x'), list));
    // The longest name that still fits after "\Quorvel Digital Level\".
    ASSERT_EQ(S_OK, parse(std::wstring(259 - 23, L'n'), list));
    EXPECT_EQ(std::wstring(259 - 23, L'n'), manager_.GetItemName(list.get()));
    EXPECT_EQ(E_INVALIDARG, parse(std::wstring(260 - 23, L'n'), list));
}

TEST_F(ShellFolderTest, BindToStationThenParseAndNameItsFile) {
    ComPtr<IShellFolder> root = CreateRootFolder();
    UniquePidl station = StationItem(L"Station 1");
    ComPtr<IShellFolder> stationFolder;
    ASSERT_EQ(S_OK, root->BindToObject(reinterpret_cast<PCUIDLIST_RELATIVE>(station.get()), nullptr,
                                       IID_PPV_ARGS(&stationFolder)));
    // The station folder keeps its parent alive: the shell may release the root first.
    root.Reset();

    std::wstring name = L"file1.lv";
    PIDLIST_RELATIVE parsed = nullptr;
    ASSERT_EQ(S_OK, stationFolder->ParseDisplayName(nullptr, nullptr, name.data(), nullptr, &parsed,
                                                    nullptr));
    UniquePidl file(reinterpret_cast<LPITEMIDLIST>(parsed));
    ASSERT_EQ(1u, manager_.GetItemCount(file.get()));
    EXPECT_TRUE(manager_.IsFile(file.get()));

    std::wstring text;
    ASSERT_EQ(S_OK, DisplayName(stationFolder.Get(), file, SHGDN_FORPARSING, text));
    EXPECT_EQ(std::wstring(kPrefix) + L"\\Station 1\\file1.lv", text);
    ASSERT_EQ(S_OK, DisplayName(stationFolder.Get(), file, SHGDN_NORMAL, text));
    EXPECT_EQ(L"file1.lv", text);

    // Two names in a station folder: the station itself and a file named by the first, the rest
    // ignored (the whole path can hold a root, a station and a file, nothing more).
    std::wstring two = L"A\\B";
    ASSERT_EQ(S_OK, stationFolder->ParseDisplayName(nullptr, nullptr, two.data(), nullptr, &parsed,
                                                    nullptr));
    UniquePidl pair(reinterpret_cast<LPITEMIDLIST>(parsed));
    ASSERT_EQ(2u, manager_.GetItemCount(pair.get()));
    EXPECT_EQ(L"Station 1", manager_.GetItemName(pair.get()));
    EXPECT_EQ(static_cast<DWORD>(PT_FILE), manager_.GetLastItemKind(pair.get()));
    EXPECT_EQ(L"A", manager_.GetItemName(manager_.GetLastItem(pair.get())));
}

TEST_F(ShellFolderTest, BindToObjectRefusesFilesAndMalformedItems) {
    ComPtr<IShellFolder> root = CreateRootFolder();
    UniquePidl file = FileItem(L"file1.lv");
    void* object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_INVALIDARG, root->BindToObject(reinterpret_cast<PCUIDLIST_RELATIVE>(file.get()),
                                               nullptr, IID_IShellFolder, &object));
    EXPECT_EQ(nullptr, object);

    // A station item whose name runs to the end of its cb without a terminator.
    UniquePidl station = StationItem(L"AB");
    auto* bytes = reinterpret_cast<uint8_t*>(station.get());
    memset(bytes + kItemNameOffset, 'x', station.get()->mkid.cb - kItemNameOffset);
    object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_INVALIDARG, root->BindToObject(reinterpret_cast<PCUIDLIST_RELATIVE>(station.get()),
                                               nullptr, IID_IShellFolder, &object));
    EXPECT_EQ(nullptr, object);

    UniquePidl good = StationItem(L"S");
    EXPECT_EQ(E_NOINTERFACE, root->BindToObject(reinterpret_cast<PCUIDLIST_RELATIVE>(good.get()),
                                                nullptr, IID_IStream, &object));
    EXPECT_EQ(nullptr, object) << "the new folder is released again";
}

TEST_F(ShellFolderTest, ObjectsOfLaterWorkAndUnsupportedOperations) {
    ComPtr<IShellFolder> folder = CreateRootFolder();
    void* object = reinterpret_cast<void*>(1);
    // The view and the background menu do not exist yet.
    EXPECT_EQ(E_NOINTERFACE, folder->CreateViewObject(nullptr, IID_IShellView, &object));
    EXPECT_EQ(nullptr, object);
    EXPECT_EQ(E_NOINTERFACE, folder->CreateViewObject(nullptr, IID_IContextMenu, &object));

    UniquePidl station = StationItem(L"S");
    object = reinterpret_cast<void*>(1);
    EXPECT_EQ(E_NOTIMPL, folder->BindToStorage(reinterpret_cast<PCUIDLIST_RELATIVE>(station.get()),
                                               nullptr, IID_IStream, &object));
    EXPECT_EQ(nullptr, object);
    PITEMID_CHILD renamed = reinterpret_cast<PITEMID_CHILD>(1);
    EXPECT_EQ(E_NOTIMPL, folder->SetNameOf(nullptr, Child(station), L"T", SHGDN_NORMAL, &renamed));
    EXPECT_EQ(nullptr, renamed);
}
