// The system's message boxes and dialogs behind the user-interface seam, and its recording double.
#include "support/user_interface.h"

#include <atomic>
#include <chrono>

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

int RecordingUserInterface::ShowMessageBox(HWND owner, const std::wstring& text,
                                           const std::wstring& caption, UINT style) {
    {
        std::lock_guard<std::mutex> guard(lock_);
        boxes_.push_back({owner, text, caption, style});
    }
    shown_.notify_all();
    return answer_;
}

INT_PTR RecordingUserInterface::RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent,
                                               DLGPROC procedure, LPARAM parameter) {
    return g_systemUserInterface.RunModalDialog(instance, templateId, parent, procedure, parameter);
}

std::vector<RecordingUserInterface::MessageBoxRecord> RecordingUserInterface::MessageBoxes() const {
    std::lock_guard<std::mutex> guard(lock_);
    return boxes_;
}

bool RecordingUserInterface::WaitForMessageBoxes(size_t count, DWORD timeoutMilliseconds) const {
    std::unique_lock<std::mutex> guard(lock_);
    return shown_.wait_for(guard, std::chrono::milliseconds(timeoutMilliseconds),
                           [&] { return boxes_.size() >= count; });
}
