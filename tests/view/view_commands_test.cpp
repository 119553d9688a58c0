// The view's commands end to end, with the real property sheet on the virtual display: add, edit,
// delete, copy and paste stations, open an item, and the broadcast that keeps two views in step
// (pasting other programs' blocks: view_paste_test.cpp).
#include "tests/view/view_fixture.h"

namespace {

TEST_F(ShellViewTest, AddRefusesBadNamesThenStoresAGoodOneWithTheDefaults) {
    AddStationOfModel(L"North");
    CExplorerWindow& browser = Open();
    std::wstring offered;
    {
        SheetUser user(::GetCurrentThreadId(), {[&](const StationPage& sheet) {
                           offered = sheet.Name();
                           for (const wchar_t* refused : {L"", L"North", L"a/b"}) {
                               sheet.Type(refused);
                               sheet.Press(PSBTN_OK);
                           }
                           sheet.Type(L"Deck 2");
                           sheet.Press(PSBTN_OK);
                       }});
        EXPECT_EQ(S_OK, Command(browser, 1280));
    }
    EXPECT_EQ(L"New digital level", offered);
    EXPECT_EQ(3u, user_.MessageBoxes().size());
    Station stored = Named(L"Deck 2");
    ASSERT_EQ(S_OK, FindStation(stored));
    Station expected = DefaultStation();
    expected.Name = L"Deck 2";
    EXPECT_EQ(expected, stored);
    EXPECT_EQ((std::vector<std::wstring>{kEntry, L"Deck 2", L"North"}), Texts(browser));
}

TEST_F(ShellViewTest, OpeningTheEntryStartsAddAndCancelStoresNothing) {
    CExplorerWindow& browser = Open();
    Select(browser, {0});
    {
        SheetUser user(::GetCurrentThreadId(),
                       {[](const StationPage& sheet) { sheet.Press(PSBTN_CANCEL); }});
        EXPECT_EQ(S_OK, Command(browser, 1289));
        EXPECT_EQ(1, user.Handled());
    }
    EXPECT_TRUE(ListStationNames().empty());
    EXPECT_EQ(0, browser.BrowseRequestCount());
}

TEST_F(ShellViewTest, OpeningAStationAsksTheBrowserToBrowseToIt) {
    AddStationOfModel(L"North");
    CExplorerWindow& browser = Open();
    Select(browser, {1});
    EXPECT_EQ(S_OK, Command(browser, 1289));
    EXPECT_EQ(1, browser.BrowseRequestCount());
}

TEST_F(ShellViewTest, PropertiesOpensOneSheetPerSelectedStationInListOrder) {
    AddStationOfModel(L"A");
    AddStationOfModel(L"B");
    AddStationOfModel(L"C");
    CExplorerWindow& browser = Open();
    Select(browser, {3, 1});
    std::vector<std::wstring> shown;
    {
        SheetUser user(::GetCurrentThreadId(), {[&](const StationPage& sheet) {
                                                    shown.push_back(sheet.Name());
                                                    sheet.Type(L"A2");
                                                    sheet.Press(PSBTN_OK);
                                                },
                                                [&](const StationPage& sheet) {
                                                    shown.push_back(sheet.Name());
                                                    sheet.Press(PSBTN_CANCEL);
                                                }});
        EXPECT_EQ(S_OK, Command(browser, 1287));
    }
    EXPECT_EQ((std::vector<std::wstring>{L"A", L"C"}), shown);
    EXPECT_EQ((std::vector<std::wstring>{kEntry, L"A2", L"B", L"C"}), Texts(browser));
}

TEST_F(ShellViewTest, StationsDeletedElsewhereAreSkippedByPropertiesAndDelete) {
    AddStationOfModel(L"A");
    AddStationOfModel(L"B");
    CExplorerWindow& browser = Open();
    Select(browser, {1, 2});
    ASSERT_EQ(S_OK, DeleteStation(Named(L"A")));
    {
        std::vector<std::wstring> shown;
        SheetUser user(::GetCurrentThreadId(), {[&](const StationPage& sheet) {
                           shown.push_back(sheet.Name());
                           sheet.Press(PSBTN_CANCEL);
                       }});
        EXPECT_EQ(S_OK, Command(browser, 1287));
        EXPECT_EQ(std::vector<std::wstring>{L"B"}, shown);
    }
    // The broadcast refreshed the list: select the stale item again by name, then delete.
    browser.PumpMessages(100);
    EXPECT_EQ((std::vector<std::wstring>{kEntry, L"B"}), Texts(browser));
    Select(browser, {1});
    ASSERT_EQ(S_OK, DeleteStation(Named(L"B")));
    EXPECT_EQ(S_OK, Command(browser, 1288));
    EXPECT_EQ(std::vector<std::wstring>{kEntry}, Texts(browser));
}

TEST_F(ShellViewTest, DeleteSkipsTheEntryAndAsksNothing) {
    for (const wchar_t* name : {L"A", L"B", L"C"})
        AddStationOfModel(name);
    CExplorerWindow& browser = Open();
    Select(browser, {0, 1, 3});
    EXPECT_EQ(S_OK, Command(browser, 1288));
    EXPECT_TRUE(user_.MessageBoxes().empty());
    EXPECT_EQ(std::vector<std::wstring>{L"B"}, ListStationNames());
    EXPECT_EQ((std::vector<std::wstring>{kEntry, L"B"}), Texts(browser));
}

TEST_F(ShellViewTest, PastingPutsCopyOfInFrontUntilTheNameIsFree) {
    AddStationOfModel(L"A");
    AddStationOfModel(L"Copy of B");
    AddStationOfModel(L"B");
    CExplorerWindow& browser = Open();
    Select(browser, {1, 2});  // A and B
    EXPECT_EQ(S_OK, Command(browser, 1281));
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ((std::vector<std::wstring>{kEntry, L"A", L"B", L"Copy of A", L"Copy of B",
                                         L"Copy of Copy of A", L"Copy of Copy of B",
                                         L"Copy of Copy of Copy of B"}),
              Texts(browser));
}

TEST_F(ShellViewTest, AChangeInOneViewRefreshesAnotherOfTheSameKind) {
    AddStationOfModel(L"A");
    AddStationOfModel(L"B");
    CExplorerWindow& first = Open();
    CExplorerWindow& second = Open();
    Select(first, {1});
    EXPECT_EQ(S_OK, Command(first, 1288));
    for (int tries = 0; tries < 50 && Texts(second).size() != 2; ++tries) {
        second.PumpMessages(20);
        WaitForFill(second);
    }
    EXPECT_EQ((std::vector<std::wstring>{kEntry, L"B"}), Texts(second));
}

}  // namespace
