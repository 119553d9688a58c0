// The view's list in a browser: what the fill shows, the view modes and the details column, the
// column click, the status text, the selection's objects and the shell's command groups.
#include "tests/view/view_fixture.h"

#include "stations/display_settings.h"
#include "stations/station_list_block.h"
#include "support/clipboard_formats.h"

namespace {

int ImageOf(HWND list, int index) {
    LVITEMW item{};
    item.mask = LVIF_IMAGE;
    item.iItem = index;
    ListView_GetItem(list, &item);
    return item.iImage;
}

TEST_F(ShellViewTest, TopFolderListsTheEntryFirstThenStationsInNameOrder) {
    // With no stations the entry stands alone.
    EXPECT_EQ(Names{kEntry}, Texts(Open()));
    AddStationsOfModel({L"bravo", L"Alpha", L"charlie"});
    CExplorerWindow& browser = Open();
    EXPECT_EQ((Names{kEntry, L"Alpha", L"bravo", L"charlie"}), Texts(browser));
    EXPECT_EQ(kRootIconIndex, ImageOf(List(browser), 0));
    EXPECT_EQ(kStationIconIndex, ImageOf(List(browser), 1));
}

// A station's list holds what its folder enumerates: one file, named for the model by the folder.
TEST_F(ShellViewTest, StationFolderListsItsOneFileAndTheStatusBarNamesTheFolderInOnePart) {
    AddStationOfModel(L"North", IDS_MODEL_LV30);
    CExplorerWindow& top = Open();
    EXPECT_EQ(1, top.StatusPartCount());
    // The top folder's own name is its root item's.
    EXPECT_EQ(L"Quorvel Digital Levels: Quorvel Digital Level", top.StatusText());
    CExplorerWindow& station = Open(L"North");
    EXPECT_EQ(L"Quorvel Digital Levels: North", station.StatusText());
    EXPECT_EQ(Names{L"file1.hvr"}, Texts(station));
    EXPECT_EQ(kFileIconIndex, ImageOf(List(station), 0));
}

TEST_F(ShellViewTest, ViewModesSetTheListStyleAndDetailsShowsOneNameColumnAtTheStoredWidth) {
    SetDisplayColumnWidth(0, 100);
    CExplorerWindow& browser = Open();
    const HWND list = List(browser);
    const struct {
        DWORD command;
        DWORD style;
    } modes[] = {{1284, LVS_SMALLICON}, {1285, LVS_LIST}, {1286, LVS_REPORT}, {1283, LVS_ICON}};
    for (const auto& mode : modes) {
        EXPECT_EQ(S_OK, Command(browser, mode.command));
        EXPECT_EQ(mode.style, ListStyle(browser)) << mode.command;
        FOLDERSETTINGS settings{};
        EXPECT_EQ(S_OK, browser.View()->GetCurrentInfo(&settings));
        EXPECT_EQ(mode.command - 1282, settings.ViewMode);
        EXPECT_EQ(Names{kEntry}, Texts(browser));
    }
    EXPECT_EQ(S_OK, Command(browser, 1286));
    const HWND header = ListView_GetHeader(list);
    ASSERT_EQ(1, Header_GetItemCount(header));
    wchar_t text[32] = {};
    LVCOLUMNW column{};
    column.mask = LVCF_TEXT;
    column.pszText = text;
    column.cchTextMax = 32;
    ASSERT_TRUE(ListView_GetColumn(list, 0, &column));
    EXPECT_STREQ(L"Name", text);
    EXPECT_EQ(100, ListView_GetColumnWidth(list, 0));

    // The end of a column drag stores both widths as the list has them; the second column does
    // not exist and reads as 0.
    ListView_SetColumnWidth(list, 0, 180);
    NMHEADERW drag{};
    drag.hdr = NMHDR{header, 0, static_cast<UINT>(HDN_ENDTRACKW)};
    ::SendMessageW(browser.ViewWindow(), WM_NOTIFY, 0, reinterpret_cast<LPARAM>(&drag));
    browser.PumpMessages(50);
    EXPECT_EQ(180, DisplayColumnWidth(0));
    EXPECT_EQ(0, DisplayColumnWidth(1));
    // Stored at once, with the view still open: the store reads the dragged width back.
    SetDisplayColumnWidth(0, 0);
    EXPECT_TRUE(LoadDisplaySettings());
    EXPECT_EQ(180, DisplayColumnWidth(0));
    // A later details view starts at the stored width.
    EXPECT_EQ(180, ListView_GetColumnWidth(List(Open(L"", Details())), 0));
    SetDisplayColumnWidth(0, 100);
}

// Each view keeps its own order: the first click on Name sorts descending, the next ascending, and
// a click in one view does not turn the next click in another.
TEST_F(ShellViewTest, TwoViewsInOneProcessSortEachByItsOwnClicks) {
    AddStationsOfModel({L"b", L"A", L"c"});
    const Names descending{kEntry, L"c", L"b", L"A"};
    const Names ascending{kEntry, L"A", L"b", L"c"};
    CExplorerWindow& first = Open(L"", Details());
    CExplorerWindow& second = Open(L"", Details());
    NotifyFromList(first, LVN_COLUMNCLICK, -1, 0);
    EXPECT_EQ(descending, Texts(first));
    // The second view has not been clicked yet: its first click sorts descending too.
    NotifyFromList(second, LVN_COLUMNCLICK, -1, 0);
    EXPECT_EQ(descending, Texts(second));
    NotifyFromList(second, LVN_COLUMNCLICK, -1, 0);
    EXPECT_EQ(ascending, Texts(second));
    // And the first goes on from its own one click, whatever the second did.
    NotifyFromList(first, LVN_COLUMNCLICK, -1, 0);
    EXPECT_EQ(ascending, Texts(first));
    EXPECT_EQ(ascending, Texts(second));
}

TEST_F(ShellViewTest, GetItemObjectAnswersForTheFirstSelectedItemOnly) {
    AddStationsOfModel({L"A", L"B"});
    CExplorerWindow& browser = Open();
    ComPtr<IDataObject> object;
    EXPECT_EQ(E_INVALIDARG,
              browser.View()->GetItemObject(SVGIO_SELECTION, IID_PPV_ARGS(&object)));
    Select(browser, {2, 1});
    EXPECT_EQ(E_NOINTERFACE, browser.View()->GetItemObject(SVGIO_ALLVIEW, IID_PPV_ARGS(&object)));
    ASSERT_EQ(S_OK, browser.View()->GetItemObject(SVGIO_SELECTION, IID_PPV_ARGS(&object)));
    // The object carries the station of list index 1, the first selected from the top.
    FORMATETC format{RegisteredFormat(ClipboardFormat::StationList), nullptr, DVASPECT_CONTENT, -1,
                     TYMED_HGLOBAL};
    STGMEDIUM medium{};
    ASSERT_EQ(S_OK, object->GetData(&format, &medium));
    std::vector<Station> stations;
    EXPECT_EQ(S_OK, ParseStationList(medium.hGlobal, stations));
    ::ReleaseStgMedium(&medium);
    ASSERT_EQ(1u, stations.size());
    EXPECT_EQ(L"A", stations[0].Name);
}

TEST_F(ShellViewTest, TheCommandTargetAnswersTheShellsTwoGroupsOnly) {
    CExplorerWindow& browser = Open();
    ComPtr<IOleCommandTarget> target;
    ASSERT_EQ(S_OK, browser.View()->QueryInterface(IID_PPV_ARGS(&target)));
    OLECMD commands[] = {{1286, 0}, {4711, 0}};
    for (const GUID* group : {&CGID_Explorer, &CGID_ShellDocView}) {
        EXPECT_EQ(S_OK, target->QueryStatus(group, 2, commands, nullptr));
        EXPECT_EQ(static_cast<DWORD>(OLECMDF_SUPPORTED | OLECMDF_ENABLED), commands[0].cmdf);
        EXPECT_EQ(0u, commands[1].cmdf);
    }
    const GUID unknown = {0x12345678, 0x1234, 0x1234, {1, 2, 3, 4, 5, 6, 7, 8}};
    EXPECT_EQ(OLECMDERR_E_UNKNOWNGROUP, target->QueryStatus(&unknown, 2, commands, nullptr));
    EXPECT_EQ(E_POINTER, target->QueryStatus(&CGID_Explorer, 2, nullptr, nullptr));
    EXPECT_EQ(OLECMDERR_E_UNKNOWNGROUP, target->Exec(&unknown, 1286, 0, nullptr, nullptr));
    EXPECT_EQ(static_cast<DWORD>(LVS_ICON), ListStyle(browser));
    EXPECT_EQ(S_OK, target->Exec(&CGID_ShellDocView, 1286, 0, nullptr, nullptr));
    EXPECT_EQ(static_cast<DWORD>(LVS_REPORT), ListStyle(browser));
}

// Wine's browsers never call TranslateAccelerator: the list's own keys still give commands, and a
// browser that does call it does not get each command twice.
TEST_F(ShellViewTest, ShortcutsWorkWithAndWithoutTheBrowsersTranslationAndActOnce) {
    AddStationsOfModel({L"A", L"B"});
    CExplorerWindow& browser = Open();
    Select(browser, {1});
    BYTE keys[256] = {};
    ASSERT_TRUE(::GetKeyboardState(keys));
    const auto control = [&](bool down) {
        keys[VK_CONTROL] = down ? 0x80 : 0;
        ASSERT_TRUE(::SetKeyboardState(keys));
    };
    // Handed to TranslateAccelerator, Ctrl+C copies and is still reported as not handled.
    control(true);
    MSG message{List(browser), WM_KEYDOWN, 'C', 0x002E0001, 0, {}};
    EXPECT_EQ(S_FALSE, browser.View()->TranslateAccelerator(&message));
    control(false);
    browser.PumpMessages(50);
    EXPECT_TRUE(::IsClipboardFormatAvailable(RegisteredFormat(ClipboardFormat::StationList)));
    (void)::OleSetClipboard(nullptr);  // the key below must copy for itself
    ASSERT_FALSE(::IsClipboardFormatAvailable(RegisteredFormat(ClipboardFormat::StationList)));

    const auto press = [&](WORD key, bool withControl, bool throughBrowser) {
        control(withControl);
        ::PostMessageW(List(browser), WM_KEYDOWN, key, 1);
        if (throughBrowser) {
            browser.PumpMessages(50);
        } else {
            MSG posted;
            while (::PeekMessageW(&posted, nullptr, 0, 0, PM_REMOVE))
                ::DispatchMessageW(&posted);
        }
        control(false);
        WaitForFill(browser);
    };
    press('C', true, false);
    press('V', true, true);
    EXPECT_EQ((Names{L"A", L"B", L"Copy of A"}), ListStationNames());
    Select(browser, {1});  // A
    press(VK_DELETE, false, false);
    EXPECT_EQ((Names{L"B", L"Copy of A"}), ListStationNames());
}

}  // namespace
