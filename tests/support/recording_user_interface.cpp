// The recording user interface of the tests.
#include "tests/support/recording_user_interface.h"

#include <chrono>

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
    return ::DialogBoxParamW(instance, MAKEINTRESOURCEW(templateId), parent, procedure, parameter);
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
