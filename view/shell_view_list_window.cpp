// The view's list control: it wants every key (Delete, Enter and the shortcuts reach the view
// even inside a dialog-like browser), and it lets only its children's commands through.
#include "view/shell_view_list_window.h"

#include <commctrl.h>

#include "support/module_instance.h"

// The list's own procedure is kept in the window's user data. A subclass through the
// common controls' window properties costs a round trip to Wine's server on every message, which
// made a fill of 1,000 stations ten times slower there; this way costs nothing anywhere.
bool CShellViewListWindow::Create(HWND parent, DWORD style, DWORD extendedStyle,
                                  UINT controlId) noexcept {
    Destroy();
    window_ = ::CreateWindowExW(extendedStyle, WC_LISTVIEWW, L"", style, 0, 0, 0, 0, parent,
                                reinterpret_cast<HMENU>(static_cast<UINT_PTR>(controlId)),
                                ThisModule(), nullptr);
    if (!window_)
        return false;
    const LONG_PTR listProcedure = ::GetWindowLongPtrW(window_, GWLP_WNDPROC);
    ::SetWindowLongPtrW(window_, GWLP_USERDATA, listProcedure);
    ::SetWindowLongPtrW(window_, GWLP_WNDPROC, reinterpret_cast<LONG_PTR>(&WindowProcedure));
    return true;
}

void CShellViewListWindow::Destroy() noexcept {
    if (!window_)
        return;
    ::DestroyWindow(window_);
    window_ = nullptr;
}

LRESULT CALLBACK CShellViewListWindow::WindowProcedure(HWND window, UINT message, WPARAM wParam,
                                                       LPARAM lParam) {
    const auto listProcedure =
        reinterpret_cast<WNDPROC>(::GetWindowLongPtrW(window, GWLP_USERDATA));
    switch (message) {
        case WM_GETDLGCODE:
            return ::CallWindowProcW(listProcedure, window, message, wParam, lParam) |
                   DLGC_WANTALLKEYS;
        case WM_COMMAND:
            // Menu and accelerator commands belong to the view window, which gets them itself;
            // only a child control's (the label editor's) are the list's.
            if (lParam == 0)
                return 0;
            break;
        default:
            break;
    }
    return ::CallWindowProcW(listProcedure, window, message, wParam, lParam);
}
