// CShellViewMenus: the view's items in the browser's menus and in its pop-up menu, their enabled
// states, and the status text, following the view's activation.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include "namespace/pidl_manager.h"
#include "support/unique_resource.h"
#include "view/portable/menu_rules.h"
#include "view/shell_view_context.h"
#include "view/shell_view_list.h"

enum class ViewActivation { Deactivated, ActiveWithoutFocus, ActiveWithFocus };

class CShellViewMenus {
public:
    // The menus' states follow the list's selection and the view mode; they show in the
    // context's browser and send their commands to its view window. Both are only kept here.
    CShellViewMenus(ShellViewContext& context, const CShellViewList& list) noexcept
        : context_(context), list_(list) {}
    CShellViewMenus(const CShellViewMenus&) = delete;
    CShellViewMenus& operator=(const CShellViewMenus&) = delete;

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

    ShellViewContext& context_;
    const CShellViewList& list_;
    CPidlMgr manager_;
    ViewActivation activation_ = ViewActivation::Deactivated;
    UniqueMenu menu_;
};
