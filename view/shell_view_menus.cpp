// The view's activation: its items merged into the browser's File, Edit and View menus, the
// list's pop-up menu, and the status text.
#include "view/shell_view_menus.h"

#include <shlwapi.h>

#include <algorithm>

#include "res/ids_download.h"
#include "res/ids_view.h"
#include "support/error_handling.h"
#include "support/text_lookup.h"

namespace {

// The browser's own separator in its View menu, in front of which the view modes go.
constexpr UINT kViewOptionsSeparator = FCIDM_MENU_VIEW_SEP_OPTIONS;

HMENU SubMenuOf(HMENU menu, UINT popupId) noexcept {
    MENUITEMINFOW info{};
    info.cbSize = sizeof info;
    info.fMask = MIIM_SUBMENU;
    if (!::GetMenuItemInfoW(menu, popupId, FALSE, &info))
        return nullptr;
    return info.hSubMenu;
}

// Inserts a group before position (by index), or at the end with position -1.
void InsertGroup(HMENU menu, UINT position, bool byPosition,
                 const std::vector<MenuItem>& group) {
    for (const MenuItem& item : group) {
        MENUITEMINFOW info{};
        info.cbSize = sizeof info;
        std::wstring text;
        if (item.command == 0) {
            info.fMask = MIIM_FTYPE;
            info.fType = MFT_SEPARATOR;
        } else {
            text = LoadUiText(item.textId);
            info.fMask = MIIM_ID | MIIM_STRING | MIIM_STATE | MIIM_FTYPE;
            info.wID = item.command;
            info.dwTypeData = text.data();
            info.fType = item.checked ? MFT_RADIOCHECK : MFT_STRING;
            info.fState = (item.enabled ? MFS_ENABLED : MFS_GRAYED) |
                          (item.isDefault ? MFS_DEFAULT : 0u) | (item.checked ? MFS_CHECKED : 0u);
        }
        // A refused item leaves the others: a menu with one item missing still works.
        if (::InsertMenuItemW(menu, position, byPosition, &info) && byPosition &&
            position != static_cast<UINT>(-1))
            ++position;
    }
}

}  // namespace

MenuContext CShellViewMenus::CurrentMenuContext() const {
    MenuContext context;
    context.folderKind = context_.folder.kind;
    context.inFileDialog = context_.InFileDialog();
    context.viewMode = context_.viewMode;
    for (const CShellViewList::SelectedItem& selected : list_.Selection()) {
        context.hasSelection = true;
        if (!selected.item)
            context.selectionHasEntry = true;
    }
    return context;
}

void CShellViewMenus::SetActivation(ViewActivation state) {
    if (state == activation_)
        return;
    RemoveMenus();
    activation_ = state;
    if (state == ViewActivation::Deactivated)
        return;
    BuildMenus();
    ShowStatusText();
}

void CShellViewMenus::RemoveMenus() noexcept {
    const Microsoft::WRL::ComPtr<IShellBrowser>& browser = context_.browser;
    if (!menu_ || !browser)
        return;
    // Wine's browsers implement neither call; Explorer's do. Either way the menu goes.
    (void)browser->SetMenuSB(nullptr, nullptr, nullptr);
    (void)browser->RemoveMenusSB(menu_.get());
    menu_.reset();
}

void CShellViewMenus::BuildMenus() {
    RemoveMenus();
    const Microsoft::WRL::ComPtr<IShellBrowser>& browser = context_.browser;
    if (activation_ == ViewActivation::Deactivated || !browser)
        return;
    UniqueMenu menu(::CreateMenu());
    if (!menu)
        return;
    OLEMENUGROUPWIDTHS widths{};
    // A browser without menus (as Wine's are) leaves the view working from its keyboard and
    // its pop-up menu.
    if (FAILED(browser->InsertMenusSB(menu.get(), &widths)))
        return;
    const MenuContext context = CurrentMenuContext();
    if (const HMENU file = SubMenuOf(menu.get(), FCIDM_MENU_FILE)) {
        const std::vector<MenuItem> group = FileMenuGroup(context);
        InsertGroup(file, 0, true, group);
        // The browser's own items (Close) follow, set apart.
        if (::GetMenuItemCount(file) > static_cast<int>(group.size()))
            InsertGroup(file, static_cast<UINT>(group.size()), true, {MenuItem{}});
    }
    if (const HMENU view = SubMenuOf(menu.get(), FCIDM_MENU_VIEW)) {
        // In front of the browser's options separator; at the end if it has none.
        std::vector<MenuItem> group = ViewMenuGroup(context);
        if (::GetMenuState(view, kViewOptionsSeparator, MF_BYCOMMAND) != static_cast<UINT>(-1))
            InsertGroup(view, kViewOptionsSeparator, false, group);
        else
            InsertGroup(view, static_cast<UINT>(-1), true, group);
    }
    if (activation_ == ViewActivation::ActiveWithFocus) {
        if (const HMENU edit = SubMenuOf(menu.get(), FCIDM_MENU_EDIT)) {
            while (::GetMenuItemCount(edit) > 0)
                ::DeleteMenu(edit, 0, MF_BYPOSITION);
            InsertGroup(edit, static_cast<UINT>(-1), true, EditMenuGroup(context));
        }
    }
    // The menu is the browser's to show from here; it stays ours to remove and destroy.
    if (FAILED(browser->SetMenuSB(menu.get(), nullptr, context_.window))) {
        (void)browser->RemoveMenusSB(menu.get());
        return;
    }
    menu_ = std::move(menu);
}

void CShellViewMenus::UpdateMenuStates() noexcept {
    if (!menu_)
        return;
    try {
        const MenuContext context = CurrentMenuContext();
        for (const auto& group :
             {FileMenuGroup(context), ViewMenuGroup(context), EditMenuGroup(context)}) {
            for (const MenuItem& item : group) {
                if (item.command != 0)
                    ::EnableMenuItem(menu_.get(), item.command,
                                     MF_BYCOMMAND | (item.enabled ? MF_ENABLED : MF_GRAYED));
            }
        }
        const UINT checked = CommandOfViewMode(context_.viewMode);
        ::CheckMenuRadioItem(menu_.get(), IDM_LARGE_ICONS, IDM_DETAILS, checked, MF_BYCOMMAND);
    }
    CATCH_LOG()
}

void CShellViewMenus::ShowStatusText() {
    const Microsoft::WRL::ComPtr<IShellBrowser>& browser = context_.browser;
    if (!browser)
        return;
    // One part over the whole bar, "Quorvel Digital Levels: " and the folder's name, 260
    // characters at most.
    std::wstring text = LoadUiText(IDS_DIGITAL_LEVELS) + L": ";
    STRRET name{};
    PCUITEMID_CHILD own = manager_.GetLastItem(context_.ownIdentifier.get());
    wchar_t folderName[MAX_PATH] = {};
    if (SUCCEEDED(context_.folder.folder->GetDisplayNameOf(own, SHGDN_NORMAL, &name)))
        (void)::StrRetToBufW(&name, own, folderName, ARRAYSIZE(folderName));
    text += folderName;
    if (text.size() >= MAX_PATH)
        text.resize(MAX_PATH - 1);
    int partEdge = -1;
    LRESULT ignored = 0;
    // A browser without a status bar shows nothing, and nothing else depends on it.
    (void)browser->SendControlMsg(FCW_STATUS, SB_SETPARTS, 1, reinterpret_cast<LPARAM>(&partEdge),
                                  &ignored);
    (void)browser->SendControlMsg(FCW_STATUS, SB_SETTEXTW, 0,
                                  reinterpret_cast<LPARAM>(text.c_str()), &ignored);
}

void CShellViewMenus::ShowPopupMenu(POINT position) {
    UniqueMenu popup(::CreatePopupMenu());
    if (!popup)
        return;
    const MenuContext context = CurrentMenuContext();
    InsertGroup(popup.get(), static_cast<UINT>(-1), true, FileMenuGroup(context));
    if (!context.hasSelection)
        InsertGroup(popup.get(), static_cast<UINT>(-1), true, ViewMenuGroup(context));
    InsertGroup(popup.get(), static_cast<UINT>(-1), true, EditMenuGroup(context));
    if (position.x == -1 && position.y == -1) {
        // From the keyboard: at the focused item, or at the list's corner.
        RECT area{};
        const int focused = static_cast<int>(list_.Send(LVM_GETNEXTITEM, static_cast<WPARAM>(-1),
                                                        LVNI_FOCUSED | LVNI_SELECTED));
        area.left = LVIR_ICON;
        if (focused < 0 ||
            !list_.Send(LVM_GETITEMRECT, focused, reinterpret_cast<LPARAM>(&area)))
            area = RECT{};
        position = POINT{area.left, area.bottom};
        ::ClientToScreen(list_.Window(), &position);
    }
    // The chosen item comes back as WM_COMMAND to the view window.
    ::TrackPopupMenu(popup.get(), TPM_RIGHTBUTTON, position.x, position.y, 0, context_.window,
                     nullptr);
}
