// CShellViewListWindow: the view's list control, subclassed for the two answers a list inside a
// browser must give differently from a plain one.
#pragma once

#include <windows.h>

class CShellViewListWindow {
public:
    CShellViewListWindow() noexcept = default;
    CShellViewListWindow(const CShellViewListWindow&) = delete;
    CShellViewListWindow& operator=(const CShellViewListWindow&) = delete;
    ~CShellViewListWindow() { Destroy(); }

    // Creates the list as a child of parent with the given styles and control id.
    [[nodiscard]] bool Create(HWND parent, DWORD style, DWORD extendedStyle,
                              UINT controlId) noexcept;
    void Destroy() noexcept;

    HWND Window() const noexcept { return window_; }
    LRESULT Send(UINT message, WPARAM wParam = 0, LPARAM lParam = 0) const noexcept {
        return ::SendMessageW(window_, message, wParam, lParam);
    }

private:
    static LRESULT CALLBACK WindowProcedure(HWND window, UINT message, WPARAM wParam,
                                            LPARAM lParam);

    HWND window_ = nullptr;
};
