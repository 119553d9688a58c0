// CViewNotifyWindow: a hidden top-level window that hears the station list's change broadcast
// for one view. A view window is a child, and broadcasts reach top-level windows only.
#pragma once

#include <windows.h>

#include "support/unique_resource.h"

class CViewNotifyWindow {
public:
    CViewNotifyWindow() noexcept = default;
    CViewNotifyWindow(const CViewNotifyWindow&) = delete;
    CViewNotifyWindow& operator=(const CViewNotifyWindow&) = delete;

    // Creates the window of class "QRV Net Shell Extension - Notify"; every change broadcast it
    // hears is posted on to view with the same arguments.
    [[nodiscard]] bool Create(HWND view) noexcept;
    void Destroy() noexcept { window_.reset(); }

    HWND Window() const noexcept { return window_.get(); }

private:
    static LRESULT CALLBACK WindowProcedure(HWND window, UINT message, WPARAM wParam,
                                            LPARAM lParam);

    UniqueWindow window_;
};

// Tells every view of folders of that kind, in every process, that the station list changed.
void BroadcastStationsChanged(DWORD folderKind) noexcept;
