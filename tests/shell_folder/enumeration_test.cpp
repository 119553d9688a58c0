// The item enumerator: what it lists for each folder and flag, and Next/Skip/Reset.
#include "tests/shell_folder/shell_folder_fixture.h"

#include "namespace/lv_enum_id_list.h"
#include "support/registry_value.h"

TEST_F(ShellFolderTest, RootListsStationsOnlyForFolders) {
    AddStationOfModel(L"Station 1");
    AddStationOfModel(L"Station 2", IDS_MODEL_LV30);
    // A subkey whose name is no text is left out (with a line in the error log).
    ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(StationKey(L"Stray").get(), L"Name", 7));
    // Names written by other tools that a path would not carry as themselves are left out: an
    // empty one would make the path of the root itself, and "North\South" would be listed as
    // "North", another station's name.
    ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(StationKey(L"Station 8").get(), L"Name", L""));
    ASSERT_EQ(ERROR_SUCCESS,
              WriteStringValue(StationKey(L"Station 9").get(), L"Name", L"North\\South"));

    const Items expected = {{PT_STATION, L"Station 1"}, {PT_STATION, L"Station 2"}};
    EXPECT_EQ(expected, Enumerate(root_.Get(), SHCONTF_FOLDERS));
    EXPECT_EQ(expected, Enumerate(root_.Get(), SHCONTF_FOLDERS | SHCONTF_NONFOLDERS));
    EXPECT_EQ(Items{}, Enumerate(root_.Get(), SHCONTF_NONFOLDERS));
}

TEST_F(ShellFolderTest, StationFolderListsOneFileNamedByModel) {
    AddStationOfModel(L"Level 10", IDS_MODEL_LV10);
    AddStationOfModel(L"Level 20", IDS_MODEL_LV20);
    AddStationOfModel(L"Level 30", IDS_MODEL_LV30);
    const std::pair<const wchar_t*, const wchar_t*> cases[] = {
        {L"Level 10", L"file1.lv"},  {L"Level 20", L"file1.hvr"},
        {L"Level 30", L"file1.hvr"}, {L"Not in the store", L"file1.lv"},
        {L"level 30", L"file1.lv"},  // station names are matched case-sensitively
    };
    for (const auto& [station, file] : cases) {
        ComPtr<IShellFolder> folder = Bind(root_.Get(), StationItem(station));
        ASSERT_TRUE(folder);
        EXPECT_EQ((Items{{PT_FILE, file}}), Enumerate(folder.Get(), SHCONTF_NONFOLDERS))
            << testing::PrintToString(station);
        EXPECT_EQ(Items{}, Enumerate(folder.Get(), SHCONTF_FOLDERS));
    }
}

TEST_F(ShellFolderTest, NextSkipAndResetFollowTheEnumerationRules) {
    for (const wchar_t* name : {L"A", L"B", L"C"})
        AddStationOfModel(name);
    ComPtr<IEnumIDList> list;
    ASSERT_EQ(S_OK, root_->EnumObjects(nullptr, SHCONTF_FOLDERS, &list));
    PITEMID_CHILD items[5] = {};
    ULONG fetched = 99;
    // The names of the items fetched, which are freed.
    auto names = [&](ULONG count) {
        std::vector<std::wstring> fetchedNames;
        for (ULONG index = 0; index < count; ++index) {
            const UniqueChildPidl fetchedItem(items[index]);
            fetchedNames.push_back(manager_.GetItemName(fetchedItem.get()));
        }
        return fetchedNames;
    };
    using Names = std::vector<std::wstring>;

    // Two or more without a count to report: refused, and nothing moves.
    EXPECT_EQ(E_INVALIDARG, list->Next(2, items, nullptr));
    EXPECT_EQ(S_OK, list->Next(1, items, nullptr));
    EXPECT_EQ(Names{L"A"}, names(1));

    ASSERT_EQ(S_OK, list->Reset());
    EXPECT_EQ(S_FALSE, list->Next(5, items, &fetched));
    EXPECT_EQ((Names{L"A", L"B", L"C"}), names(fetched));
    EXPECT_EQ(S_FALSE, list->Next(5, items, &fetched));
    EXPECT_EQ(0u, fetched);

    ASSERT_EQ(S_OK, list->Reset());
    EXPECT_EQ(S_OK, list->Skip(0));
    EXPECT_EQ(S_OK, list->Skip(2));
    EXPECT_EQ(S_OK, list->Next(1, items, &fetched));
    EXPECT_EQ(Names{L"C"}, names(fetched));
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
    PITEMID_CHILD item = nullptr;
    // An empty path is the root; filling again starts over.
    for (const auto& [path, flags, name] :
         {std::tuple{L"", SHCONTF_FOLDERS, L"Station 1"},
          std::tuple{L"Quorvel Digital Level\\Station 1", SHCONTF_NONFOLDERS, L"file1.hvr"}}) {
        ASSERT_EQ(S_OK, list->Fill(path, flags));
        ASSERT_EQ(S_OK, list->Next(1, &item, nullptr));
        EXPECT_EQ(name, manager_.GetItemName(UniqueChildPidl(item).get()));
    }
    EXPECT_EQ(S_FALSE, list->Next(1, &item, nullptr));
}
