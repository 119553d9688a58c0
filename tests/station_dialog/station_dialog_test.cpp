// The station property sheet under Wine's common controls: typing, picking, OK, Apply, Cancel,
// the three name refusals, the conversions of the page, and the store afterwards.
#include "stations/station_dialog.h"

#include <commctrl.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <optional>

#include "res/resource.h"
#include "stations/station_store.h"
#include "support/module_instance.h"
#include "support/registry_value.h"
#include "support/text_lookup.h"
#include "tests/progress_dialogs/dialog_driver.h"
#include "tests/stations/station_builders.h"
#include "tests/stations/store_refusal.h"
#include "tests/support/registry_override.h"

namespace {

// Runs the sheet modally on this thread while script acts on its page from another.
INT_PTR RunSheet(CStationDialog& dialog, const std::function<void(const StationPage&)>& script) {
    return RunDialog(dialog, [&](HWND frame) {
        ASSERT_TRUE(WaitFor([&] { return StationPage{frame}.Shown(); }, 5000));
        ::Sleep(200);
        script(StationPage{frame});
    });
}

class StationDialog : public ::testing::Test {
protected:
    void SetUp() override {
        INITCOMMONCONTROLSEX controls{sizeof controls, ICC_STANDARD_CLASSES | ICC_TAB_CLASSES};
        ::InitCommonControlsEx(&controls);
        registry_.SetSerialPorts({L"COM3", L"COM10", L"COM2"});
        Station north = DefaultStation();
        north.Name = L"North";
        north.Port = L"COM10";
        ASSERT_EQ(S_OK, AddStation(north));
    }

    RegistryOverride registry_{RegistryOverride::Hives::CurrentUserAndLocalMachine};
    RecordingUserInterface user_;
    ScopedUserInterface seam_{user_};
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
        const INT_PTR result = RunSheet(dialog, [&](const StationPage& page) {
            page.Type(test.typed);
            page.Press(PSBTN_OK);
            EXPECT_TRUE(::IsWindow(page.frame)) << test.typed;
            page.Press(PSBTN_CANCEL);
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
        const INT_PTR result = RunSheet(dialog, [&](const StationPage& page) {
            EXPECT_EQ(L"Create Digital Level", Text(page.frame));
            EXPECT_EQ(L"New digital level", Text(page.window, IDC_STATION_NAME_EDIT));
            EXPECT_EQ(L"Baudrate:", Text(page.window, IDC_STATION_BAUD_LABEL));
            EXPECT_EQ(L"9600", page.Selected(IDC_STATION_BAUD));
            EXPECT_EQ(L"Even", page.Selected(IDC_STATION_PARITY));
            EXPECT_EQ(L"Quorvel LV-10", page.Selected(IDC_STATION_MODEL));
            page.Type(name);
            page.Pick(IDC_STATION_PORT, L"COM2");
            page.Pick(IDC_STATION_MODEL, L"Quorvel LV-30");
            EXPECT_FALSE(page.ApplyEnabled()) << "a new station is stored by OK alone";
            page.Press(PSBTN_OK);
        });
        EXPECT_EQ(IDOK, result);
        EXPECT_TRUE(dialog.Added());
        Station stored;
        stored.Name = name;
        ASSERT_EQ(S_OK, FindStation(stored));
        EXPECT_EQ(L"COM2", stored.Port);
        EXPECT_EQ(L"Quorvel LV-30", stored.Model);
        EXPECT_EQ(9600u, stored.BaudRate);
    }
}

TEST_F(StationDialog, EditModeKeepsWhatTheRecordHoldsAndRefusesAValueTheRuleDoesNot) {
    Station odd = DefaultStation();
    odd.Name = L"Odd one";
    odd.BaudRate = 19200;
    odd.Parity = 7;
    odd.Port = L"COM9";  // not among the computer's ports
    odd.StopBits = 2;
    odd.DataBits = 8;
    odd.Flow = 1;
    odd.Manufacturer = L"Maker";
    ASSERT_EQ(S_OK, AddStation(odd));
    Station station = odd;
    station.Model = L"Some other level";
    CStationDialog dialog(nullptr, station, false);
    const INT_PTR result = RunSheet(dialog, [&](const StationPage& page) {
        EXPECT_EQ(L"Digital Level properties", Text(page.frame));
        EXPECT_EQ(L"19200", page.Selected(IDC_STATION_BAUD)) << "the station's own rate";
        EXPECT_EQ(L"None", page.Selected(IDC_STATION_PARITY));
        EXPECT_EQ(L"COM9 (not present)", page.Selected(IDC_STATION_PORT));
        EXPECT_EQ(L"", page.Selected(IDC_STATION_MODEL));
        EXPECT_FALSE(page.ApplyEnabled());
        page.Type(L"North");  // another station's name: accepted when editing
        EXPECT_TRUE(page.ApplyEnabled());
        page.Press(PSBTN_APPLYNOW);  // refused: no model
        EXPECT_TRUE(::IsWindow(page.frame));
        page.Pick(IDC_STATION_MODEL, L"Quorvel LV-20");
        page.Press(PSBTN_APPLYNOW);
        EXPECT_TRUE(::IsWindow(page.frame));
        page.Press(PSBTN_CANCEL);
    });
    EXPECT_EQ(IDCANCEL, result);
    const auto boxes = user_.MessageBoxes();
    ASSERT_EQ(1u, boxes.size());
    EXPECT_EQ(L"This digital level cannot be stored: its value Model is not allowed (\"\" is not "
              L"a model; the models are \"Quorvel LV-10\", \"Quorvel LV-20\", \"Quorvel "
              L"LV-30\").",
              boxes[0].text);
    const std::vector<std::wstring> names = ListStationNames();
    EXPECT_EQ(2, std::count(names.begin(), names.end(), L"North")) << "Apply stored the rename";
    // The port's mark is not stored, and the values the page does not show are kept.
    Station expected = odd;
    expected.Name = L"North";
    expected.Parity = 0;
    expected.Model = L"Quorvel LV-20";
    EXPECT_EQ(expected, station);
}

TEST_F(StationDialog, AnAbsentPortAnd19200SurviveOkAndAnAdapterPluggedInAppearsWhenTheListOpens) {
    registry_.SetSerialPorts({L"COM7", L"COM8"});
    Station fast = DefaultStation();
    fast.Name = L"Fast";
    fast.Port = L"COM9";
    fast.BaudRate = 19200;
    ASSERT_EQ(S_OK, AddStation(fast));  // "Station 1", after the fixture's North
    Station station = fast;
    CStationDialog dialog(nullptr, station, false);
    std::vector<std::wstring> listed;
    const INT_PTR result = RunSheet(dialog, [&](const StationPage& page) {
        EXPECT_EQ(L"COM9 (not present)", page.Selected(IDC_STATION_PORT));
        EXPECT_EQ(L"19200", page.Selected(IDC_STATION_BAUD));
        registry_.SetSerialPorts({L"COM7", L"COM8", L"COM12"});
        const HWND ports = ::GetDlgItem(page.window, IDC_STATION_PORT);
        ::SendMessageW(ports, CB_SHOWDROPDOWN, TRUE, 0);
        for (LRESULT i = 0; i < ::SendMessageW(ports, CB_GETCOUNT, 0, 0); ++i) {
            wchar_t text[64] = {};
            ::SendMessageW(ports, CB_GETLBTEXT, i, reinterpret_cast<LPARAM>(text));
            listed.push_back(text);
        }
        EXPECT_EQ(L"COM9 (not present)", page.Selected(IDC_STATION_PORT)) << "kept selected";
        // The mark fits beside the list's button: measured in the list's own font.
        const HDC dc = ::GetDC(ports);
        const HGDIOBJ font =
            ::SelectObject(dc, reinterpret_cast<HFONT>(::SendMessageW(ports, WM_GETFONT, 0, 0)));
        const std::wstring longest = L"COM12 (not present)";
        SIZE extent{};
        ::GetTextExtentPoint32W(dc, longest.c_str(), static_cast<int>(longest.size()), &extent);
        ::SelectObject(dc, font);
        ::ReleaseDC(ports, dc);
        RECT box{};
        ::GetClientRect(ports, &box);
        EXPECT_LT(extent.cx, box.right - ::GetSystemMetrics(SM_CXVSCROLL) - 4);
        ::SendMessageW(ports, CB_SHOWDROPDOWN, FALSE, 0);
        page.Press(PSBTN_OK);
    });
    EXPECT_EQ(IDOK, result);
    EXPECT_TRUE(user_.MessageBoxes().empty());
    EXPECT_EQ((std::vector<std::wstring>{L"COM12", L"COM7", L"COM8", L"COM9 (not present)"}),
              listed);
    // Read back from the registry: the store's own reading would replace an absent port.
    const UniqueRegKey key = StationKey(L"Station 1");
    std::wstring port;
    DWORD baud = 0;
    ASSERT_EQ(ERROR_SUCCESS, ReadStringValue(key.get(), L"Port", 64, port));
    EXPECT_EQ(L"COM9", port);
    ASSERT_EQ(ERROR_SUCCESS, ReadDwordValue(key.get(), L"BaudRate", baud));
    EXPECT_EQ(19200u, baud);
}

TEST_F(StationDialog, OkOnAStationMissingFromTheStoreShowsItsWholeNameAndStoresNothing) {
    Station station = DefaultStation();
    station.Name = std::wstring(259, L'n');  // the longest name the rule allows, never stored
    CStationDialog dialog(nullptr, station, false);
    const INT_PTR result = RunSheet(dialog, [&](const StationPage& page) {
        EXPECT_EQ(station.Name, Text(page.window, IDC_STATION_NAME_EDIT));
        page.Press(PSBTN_OK);
    });
    EXPECT_EQ(IDOK, result);
    EXPECT_EQ(std::wstring(259, L'n'), station.Name);
    EXPECT_EQ(std::vector<std::wstring>{L"North"}, ListStationNames());
}

TEST_F(StationDialog, AGermanUiRelabelsTheSheetAndItsRefusals) {
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN)));
    Station station = DefaultStation();
    CStationDialog dialog(nullptr, station, true);
    RunSheet(dialog, [&](const StationPage& page) {
        EXPECT_EQ(L"Digitalnivellier anlegen", Text(page.frame));
        EXPECT_EQ(L"Anschluss:", Text(page.window, IDC_STATION_PORT_LABEL));
        EXPECT_EQ(L"Parität:", Text(page.window, IDC_STATION_PARITY_LABEL));
        EXPECT_EQ(L"Gerade", page.Selected(IDC_STATION_PARITY));
        page.Type(L"");
        page.Press(PSBTN_OK);
        page.Press(PSBTN_CANCEL);
    });
    EXPECT_TRUE(SelectThreadUiLanguage(before));
    const auto boxes = user_.MessageBoxes();
    ASSERT_EQ(1u, boxes.size());
    EXPECT_EQ(L"Bitte einen gültigen Gerätenamen eingeben!", boxes[0].text);
    EXPECT_EQ(L"Neues Digitalnivellier hinzufügen", boxes[0].caption);
}

TEST_F(StationDialog, AWriteTheStoreRefusesIsShownAndTheSheetKeepsTheEditUntilOkOrCancel) {
    const std::wstring refused =
        L"The digital level 'South' could not be stored. Your changes are kept in this window: "
        L"try again, or cancel.\r\n\r\n" +
        SystemMessageText(ERROR_ACCESS_DENIED);
    const struct {
        bool newStation;
        const wchar_t* lockedKey;  // the Stations key for an add, the station's own for an edit
        int secondButton;          // after the store works again
    } cases[] = {
        {true, L"", PSBTN_OK},
        {true, L"", PSBTN_CANCEL},
        {false, L"Station 0", PSBTN_OK},
        {false, L"Station 0", PSBTN_CANCEL},
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(std::to_string(test.newStation) + " " + std::to_string(test.secondButton));
        RecordingUserInterface user;
        ScopedUserInterface seam(user);
        Station station = test.newStation ? DefaultStation() : Named(L"North");
        ASSERT_TRUE(test.newStation || FindStation(station) == S_OK);
        std::optional<WriteRefusingKey> locked(std::in_place, test.lockedKey);
        CStationDialog dialog(nullptr, station, test.newStation);
        const INT_PTR result = RunSheet(dialog, [&](const StationPage& page) {
            page.Type(L"South");
            page.Pick(IDC_STATION_BAUD, L"2400");
            page.Press(PSBTN_OK);
            ::Sleep(300);  // a sheet that accepted the OK would be gone by now
            EXPECT_TRUE(::IsWindow(page.frame)) << "the sheet closed over a refused write";
            EXPECT_EQ(L"South", Text(page.window, IDC_STATION_NAME_EDIT));
            EXPECT_EQ(L"2400", page.Selected(IDC_STATION_BAUD));
            locked.reset();
            page.Press(test.secondButton);
        });
        const auto boxes = user.MessageBoxes();
        ASSERT_EQ(1u, boxes.size());
        EXPECT_EQ(refused, boxes[0].text);
        EXPECT_EQ(static_cast<UINT>(MB_ICONERROR), boxes[0].style);
        Station stored = Named(L"South");
        if (test.secondButton == PSBTN_OK) {
            EXPECT_EQ(IDOK, result);
            EXPECT_EQ(test.newStation, dialog.Added());
            ASSERT_EQ(S_OK, FindStation(stored));
            EXPECT_EQ(2400u, stored.BaudRate);
        } else {
            EXPECT_EQ(IDCANCEL, result);
            EXPECT_FALSE(dialog.Added());
            EXPECT_EQ(E_FAIL, FindStation(stored));
        }
        // Back to the fixture's one station for the next case.
        if (SUCCEEDED(FindStation(stored))) {
            ASSERT_EQ(S_OK, test.newStation ? DeleteStation(stored)
                                            : UpdateStation(L"South", Named(L"North")));
        }
    }
}
