// A user interface for tests: records every message box, from any thread, and answers it with OK
// at once; modal dialogs still run for real so that a test can drive them as a user would.
#pragma once

#include <windows.h>

#include <mutex>
#include <string>
#include <vector>

#include "support/user_interface.h"

class RecordingUserInterface : public UserInterface {
public:
    struct MessageBoxRecord {
        HWND owner;
        std::wstring text;
        std::wstring caption;
        UINT style;
    };

    int ShowMessageBox(HWND owner, const std::wstring& text, const std::wstring& caption,
                       UINT style) override;
    INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent, DLGPROC procedure,
                           LPARAM parameter) override;

    std::vector<MessageBoxRecord> MessageBoxes() const;

private:
    mutable std::mutex lock_;
    std::vector<MessageBoxRecord> boxes_;
};
