// The one seam through which the module shows message boxes and runs modal dialogs, so that
// tests can record texts and answers instead of blocking on a box nobody will press.
#pragma once

#include <windows.h>

#include <condition_variable>
#include <mutex>
#include <string>
#include <vector>

class UserInterface {
public:
    virtual ~UserInterface() = default;
    // As MessageBoxW; returns the button pressed (IDOK, ...), 0 on failure.
    virtual int ShowMessageBox(HWND owner, const std::wstring& text, const std::wstring& caption,
                               UINT style) = 0;
    // As DialogBoxParamW; returns the dialog's result, -1 on failure.
    virtual INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent,
                                   DLGPROC procedure, LPARAM parameter) = 0;
};

// The user interface in force: the system's own unless a ScopedUserInterface replaced it.
UserInterface& CurrentUserInterface() noexcept;

int ShowMessageBox(HWND owner, const std::wstring& text, const std::wstring& caption, UINT style);
INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent, DLGPROC procedure,
                       LPARAM parameter);

// Puts a replacement in force for its own life and then restores the one before. Replace only
// while no box or dialog is being shown.
class ScopedUserInterface {
public:
    explicit ScopedUserInterface(UserInterface& replacement) noexcept;
    ScopedUserInterface(const ScopedUserInterface&) = delete;
    ScopedUserInterface& operator=(const ScopedUserInterface&) = delete;
    ~ScopedUserInterface();

private:
    UserInterface* previous_;
};

// Records every message box, from any thread, and answers it at once with a set button; modal
// dialogs still run for real so that a test can drive them as a user would.
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
