// The hidden window that passes the change broadcast on to its view.
#include "view/view_notify_window.h"

#include "support/module_instance.h"
#include "support/registered_messages.h"

namespace {

constexpr wchar_t kNotifyWindowClass[] = L"QRV Net Shell Extension - Notify";

}  // namespace

bool CViewNotifyWindow::Create(HWND view) noexcept {
    Destroy();
    const HINSTANCE instance = ThisModule();
    WNDCLASSEXW windowClass{};
    windowClass.cbSize = sizeof windowClass;
    windowClass.lpfnWndProc = &WindowProcedure;
    windowClass.hInstance = instance;
    windowClass.lpszClassName = kNotifyWindowClass;
    // A second registration fails with "class exists", which is what every view after the
    // first one meets.
    if (!::RegisterClassExW(&windowClass) && ::GetLastError() != ERROR_CLASS_ALREADY_EXISTS)
        return false;
    // Not a message-only window: those do not hear broadcasts.
    window_.reset(::CreateWindowExW(WS_EX_TOOLWINDOW, kNotifyWindowClass, L"", WS_POPUP, 0, 0, 0, 0,
                                    nullptr, nullptr, instance, nullptr));
    if (!window_)
        return false;
    ::SetWindowLongPtrW(window_.get(), GWLP_USERDATA, reinterpret_cast<LONG_PTR>(view));
    return true;
}

LRESULT CALLBACK CViewNotifyWindow::WindowProcedure(HWND window, UINT message, WPARAM wParam,
                                                    LPARAM lParam) {
    if (message != 0 && message == g_registeredMessages.globalNotify) {
        const auto view = reinterpret_cast<HWND>(::GetWindowLongPtrW(window, GWLP_USERDATA));
        if (view)
            ::PostMessageW(view, message, wParam, lParam);
        return 0;
    }
    return ::DefWindowProcW(window, message, wParam, lParam);
}

void BroadcastStationsChanged(DWORD folderKind) noexcept {
    // Posted, not sent: a hung window elsewhere must not hang this one.
    ::PostMessageW(HWND_BROADCAST, g_registeredMessages.globalNotify, 1, folderKind);
}
