// Driving a modal dialog from a second thread as a user would (reading its controls, pressing
// its buttons), and the fixture that the tests of both download dialogs share.
#pragma once

#include <windows.h>

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <string>
#include <thread>

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

// Runs the dialog (or property sheet) modally on this thread while script drives its window from
// another. The run fails when the dialog does not appear within ten seconds, or is still open 30
// seconds after the script ended (it is closed then).
template <typename Dialog>
INT_PTR RunDialog(Dialog& dialog, const std::function<void(HWND)>& script) {
    std::thread user([&script, dialogThread = ::GetCurrentThreadId()] {
        HWND window = nullptr;
        const auto found = [&] {
            ::EnumThreadWindows(dialogThread, &FindVisibleDialog,
                                reinterpret_cast<LPARAM>(&window));
            return window != nullptr;
        };
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
