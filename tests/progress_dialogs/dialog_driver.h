// Drives a modal dialog from a second thread as a user would: finds it, reads its controls,
// presses its buttons.
#pragma once

#include <windows.h>

#include <functional>
#include <string>

#include "support/modal_dialog.h"

class DialogDriver {
public:
    explicit DialogDriver(DWORD dialogThread) : dialogThread_(dialogThread) {}

    // The visible dialog window of the dialog thread; null after timeoutMilliseconds.
    HWND WaitForDialog(DWORD timeoutMilliseconds = 10000);
    HWND Dialog() const { return dialog_; }

    std::wstring Title() const;
    std::wstring Text(int controlId) const;
    bool IsEnabled(int controlId) const;
    // Clicks the button (BM_CLICK), as the mouse would.
    void Press(int controlId) const;
    // True once the control shows text; false after timeoutMilliseconds.
    bool WaitForText(int controlId, const std::wstring& text, DWORD timeoutMilliseconds) const;
    // True once the dialog window is gone; false after timeoutMilliseconds.
    bool WaitUntilClosed(DWORD timeoutMilliseconds) const;

private:
    DWORD dialogThread_;
    HWND dialog_ = nullptr;
};

// Runs the dialog modally on this thread while script drives it from another. If the dialog is
// still open 30 seconds after the script ended, the run fails and the dialog is closed.
INT_PTR RunDialog(CModalDialog& dialog, const std::function<void(DialogDriver&)>& script);
