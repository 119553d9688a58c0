// The item enumerator: what it lists for each folder and flag, and Next/Skip/Reset.
#include "tests/shell_folder/shell_folder_fixture.h"

#include "namespace/lv_enum_id_list.h"
#include "support/registry_value.h"

namespace {

using Items = std::vector<std::pair<DWORD, std::wstring>>;

}  // namespace

TEST_F(ShellFolderTest, RootListsStationsOnlyForFolders) {
    AddStationOfModel(L"Station 1");
    AddStationOfModel(L"Station 2", IDS_MODEL_LV30);
    // A subkey without a readable name is skipped silently.
    UniqueRegKey stray;
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegCreateKeyExW(HKEY_CURRENT_USER, (StationsKeyPath() + L"\\Stray").c_str(), 0,
                                nullptr, 0, KEY_ALL_ACCESS, nullptr, stray.put(), nullptr));
    ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(stray.get(), L"Name", 7));
    // Names written by other tools: an empty one makes the path of the root itself, a backslash
    // ends the station's part of the path.
    for (const auto& [key, name] : {std::pair<const wchar_t*, const wchar_t*>{L"Station 8", L""},
                                    {L"Station 9", L"North\\South"}}) {
        UniqueRegKey written;
        ASSERT_EQ(ERROR_SUCCESS,
                  ::RegCreateKeyExW(HKEY_CURRENT_USER, (StationsKeyPath() + L"\\" + key).c_str(),
                                    0, nullptr, 0, KEY_ALL_ACCESS, nullptr, written.put(), nullptr));
        ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(written.get(), L"Name", name));
    }

    ComPtr<IShellFolder> folder = CreateRootFolder();
    const Items expected = {{PT_STATION, L"Station 1"},
                            {PT_STATION, L"Station 2"},
                            {PT_ROOT, L"Quorvel Digital Level"},
                            {PT_STATION, L"North"}};
    EXPECT_EQ(expected, Enumerate(folder.Get(), SHCONTF_FOLDERS));
    EXPECT_EQ(expected, Enumerate(folder.Get(), SHCONTF_FOLDERS | SHCONTF_NONFOLDERS));
    EXPECT_EQ(Items{}, Enumerate(folder.Get(), SHCONTF_NONFOLDERS));
}

TEST_F(ShellFolderTest, StationFolderListsOneFileNamedByModel) {
    AddStationOfModel(L"Level 10", IDS_MODEL_LV10);
    AddStationOfModel(L"Level 20", IDS_MODEL_LV20);
    AddStationOfModel(L"Level 30", IDS_MODEL_LV30);
    ComPtr<IShellFolder> root = CreateRootFolder();
    const std::pair<const wchar_t*, const wchar_t*> cases[] = {
        {L"Level 10", L"file1.lv"},  {L"Level 20", L"file1.hvr"},
        {L"Level 30", L"file1.hvr"}, {L"Not in the store", L"file1.lv"},
        {L"level 30", L"file1.lv"},  // station names are matched case-sensitively
    };
    for (const auto& [station, file] : cases) {
        UniquePidl item = StationItem(station);
        ComPtr<IShellFolder> folder;
        ASSERT_EQ(S_OK, root->BindToObject(reinterpret_cast<PCUIDLIST_RELATIVE>(item.get()),
                                           nullptr, IID_PPV_ARGS(&folder)));
        EXPECT_EQ((Items{{PT_FILE, file}}), Enumerate(folder.Get(), SHCONTF_NONFOLDERS))
            << testing::PrintToString(station);
        EXPECT_EQ(Items{}, Enumerate(folder.Get(), SHCONTF_FOLDERS));
    }
}

TEST_F(ShellFolderTest, NextSkipAndResetFollowTheEnumerationRules) {
    for (const wchar_t* name : {L"A", L"B", L"C"})
        AddStationOfModel(name);
    ComPtr<IShellFolder> folder = CreateRootFolder();
    ComPtr<IEnumIDList> list;
    ASSERT_EQ(S_OK, folder->EnumObjects(nullptr, SHCONTF_FOLDERS, &list));

    auto freeAll = [](PITEMID_CHILD* items, ULONG count) {
        for (ULONG index = 0; index < count; ++index)
            ::CoTaskMemFree(items[index]);
    };
    PITEMID_CHILD items[5] = {};
    ULONG fetched = 99;
    // Two or more without a count to report: refused, and nothing moves.
    EXPECT_EQ(E_INVALIDARG, list->Next(2, items, nullptr));
    EXPECT_EQ(S_OK, list->Next(1, items, nullptr));
    EXPECT_EQ(L"A", manager_.GetItemName(items[0]));
    freeAll(items, 1);

    ASSERT_EQ(S_OK, list->Reset());
    EXPECT_EQ(S_FALSE, list->Next(5, items, &fetched));
    ASSERT_EQ(3u, fetched);
    EXPECT_EQ(L"A", manager_.GetItemName(items[0]));
    EXPECT_EQ(L"C", manager_.GetItemName(items[2]));
    freeAll(items, fetched);
    EXPECT_EQ(S_FALSE, list->Next(5, items, &fetched));
    EXPECT_EQ(0u, fetched);

    ASSERT_EQ(S_OK, list->Reset());
    EXPECT_EQ(S_OK, list->Skip(0));
    EXPECT_EQ(S_OK, list->Skip(2));
    EXPECT_EQ(S_OK, list->Next(1, items, &fetched));
    EXPECT_EQ(L"C", manager_.GetItemName(items[0]));
    freeAll(items, fetched);
    ASSERT_EQ(S_OK, list->Reset());
    EXPECT_EQ(S_OK, list->Skip(3)) << "passing exactly the last item is not running out";
    EXPECT_EQ(S_FALSE, list->Skip(1));
    ASSERT_EQ(S_OK, list->Reset());
    EXPECT_EQ(S_FALSE, list->Skip(4));

    IEnumIDList* copy = reinterpret_cast<IEnumIDList*>(1);
    EXPECT_EQ(E_NOTIMPL, list->Clone(&copy));
    EXPECT_EQ(nullptr, copy);
}

TEST_F(ShellFolderTest, FillingFromPaths) {
    AddStationOfModel(L"Station 1", IDS_MODEL_LV20);
    auto list = MakeComObject<CLVEnumIDList>();
    // A path of separators only has no first component: the folder reports this as no memory.
    EXPECT_TRUE(FAILED(list->Fill(L"\\\\\\", SHCONTF_FOLDERS)));
    // An empty path is the root.
    ASSERT_EQ(S_OK, list->Fill(L"", SHCONTF_FOLDERS));
    PITEMID_CHILD item = nullptr;
    ASSERT_EQ(S_OK, list->Next(1, &item, nullptr));
    UniquePidl first(reinterpret_cast<LPITEMIDLIST>(item));
    EXPECT_EQ(L"Station 1", manager_.GetItemName(first.get()));
    // Filling again starts over.
    ASSERT_EQ(S_OK, list->Fill(L"Quorvel Digital Level\\Station 1", SHCONTF_NONFOLDERS));
    ASSERT_EQ(S_OK, list->Next(1, &item, nullptr));
    UniquePidl file(reinterpret_cast<LPITEMIDLIST>(item));
    EXPECT_EQ(L"file1.hvr", manager_.GetItemName(file.get()));
    EXPECT_EQ(S_FALSE, list->Next(1, &item, nullptr));
}
