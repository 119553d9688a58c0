// CExplorerWindow: the frame, its controls and layout, its commands and the message loop.
#include "tools/lvexplore/explorer_window.h"

#include <commctrl.h>

#include <cstdarg>
#include <cwchar>

#include "support/error_handling.h"
#include "support/module_instance.h"

using Microsoft::WRL::ComPtr;

namespace {

constexpr wchar_t kFrameClass[] = L"LVExplorerFrame";
constexpr int kFrameWidth = 640;
constexpr int kFrameHeight = 480;

HRESULT RegisterFrameClass(WNDPROC procedure) noexcept {
    WNDCLASSEXW frameClass{};
    frameClass.cbSize = sizeof(frameClass);
    frameClass.lpfnWndProc = procedure;
    frameClass.hInstance = ThisModule();
    frameClass.hCursor = ::LoadCursorW(nullptr, IDC_ARROW);
    frameClass.hIcon = ::LoadIconW(nullptr, IDI_APPLICATION);
    frameClass.hbrBackground = reinterpret_cast<HBRUSH>(COLOR_WINDOW + 1);
    frameClass.lpszClassName = kFrameClass;
    if (!::RegisterClassExW(&frameClass) && ::GetLastError() != ERROR_CLASS_ALREADY_EXISTS)
        LV_LOG_AND_RETURN(LastErrorResult());
    return S_OK;
}

// The control's own visibility: while the frame is hidden, IsWindowVisible says no for all.
int WindowHeight(HWND window) noexcept {
    RECT bounds{};
    if (!window || !(::GetWindowLongPtrW(window, GWL_STYLE) & WS_VISIBLE) ||
        !::GetWindowRect(window, &bounds))
        return 0;
    return bounds.bottom - bounds.top;
}

TBBUTTON TextButton(UINT command, const wchar_t* text) noexcept {
    TBBUTTON button{};
    button.iBitmap = I_IMAGENONE;
    button.idCommand = static_cast<int>(command);
    button.fsState = TBSTATE_ENABLED;
    button.fsStyle = BTNS_BUTTON | BTNS_AUTOSIZE | BTNS_SHOWTEXT;
    button.iString = reinterpret_cast<INT_PTR>(text);
    return button;
}

// Backspace in a text field deletes a character; it goes up only from the view itself.
bool FocusIsInTextField() noexcept {
    wchar_t name[32] = L"";
    const HWND focus = ::GetFocus();
    return focus && ::GetClassNameW(focus, name, ARRAYSIZE(name)) &&
           ::lstrcmpiW(name, L"Edit") == 0;
}

}  // namespace

CExplorerWindow::CExplorerWindow(const ExplorerOptions& options) : options_(options) {}

CExplorerWindow::~CExplorerWindow() {
    // The last reference is gone: messages sent while the frame goes must not reach this object.
    if (frame_)
        ::SetWindowLongPtrW(frame_.get(), GWLP_USERDATA, 0);
    Close();
}

HRESULT CExplorerWindow::Create(const ExplorerOptions& options,
                                 ComPtr<CExplorerWindow>& window) noexcept {
    try {
        window.Reset();
        ComPtr<CExplorerWindow> made = MakeComObject<CExplorerWindow>(options);
        RETURN_IF_FAILED(made->CreateFrame());
        window = std::move(made);
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CExplorerWindow::CreateFrame() noexcept {
    const INITCOMMONCONTROLSEX controls{sizeof(controls), ICC_BAR_CLASSES};
    ::InitCommonControlsEx(&controls);
    RETURN_IF_FAILED(RegisterFrameClass(&CExplorerWindow::WindowProcedure));
    RETURN_IF_FAILED(CreateBrowserMenuBar(menuBar_));
    RETURN_IF_FAILED(CreateBrowserAccelerators(accelerators_));
    frame_.reset(::CreateWindowExW(
        0, kFrameClass, L"lvexplore", WS_OVERLAPPEDWINDOW | WS_CLIPCHILDREN, CW_USEDEFAULT,
        CW_USEDEFAULT, kFrameWidth, kFrameHeight, nullptr, menuBar_.get(), ThisModule(), this));
    RETURN_IF_WIN32_BOOL_FALSE(frame_);
    RETURN_IF_FAILED(CreateControls(frame_.get()));
    Layout();
    ShowPlace();
    if (options_.visible) {
        ::ShowWindow(frame_.get(), SW_SHOW);
        ::UpdateWindow(frame_.get());
    }
    return S_OK;
}

HRESULT CExplorerWindow::CreateControls(HWND frame) noexcept {
    toolbar_ =
        ::CreateWindowExW(0, TOOLBARCLASSNAMEW, nullptr,
                          WS_CHILD | WS_VISIBLE | TBSTYLE_FLAT | TBSTYLE_LIST | CCS_TOP, 0, 0, 0, 0,
                          frame, reinterpret_cast<HMENU>(FCIDM_TOOLBAR), ThisModule(), nullptr);
    RETURN_IF_WIN32_BOOL_FALSE(toolbar_);
    ::SendMessageW(toolbar_, TB_BUTTONSTRUCTSIZE, sizeof(TBBUTTON), 0);
    TBBUTTON buttons[] = {TextButton(kCommandBack, L"Back"), TextButton(kCommandUp, L"Up")};
    RETURN_IF_WIN32_BOOL_FALSE(::SendMessageW(toolbar_, TB_ADDBUTTONSW, ARRAYSIZE(buttons),
                                              reinterpret_cast<LPARAM>(buttons)));
    status_ = ::CreateWindowExW(0, STATUSCLASSNAMEW, nullptr,
                                WS_CHILD | WS_VISIBLE | SBARS_SIZEGRIP, 0, 0, 0, 0, frame,
                                reinterpret_cast<HMENU>(FCIDM_STATUS), ThisModule(), nullptr);
    RETURN_IF_WIN32_BOOL_FALSE(status_);
    return S_OK;
}

void CExplorerWindow::Close() noexcept {
    ReleaseView();
    if (frame_) {
        // A window destroys the menu it carries: neither ours nor a view's shared one may go so.
        ::SetMenu(frame_.get(), nullptr);
        frame_.reset();
    }
    ForgetLentPopups(true);
    menuBar_.reset();
    toolbar_ = status_ = nullptr;
}

HMENU CExplorerWindow::MenuBar() const noexcept {
    return frame_ ? ::GetMenu(frame_.get()) : nullptr;
}

std::wstring CExplorerWindow::StatusText(int part) const {
    if (!status_)
        return {};
    const LRESULT lengthAndType = ::SendMessageW(status_, SB_GETTEXTLENGTHW, part, 0);
    std::wstring text(LOWORD(lengthAndType) + 1, L'\0');
    ::SendMessageW(status_, SB_GETTEXTW, part, reinterpret_cast<LPARAM>(text.data()));
    text.resize(std::wcslen(text.c_str()));
    return text;
}

int CExplorerWindow::StatusPartCount() const {
    return status_ ? static_cast<int>(::SendMessageW(status_, SB_GETPARTS, 0, 0)) : 0;
}

RECT CExplorerWindow::ViewArea() const noexcept {
    RECT area{};
    if (frame_)
        ::GetClientRect(frame_.get(), &area);
    area.top += WindowHeight(toolbar_);
    area.bottom -= WindowHeight(status_);
    if (area.bottom < area.top)
        area.bottom = area.top;
    return area;
}

void CExplorerWindow::Layout() noexcept {
    if (toolbar_)
        ::SendMessageW(toolbar_, TB_AUTOSIZE, 0, 0);
    if (status_)
        ::SendMessageW(status_, WM_SIZE, 0, 0);
    if (viewWindow_) {
        const RECT area = ViewArea();
        ::MoveWindow(viewWindow_, area.left, area.top, area.right - area.left,
                     area.bottom - area.top, TRUE);
    }
}

// The title names the folder; Back and Up are enabled only where they lead somewhere.
void CExplorerWindow::ShowPlace() noexcept {
    if (!frame_)
        return;
    try {
        const std::wstring name = ShellItemName(current_.get(), SIGDN_NORMALDISPLAY);
        ::SetWindowTextW(frame_.get(), name.empty() ? L"lvexplore" : name.c_str());
    } catch (...) {
        // Without memory for the name the title stays as it was.
    }
    ::SendMessageW(toolbar_, TB_ENABLEBUTTON, kCommandBack, MAKELPARAM(!history_.empty(), 0));
    ::SendMessageW(toolbar_, TB_ENABLEBUTTON, kCommandUp,
                   MAKELPARAM(current_ && !ILIsEmpty(current_.get()), 0));
}

void CExplorerWindow::OnCommand(WPARAM wParam, LPARAM lParam) {
    const UINT id = LOWORD(wParam);
    switch (id) {
        case kCommandClose:
            Close();
            return;
        case kCommandBack:
            (void)GoBack();  // nothing to go back to: the command does nothing, as a browser's
            return;
        case kCommandUp:
            (void)GoUp();  // at the desktop already
            return;
        case kCommandRefresh:
            if (const ComPtr<IShellView> view = view_)
                view->Refresh();
            return;
        default:
            // Everything else on the menu bar or from an accelerator is a merged item of the view.
            if (lParam == 0 && viewWindow_)
                ::SendMessageW(viewWindow_, WM_COMMAND, wParam, lParam);
    }
}

LRESULT CExplorerWindow::HandleMessage(HWND frame, UINT message, WPARAM wParam, LPARAM lParam) {
    switch (message) {
        case WM_SIZE:
            Layout();
            return 0;
        case WM_SETFOCUS:
            if (viewWindow_)
                ::SetFocus(viewWindow_);
            return 0;
        case WM_ACTIVATE:
            if (LOWORD(wParam) != WA_INACTIVE) {
                if (const ComPtr<IShellView> view = view_)
                    view->UIActivate(SVUIA_ACTIVATE_FOCUS);
            }
            break;
        case WM_COMMAND:
            OnCommand(wParam, lParam);
            return 0;
        case WM_CLOSE:
            Close();
            return 0;
        case WM_DESTROY:
            ReleaseView();
            ::SetMenu(frame, nullptr);
            if (quitWhenDestroyed_)
                ::PostQuitMessage(0);
            return 0;
        case WM_NCDESTROY:
            ::SetWindowLongPtrW(frame, GWLP_USERDATA, 0);
            (void)frame_.release();  // destroyed by someone else: nothing left to destroy
            toolbar_ = status_ = nullptr;
            break;
    }
    return ::DefWindowProcW(frame, message, wParam, lParam);
}

LRESULT CALLBACK CExplorerWindow::WindowProcedure(HWND frame, UINT message, WPARAM wParam,
                                                  LPARAM lParam) {
    if (message == WM_NCCREATE) {
        const auto* creation = reinterpret_cast<const CREATESTRUCTW*>(lParam);
        ::SetWindowLongPtrW(frame, GWLP_USERDATA,
                            reinterpret_cast<LONG_PTR>(creation->lpCreateParams));
    }
    auto* window = reinterpret_cast<CExplorerWindow*>(::GetWindowLongPtrW(frame, GWLP_USERDATA));
    if (!window)
        return ::DefWindowProcW(frame, message, wParam, lParam);
    // Closing from the menu may drop every other reference: the object outlives its handler.
    const ComPtr<CExplorerWindow> keepAlive(window);
    try {
        return window->HandleMessage(frame, message, wParam, lParam);
    } catch (...) {
        LogFailure(ResultFromCaughtException(), __FILE__, __func__, __LINE__);
        return 0;
    }
}

bool CExplorerWindow::TranslateThroughView(MSG& message) {
    if (const ComPtr<IShellView> view = view_; view && view->TranslateAccelerator(&message) == S_OK)
        return true;
    // The frame's own keys only, and only for its own windows; a key the view translated but
    // left (S_FALSE) is not one of them.
    const HWND frame = frame_.get();
    if (!frame || (message.hwnd != frame && !::IsChild(frame, message.hwnd)))
        return false;
    if (message.message == WM_KEYDOWN && message.wParam == VK_BACK && FocusIsInTextField())
        return false;
    if (!::TranslateAcceleratorW(frame, accelerators_.get(), &message))
        return false;
    // Wine: DefWindowProc opens the menu bar when Alt goes up unless it saw another key while Alt
    // was down, and Alt+Left never reached it. Windows tracks that itself; there this does nothing.
    if (message.message == WM_SYSKEYDOWN)
        ::DefWindowProcW(frame, message.message, message.wParam, message.lParam);
    return true;
}

void CExplorerWindow::PumpMessages(DWORD milliseconds) {
    const ULONGLONG deadline = ::GetTickCount64() + milliseconds;
    for (;;) {
        MSG message;
        while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) {
            if (message.message == WM_QUIT) {
                ::PostQuitMessage(static_cast<int>(message.wParam));  // for the caller's own loop
                return;
            }
            if (!TranslateThroughView(message)) {
                ::TranslateMessage(&message);
                ::DispatchMessageW(&message);
            }
        }
        const ULONGLONG now = ::GetTickCount64();
        if (now >= deadline)
            return;
        ::MsgWaitForMultipleObjectsEx(0, nullptr, static_cast<DWORD>(deadline - now), QS_ALLINPUT,
                                      MWMO_INPUTAVAILABLE);
    }
}

void CExplorerWindow::Trace(const wchar_t* format, ...) const noexcept {
    if (!options_.trace)
        return;
    wchar_t text[256];
    va_list arguments;
    va_start(arguments, format);
    _vsnwprintf(text, ARRAYSIZE(text) - 1, format, arguments);
    va_end(arguments);
    text[ARRAYSIZE(text) - 1] = 0;
    try {
        options_.trace(text);
    } catch (...) {
        // A trace that fails is lost; the call it reports goes on.
    }
}

int RunExplorerMessageLoop(CExplorerWindow& window) {
    if (!window.Window())
        return 0;
    window.quitWhenDestroyed_ = true;
    MSG message{};
    while (::GetMessageW(&message, nullptr, 0, 0) > 0) {
        if (!window.TranslateThroughView(message)) {
            ::TranslateMessage(&message);
            ::DispatchMessageW(&message);
        }
    }
    return static_cast<int>(message.wParam);
}
