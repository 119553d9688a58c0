// The view's list control: it wants every key (Delete, Enter and the shortcuts reach the view
// even inside a dialog-like browser), and it lets only its children's commands through.
#include "view/shell_view_list_window.h"

#include <commctrl.h>

#include "support/module_instance.h"

namespace {

constexpr UINT_PTR kSubclassId = 1;

}  // namespace

bool CShellViewListWindow::Create(HWND parent, DWORD style, DWORD extendedStyle,
                                  UINT controlId) noexcept {
    Destroy();
    window_ = ::CreateWindowExW(extendedStyle, WC_LISTVIEWW, L"", style, 0, 0, 0, 0, parent,
                                reinterpret_cast<HMENU>(static_cast<UINT_PTR>(controlId)),
                                ThisModule(), nullptr);
    if (!window_)
        return false;
    if (!::SetWindowSubclass(window_, &SubclassProcedure, kSubclassId, 0)) {
        Destroy();
        return false;
    }
    return true;
}

void CShellViewListWindow::Destroy() noexcept {
    if (!window_)
        return;
    ::RemoveWindowSubclass(window_, &SubclassProcedure, kSubclassId);
    ::DestroyWindow(window_);
    window_ = nullptr;
}

LRESULT CALLBACK CShellViewListWindow::SubclassProcedure(HWND window, UINT message,
                                                         WPARAM wParam, LPARAM lParam, UINT_PTR,
                                                         DWORD_PTR) {
    switch (message) {
        case WM_GETDLGCODE:
            return ::DefSubclassProc(window, message, wParam, lParam) | DLGC_WANTALLKEYS;
        case WM_COMMAND:
            // Menu and accelerator commands belong to the view window, which gets them itself;
            // only a child control's (the label editor's) are the list's.
            if (lParam == 0)
                return 0;
            break;
        default:
            break;
    }
    return ::DefSubclassProc(window, message, wParam, lParam);
}
