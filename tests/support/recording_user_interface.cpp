// The recording user interface of the tests.
#include "tests/support/recording_user_interface.h"

int RecordingUserInterface::ShowMessageBox(HWND owner, const std::wstring& text,
                                           const std::wstring& caption, UINT style) {
    std::lock_guard<std::mutex> guard(lock_);
    boxes_.push_back({owner, text, caption, style});
    return IDOK;
}

INT_PTR RecordingUserInterface::RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent,
                                               DLGPROC procedure, LPARAM parameter) {
    return ::DialogBoxParamW(instance, MAKEINTRESOURCEW(templateId), parent, procedure, parameter);
}

std::vector<RecordingUserInterface::MessageBoxRecord> RecordingUserInterface::MessageBoxes() const {
    std::lock_guard<std::mutex> guard(lock_);
    return boxes_;
}
