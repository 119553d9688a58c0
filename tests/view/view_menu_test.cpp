// The view's items in the browser's File, Edit and View menus for each kind of selection, in a
// file dialog and in a browser without menus; and the folder's background menu object.
#include "tests/view/view_fixture.h"

#include "support/clipboard_formats.h"
#include "view/lv_context_menu.h"

namespace {

struct MenuEntry {
    std::wstring text;
    UINT state;
};

HMENU Popup(HMENU bar, UINT id) {
    MENUITEMINFOW info{};
    info.cbSize = sizeof info;
    info.fMask = MIIM_SUBMENU;
    return ::GetMenuItemInfoW(bar, id, FALSE, &info) ? info.hSubMenu : nullptr;
}

MenuEntry Entry(HMENU menu, UINT command) {
    wchar_t text[64] = {};
    ::GetMenuStringW(menu, command, text, 64, MF_BYCOMMAND);
    return {text, ::GetMenuState(menu, command, MF_BYCOMMAND)};
}

bool Grayed(HMENU menu, UINT command) {
    return (Entry(menu, command).state & MF_GRAYED) != 0;
}

TEST_F(ShellViewTest, MergedItemsAreEnabledByWhatIsSelected) {
    AddStationsOfModel({L"A", L"B"});
    CExplorerWindow& browser = Open();
    const struct {
        const char* selection;
        std::initializer_list<int> indexes;
        bool open, deleteAndProperties, copy, paste;
    } cases[] = {
        {"nothing", {}, false, false, false, false},
        {"the entry alone", {0}, true, false, true, false},
        {"the entry and a station", {0, 1}, true, false, true, false},
        {"stations", {1, 2}, true, true, true, true},
    };
    for (const auto& c : cases) {
        Select(browser, c.indexes);
        const HMENU bar = browser.MenuBar();
        EXPECT_EQ(!c.open, Grayed(bar, 1289)) << c.selection;
        EXPECT_EQ(!c.deleteAndProperties, Grayed(bar, 1288)) << c.selection;
        EXPECT_EQ(!c.deleteAndProperties, Grayed(bar, 1287)) << c.selection;
        EXPECT_FALSE(Grayed(bar, 1280)) << c.selection;
        EXPECT_EQ(!c.copy, Grayed(bar, 1281)) << c.selection;
        EXPECT_EQ(!c.paste, Grayed(bar, 1282)) << c.selection;
    }
}

TEST_F(ShellViewTest, FileEditAndViewPopupsHoldTheViewsItemsWithTheirTextsAndMarks) {
    CExplorerWindow& browser = Open();
    const HMENU bar = browser.MenuBar();
    const HMENU file = Popup(bar, FCIDM_MENU_FILE);
    ASSERT_NE(nullptr, file);
    EXPECT_EQ(1289u, ::GetMenuItemID(file, 0));
    EXPECT_EQ(1289u, ::GetMenuDefaultItem(file, FALSE, GMDI_USEDISABLED));
    EXPECT_EQ(L"Open", Entry(file, 1289).text);
    EXPECT_EQ(L"Create Digital Level", Entry(file, 1280).text);
    EXPECT_EQ(L"Delete", Entry(file, 1288).text);
    EXPECT_EQ(L"Properties", Entry(file, 1287).text);
    // With the focus the Edit popup holds the view's two items and nothing of the browser's.
    const HMENU edit = Popup(bar, FCIDM_MENU_EDIT);
    ASSERT_EQ(3, ::GetMenuItemCount(edit));
    EXPECT_EQ(L"&Copy", Entry(edit, 1281).text);
    EXPECT_EQ(L"&Paste", Entry(edit, 1282).text);
    // The modes stand in front of the browser's options separator, the current one marked.
    const HMENU view = Popup(bar, FCIDM_MENU_VIEW);
    EXPECT_EQ(L"Large Icons", Entry(view, 1283).text);
    EXPECT_EQ(L"Details", Entry(view, 1286).text);
    int separator = -1, details = -1;
    for (int index = 0; index < ::GetMenuItemCount(view); ++index) {
        if (::GetMenuItemID(view, index) == FCIDM_MENU_VIEW_SEP_OPTIONS)
            separator = index;
        if (::GetMenuItemID(view, index) == 1286)
            details = index;
    }
    EXPECT_LT(details, separator);
    EXPECT_TRUE(Entry(view, 1283).state & MF_CHECKED);
    EXPECT_EQ(S_OK, Command(browser, 1286));
    const HMENU moved = Popup(browser.MenuBar(), FCIDM_MENU_VIEW);
    EXPECT_FALSE(Entry(moved, 1283).state & MF_CHECKED);
    EXPECT_TRUE(Entry(moved, 1286).state & MF_CHECKED);

    // Active without the focus: the Edit popup is the browser's own again.
    EXPECT_EQ(S_OK, browser.View()->UIActivate(SVUIA_ACTIVATE_NOFOCUS));
    EXPECT_EQ(0xFFFFFFFFu, ::GetMenuState(browser.MenuBar(), 1281, MF_BYCOMMAND));
    EXPECT_NE(0xFFFFFFFFu, ::GetMenuState(browser.MenuBar(), 1289, MF_BYCOMMAND));
}

TEST_F(ShellViewTest, AStationsFolderOffersOpenAndEditButNoStationCommands) {
    AddStationOfModel(L"S");
    const HMENU bar = Open(L"S").MenuBar();
    EXPECT_NE(0xFFFFFFFFu, ::GetMenuState(bar, 1289, MF_BYCOMMAND));
    EXPECT_NE(0xFFFFFFFFu, ::GetMenuState(bar, 1281, MF_BYCOMMAND));
    for (UINT command : {1280u, 1287u, 1288u})
        EXPECT_EQ(0xFFFFFFFFu, ::GetMenuState(bar, command, MF_BYCOMMAND)) << command;
}

TEST_F(ShellViewTest, AGermanUiTranslatesTheEntryTheMenusAndTheStatusText) {
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN)));
    CExplorerWindow& browser = Open(L"", Details());
    const HMENU bar = browser.MenuBar();
    const Names entry = Texts(browser);
    const std::wstring open = Entry(bar, 1289).text;
    const std::wstring create = Entry(bar, 1280).text;
    const std::wstring copy = Entry(bar, 1281).text;
    const std::wstring status = browser.StatusText();
    EXPECT_TRUE(SelectThreadUiLanguage(before));
    EXPECT_EQ(Names{L"Neues Digitalnivellier hinzufügen"}, entry);
    EXPECT_EQ(L"Öffnen", open);
    EXPECT_EQ(L"Digitalnivellier anlegen", create);
    EXPECT_EQ(L"&Kopieren", copy);
    EXPECT_EQ(L"Quorvel Digitalnivelliere: Quorvel Digital Level", status);
}

TEST_F(ShellViewTest, InAFileDialogOpenReadsSelect) {
    const HMENU bar = Open(L"", {.commonDialog = true}).MenuBar();
    EXPECT_EQ(L"Select", Entry(bar, 1289).text);
}

TEST_F(ShellViewTest, ABrowserWithoutMenusLeavesAWorkingView) {
    AddStationOfModel(L"North");
    CExplorerWindow& browser = Open(L"", {.menusNotImplemented = true});
    EXPECT_EQ((Names{kEntry, L"North"}), Texts(browser));
    Select(browser, {1});
    EXPECT_EQ(S_OK, Command(browser, 1281));
    EXPECT_TRUE(::IsClipboardFormatAvailable(RegisteredFormat(ClipboardFormat::StationList)));
    EXPECT_EQ(S_OK, Command(browser, 1288));
    EXPECT_TRUE(ListStationNames().empty());
}

TEST_F(ShellViewTest, TheBackgroundMenuCarriesItsOneSampleCommand) {
    auto menu = MakeComObject<CLVContextMenu>();
    UniqueMenu popup(::CreatePopupMenu());
    EXPECT_EQ(MAKE_HRESULT(0, 0, 0), menu->QueryContextMenu(popup.get(), 0, 40, 50, CMF_DEFAULTONLY));
    EXPECT_EQ(0, ::GetMenuItemCount(popup.get()));
    EXPECT_EQ(MAKE_HRESULT(0, 0, 1), menu->QueryContextMenu(popup.get(), 0, 40, 50, CMF_NORMAL));
    EXPECT_EQ(L"&Sample Explorer Bar Command", Entry(popup.get(), 40).text);

    CMINVOKECOMMANDINFO invoke{};
    invoke.cbSize = sizeof invoke;
    invoke.lpVerb = "open";
    EXPECT_EQ(E_INVALIDARG, menu->InvokeCommand(&invoke));
    invoke.lpVerb = MAKEINTRESOURCEA(1);
    EXPECT_EQ(E_INVALIDARG, menu->InvokeCommand(&invoke));
    invoke.lpVerb = MAKEINTRESOURCEA(0);
    EXPECT_EQ(S_OK, menu->InvokeCommand(&invoke));
    ASSERT_EQ(1u, user_.MessageBoxes().size());
    EXPECT_EQ(L"Explorer Bar Command selected.", user_.MessageBoxes()[0].text);
    EXPECT_EQ(L"Sample Explorer Bar", user_.MessageBoxes()[0].caption);
    EXPECT_EQ(static_cast<UINT>(MB_ICONINFORMATION), user_.MessageBoxes()[0].style);

    // 8-bit text into the wide request's buffer, as the menu always answered.
    char text[64] = {};
    EXPECT_EQ(S_OK, menu->GetCommandString(0, GCS_VERBW, nullptr, text, 32));
    EXPECT_STREQ("command", text);
    EXPECT_EQ(S_OK, menu->GetCommandString(0, GCS_HELPTEXTW, nullptr, text, 32));
    EXPECT_STREQ("Explorer Bar command help text", text);
    EXPECT_EQ(S_OK, menu->GetCommandString(0, GCS_VALIDATEW, nullptr, nullptr, 0));
    EXPECT_EQ(E_INVALIDARG, menu->GetCommandString(0, GCS_VERBA, nullptr, text, 32));
    EXPECT_EQ(E_INVALIDARG, menu->GetCommandString(1, GCS_VERBW, nullptr, text, 32));
}

}  // namespace
