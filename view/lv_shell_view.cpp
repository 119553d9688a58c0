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
    list_.StopFill();
    menus_.RemoveMenus();
    notifyWindow_.Destroy();
    window_.reset();
}

HRESULT CLVShellView::SetUp(IShellFolder* folder, PCUIDLIST_RELATIVE own) noexcept {
    RETURN_HR_IF(E_INVALIDARG, !folder || !own);
    try {
        CPidlMgr manager;
        ShellViewFolder& shown = context_.folder;
        shown.folder = folder;
        shown.kind = manager.GetLastItemKind(own);
        shown.path = kRootItemName;
        if (shown.kind == PT_STATION)
            shown.path += L'\\' + manager.GetItemName(manager.GetLastItem(own));
        context_.ownIdentifier = manager.CopyPidl(own);
        RETURN_IF_NULL_ALLOC(context_.ownIdentifier.get());
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
    *window = window_.get();
    return window_ ? S_OK : E_FAIL;
}

HRESULT CLVShellView::TranslateAccelerator(MSG* message) {
    if (message)
        commands_.TranslateAccelerator(*message);
    // S_FALSE even for a translated key: the browser goes on processing the message, as the
    // folder always let it.
    return S_FALSE;
}

HRESULT CLVShellView::UIActivate(UINT state) {
    try {
        switch (state) {
            case SVUIA_DEACTIVATE:
                menus_.SetActivation(ViewActivation::Deactivated);
                break;
            case SVUIA_ACTIVATE_NOFOCUS:
                menus_.SetActivation(ViewActivation::ActiveWithoutFocus);
                break;
            default:
                menus_.SetActivation(ViewActivation::ActiveWithFocus);
                break;
        }
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVShellView::Refresh() {
    return list_.Refresh();
}

HRESULT CLVShellView::CreateViewWindow(IShellView*, LPCFOLDERSETTINGS settings,
                                       IShellBrowser* browser, RECT* area, HWND* window) {
    if (!window)
        return E_POINTER;
    *window = nullptr;
    RETURN_HR_IF(E_INVALIDARG, !settings || !browser || !area);
    // A view made by its class factory has no folder to show.
    RETURN_HR_IF(E_UNEXPECTED, window_ || !context_.folder.folder);
    try {
        RETURN_HR_IF(E_FAIL, !RegisterViewWindowClass(&WindowProcedure));
        context_.browser = browser;
        // Only a file dialog's browser is meant to offer it; Explorer's answers too, and then
        // the view says "Select" where it means "Open", as on Windows.
        context_.dialogBrowser.Reset();
        (void)browser->QueryInterface(IID_PPV_ARGS(&context_.dialogBrowser));
        context_.folderFlags = settings->fFlags;
        UINT viewMode = settings->ViewMode;
        if (viewMode < FVM_ICON || viewMode > FVM_DETAILS)
            viewMode = FVM_ICON;
        list_.SetViewMode(viewMode);
        // No buttons of ours for the browser's toolbar; a browser without one says so, which
        // changes nothing.
        (void)browser->SetToolbarItems(nullptr, 0, FCT_MERGE);
        HWND parent = nullptr;
        RETURN_IF_FAILED(browser->GetWindow(&parent));

        // The window procedure takes the window into window_ with its first message.
        const HWND created =
            ::CreateWindowExW(0, kViewWindowClass, L"", WS_CHILD | WS_VISIBLE | WS_CLIPSIBLINGS,
                              area->left, area->top, area->right - area->left,
                              area->bottom - area->top, parent, nullptr, ThisModule(), this);
        RETURN_HR_IF(E_FAIL, !created);
        commands_.LoadAccelerators();
        // Without the window the view only misses other views' changes.
        (void)notifyWindow_.Create(window_.get());
        *window = window_.get();
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVShellView::DestroyViewWindow() {
    try {
        menus_.SetActivation(ViewActivation::Deactivated);
    }
    CATCH_LOG()
    list_.StopFill();
    notifyWindow_.Destroy();
    window_.reset();
    commands_.UnloadAccelerators();
    return S_OK;
}

HRESULT CLVShellView::GetCurrentInfo(LPFOLDERSETTINGS settings) {
    if (!settings)
        return E_POINTER;
    *settings = FOLDERSETTINGS{context_.viewMode, context_.folderFlags};
    return S_OK;
}

HRESULT CLVShellView::GetItemObject(UINT item, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if ((item & SVGIO_TYPE_MASK) != SVGIO_SELECTION)
        return E_NOINTERFACE;
    try {
        const std::vector<CShellViewList::SelectedItem> selection = list_.Selection();
        if (selection.empty())
            return E_INVALIDARG;
        // A multiple selection still gives an object for its first item only.
        PCUITEMID_CHILD first = selection.front().item;
        return context_.folder.folder->GetUIObjectOf(window_.get(), 1, &first, iid, nullptr,
                                                     object);
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
        commands_.OnCommand(command);
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
        view->SetViewWindow(window);
    }
    if (!view)
        return ::DefWindowProcW(window, message, wParam, lParam);
    // A window procedure is the edge of the view's code: nothing may unwind into the system.
    try {
        return view->HandleMessage(window, message, wParam, lParam);
    }
    CATCH_LOG()
    return ::DefWindowProcW(window, message, wParam, lParam);
}

void CLVShellView::SetViewWindow(HWND window) noexcept {
    if (window)
        window_.reset(window);
    else
        (void)window_.release();  // the window is going of itself, or window_ let it go already
    context_.window = window;
}

void CLVShellView::ActivateWithFocus() {
    if (context_.browser)
        (void)context_.browser->OnViewWindowActive(this);
    menus_.SetActivation(ViewActivation::ActiveWithFocus);
}

LRESULT CLVShellView::HandleMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
    switch (message) {
        case WM_CREATE:
            if (!list_.Create())
                return -1;
            list_.StartFill();
            return 0;
        case WM_DESTROY:
            list_.Destroy();
            return 0;
        case WM_NCDESTROY:
            ::SetWindowLongPtrW(window, GWLP_USERDATA, 0);
            SetViewWindow(nullptr);
            break;
        case WM_SIZE:
            list_.Resize(LOWORD(lParam), HIWORD(lParam));
            return 0;
        case WM_ACTIVATE:
            if (LOWORD(wParam) != WA_INACTIVE)
                menus_.SetActivation(ViewActivation::ActiveWithFocus);
            return 0;
        case WM_SETFOCUS:
            ActivateWithFocus();
            ::SetFocus(list_.Window());
            return 0;
        case WM_KILLFOCUS:
            if (menus_.Activation() == ViewActivation::ActiveWithFocus)
                menus_.SetActivation(ViewActivation::ActiveWithoutFocus);
            return 0;
        case WM_SETTINGCHANGE:
            list_.ApplyViewModeStyle();
            return 0;
        case WM_NOTIFY:
            return OnNotify(*reinterpret_cast<const NMHDR*>(lParam));
        case WM_CONTEXTMENU:
            menus_.ShowPopupMenu(POINT{GET_X_LPARAM(lParam), GET_Y_LPARAM(lParam)});
            return 0;
        case WM_COMMAND:
            commands_.OnCommand(LOWORD(wParam));
            return 0;
        case kReadColumnWidthsMessage:
            list_.ReadColumnWidths();
            return 0;
        default:
            break;
    }
    if (message != 0 && message == g_registeredMessages.getEnumIdList) {
        list_.OnEnumeratorReady(reinterpret_cast<IEnumIDList*>(lParam));
        return 0;
    }
    if (message != 0 && message == g_registeredMessages.globalNotify) {
        if (wParam == 1 && static_cast<DWORD>(lParam) == context_.folder.kind)
            (void)Refresh();  // fails only without a list, which there is nothing to refresh in
        return 0;
    }
    return ::DefWindowProcW(window, message, wParam, lParam);
}

LRESULT CLVShellView::OnNotify(const NMHDR& header) {
    // The header's notifications reach the view through the list.
    if (header.code == HDN_ENDTRACKW || header.code == HDN_ENDTRACKA) {
        list_.OnHeaderEndTrack();
        return 0;
    }
    if (header.hwndFrom != list_.Window())
        return 0;
    switch (header.code) {
        case NM_SETFOCUS:
            ActivateWithFocus();
            return 0;
        case NM_KILLFOCUS:
            menus_.SetActivation(ViewActivation::Deactivated);
            return 0;
        case LVN_GETDISPINFOW:
            list_.OnGetDisplayInfo(*reinterpret_cast<NMLVDISPINFOW*>(const_cast<NMHDR*>(&header)));
            return 0;
        case LVN_DELETEITEM:
            list_.OnDeleteItem(reinterpret_cast<const NMLISTVIEW&>(header));
            return 0;
        case LVN_COLUMNCLICK:
            list_.OnColumnClick(reinterpret_cast<const NMLISTVIEW&>(header).iSubItem);
            return 0;
        case LVN_KEYDOWN:
            commands_.OnListKeyDown(reinterpret_cast<const NMLVKEYDOWN&>(header).wVKey);
            return 0;
        case LVN_ITEMACTIVATE:
            commands_.OpenSelection();
            return 0;
        case LVN_BEGINDRAG:
            commands_.BeginDrag();
            return 0;
        case LVN_ITEMCHANGED:
            // The menus' enabled states follow the selection.
            if (reinterpret_cast<const NMLISTVIEW&>(header).uChanged & LVIF_STATE)
                menus_.UpdateMenuStates();
            return 0;
        default:
            break;
    }
    return 0;
}
