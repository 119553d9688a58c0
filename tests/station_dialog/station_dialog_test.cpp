// The station property sheet under Wine's common controls: typing, picking, OK, Apply, Cancel,
// the three name refusals, the conversions of the page, and the store afterwards.
#include "stations/station_dialog.h"

#include <commctrl.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <thread>
#include <tuple>

#include "res/resource.h"
#include "stations/station_store.h"
#include "support/text_lookup.h"
#include "tests/support/recording_user_interface.h"
#include "tests/support/registry_override.h"

namespace {

constexpr int kApplyButton = 0x3021;  // the sheet's Apply

// The sheet's frame, its page, and what a user does to them, from a thread of its own.
struct Sheet {
    HWND frame;
    HWND page;

    std::wstring Text(int controlId = 0, bool onFrame = false) const {
        wchar_t text[512] = {};
        const HWND window = controlId ? ::GetDlgItem(onFrame ? frame : page, controlId) : frame;
        ::SendMessageW(window, WM_GETTEXT, 512, reinterpret_cast<LPARAM>(text));
        return text;
    }
    // The selected entry's text; empty with no selection.
    std::wstring Selected(int listId) const {
        const HWND list = ::GetDlgItem(page, listId);
        const LRESULT index = ::SendMessageW(list, CB_GETCURSEL, 0, 0);
        wchar_t text[256] = {};
        if (index != CB_ERR)
            ::SendMessageW(list, CB_GETLBTEXT, index, reinterpret_cast<LPARAM>(text));
        return text;
    }
    void Type(const std::wstring& text) const {
        const HWND edit = ::GetDlgItem(page, IDC_STATION_NAME_EDIT);
        ::SendMessageW(edit, EM_SETSEL, 0, -1);
        ::SendMessageW(edit, WM_CHAR, VK_BACK, 0);
        for (wchar_t c : text)
            ::SendMessageW(edit, WM_CHAR, c, 0);
    }
    void Pick(int listId, const std::wstring& entry) const {
        const HWND list = ::GetDlgItem(page, listId);
        const LRESULT index =
            ::SendMessageW(list, CB_FINDSTRINGEXACT, -1, reinterpret_cast<LPARAM>(entry.c_str()));
        ::SendMessageW(list, CB_SETCURSEL, index, 0);
        ::SendMessageW(page, WM_COMMAND, MAKEWPARAM(listId, CBN_SELCHANGE),
                       reinterpret_cast<LPARAM>(list));
    }
    bool ApplyEnabled() const { return ::IsWindowEnabled(::GetDlgItem(frame, kApplyButton)); }
    // The sheet's own press of a button, as a click gives it; it does not depend on where the
    // sheet is on the screen or whether it has the focus yet.
    void Press(int buttonId) const {
        const int button = buttonId == IDOK         ? PSBTN_OK
                           : buttonId == IDCANCEL   ? PSBTN_CANCEL
                                                    : PSBTN_APPLYNOW;
        ::SendMessageW(frame, PSM_PRESSBUTTON, button, 0);
    }
};

// Runs the sheet modally on this thread while script acts on it from another.
INT_PTR RunSheet(CStationDialog& dialog, const std::function<void(const Sheet&)>& script) {
    std::thread user([&, sheetThread = ::GetCurrentThreadId()] {
        Sheet sheet{};
        for (int tries = 0; tries < 500 && !sheet.page; ++tries) {
            ::Sleep(20);
            ::EnumThreadWindows(
                sheetThread,
                [](HWND window, LPARAM found) {
                    if (!::IsWindowVisible(window))
                        return TRUE;
                    *reinterpret_cast<HWND*>(found) = window;
                    return FALSE;
                },
                reinterpret_cast<LPARAM>(&sheet.frame));
            if (sheet.frame)
                sheet.page = ::FindWindowExW(sheet.frame, nullptr, L"#32770", nullptr);
        }
        if (!sheet.page) {
            ADD_FAILURE() << "no sheet appeared";
            return;
        }
        // The page exists before the sheet has finished setting it up: wait until it shows.
        for (int tries = 0; tries < 250 && !::IsWindowVisible(sheet.page); ++tries)
            ::Sleep(20);
        ::Sleep(200);
        script(sheet);
        for (int tries = 0; tries < 250 && ::IsWindow(sheet.frame); ++tries)
            ::Sleep(20);
        if (::IsWindow(sheet.frame)) {
            ADD_FAILURE() << "the sheet stayed open";
            sheet.Press(IDCANCEL);
        }
    });
    const INT_PTR result = dialog.DoModal();
    user.join();
    return result;
}

class StationDialog : public ::testing::Test {
protected:
    void SetUp() override {
        INITCOMMONCONTROLSEX controls{sizeof controls, ICC_STANDARD_CLASSES | ICC_TAB_CLASSES};
        ::InitCommonControlsEx(&controls);
        registry_.SetSerialPorts({L"COM3", L"COM10", L"COM2"});
        north_.Name = L"North";
        north_.Port = L"COM10";
        ASSERT_EQ(S_OK, AddStation(north_));
    }
    static Station Stored(const std::wstring& name) {
        Station station;
        station.Name = name;
        EXPECT_EQ(S_OK, FindStation(station)) << name;
        return station;
    }

    RegistryOverride registry_{RegistryOverride::Hives::CurrentUserAndLocalMachine};
    RecordingUserInterface user_;
    ScopedUserInterface seam_{user_};
    Station north_ = DefaultStation();
};

}  // namespace

TEST_F(StationDialog, RefusedNamesKeepTheSheetOpenWithTheirTextAndStoreNothing) {
    const struct {
        const wchar_t* typed;
        const wchar_t* text;
    } cases[] = {
        {L"", L"Please enter valid device name!"},
        {L"A\"B", L"Digital Level's name can't contain folowing symbols:\n\t\t\\/*"},
        {L"North", L"The digital level 'North' already exists"},
    };
    for (const auto& test : cases) {
        RecordingUserInterface user;
        ScopedUserInterface seam(user);
        Station station = DefaultStation();
        CStationDialog dialog(nullptr, station, true);
        const INT_PTR result = RunSheet(dialog, [&](const Sheet& sheet) {
            sheet.Type(test.typed);
            sheet.Press(IDOK);
            EXPECT_TRUE(::IsWindow(sheet.frame)) << test.typed;
            sheet.Press(IDCANCEL);
        });
        EXPECT_EQ(IDCANCEL, result);
        const auto boxes = user.MessageBoxes();
        ASSERT_EQ(1u, boxes.size()) << test.typed;
        EXPECT_EQ(test.text, boxes[0].text);
        EXPECT_EQ(L"Add New Digital Level", boxes[0].caption);
        EXPECT_EQ(static_cast<UINT>(MB_ICONERROR), boxes[0].style);
        EXPECT_EQ(1u, ListStationNames().size()) << "nothing was added";
    }
}

TEST_F(StationDialog, NewStationOpensWithTheListsAndStoresOnOkOnly) {
    for (const std::wstring name : {L"   ", L"NORTH"}) {  // blanks pass; case makes another name
        Station station = DefaultStation();
        station.Name = L"New digital level";
        CStationDialog dialog(nullptr, station, true);
        const INT_PTR result = RunSheet(dialog, [&](const Sheet& sheet) {
            EXPECT_EQ(L"Create Digital Level", sheet.Text());
            EXPECT_EQ(L"New digital level", sheet.Text(IDC_STATION_NAME_EDIT));
            EXPECT_EQ(L"Baudrate:", sheet.Text(IDC_STATION_BAUD_LABEL));
            EXPECT_EQ(L"9600", sheet.Selected(IDC_STATION_BAUD));
            EXPECT_EQ(L"Even", sheet.Selected(IDC_STATION_PARITY));
            EXPECT_EQ(L"Quorvel LV-10", sheet.Selected(IDC_STATION_MODEL));
            sheet.Type(name);
            sheet.Pick(IDC_STATION_PORT, L"COM2");
            sheet.Pick(IDC_STATION_MODEL, L"Quorvel LV-30");
            EXPECT_FALSE(sheet.ApplyEnabled()) << "a new station is stored by OK alone";
            sheet.Press(IDOK);
        });
        EXPECT_EQ(IDOK, result);
        EXPECT_TRUE(dialog.Added());
        const Station stored = Stored(name);
        EXPECT_EQ(L"COM2", stored.Port);
        EXPECT_EQ(L"Quorvel LV-30", stored.Model);
        EXPECT_EQ(9600u, stored.BaudRate);
    }
}

TEST_F(StationDialog, EditModeShowsUnlistedValuesAsNoSelectionAndApplyStoresBeforeCancel) {
    Station odd = DefaultStation();
    odd.Name = L"Odd one";
    odd.BaudRate = 19200;
    odd.Parity = 7;
    odd.Port = L"COM9";  // not among the computer's ports
    odd.StopBits = 2;
    ASSERT_EQ(S_OK, AddStation(odd));
    Station station = odd;  // as the folder holds it: the store would read the port as COM3
    CStationDialog dialog(nullptr, station, false);
    const INT_PTR result = RunSheet(dialog, [&](const Sheet& sheet) {
        EXPECT_EQ(L"Digital Level properties", sheet.Text());
        EXPECT_EQ(L"", sheet.Selected(IDC_STATION_BAUD)) << "19200 is not offered";
        EXPECT_EQ(L"None", sheet.Selected(IDC_STATION_PARITY));
        EXPECT_EQ(L"", sheet.Selected(IDC_STATION_PORT));
        EXPECT_FALSE(sheet.ApplyEnabled());
        sheet.Type(L"North");  // another station's name: accepted when editing
        EXPECT_TRUE(sheet.ApplyEnabled());
        sheet.Press(kApplyButton);
        EXPECT_TRUE(::IsWindow(sheet.frame));
        sheet.Press(IDCANCEL);
    });
    EXPECT_EQ(IDCANCEL, result);
    EXPECT_TRUE(user_.MessageBoxes().empty());
    const std::vector<std::wstring> names = ListStationNames();
    EXPECT_EQ(2, std::count(names.begin(), names.end(), L"North")) << "Apply stored the rename";
    EXPECT_EQ(0u, station.BaudRate);
    EXPECT_EQ(0u, station.Parity);
    EXPECT_EQ(L"", station.Port);
    EXPECT_EQ(2u, station.StopBits) << "values the page does not show are kept";
}

TEST_F(StationDialog, AGermanUiRelabelsTheSheetAndItsRefusals) {
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN)));
    Station station = DefaultStation();
    CStationDialog dialog(nullptr, station, true);
    RunSheet(dialog, [&](const Sheet& sheet) {
        EXPECT_EQ(L"Digitalnivellier anlegen", sheet.Text());
        EXPECT_EQ(L"Anschluss:", sheet.Text(IDC_STATION_PORT_LABEL));
        EXPECT_EQ(L"Parität:", sheet.Text(IDC_STATION_PARITY_LABEL));
        EXPECT_EQ(L"Gerade", sheet.Selected(IDC_STATION_PARITY));
        sheet.Type(L"");
        sheet.Press(IDOK);
        sheet.Press(IDCANCEL);
    });
    SelectThreadUiLanguage(before);
    const auto boxes = user_.MessageBoxes();
    ASSERT_EQ(1u, boxes.size());
    EXPECT_EQ(L"Bitte einen gültigen Gerätenamen eingeben!", boxes[0].text);
    EXPECT_EQ(L"Neues Digitalnivellier hinzufügen", boxes[0].caption);
}

TEST_F(StationDialog, ValuesTheListsDoNotHoldLeaveTheHiddenFieldsAlone) {
    Station station = DefaultStation();
    station.Name = std::wstring(300, L'n');  // longer than the store keeps: never found there
    station.Model = L"Some other level";
    station.Port = L"COM99";
    station.StopBits = 2;
    station.DataBits = 8;
    station.Flow = 1;
    station.Manufacturer = L"Maker";
    const Station before = station;
    CStationDialog dialog(nullptr, station, false);
    const INT_PTR result = RunSheet(dialog, [&](const Sheet& sheet) {
        EXPECT_EQ(before.Name, sheet.Text(IDC_STATION_NAME_EDIT));
        EXPECT_EQ(L"", sheet.Selected(IDC_STATION_MODEL));
        sheet.Press(IDOK);
    });
    EXPECT_EQ(IDOK, result);
    EXPECT_EQ(before.Name, station.Name);
    EXPECT_EQ(L"", station.Model) << "no selection reads back as no text";
    EXPECT_EQ(L"", station.Port);
    EXPECT_EQ(9600u, station.BaudRate);
    EXPECT_EQ(std::make_tuple(2u, 8u, 1u, std::wstring(L"Maker")),
              std::make_tuple(station.StopBits, station.DataBits, station.Flow,
                              station.Manufacturer));
    EXPECT_EQ(std::vector<std::wstring>{L"North"}, ListStationNames()) << "nothing was stored";
}
