// DialogDriver: finding, reading and pressing a dialog of another thread.
#include "tests/progress_dialogs/dialog_driver.h"

#include <gtest/gtest.h>

#include <thread>

namespace {

struct Search {
    HWND found = nullptr;
};

BOOL CALLBACK FindDialog(HWND window, LPARAM parameter) {
    wchar_t className[16] = {};
    ::GetClassNameW(window, className, 16);
    if (std::wstring(className) == L"#32770" && ::IsWindowVisible(window)) {
        reinterpret_cast<Search*>(parameter)->found = window;
        return FALSE;
    }
    return TRUE;
}

std::wstring WindowText(HWND window) {
    wchar_t text[1024] = {};
    // Another thread's window: WM_GETTEXT is sent to it and answered by its modal loop.
    ::SendMessageTimeoutW(window, WM_GETTEXT, 1024, reinterpret_cast<LPARAM>(text), SMTO_NORMAL,
                          5000, nullptr);
    return text;
}

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

}  // namespace

HWND DialogDriver::WaitForDialog(DWORD timeoutMilliseconds) {
    WaitFor(
        [&] {
            Search search;
            ::EnumThreadWindows(dialogThread_, &FindDialog, reinterpret_cast<LPARAM>(&search));
            dialog_ = search.found;
            return dialog_ != nullptr;
        },
        timeoutMilliseconds);
    return dialog_;
}

std::wstring DialogDriver::Title() const {
    return WindowText(dialog_);
}

std::wstring DialogDriver::Text(int controlId) const {
    return WindowText(::GetDlgItem(dialog_, controlId));
}

bool DialogDriver::IsEnabled(int controlId) const {
    return ::IsWindowEnabled(::GetDlgItem(dialog_, controlId)) != FALSE;
}

void DialogDriver::Press(int controlId) const {
    ::PostMessageW(::GetDlgItem(dialog_, controlId), BM_CLICK, 0, 0);
}

bool DialogDriver::WaitForText(int controlId, const std::wstring& text,
                               DWORD timeoutMilliseconds) const {
    return WaitFor([&] { return Text(controlId) == text; }, timeoutMilliseconds);
}

bool DialogDriver::WaitUntilClosed(DWORD timeoutMilliseconds) const {
    return WaitFor([&] { return !::IsWindow(dialog_); }, timeoutMilliseconds);
}

INT_PTR RunDialog(CModalDialog& dialog, const std::function<void(DialogDriver&)>& script) {
    DialogDriver driver(::GetCurrentThreadId());
    std::thread user([&] {
        script(driver);
        if (driver.Dialog() && !driver.WaitUntilClosed(30000)) {
            ADD_FAILURE() << "the dialog stayed open after the script";
            ::PostMessageW(driver.Dialog(), WM_CLOSE, 0, 0);
        }
    });
    const INT_PTR result = dialog.DoModal();
    user.join();
    return result;
}
