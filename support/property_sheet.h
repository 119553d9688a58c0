// A small property-sheet base beside the modal-dialog base: a modal sheet over PropertySheetW
// and its pages over PROPSHEETPAGEW, with text exchange for edit controls and drop-down lists.
#pragma once

#include <windows.h>
#include <commctrl.h>

#include <string>
#include <utility>
#include <vector>

class CPropertySheet;

class CPropertyPage {
public:
    // The template is a dialog resource of this module.
    explicit CPropertyPage(UINT templateId) noexcept : templateId_(templateId) {}
    CPropertyPage(const CPropertyPage&) = delete;
    CPropertyPage& operator=(const CPropertyPage&) = delete;
    virtual ~CPropertyPage() = default;

    // The page's window while it exists, else null.
    HWND Window() const noexcept { return window_; }

protected:
    // Binds a text field to an edit control: its text in both directions.
    void BindEdit(int controlId, std::wstring& field);
    // Binds a text field to a drop-down list: the entry whose text equals the field exactly is
    // selected, and the selected entry's text is read back. An empty field is "no selection",
    // both ways: a text that no entry has leaves the list without a selection.
    void BindList(int controlId, std::wstring& field);
    // Writes every bound field into its control / reads every control back into its field.
    void UpdateControls();
    void UpdateFields();

    void SetControlText(int controlId, const std::wstring& text) noexcept;
    void AddListEntry(int controlId, const std::wstring& text) noexcept;
    // Replaces a drop-down list's entries and selects the one whose text equals selected exactly
    // (none when no entry does). Sends no selection-change notification.
    void SetListEntries(int controlId, const std::vector<std::wstring>& entries,
                        const std::wstring& selected);
    // Tells the sheet that the page holds changes: the sheet enables Apply.
    void SetModified() noexcept;

    CPropertySheet* Sheet() const noexcept { return sheet_; }

    // Handlers, on the sheet's thread. OnInitDialog's default refreshes the controls.
    virtual void OnInitDialog();
    // Any command from a control of the page (notification code, control id).
    virtual void OnCommand(WORD controlId, WORD notification);

private:
    friend class CPropertySheet;
    static INT_PTR CALLBACK DialogProcedure(HWND window, UINT message, WPARAM wParam,
                                            LPARAM lParam);
    INT_PTR HandleMessage(UINT message, WPARAM wParam, LPARAM lParam);

    UINT templateId_;
    CPropertySheet* sheet_ = nullptr;
    HWND window_ = nullptr;
    std::vector<std::pair<int, std::wstring*>> edits_;
    std::vector<std::pair<int, std::wstring*>> lists_;
};

class CPropertySheet {
public:
    // parent may be null. The pages must outlive the sheet's run.
    CPropertySheet(HWND parent, std::wstring caption) noexcept;
    CPropertySheet(const CPropertySheet&) = delete;
    CPropertySheet& operator=(const CPropertySheet&) = delete;
    virtual ~CPropertySheet() = default;

    void AddPage(CPropertyPage& page);
    // Runs the sheet modally: IDOK when it closed with OK, IDCANCEL otherwise, -1 when it could
    // not be shown.
    INT_PTR DoModal();

    // The sheet's frame window while it runs, else null.
    HWND Window() const noexcept { return window_; }

protected:
    // Once the sheet and its first page exist.
    virtual void OnInitialized() {}
    // OK (closing true) or Apply, before the default processing; false keeps the sheet open and
    // stores nothing further.
    virtual bool OnApply(bool closing) = 0;

    void SetCaption(const std::wstring& caption) noexcept;
    void SetFirstTabText(const std::wstring& text) noexcept;

private:
    friend class CPropertyPage;
    void PageInitialized(HWND pageWindow);
    bool Apply(bool closing);

    HWND parent_;
    std::wstring caption_;
    HWND window_ = nullptr;
    bool closedWithOk_ = false;
    std::vector<CPropertyPage*> pages_;
};
