// FakeView: a view of the test's own that merges its menus and writes the status bar on
// activation as a folder view does, and records what reaches its window.
#pragma once

#include <windows.h>
#include <commctrl.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <vector>

#include "support/com_object.h"
#include "support/unique_resource.h"

constexpr UINT kViewCommand = 0x100;  // the item the view puts into the browser's File popup

inline LRESULT CALLBACK RecordCommands(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
    auto* commands =
        reinterpret_cast<std::vector<UINT>*>(::GetWindowLongPtrW(window, GWLP_USERDATA));
    if (message == WM_COMMAND && commands)
        commands->push_back(LOWORD(wParam));
    return ::DefWindowProcW(window, message, wParam, lParam);
}

class FakeView final : public ComObject<IShellView> {
public:
    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {
            QITABENT(FakeView, IShellView), QITABENTMULTI(FakeView, IOleWindow, IShellView), {}};
        return QISearch(this, table, iid, object);
    }
    IFACEMETHODIMP GetWindow(HWND* window) override {
        *window = window_.get();
        return S_OK;
    }
    IFACEMETHODIMP ContextSensitiveHelp(BOOL) override { return E_NOTIMPL; }
    IFACEMETHODIMP TranslateAccelerator(MSG* message) override {
        return message->message == WM_KEYDOWN && message->wParam == keyTaken ? S_OK : S_FALSE;
    }
    IFACEMETHODIMP EnableModeless(BOOL) override { return E_NOTIMPL; }
    IFACEMETHODIMP UIActivate(UINT newState) override {
        if (newState == state)
            return S_OK;
        if (menu) {
            browser_->SetMenuSB(nullptr, nullptr, nullptr);
            browser_->RemoveMenusSB(menu);
            ::DestroyMenu(menu);
            menu = nullptr;
        }
        state = newState;
        if (state == SVUIA_DEACTIVATE)
            return S_OK;
        menu = ::CreateMenu();
        browser_->InsertMenusSB(menu, &widths);
        MENUITEMINFOW file{};
        file.cbSize = sizeof(file);
        file.fMask = MIIM_SUBMENU;
        if (::GetMenuItemInfoW(menu, FCIDM_MENU_FILE, FALSE, &file))
            ::InsertMenuW(file.hSubMenu, 0, MF_BYPOSITION | MF_STRING, kViewCommand, L"View item");
        browser_->SetMenuSB(menu, nullptr, window_.get());
        LRESULT result = 0;
        browser_->SendControlMsg(FCW_STATUS, SB_SETTEXTW, 0,
                                 reinterpret_cast<LPARAM>(L"Fake status"), &result);
        return S_OK;
    }
    IFACEMETHODIMP Refresh() override {
        ++refreshes;
        return S_OK;
    }
    IFACEMETHODIMP CreateViewWindow(IShellView*, LPCFOLDERSETTINGS, IShellBrowser* browser,
                                    RECT* area, HWND* window) override {
        static const WNDCLASSW viewClass{
            0,       RecordCommands, 0,       0,       ::GetModuleHandleW(nullptr),
            nullptr, nullptr,        nullptr, nullptr, L"FakeShellView"};
        static const ATOM registered = ::RegisterClassW(&viewClass);
        HWND parent = nullptr;
        browser->GetWindow(&parent);
        window_.reset(::CreateWindowExW(
            0, MAKEINTATOM(registered), nullptr, WS_CHILD | WS_VISIBLE, area->left, area->top,
            area->right - area->left, area->bottom - area->top, parent, nullptr, nullptr, nullptr));
        ::SetWindowLongPtrW(window_.get(), GWLP_USERDATA, reinterpret_cast<LONG_PTR>(&commands));
        browser_ = browser;
        *window = window_.get();
        return window_ ? S_OK : E_FAIL;
    }
    IFACEMETHODIMP DestroyViewWindow() override {
        UIActivate(SVUIA_DEACTIVATE);
        window_.reset();
        browser_.Reset();
        return S_OK;
    }
    IFACEMETHODIMP GetCurrentInfo(LPFOLDERSETTINGS) override { return E_NOTIMPL; }
    IFACEMETHODIMP AddPropertySheetPages(DWORD, LPFNSVADDPROPSHEETPAGE, LPARAM) override {
        return E_NOTIMPL;
    }
    IFACEMETHODIMP SaveViewState() override { return S_OK; }
    IFACEMETHODIMP SelectItem(PCUITEMID_CHILD, SVSIF) override { return E_NOTIMPL; }
    IFACEMETHODIMP GetItemObject(UINT, REFIID, void**) override { return E_NOTIMPL; }

    UINT state = SVUIA_DEACTIVATE;
    HMENU menu = nullptr;  // the shared menu while active
    OLEMENUGROUPWIDTHS widths{};
    std::vector<UINT> commands;
    int refreshes = 0;
    WPARAM keyTaken = 0;  // the key its TranslateAccelerator answers S_OK for

private:
    UniqueWindow window_;
    Microsoft::WRL::ComPtr<IShellBrowser> browser_;
};
