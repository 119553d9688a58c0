// The modal-dialog base: message dispatch to virtual handlers and text data exchange.
#include "support/modal_dialog.h"

#include "support/module_instance.h"
#include "support/user_interface.h"

CModalDialog::CModalDialog(UINT templateId, HWND parent) noexcept
    : templateId_(templateId), parent_(parent) {}

CModalDialog::~CModalDialog() = default;

INT_PTR CModalDialog::DoModal() {
    return RunModalDialog(ThisModule(), templateId_, parent_, &CModalDialog::DialogProcedure,
                          reinterpret_cast<LPARAM>(this));
}

void CModalDialog::BindText(int controlId, std::wstring& field) {
    bindings_.emplace_back(controlId, &field);
}

void CModalDialog::UpdateControls() {
    if (!window_)
        return;
    for (const auto& [controlId, field] : bindings_)
        ::SetDlgItemTextW(window_, controlId, field->c_str());
}

void CModalDialog::UpdateFields() {
    if (!window_)
        return;
    for (const auto& [controlId, field] : bindings_) {
        const HWND control = ::GetDlgItem(window_, controlId);
        const int length = control ? ::GetWindowTextLengthW(control) : 0;
        std::wstring text(static_cast<size_t>(length) + 1, L'\0');
        const int copied = control ? ::GetWindowTextW(control, text.data(), length + 1) : 0;
        text.resize(static_cast<size_t>(copied));
        *field = std::move(text);
    }
}

void CModalDialog::EndDialog(INT_PTR result) noexcept {
    if (window_)
        ::EndDialog(window_, result);
}

void CModalDialog::SetControlText(int controlId, const std::wstring& text) noexcept {
    if (window_)
        ::SetDlgItemTextW(window_, controlId, text.c_str());
}

void CModalDialog::EnableControl(int controlId, bool enable) noexcept {
    if (window_)
        ::EnableWindow(::GetDlgItem(window_, controlId), enable ? TRUE : FALSE);
}

BOOL CModalDialog::OnInitDialog() {
    UpdateControls();
    return TRUE;
}

void CModalDialog::OnOK() {
    UpdateFields();
    EndDialog(IDOK);
}

void CModalDialog::OnCancel() {
    EndDialog(IDCANCEL);
}

bool CModalDialog::OnCommand(WORD, WORD) {
    return false;
}

bool CModalDialog::OnMessage(UINT, WPARAM, LPARAM, INT_PTR&) {
    return false;
}

void CModalDialog::OnDestroy() {}

INT_PTR CALLBACK CModalDialog::DialogProcedure(HWND window, UINT message, WPARAM wParam,
                                               LPARAM lParam) {
    CModalDialog* dialog = nullptr;
    if (message == WM_INITDIALOG) {
        dialog = reinterpret_cast<CModalDialog*>(lParam);
        ::SetWindowLongPtrW(window, DWLP_USER, lParam);
        dialog->window_ = window;
    } else {
        dialog = reinterpret_cast<CModalDialog*>(::GetWindowLongPtrW(window, DWLP_USER));
    }
    if (!dialog)
        return FALSE;
    // No exception may unwind through the system's dialog manager.
    try {
        return dialog->HandleMessage(message, wParam, lParam);
    } catch (...) {
        ::EndDialog(window, -1);
        return TRUE;
    }
}

INT_PTR CModalDialog::HandleMessage(UINT message, WPARAM wParam, LPARAM lParam) {
    switch (message) {
        case WM_INITDIALOG:
            return OnInitDialog();
        case WM_COMMAND: {
            const WORD controlId = LOWORD(wParam);
            const WORD notification = HIWORD(wParam);
            if (controlId == IDOK && notification == BN_CLICKED) {
                OnOK();
                return TRUE;
            }
            if (controlId == IDCANCEL && notification == BN_CLICKED) {
                OnCancel();
                return TRUE;
            }
            return OnCommand(controlId, notification) ? TRUE : FALSE;
        }
        case WM_DESTROY:
            OnDestroy();
            ::SetWindowLongPtrW(window_, DWLP_USER, 0);
            window_ = nullptr;
            return TRUE;
        default: {
            INT_PTR result = 0;
            if (OnMessage(message, wParam, lParam, result)) {
                // A dialog procedure returns message results through DWLP_MSGRESULT.
                ::SetWindowLongPtrW(window_, DWLP_MSGRESULT, result);
                return TRUE;
            }
            return FALSE;
        }
    }
}
