// A user interface for tests: records every message box, from any thread, and answers it at
// once; modal dialogs still run for real so that a test can drive them as a user would.
#pragma once

#include <windows.h>

#include <condition_variable>
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

    explicit RecordingUserInterface(int answer = IDOK) noexcept : answer_(answer) {}

    int ShowMessageBox(HWND owner, const std::wstring& text, const std::wstring& caption,
                       UINT style) override;
    INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent, DLGPROC procedure,
                           LPARAM parameter) override;

    std::vector<MessageBoxRecord> MessageBoxes() const;
    // True once at least count boxes were shown; false after timeoutMilliseconds without them.
    bool WaitForMessageBoxes(size_t count, DWORD timeoutMilliseconds) const;

private:
    const int answer_;
    mutable std::mutex lock_;
    mutable std::condition_variable shown_;
    std::vector<MessageBoxRecord> boxes_;
};
