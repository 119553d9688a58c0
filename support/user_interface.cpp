// The system's message boxes and dialogs behind the user-interface seam.
#include "support/user_interface.h"

#include <atomic>

namespace {

class SystemUserInterface : public UserInterface {
public:
    int ShowMessageBox(HWND owner, const std::wstring& text, const std::wstring& caption,
                       UINT style) override {
        return ::MessageBoxW(owner, text.c_str(), caption.c_str(), style);
    }
    INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent, DLGPROC procedure,
                           LPARAM parameter) override {
        return ::DialogBoxParamW(instance, MAKEINTRESOURCEW(templateId), parent, procedure,
                                 parameter);
    }
};

SystemUserInterface g_systemUserInterface;
std::atomic<UserInterface*> g_currentUserInterface{&g_systemUserInterface};

}  // namespace

UserInterface& CurrentUserInterface() noexcept {
    return *g_currentUserInterface.load();
}

int ShowMessageBox(HWND owner, const std::wstring& text, const std::wstring& caption, UINT style) {
    return CurrentUserInterface().ShowMessageBox(owner, text, caption, style);
}

INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent, DLGPROC procedure,
                       LPARAM parameter) {
    return CurrentUserInterface().RunModalDialog(instance, templateId, parent, procedure,
                                                 parameter);
}

ScopedUserInterface::ScopedUserInterface(UserInterface& replacement) noexcept
    : previous_(g_currentUserInterface.exchange(&replacement)) {}

ScopedUserInterface::~ScopedUserInterface() {
    g_currentUserInterface.store(previous_);
}
