// The view's commands end to end with the real property sheet: add, edit, delete, copy, paste,
// open, and the broadcast that keeps two views in step (other programs' blocks: view_paste_test).
#include "tests/view/view_fixture.h"

#include <algorithm>
#include <list>

#include "tests/stations/store_refusal.h"

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
    EXPECT_EQ((Names{kEntry, L"Deck 2", L"North"}), Texts(browser));
}

// Opening the entry starts Add (cancelled here: nothing stored); opening a station browses to it.
TEST_F(ShellViewTest, OpeningTheEntryStartsAddAndOpeningAStationBrowsesToIt) {
    AddStationOfModel(L"North");
    CExplorerWindow& browser = Open();
    Select(browser, {0});
    {
        SheetUser user(::GetCurrentThreadId(),
                       {[](const StationPage& sheet) { sheet.Press(PSBTN_CANCEL); }});
        EXPECT_EQ(S_OK, Command(browser, 1289));
        EXPECT_EQ(1, user.Handled());
    }
    EXPECT_EQ(Names{L"North"}, ListStationNames());
    EXPECT_EQ(0, browser.BrowseRequestCount());
    Select(browser, {1});
    EXPECT_EQ(S_OK, Command(browser, 1289));
    EXPECT_EQ(1, browser.BrowseRequestCount());
}

TEST_F(ShellViewTest, PropertiesOpensOneSheetPerSelectedStationInListOrder) {
    AddStationsOfModel({L"A", L"B", L"C"});
    CExplorerWindow& browser = Open();
    Select(browser, {3, 1});
    Names shown;
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
    EXPECT_EQ((Names{L"A", L"C"}), shown);
    EXPECT_EQ((Names{kEntry, L"A2", L"B", L"C"}), Texts(browser));
}

TEST_F(ShellViewTest, StationsDeletedElsewhereAreSkippedByPropertiesAndDelete) {
    AddStationsOfModel({L"A", L"B"});
    CExplorerWindow& browser = Open();
    Select(browser, {1, 2});
    ASSERT_EQ(S_OK, DeleteStation(Named(L"A")));
    {
        Names shown;
        SheetUser user(::GetCurrentThreadId(), {[&](const StationPage& sheet) {
                           shown.push_back(sheet.Name());
                           sheet.Press(PSBTN_CANCEL);
                       }});
        EXPECT_EQ(S_OK, Command(browser, 1287));
        EXPECT_EQ(Names{L"B"}, shown);
    }
    // The broadcast refreshed the list: select the stale item again by name, then delete.
    browser.PumpMessages(100);
    EXPECT_EQ((Names{kEntry, L"B"}), Texts(browser));
    Select(browser, {1});
    ASSERT_EQ(S_OK, DeleteStation(Named(L"B")));
    EXPECT_EQ(S_OK, Command(browser, 1288));
    EXPECT_EQ(Names{kEntry}, Texts(browser));
}

TEST_F(ShellViewTest, DeleteSkipsTheEntryAndAsksNothing) {
    AddStationsOfModel({L"A", L"B", L"C"});
    CExplorerWindow& browser = Open();
    Select(browser, {0, 1, 3});
    EXPECT_EQ(S_OK, Command(browser, 1288));
    EXPECT_TRUE(user_.MessageBoxes().empty());
    EXPECT_EQ(Names{L"B"}, ListStationNames());
    EXPECT_EQ((Names{kEntry, L"B"}), Texts(browser));
}

TEST_F(ShellViewTest, PastingPutsCopyOfInFrontUntilTheNameIsFree) {
    AddStationsOfModel({L"A", L"Copy of B", L"B"});
    CExplorerWindow& browser = Open();
    Select(browser, {1, 2});  // A and B
    EXPECT_EQ(S_OK, Command(browser, 1281));
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ(S_OK, Command(browser, 1282));
    EXPECT_EQ((Names{kEntry, L"A", L"B", L"Copy of A", L"Copy of B", L"Copy of Copy of A",
                     L"Copy of Copy of B", L"Copy of Copy of Copy of B"}),
              Texts(browser));
}

TEST_F(ShellViewTest, AChangeInOneViewRefreshesAnotherOfTheSameKind) {
    AddStationsOfModel({L"A", L"B"});
    CExplorerWindow& first = Open();
    CExplorerWindow& second = Open();
    Select(first, {1});
    EXPECT_EQ(S_OK, Command(first, 1288));
    for (int tries = 0; tries < 50 && Texts(second).size() != 2; ++tries) {
        second.PumpMessages(20);
        WaitForFill(second);
    }
    EXPECT_EQ((Names{kEntry, L"B"}), Texts(second));
}

TEST_F(ShellViewTest, DeleteRemovesWhatItCanAndNamesTheRestInOneBoundedMessage) {
    std::vector<Station> levels;
    for (int number = 1; number <= 14; ++number)
        levels.push_back(Named((number < 10 ? L"Level 0" : L"Level ") + std::to_wstring(number)));
    ASSERT_EQ(S_OK, AddStations(levels));  // "Station 0" to "Station 13"
    std::list<WriteRefusingKey> locked;
    for (int key = 0; key < 12; ++key)
        locked.emplace_back(L"Station " + std::to_wstring(key));
    CExplorerWindow& browser = Open();
    Select(browser, {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14});
    ASSERT_EQ(S_OK, DeleteStation(levels[13]));  // gone meanwhile: no failure, simply gone
    EXPECT_EQ(S_OK, Command(browser, 1288));

    const auto boxes = user_.MessageBoxes();
    ASSERT_EQ(1u, boxes.size());
    std::wstring named;
    for (int number = 1; number <= 10; ++number)
        named += L"'" + levels[number - 1].Name + L"'\r\n";
    EXPECT_EQ(L"These digital levels could not be deleted:\r\n" + named + L"and 2 more\r\n\r\n" +
                  SystemMessageText(ERROR_ACCESS_DENIED),
              boxes[0].text);
    EXPECT_EQ(browser.ViewWindow(), boxes[0].owner);
    EXPECT_EQ(L"Quorvel Digital Levels", boxes[0].caption);
    const Names left = ListStationNames();
    EXPECT_EQ(12u, left.size());
    EXPECT_EQ(std::count(left.begin(), left.end(), levels[12].Name), 0) << "the free one went";
    EXPECT_EQ(13u, Texts(browser).size()) << "the list shows what is left";
}

}  // namespace
