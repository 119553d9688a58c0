// CExplorerWindow's navigation: binding a folder, asking it for its view, swapping views, and the
// history behind Back and Up.
#include "tools/lvexplore/explorer_window.h"

#include "support/error_handling.h"

using Microsoft::WRL::ComPtr;

namespace {

[[nodiscard]] HRESULT BindToFolder(PCIDLIST_ABSOLUTE folder, ComPtr<IShellFolder>& bound) noexcept {
    ComPtr<IShellFolder> desktop;
    RETURN_IF_FAILED(::SHGetDesktopFolder(&desktop));
    if (ILIsEmpty(folder)) {
        bound = desktop;
        return S_OK;
    }
    return desktop->BindToObject(folder, nullptr, IID_PPV_ARGS(&bound));
}

}  // namespace

HRESULT CExplorerWindow::BrowseTo(PCIDLIST_ABSOLUTE folder) noexcept {
    try {
        failedStep_ = BrowseStep::None;
        return Navigate(folder, true);
    }
    CATCH_RETURN()
}

HRESULT CExplorerWindow::BrowseToParsingName(const wchar_t* parsingName) noexcept {
    failedStep_ = BrowseStep::None;
    RETURN_HR_IF(E_POINTER, !parsingName);
    PIDLIST_ABSOLUTE parsed = nullptr;
    const HRESULT result = ::SHParseDisplayName(parsingName, nullptr, &parsed, 0, nullptr);
    const UniqueAbsoluteIdList list(parsed);
    if (FAILED(result)) {
        failedStep_ = BrowseStep::Parse;
        return result;
    }
    return BrowseTo(list.get());
}

HRESULT CExplorerWindow::BrowseToView(IShellView* view, PCIDLIST_ABSOLUTE folder) noexcept {
    try {
        failedStep_ = BrowseStep::None;
        return ShowView(view, folder, true);
    }
    CATCH_RETURN()
}

bool CExplorerWindow::GoBack() noexcept {
    return SUCCEEDED(NavigateBack());
}

bool CExplorerWindow::GoUp() noexcept {
    return SUCCEEDED(NavigateUp());
}

HRESULT CExplorerWindow::Navigate(PCIDLIST_ABSOLUTE folder, bool remember) noexcept {
    RETURN_HR_IF(E_POINTER, !folder);
    ComPtr<IShellFolder> shellFolder;
    HRESULT result = BindToFolder(folder, shellFolder);
    if (FAILED(result)) {
        failedStep_ = BrowseStep::Bind;
        return result;
    }
    ComPtr<IShellView> view;
    result = shellFolder->CreateViewObject(frame_.get(), IID_PPV_ARGS(&view));
    if (FAILED(result) || !view) {
        failedStep_ = BrowseStep::CreateView;
        return FAILED(result) ? result : E_NOINTERFACE;
    }
    return ShowView(view.Get(), folder, remember);
}

HRESULT CExplorerWindow::ShowView(IShellView* view, PCIDLIST_ABSOLUTE folder,
                                  bool remember) noexcept {
    RETURN_HR_IF(E_UNEXPECTED, !frame_);
    RETURN_HR_IF(E_POINTER, !view || !folder);
    UniqueAbsoluteIdList place(::ILCloneFull(folder));
    RETURN_IF_NULL_ALLOC(place.get());
    // The one allocation that could fail after the old view is gone is made now.
    try {
        history_.reserve(history_.size() + 1);
    }
    CATCH_RETURN()

    FOLDERSETTINGS settings = NextFolderSettings();
    RECT area = ViewArea();
    HWND window = nullptr;
    // Keeps the old view alive to the end: it is often the caller, from its window procedure.
    const ComPtr<IShellView> previous = view_;
    HRESULT result = view->CreateViewWindow(previous.Get(), &settings, this, &area, &window);
    if (SUCCEEDED(result) && !window) {
        view->DestroyViewWindow();
        result = E_FAIL;
    }
    if (FAILED(result)) {
        failedStep_ = BrowseStep::CreateViewWindow;
        return result;
    }

    ReleaseView();
    view_ = view;
    viewWindow_ = window;
    if (remember && current_)
        history_.push_back(std::move(current_));
    current_ = std::move(place);
    ShowPlace();
    const ComPtr<IShellView> shown = view_;
    shown->UIActivate(SVUIA_ACTIVATE_FOCUS);
    ::SetFocus(viewWindow_);
    return S_OK;
}

HRESULT CExplorerWindow::NavigateBack() noexcept {
    if (history_.empty())
        return E_FAIL;
    UniqueAbsoluteIdList previous = std::move(history_.back());
    history_.pop_back();
    const HRESULT result = Navigate(previous.get(), false);
    if (FAILED(result))
        history_.push_back(std::move(previous));  // into the room it just left: cannot throw
    return result;
}

HRESULT CExplorerWindow::NavigateUp() noexcept {
    if (!current_ || ILIsEmpty(current_.get()))
        return E_FAIL;
    UniqueAbsoluteIdList parent(::ILCloneFull(current_.get()));
    RETURN_IF_NULL_ALLOC(parent.get());
    ::ILRemoveLastID(parent.get());
    return Navigate(parent.get(), true);
}

FOLDERSETTINGS CExplorerWindow::NextFolderSettings() const noexcept {
    FOLDERSETTINGS settings{options_.viewMode, 0};
    FOLDERSETTINGS current{};
    if (view_ && SUCCEEDED(view_->GetCurrentInfo(&current)) && current.ViewMode >= FVM_FIRST &&
        current.ViewMode <= FVM_LAST)
        settings.ViewMode = current.ViewMode;
    return settings;
}

void CExplorerWindow::ReleaseView() noexcept {
    if (!view_)
        return;
    // No active view from here on: calls the view makes while it goes find none.
    const ComPtr<IShellView> view = std::move(view_);
    view_ = nullptr;
    viewWindow_ = nullptr;
    view->UIActivate(SVUIA_DEACTIVATE);
    view->DestroyViewWindow();
}
