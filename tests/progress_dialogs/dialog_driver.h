// Driving a modal dialog from a second thread as a user would (reading its controls, pressing
// its buttons), and the fixture that the tests of both download dialogs share.
#pragma once

#include <windows.h>
#include <commctrl.h>

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <string>
#include <thread>

#include "res/resource.h"
#include "support/modal_dialog.h"
#include "support/registered_messages.h"
#include "support/user_interface.h"
#include "tests/support/recording_user_interface.h"

// A control's text, or without one the dialog's title. The dialog belongs to another thread:
// WM_GETTEXT is sent to it and answered by its modal loop.
inline std::wstring Text(HWND dialog, int controlId = 0) {
    wchar_t text[1024] = {};
    ::SendMessageTimeoutW(controlId ? ::GetDlgItem(dialog, controlId) : dialog, WM_GETTEXT, 1024,
                          reinterpret_cast<LPARAM>(text), SMTO_NORMAL, 5000, nullptr);
    return text;
}

inline bool IsEnabled(HWND dialog, int controlId) {
    return ::IsWindowEnabled(::GetDlgItem(dialog, controlId)) != FALSE;
}

// Clicks the button (BM_CLICK), as the mouse would.
inline void Press(HWND dialog, int controlId) {
    ::PostMessageW(::GetDlgItem(dialog, controlId), BM_CLICK, 0, 0);
}

// True once condition() holds; false after timeoutMilliseconds.
template <typename Condition>
bool WaitFor(Condition condition, DWORD timeoutMilliseconds) {
    const ULONGLONG end = ::GetTickCount64() + timeoutMilliseconds;
    while (!condition()) {
        if (::GetTickCount64() >= end)
            return false;
        ::Sleep(20);
    }
    return true;
}

inline bool WaitForText(HWND dialog, int controlId, const std::wstring& text, DWORD timeout) {
    return WaitFor([&] { return Text(dialog, controlId) == text; }, timeout);
}

inline BOOL CALLBACK FindVisibleDialog(HWND window, LPARAM found) {
    wchar_t className[16] = {};
    ::GetClassNameW(window, className, 16);
    if (std::wstring(className) != L"#32770" || !::IsWindowVisible(window))
        return TRUE;
    *reinterpret_cast<HWND*>(found) = window;
    return FALSE;
}

// The visible dialog window of the thread; null while it shows none.
inline HWND VisibleDialogOf(DWORD thread) {
    HWND window = nullptr;
    ::EnumThreadWindows(thread, &FindVisibleDialog, reinterpret_cast<LPARAM>(&window));
    return window;
}

// Runs the dialog (or property sheet) modally on this thread while script drives its window from
// another. The run fails when the dialog does not appear within ten seconds, or is still open 30
// seconds after the script ended (it is closed then).
template <typename Dialog>
INT_PTR RunDialog(Dialog& dialog, const std::function<void(HWND)>& script) {
    std::thread user([&script, dialogThread = ::GetCurrentThreadId()] {
        HWND window = nullptr;
        const auto found = [&] { return (window = VisibleDialogOf(dialogThread)) != nullptr; };
        if (!WaitFor(found, 10000)) {
            ADD_FAILURE() << "no dialog appeared";
            return;
        }
        script(window);
        if (!WaitFor([&] { return !::IsWindow(window); }, 30000)) {
            ADD_FAILURE() << "the dialog stayed open after the script";
            ::PostMessageW(window, WM_CLOSE, 0, 0);
        }
    });
    const INT_PTR result = dialog.DoModal();
    user.join();
    return result;
}

// The station property sheet's one page, acted on from the thread that drives the sheet.
struct StationPage {
    HWND frame;
    HWND window = ::FindWindowExW(frame, nullptr, L"#32770", nullptr);

    // The page exists before the sheet has finished setting it up: it is ready once it shows.
    bool Shown() const { return window && ::IsWindowVisible(window); }
    std::wstring Name() const { return Text(window, IDC_STATION_NAME_EDIT); }
    // The selected entry's text; empty with no selection.
    std::wstring Selected(int listId) const {
        const HWND list = ::GetDlgItem(window, listId);
        const LRESULT index = ::SendMessageW(list, CB_GETCURSEL, 0, 0);
        wchar_t text[256] = {};
        if (index != CB_ERR)
            ::SendMessageW(list, CB_GETLBTEXT, index, reinterpret_cast<LPARAM>(text));
        return text;
    }
    // Replaces the name with text, key by key.
    void Type(const std::wstring& text) const {
        const HWND edit = ::GetDlgItem(window, IDC_STATION_NAME_EDIT);
        ::SendMessageW(edit, EM_SETSEL, 0, -1);
        ::SendMessageW(edit, WM_CHAR, VK_BACK, 0);
        for (wchar_t c : text)
            ::SendMessageW(edit, WM_CHAR, c, 0);
    }
    void Pick(int listId, const std::wstring& entry) const {
        const HWND list = ::GetDlgItem(window, listId);
        const LRESULT index =
            ::SendMessageW(list, CB_FINDSTRINGEXACT, -1, reinterpret_cast<LPARAM>(entry.c_str()));
        ::SendMessageW(list, CB_SETCURSEL, index, 0);
        ::SendMessageW(window, WM_COMMAND, MAKEWPARAM(listId, CBN_SELCHANGE),
                       reinterpret_cast<LPARAM>(list));
    }
    bool ApplyEnabled() const { return IsEnabled(frame, 0x3021); }  // the sheet's Apply
    // The sheet's own press of a button, as a click gives it; it does not depend on where the
    // sheet is on the screen or whether it has the focus yet.
    void Press(int button) const { ::SendMessageW(frame, PSM_PRESSBUTTON, button, 0); }
};

// Registered messages, message boxes recorded instead of shown, and files in the temporary
// folder under names of this process.
class DialogTest : public ::testing::Test {
protected:
    void SetUp() override { RegisterWindowMessages(); }

    static std::filesystem::path TemporaryFile(const std::wstring& name) {
        return std::filesystem::temp_directory_path() /
               (L"lv_" + std::to_wstring(::GetCurrentProcessId()) + L"_" + name);
    }
    static std::string ReadAll(const std::filesystem::path& path) {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    }
    // The one message box of a run, owned by the dialog's window.
    static void ExpectOneBox(const RecordingUserInterface& user, const std::wstring& text,
                             UINT style, const std::wstring& caption = L"Quorvel Digital Levels") {
        const auto boxes = user.MessageBoxes();
        ASSERT_EQ(boxes.size(), 1u);
        EXPECT_EQ(boxes[0].text, text);
        EXPECT_EQ(boxes[0].caption, caption);
        EXPECT_EQ(boxes[0].style, style);
        EXPECT_NE(boxes[0].owner, nullptr);
    }

    RecordingUserInterface user_;
    ScopedUserInterface seam_{user_};
};
