// The one seam through which the module shows message boxes and runs modal dialogs, so that
// tests can record texts and answers instead of blocking on a box nobody will press.
#pragma once

#include <windows.h>

#include <string>

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
