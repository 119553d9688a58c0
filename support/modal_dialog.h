// A small modal-dialog base: text fields bound to controls and refreshed from the fields.
#pragma once

#include <windows.h>

#include <string>
#include <utility>
#include <vector>

class CModalDialog {
public:
    // The template is a dialog resource of this module; parent may be null.
    CModalDialog(UINT templateId, HWND parent) noexcept;
    CModalDialog(const CModalDialog&) = delete;
    CModalDialog& operator=(const CModalDialog&) = delete;
    // The window's destruction does not delete the object: its creator does, after DoModal.
    virtual ~CModalDialog();

    // Runs the dialog modally through the user-interface seam; the result of EndDialog, or -1.
    INT_PTR DoModal();

    // The dialog's window while it exists, else null.
    HWND Window() const noexcept { return window_; }

protected:
    // Binds a text field to a control as plain text; the field must outlive the dialog.
    void BindText(int controlId, std::wstring& field);
    // Writes every bound field into its control (the refresh after each change of a field).
    void UpdateControls();
    // Reads every bound control back into its field.
    void UpdateFields();

    void EndDialog(INT_PTR result) noexcept;
    void SetControlText(int controlId, const std::wstring& text) noexcept;
    void EnableControl(int controlId, bool enable) noexcept;

    // Handlers, on the dialog's thread. The defaults: OnInitDialog refreshes the controls and
    // lets the system set the focus; OnOK reads the fields and ends with IDOK; OnCancel ends with
    // IDCANCEL (WM_CLOSE arrives here too, as IDCANCEL).
    virtual BOOL OnInitDialog();
    virtual void OnOK();
    virtual void OnCancel();
    // Any other command; true when handled.
    virtual bool OnCommand(WORD controlId, WORD notification);
    // Any other message (registered messages included); true when handled, with its result.
    virtual bool OnMessage(UINT message, WPARAM wParam, LPARAM lParam, INT_PTR& result);
    // Last message to the window; the handle is cleared after it.
    virtual void OnDestroy();

private:
    static INT_PTR CALLBACK DialogProcedure(HWND window, UINT message, WPARAM wParam,
                                            LPARAM lParam);
    INT_PTR HandleMessage(UINT message, WPARAM wParam, LPARAM lParam);

    UINT templateId_;
    HWND parent_;
    HWND window_ = nullptr;
    std::vector<std::pair<int, std::wstring*>> bindings_;
};
