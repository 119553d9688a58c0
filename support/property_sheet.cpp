// The property-sheet base: the modal run, page dispatch, text exchange and the apply hook.
#include "support/property_sheet.h"

#include "support/module_instance.h"

namespace {

// The sheet's frame: the parent of each page.
HWND SheetWindowOf(HWND page) noexcept {
    return ::GetParent(page);
}

std::wstring ListEntryText(HWND list, LRESULT index) {
    const LRESULT length = ::SendMessageW(list, CB_GETLBTEXTLEN, static_cast<WPARAM>(index), 0);
    if (length == CB_ERR)
        return {};
    std::wstring text(static_cast<size_t>(length) + 1, L'\0');
    const LRESULT copied = ::SendMessageW(list, CB_GETLBTEXT, static_cast<WPARAM>(index),
                                          reinterpret_cast<LPARAM>(text.data()));
    text.resize(copied == CB_ERR ? 0 : static_cast<size_t>(copied));
    return text;
}

}  // namespace

void CPropertyPage::BindEdit(int controlId, std::wstring& field) {
    edits_.emplace_back(controlId, &field);
}

void CPropertyPage::BindList(int controlId, std::wstring& field) {
    lists_.emplace_back(controlId, &field);
}

void CPropertyPage::UpdateControls() {
    if (!window_)
        return;
    for (const auto& [controlId, field] : edits_)
        ::SetDlgItemTextW(window_, controlId, field->c_str());
    for (const auto& [controlId, field] : lists_) {
        const HWND list = ::GetDlgItem(window_, controlId);
        // CB_FINDSTRINGEXACT ignores case: the entries are compared here, exactly.
        LRESULT selected = CB_ERR;
        const LRESULT count = ::SendMessageW(list, CB_GETCOUNT, 0, 0);
        for (LRESULT index = 0; !field->empty() && index < count && selected == CB_ERR; ++index) {
            if (ListEntryText(list, index) == *field)
                selected = index;
        }
        ::SendMessageW(list, CB_SETCURSEL, static_cast<WPARAM>(selected), 0);
    }
}

void CPropertyPage::UpdateFields() {
    if (!window_)
        return;
    for (const auto& [controlId, field] : edits_) {
        const HWND control = ::GetDlgItem(window_, controlId);
        const int length = control ? ::GetWindowTextLengthW(control) : 0;
        std::wstring text(static_cast<size_t>(length) + 1, L'\0');
        const int copied = control ? ::GetWindowTextW(control, text.data(), length + 1) : 0;
        text.resize(static_cast<size_t>(copied));
        *field = std::move(text);
    }
    for (const auto& [controlId, field] : lists_) {
        const HWND list = ::GetDlgItem(window_, controlId);
        const LRESULT selected = ::SendMessageW(list, CB_GETCURSEL, 0, 0);
        *field = selected == CB_ERR ? std::wstring() : ListEntryText(list, selected);
    }
}

void CPropertyPage::SetControlText(int controlId, const std::wstring& text) noexcept {
    if (window_)
        ::SetDlgItemTextW(window_, controlId, text.c_str());
}

void CPropertyPage::AddListEntry(int controlId, const std::wstring& text) noexcept {
    if (window_) {
        ::SendDlgItemMessageW(window_, controlId, CB_ADDSTRING, 0,
                              reinterpret_cast<LPARAM>(text.c_str()));
    }
}

void CPropertyPage::SetListEntries(int controlId, const std::vector<std::wstring>& entries,
                                   const std::wstring& selected) {
    const HWND list = window_ ? ::GetDlgItem(window_, controlId) : nullptr;
    if (!list)
        return;
    ::SendMessageW(list, CB_RESETCONTENT, 0, 0);
    for (const std::wstring& entry : entries)
        ::SendMessageW(list, CB_ADDSTRING, 0, reinterpret_cast<LPARAM>(entry.c_str()));
    // A sorted list places entries where it likes: the selection is found afterwards, exactly.
    LRESULT found = CB_ERR;
    const LRESULT count = ::SendMessageW(list, CB_GETCOUNT, 0, 0);
    for (LRESULT index = 0; !selected.empty() && index < count && found == CB_ERR; ++index) {
        if (ListEntryText(list, index) == selected)
            found = index;
    }
    ::SendMessageW(list, CB_SETCURSEL, static_cast<WPARAM>(found), 0);
}

void CPropertyPage::SetModified() noexcept {
    if (window_)
        PropSheet_Changed(SheetWindowOf(window_), window_);
}

void CPropertyPage::OnInitDialog() {
    UpdateControls();
}

void CPropertyPage::OnCommand(WORD, WORD) {}

INT_PTR CALLBACK CPropertyPage::DialogProcedure(HWND window, UINT message, WPARAM wParam,
                                                LPARAM lParam) {
    CPropertyPage* page = nullptr;
    if (message == WM_INITDIALOG) {
        page = reinterpret_cast<CPropertyPage*>(reinterpret_cast<PROPSHEETPAGEW*>(lParam)->lParam);
        ::SetWindowLongPtrW(window, DWLP_USER, reinterpret_cast<LONG_PTR>(page));
        page->window_ = window;
    } else {
        page = reinterpret_cast<CPropertyPage*>(::GetWindowLongPtrW(window, DWLP_USER));
    }
    if (!page)
        return FALSE;
    // No exception may unwind through the system's dialog manager: the sheet is cancelled.
    try {
        return page->HandleMessage(message, wParam, lParam);
    } catch (...) {
        PropSheet_PressButton(SheetWindowOf(window), PSBTN_CANCEL);
        return TRUE;
    }
}

INT_PTR CPropertyPage::HandleMessage(UINT message, WPARAM wParam, LPARAM lParam) {
    switch (message) {
        case WM_INITDIALOG:
            if (sheet_)
                sheet_->PageInitialized(window_);
            OnInitDialog();
            return TRUE;
        case WM_COMMAND:
            OnCommand(LOWORD(wParam), HIWORD(wParam));
            return TRUE;
        case WM_NOTIFY: {
            const auto* header = reinterpret_cast<const NMHDR*>(lParam);
            if (header->code != PSN_APPLY || !sheet_)
                return FALSE;
            // OK and Apply both arrive here, OK with lParam set; a refusal keeps the sheet open.
            const bool closing = reinterpret_cast<const PSHNOTIFY*>(lParam)->lParam != FALSE;
            const bool accepted = sheet_->Apply(closing);
            ::SetWindowLongPtrW(window_, DWLP_MSGRESULT,
                                accepted ? PSNRET_NOERROR : PSNRET_INVALID_NOCHANGEPAGE);
            return TRUE;
        }
        case WM_DESTROY:
            ::SetWindowLongPtrW(window_, DWLP_USER, 0);
            window_ = nullptr;
            return TRUE;
        default:
            return FALSE;
    }
}

CPropertySheet::CPropertySheet(HWND parent, std::wstring caption) noexcept
    : parent_(parent), caption_(std::move(caption)) {}

void CPropertySheet::AddPage(CPropertyPage& page) {
    page.sheet_ = this;
    pages_.push_back(&page);
}

INT_PTR CPropertySheet::DoModal() {
    std::vector<PROPSHEETPAGEW> pages;
    for (CPropertyPage* page : pages_) {
        PROPSHEETPAGEW description{};
        description.dwSize = sizeof description;
        description.hInstance = ThisModule();
        description.pszTemplate = MAKEINTRESOURCEW(page->templateId_);
        description.pfnDlgProc = &CPropertyPage::DialogProcedure;
        description.lParam = reinterpret_cast<LPARAM>(page);
        pages.push_back(description);
    }
    PROPSHEETHEADERW header{};
    header.dwSize = sizeof header;
    header.dwFlags = PSH_PROPSHEETPAGE;
    header.hwndParent = parent_;
    header.hInstance = ThisModule();
    header.pszCaption = caption_.c_str();
    header.nPages = static_cast<UINT>(pages.size());
    header.ppsp = pages.data();
    closedWithOk_ = false;
    const INT_PTR result = ::PropertySheetW(&header);
    window_ = nullptr;
    if (result < 0)
        return -1;
    // Its own answer tells whether changes were applied, not which button closed it.
    return closedWithOk_ ? IDOK : IDCANCEL;
}

void CPropertySheet::SetCaption(const std::wstring& caption) noexcept {
    caption_ = caption;
    if (window_)
        ::SetWindowTextW(window_, caption.c_str());
}

void CPropertySheet::SetFirstTabText(const std::wstring& text) noexcept {
    const HWND tabs = window_ ? PropSheet_GetTabControl(window_) : nullptr;
    if (!tabs)
        return;
    std::wstring copy = text.substr(0, 255);
    TCITEMW item{};
    item.mask = TCIF_TEXT;
    item.pszText = copy.data();
    TabCtrl_SetItem(tabs, 0, &item);
}

void CPropertySheet::PageInitialized(HWND pageWindow) {
    if (window_)
        return;
    window_ = SheetWindowOf(pageWindow);
    // A sheet of its own (no owner window) opens in the middle of the screen, not in a corner.
    RECT frame{}, screen{};
    if (!parent_ && ::GetWindowRect(window_, &frame) &&
        ::SystemParametersInfoW(SPI_GETWORKAREA, 0, &screen, 0)) {
        const int width = frame.right - frame.left, height = frame.bottom - frame.top;
        ::SetWindowPos(window_, nullptr, screen.left + (screen.right - screen.left - width) / 2,
                       screen.top + (screen.bottom - screen.top - height) / 2, 0, 0,
                       SWP_NOSIZE | SWP_NOZORDER | SWP_NOACTIVATE);
    }
    OnInitialized();
}

bool CPropertySheet::Apply(bool closing) {
    const bool accepted = OnApply(closing);
    if (accepted && closing)
        closedWithOk_ = true;
    return accepted;
}
