// CShellViewMenus: the view's items in the browser's menus and in its pop-up menu, their enabled
// states, and the status text, following the view's activation.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include "namespace/pidl_manager.h"
#include "support/unique_resource.h"
#include "view/portable/menu_rules.h"
#include "view/shell_view_folder.h"
#include "view/shell_view_list.h"

enum class ViewActivation { Deactivated, ActiveWithoutFocus, ActiveWithFocus };

class CShellViewMenus {
public:
    // The menus' states follow the list's selection and view mode.
    explicit CShellViewMenus(const CShellViewList& list) noexcept : list_(list) {}
    CShellViewMenus(const CShellViewMenus&) = delete;
    CShellViewMenus& operator=(const CShellViewMenus&) = delete;

    // The folder, and its own identifier, whose last item names the folder in the status text.
    [[nodiscard]] HRESULT SetUp(const ShellViewFolder& folder, PCUIDLIST_RELATIVE own) noexcept;
    // The browser whose menus and status bar show the view's; inFileDialog when it offered its
    // common-dialog interface.
    void SetBrowser(IShellBrowser* browser, bool inFileDialog) noexcept;
    // The view window, which receives the menus' commands; null once it is gone.
    void SetViewWindow(HWND view) noexcept { view_ = view; }

    ViewActivation Activation() const noexcept { return activation_; }
    // Merges the menus and shows the status text for an active view; removes them otherwise.
    void SetActivation(ViewActivation state);
    void RemoveMenus() noexcept;
    // Merges the menus anew (after a change of view mode, so that the radio mark moves).
    void BuildMenus();
    // Enabled states and radio mark of the merged items, after the selection changed.
    void UpdateMenuStates() noexcept;
    // At a screen position, or at the focused item for (-1, -1) (from the keyboard).
    void ShowPopupMenu(POINT screenPosition);

private:
    void ShowStatusText();
    MenuContext CurrentMenuContext() const;

    const CShellViewList& list_;
    CPidlMgr manager_;
    ShellViewFolder folder_;
    UniqueRelativePidl ownIdentifier_;
    Microsoft::WRL::ComPtr<IShellBrowser> browser_;
    bool inFileDialog_ = false;
    HWND view_ = nullptr;
    ViewActivation activation_ = ViewActivation::Deactivated;
    UniqueMenu menu_;
};
