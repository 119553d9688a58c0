// CExplorerWindow's IShellBrowser and ICommDlgBrowser: what a view asks of the browser that hosts
// it (menus to merge into, the status bar, navigation).
#include "tools/lvexplore/explorer_window.h"

#include <commctrl.h>

#include "support/error_handling.h"

using Microsoft::WRL::ComPtr;

IFACEMETHODIMP CExplorerWindow::QueryInterface(REFIID iid, void** object) {
    // Only a file dialog's browser is a common-dialog browser: views change their menus for it.
    if (iid == IID_ICommDlgBrowser && !options_.commonDialog) {
        if (object)
            *object = nullptr;
        return E_NOINTERFACE;
    }
    static const QITAB table[] = {QITABENT(CExplorerWindow, IShellBrowser),
                                  QITABENTMULTI(CExplorerWindow, IOleWindow, IShellBrowser),
                                  QITABENT(CExplorerWindow, ICommDlgBrowser),
                                  {}};
    return QISearch(this, table, iid, object);
}

IFACEMETHODIMP CExplorerWindow::GetWindow(HWND* window) {
    RETURN_HR_IF(E_POINTER, !window);
    *window = frame_.get();
    return frame_ ? S_OK : E_FAIL;
}

IFACEMETHODIMP CExplorerWindow::InsertMenusSB(HMENU shared, OLEMENUGROUPWIDTHS* widths) {
    Trace(L"InsertMenusSB(%p)", static_cast<void*>(shared));
    if (options_.menusNotImplemented)
        return E_NOTIMPL;
    RETURN_HR_IF(E_INVALIDARG, !::IsMenu(shared));
    try {
        ForgetLentPopups(false);
        lent_.reserve(lent_.size() + 1);
        BrowserPopups popups;
        RETURN_IF_FAILED(CreateBrowserPopups(popups));
        RETURN_IF_FAILED(InsertBrowserPopups(shared, popups, widths));
        lent_.push_back({shared, std::move(popups), false});
        return S_OK;
    }
    CATCH_RETURN()
}

IFACEMETHODIMP CExplorerWindow::SetMenuSB(HMENU shared, HOLEMENU, HWND) {
    Trace(L"SetMenuSB(%p)", static_cast<void*>(shared));
    if (options_.menusNotImplemented)
        return E_NOTIMPL;
    RETURN_HR_IF(E_INVALIDARG, shared && !::IsMenu(shared));
    RETURN_HR_IF(E_UNEXPECTED, !frame_);
    RETURN_IF_WIN32_BOOL_FALSE(::SetMenu(frame_.get(), shared ? shared : menuBar_.get()));
    ::DrawMenuBar(frame_.get());
    return S_OK;
}

IFACEMETHODIMP CExplorerWindow::RemoveMenusSB(HMENU shared) {
    Trace(L"RemoveMenusSB(%p)", static_cast<void*>(shared));
    if (options_.menusNotImplemented)
        return E_NOTIMPL;
    for (LentPopups& lent : lent_) {
        if (lent.shared == shared && !lent.returned) {
            RemoveBrowserPopups(shared, lent.popups);
            lent.returned = true;
        }
    }
    // A view may destroy its menu next without setting it off the frame first.
    if (frame_ && shared && ::GetMenu(frame_.get()) == shared) {
        ::SetMenu(frame_.get(), menuBar_.get());
        ::DrawMenuBar(frame_.get());
    }
    return S_OK;
}

// Drops the popups a view has given back (all of them when the browser closes). A popup still in
// a shared menu that its view destroyed went with it: that one is only forgotten.
void CExplorerWindow::ForgetLentPopups(bool all) noexcept {
    std::erase_if(lent_, [all](LentPopups& lent) {
        if (!all && !lent.returned)
            return false;
        for (UniqueMenu& popup : lent.popups) {
            if (popup && !::IsMenu(popup.get()))
                (void)popup.release();
        }
        return true;
    });
}

IFACEMETHODIMP CExplorerWindow::SetStatusTextSB(LPCWSTR text) {
    Trace(L"SetStatusTextSB(\"%ls\")", text ? text : L"");
    if (options_.menusNotImplemented)
        return E_NOTIMPL;
    RETURN_HR_IF(E_UNEXPECTED, !status_);
    ::SendMessageW(status_, SB_SETTEXTW, 0, reinterpret_cast<LPARAM>(text ? text : L""));
    return S_OK;
}

// The view's keys have had their turn in the browser's loop already; the browser's own are
// translated there too, after the view returns. Nothing to do twice here.
IFACEMETHODIMP CExplorerWindow::TranslateAcceleratorSB(MSG*, WORD id) {
    Trace(L"TranslateAcceleratorSB(%u)", static_cast<unsigned>(id));
    return S_FALSE;
}

IFACEMETHODIMP CExplorerWindow::BrowseObject(PCUIDLIST_RELATIVE list, UINT flags) {
    Trace(L"BrowseObject(flags 0x%X)", flags);
    try {
        ++browseRequests_;
        failedStep_ = BrowseStep::None;
        // The old view goes inside this call, and its window procedure is usually the caller.
        const ComPtr<IShellView> caller = view_;
        if (flags & SBSP_NAVIGATEBACK)
            return NavigateBack();
        if (flags & SBSP_NAVIGATEFORWARD)
            return E_NOTIMPL;  // no forward history
        if (flags & SBSP_PARENT)
            return NavigateUp();
        RETURN_HR_IF(E_INVALIDARG, !list);
        if (flags & SBSP_RELATIVE) {
            RETURN_HR_IF(E_UNEXPECTED, !current_);
            const UniqueAbsoluteIdList combined(::ILCombine(current_.get(), list));
            RETURN_IF_NULL_ALLOC(combined.get());
            return Navigate(combined.get(), true);
        }
        // Without SBSP_RELATIVE the list is absolute (SBSP_ABSOLUTE is 0); the interface types
        // it as relative for both cases.
        return Navigate(reinterpret_cast<PCIDLIST_ABSOLUTE>(list), true);
    }
    CATCH_RETURN()
}

IFACEMETHODIMP CExplorerWindow::GetViewStateStream(DWORD, IStream** stream) {
    Trace(L"GetViewStateStream");
    if (stream)
        *stream = nullptr;
    return E_NOTIMPL;
}

HWND CExplorerWindow::ControlWindow(UINT id) const noexcept {
    switch (id) {
        case FCW_STATUS:
            return status_;
        case FCW_TOOLBAR:
            return toolbar_;
        default:
            return nullptr;  // no tree, progress bar or internet bar in this browser
    }
}

IFACEMETHODIMP CExplorerWindow::GetControlWindow(UINT id, HWND* window) {
    Trace(L"GetControlWindow(%u)", id);
    RETURN_HR_IF(E_POINTER, !window);
    *window = nullptr;
    if (options_.menusNotImplemented)
        return E_NOTIMPL;
    *window = ControlWindow(id);
    return *window ? S_OK : E_FAIL;
}

IFACEMETHODIMP CExplorerWindow::SendControlMsg(UINT id, UINT message, WPARAM wParam, LPARAM lParam,
                                               LRESULT* result) {
    Trace(L"SendControlMsg(%u, 0x%X, 0x%IX)", id, message, wParam);
    if (result)
        *result = 0;
    if (options_.menusNotImplemented)
        return E_NOTIMPL;
    const HWND control = ControlWindow(id);
    if (!control)
        return E_FAIL;
    const LRESULT answer = ::SendMessageW(control, message, wParam, lParam);
    if (result)
        *result = answer;
    return S_OK;
}

IFACEMETHODIMP CExplorerWindow::QueryActiveShellView(IShellView** view) {
    Trace(L"QueryActiveShellView");
    RETURN_HR_IF(E_POINTER, !view);
    *view = nullptr;
    if (!view_)
        return E_FAIL;
    return view_.CopyTo(view);
}

IFACEMETHODIMP CExplorerWindow::OnViewWindowActive(IShellView*) {
    Trace(L"OnViewWindowActive");
    return S_OK;
}

IFACEMETHODIMP CExplorerWindow::SetToolbarItems(TBBUTTON*, UINT count, UINT flags) {
    Trace(L"SetToolbarItems(%u buttons, flags 0x%X)", count, flags);
    return S_OK;  // the toolbar keeps the browser's buttons only
}

IFACEMETHODIMP CExplorerWindow::OnDefaultCommand(IShellView*) {
    Trace(L"OnDefaultCommand");
    return S_OK;
}

IFACEMETHODIMP CExplorerWindow::OnStateChange(IShellView*, ULONG change) {
    Trace(L"OnStateChange(%lu)", change);
    return S_OK;
}

IFACEMETHODIMP CExplorerWindow::IncludeObject(IShellView*, PCUITEMID_CHILD) {
    Trace(L"IncludeObject");
    return S_OK;
}
