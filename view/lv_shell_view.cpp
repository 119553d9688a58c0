// The view's COM face and its window: creation, destruction, messages, the browser's keyboard and
// command routes.
#include "view/lv_shell_view.h"

#include <windowsx.h>

#include "namespace/portable/item_id_layout.h"
#include "res/ids_view.h"
#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/registered_messages.h"

namespace {

constexpr wchar_t kViewWindowClass[] = L"LVViewNSClass";
constexpr UINT kReadColumnWidthsMessage = WM_APP + 1;

bool RegisterViewWindowClass(WNDPROC procedure) noexcept {
    WNDCLASSEXW windowClass{};
    windowClass.cbSize = sizeof windowClass;
    if (::GetClassInfoExW(ThisModule(), kViewWindowClass, &windowClass))
        return true;
    windowClass.style = CS_HREDRAW | CS_VREDRAW;
    windowClass.lpfnWndProc = procedure;
    windowClass.hInstance = ThisModule();
    windowClass.hCursor = ::LoadCursorW(nullptr, IDC_ARROW);
    windowClass.hbrBackground = reinterpret_cast<HBRUSH>(COLOR_WINDOW + 1);
    windowClass.lpszClassName = kViewWindowClass;
    return ::RegisterClassExW(&windowClass) || ::GetLastError() == ERROR_CLASS_ALREADY_EXISTS;
}

}  // namespace

CLVShellView::~CLVShellView() {
    // A browser that released the view without destroying its window (or a failed creation)
    // leaves no window, thread or menu behind.
    StopFillThreads();
    RemoveMenus();
    notifyWindow_.Destroy();
    if (window_)
        ::DestroyWindow(window_);
}

HRESULT CLVShellView::SetUp(IShellFolder* folder, PCUIDLIST_RELATIVE own) noexcept {
    RETURN_HR_IF(E_INVALIDARG, !folder || !own);
    try {
        folder_ = folder;
        ownIdentifier_.reset(manager_.CopyPidl(own));
        RETURN_IF_NULL_ALLOC(ownIdentifier_.get());
        folderKind_ = manager_.GetLastItemKind(own);
        folderPath_ = kRootItemName;
        if (folderKind_ == PT_STATION)
            folderPath_ += L'\\' + manager_.GetItemName(manager_.GetLastItem(own));
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVShellView::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {
        QITABENT(CLVShellView, IShellView),
        QITABENTMULTI(CLVShellView, IOleWindow, IShellView),
        QITABENT(CLVShellView, IOleCommandTarget),
        {},
    };
    return QISearch(this, table, iid, object);
}

HRESULT CLVShellView::GetWindow(HWND* window) {
    if (!window)
        return E_POINTER;
    *window = window_;
    return window_ ? S_OK : E_FAIL;
}

HRESULT CLVShellView::TranslateAccelerator(MSG* message) {
    if (message && window_ && accelerators_ &&
        ::TranslateAcceleratorW(window_, accelerators_.get(), message)) {
        translatedKey_ = message->wParam;
        translatedKeyTime_ = static_cast<LONG>(message->time);
    }
    // S_FALSE even for a translated key: the browser goes on processing the message, as the
    // folder always let it.
    return S_FALSE;
}

HRESULT CLVShellView::UIActivate(UINT state) {
    try {
        switch (state) {
            case SVUIA_DEACTIVATE:
                SetActivation(ViewActivation::Deactivated);
                break;
            case SVUIA_ACTIVATE_NOFOCUS:
                SetActivation(ViewActivation::ActiveWithoutFocus);
                break;
            default:
                SetActivation(ViewActivation::ActiveWithFocus);
                break;
        }
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVShellView::Refresh() {
    if (!list_.Window())
        return E_FAIL;
    try {
        list_.Send(LVM_DELETEALLITEMS);
        StartFill();
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVShellView::CreateViewWindow(IShellView*, LPCFOLDERSETTINGS settings,
                                       IShellBrowser* browser, RECT* area, HWND* window) {
    if (!window)
        return E_POINTER;
    *window = nullptr;
    RETURN_HR_IF(E_INVALIDARG, !settings || !browser || !area);
    // A view made by its class factory has no folder to show.
    RETURN_HR_IF(E_UNEXPECTED, window_ != nullptr || !folder_);
    try {
        RETURN_HR_IF(E_FAIL, !RegisterViewWindowClass(&WindowProcedure));
        browser_ = browser;
        dialogBrowser_.Reset();
        // Only a file dialog's browser is meant to offer it; Explorer's answers too, and then
        // the view says "Select" where it means "Open", as on Windows.
        (void)browser->QueryInterface(IID_PPV_ARGS(&dialogBrowser_));
        settings_ = *settings;
        if (settings_.ViewMode < FVM_ICON || settings_.ViewMode > FVM_DETAILS)
            settings_.ViewMode = FVM_ICON;
        // No buttons of ours for the browser's toolbar; a browser without one says so, which
        // changes nothing.
        (void)browser->SetToolbarItems(nullptr, 0, FCT_MERGE);
        RETURN_IF_FAILED(browser->GetWindow(&parent_));

        const HWND created =
            ::CreateWindowExW(0, kViewWindowClass, L"", WS_CHILD | WS_VISIBLE | WS_CLIPSIBLINGS,
                              area->left, area->top, area->right - area->left,
                              area->bottom - area->top, parent_, nullptr, ThisModule(), this);
        RETURN_HR_IF(E_FAIL, !created);
        accelerators_.reset(
            ::LoadAcceleratorsW(ThisModule(), MAKEINTRESOURCEW(IDR_VIEW_ACCELERATORS)));
        // Without the window the view only misses other views' changes.
        (void)notifyWindow_.Create(window_);
        *window = window_;
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVShellView::DestroyViewWindow() {
    try {
        SetActivation(ViewActivation::Deactivated);
    }
    CATCH_LOG()
    StopFillThreads();
    notifyWindow_.Destroy();
    if (window_)
        ::DestroyWindow(window_);
    accelerators_.reset();
    return S_OK;
}

HRESULT CLVShellView::GetCurrentInfo(LPFOLDERSETTINGS settings) {
    if (!settings)
        return E_POINTER;
    *settings = settings_;
    return S_OK;
}

HRESULT CLVShellView::GetItemObject(UINT item, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if ((item & SVGIO_TYPE_MASK) != SVGIO_SELECTION)
        return E_NOINTERFACE;
    try {
        const std::vector<SelectedItem> selection = Selection();
        if (selection.empty())
            return E_INVALIDARG;
        // A multiple selection still gives an object for its first item only.
        PCUITEMID_CHILD first = selection.front().item;
        return folder_->GetUIObjectOf(window_, 1, &first, iid, nullptr, object);
    }
    CATCH_RETURN()
}

HRESULT CLVShellView::QueryStatus(const GUID* group, ULONG count, OLECMD* commands, OLECMDTEXT*) {
    if (!commands)
        return E_POINTER;
    if (!group || (*group != CGID_Explorer && *group != CGID_ShellDocView))
        return OLECMDERR_E_UNKNOWNGROUP;
    for (ULONG index = 0; index < count; ++index) {
        const ULONG id = commands[index].cmdID;
        const bool known = id == IDM_REFRESH || (id >= IDM_CREATE_STATION && id <= IDM_OPEN);
        commands[index].cmdf = known ? OLECMDF_SUPPORTED | OLECMDF_ENABLED : 0;
    }
    return S_OK;
}

HRESULT CLVShellView::Exec(const GUID* group, DWORD command, DWORD, VARIANT*, VARIANT*) {
    if (!group || (*group != CGID_Explorer && *group != CGID_ShellDocView))
        return OLECMDERR_E_UNKNOWNGROUP;
    try {
        OnCommand(command);
        return S_OK;
    }
    CATCH_RETURN()
}

LRESULT CALLBACK CLVShellView::WindowProcedure(HWND window, UINT message, WPARAM wParam,
                                               LPARAM lParam) {
    auto* view = reinterpret_cast<CLVShellView*>(::GetWindowLongPtrW(window, GWLP_USERDATA));
    if (message == WM_NCCREATE) {
        view = static_cast<CLVShellView*>(reinterpret_cast<CREATESTRUCTW*>(lParam)->lpCreateParams);
        ::SetWindowLongPtrW(window, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(view));
        view->window_ = window;
    }
    if (!view)
        return ::DefWindowProcW(window, message, wParam, lParam);
    // A window procedure is the edge of the view's code: nothing may unwind into the system.
    try {
        return view->HandleMessage(message, wParam, lParam);
    }
    CATCH_LOG()
    return ::DefWindowProcW(window, message, wParam, lParam);
}

LRESULT CLVShellView::HandleMessage(UINT message, WPARAM wParam, LPARAM lParam) {
    const HWND window = window_;
    switch (message) {
        case WM_CREATE:
            if (!CreateList())
                return -1;
            StartFill();
            return 0;
        case WM_DESTROY:
            StopFillThreads();
            // The drop target holds this view: revoking it ends that cycle.
            if (dropTargetRegistered_)
                (void)::RevokeDragDrop(list_.Window());
            dropTargetRegistered_ = false;
            list_.Destroy();
            animation_.reset();
            return 0;
        case WM_NCDESTROY:
            ::SetWindowLongPtrW(window, GWLP_USERDATA, 0);
            window_ = nullptr;
            break;
        case WM_SIZE:
            ::MoveWindow(list_.Window(), 0, 0, LOWORD(lParam), HIWORD(lParam), TRUE);
            return 0;
        case WM_ACTIVATE:
            if (LOWORD(wParam) != WA_INACTIVE)
                SetActivation(ViewActivation::ActiveWithFocus);
            return 0;
        case WM_SETFOCUS:
            // The browser has to know which view to send its keys to.
            if (browser_)
                (void)browser_->OnViewWindowActive(this);
            SetActivation(ViewActivation::ActiveWithFocus);
            ::SetFocus(list_.Window());
            return 0;
        case WM_KILLFOCUS:
            if (activation_ == ViewActivation::ActiveWithFocus)
                SetActivation(ViewActivation::ActiveWithoutFocus);
            return 0;
        case WM_SETTINGCHANGE:
            ApplyViewModeStyle();
            return 0;
        case WM_NOTIFY:
            return OnNotify(*reinterpret_cast<const NMHDR*>(lParam));
        case WM_CONTEXTMENU:
            ShowPopupMenu(POINT{GET_X_LPARAM(lParam), GET_Y_LPARAM(lParam)});
            return 0;
        case WM_COMMAND:
            OnCommand(LOWORD(wParam));
            return 0;
        case kReadColumnWidthsMessage:
            ReadColumnWidths();
            return 0;
        default:
            break;
    }
    if (message != 0 && message == g_registeredMessages.getEnumIdList) {
        OnEnumeratorReady(reinterpret_cast<IEnumIDList*>(lParam));
        return 0;
    }
    if (message != 0 && message == g_registeredMessages.globalNotify) {
        if (wParam == 1 && static_cast<DWORD>(lParam) == folderKind_)
            (void)Refresh();  // fails only without a list, which there is nothing to refresh in
        return 0;
    }
    return ::DefWindowProcW(window, message, wParam, lParam);
}

LRESULT CLVShellView::OnNotify(const NMHDR& header) {
    // The header's notifications reach the view through the list.
    if (header.code == HDN_ENDTRACKW || header.code == HDN_ENDTRACKA) {
        // The header applies the new width after this notification: read it back afterwards.
        ::PostMessageW(window_, kReadColumnWidthsMessage, 0, 0);
        return 0;
    }
    if (header.hwndFrom != list_.Window())
        return 0;
    switch (header.code) {
        case NM_SETFOCUS:
            if (browser_)
                (void)browser_->OnViewWindowActive(this);
            SetActivation(ViewActivation::ActiveWithFocus);
            return 0;
        case NM_KILLFOCUS:
            SetActivation(ViewActivation::Deactivated);
            return 0;
        case LVN_GETDISPINFOW:
            OnGetDisplayInfo(*reinterpret_cast<NMLVDISPINFOW*>(const_cast<NMHDR*>(&header)));
            return 0;
        case LVN_DELETEITEM: {
            const auto& item = reinterpret_cast<const NMLISTVIEW&>(header);
            UniquePidl owned(reinterpret_cast<LPITEMIDLIST>(item.lParam));
            return 0;
        }
        case LVN_COLUMNCLICK:
            OnColumnClick(reinterpret_cast<const NMLISTVIEW&>(header).iSubItem);
            return 0;
        case LVN_KEYDOWN:
            OnListKeyDown(reinterpret_cast<const NMLVKEYDOWN&>(header).wVKey);
            return 0;
        case LVN_ITEMACTIVATE:
            OpenSelection();
            return 0;
        case LVN_BEGINDRAG:
            BeginDrag();
            return 0;
        case LVN_ITEMCHANGED:
            // The menus' enabled states follow the selection.
            if (reinterpret_cast<const NMLISTVIEW&>(header).uChanged & LVIF_STATE)
                UpdateMenuStates();
            return 0;
        default:
            break;
    }
    return 0;
}

void CLVShellView::OnListKeyDown(WORD key) {
    // The message being dispatched is the one the browser already gave to TranslateAccelerator.
    if (translatedKey_ == key && translatedKeyTime_ == ::GetMessageTime()) {
        translatedKey_ = 0;
        return;
    }
    if (!accelerators_)
        return;
    MSG message{};
    message.hwnd = list_.Window();
    message.message = WM_KEYDOWN;
    message.wParam = key;
    message.time = static_cast<DWORD>(::GetMessageTime());
    ::TranslateAcceleratorW(window_, accelerators_.get(), &message);
}
