// The browser's own menus and keyboard shortcuts.
#include "tools/lvexplore/browser_menus.h"

#include "support/error_handling.h"

namespace {

struct PopupEntry {
    UINT id;
    const wchar_t* text;
};
constexpr PopupEntry kPopups[] = {
    {FCIDM_MENU_FILE, L"&File"}, {FCIDM_MENU_EDIT, L"&Edit"}, {FCIDM_MENU_VIEW, L"&View"}};
static_assert(std::size(kPopups) == std::tuple_size_v<BrowserPopups>);

HRESULT AppendCommand(HMENU popup, UINT id, const wchar_t* text) noexcept {
    RETURN_IF_WIN32_BOOL_FALSE(::AppendMenuW(popup, MF_STRING, id, text));
    return S_OK;
}

// A separator with an id: the view finds the browser's options group by it and puts its own
// items in front of it.
HRESULT AppendSeparator(HMENU popup, UINT id) noexcept {
    MENUITEMINFOW item{};
    item.cbSize = sizeof(item);
    item.fMask = MIIM_FTYPE | MIIM_ID;
    item.fType = MFT_SEPARATOR;
    item.wID = id;
    RETURN_IF_WIN32_BOOL_FALSE(::InsertMenuItemW(popup, ::GetMenuItemCount(popup), TRUE, &item));
    return S_OK;
}

HRESULT InsertPopup(HMENU bar, UINT position, HMENU popup, const PopupEntry& entry) noexcept {
    MENUITEMINFOW item{};
    item.cbSize = sizeof(item);
    item.fMask = MIIM_STRING | MIIM_SUBMENU | MIIM_ID;
    item.wID = entry.id;
    item.hSubMenu = popup;
    item.dwTypeData = const_cast<wchar_t*>(entry.text);
    RETURN_IF_WIN32_BOOL_FALSE(::InsertMenuItemW(bar, position, TRUE, &item));
    return S_OK;
}

}  // namespace

bool IsBrowserCommand(UINT id) noexcept {
    return id >= kCommandClose && id <= kCommandRefresh;
}

HRESULT CreateBrowserPopups(BrowserPopups& popups) noexcept {
    for (UniqueMenu& popup : popups) {
        popup.reset(::CreatePopupMenu());
        RETURN_IF_WIN32_BOOL_FALSE(popup);
    }
    RETURN_IF_FAILED(AppendCommand(popups[0].get(), kCommandClose, L"&Close"));
    // Edit stays empty: its items are the view's.
    HMENU view = popups[2].get();
    RETURN_IF_FAILED(AppendSeparator(view, FCIDM_MENU_VIEW_SEP_OPTIONS));
    RETURN_IF_FAILED(AppendCommand(view, kCommandBack, L"Go &Back\tAlt+Left"));
    RETURN_IF_FAILED(AppendCommand(view, kCommandUp, L"Go &Up\tBackspace"));
    RETURN_IF_FAILED(AppendCommand(view, kCommandRefresh, L"&Refresh\tF5"));
    return S_OK;
}

HRESULT CreateBrowserMenuBar(UniqueMenu& bar) noexcept {
    UniqueMenu made(::CreateMenu());
    RETURN_IF_WIN32_BOOL_FALSE(made);
    BrowserPopups popups;
    RETURN_IF_FAILED(CreateBrowserPopups(popups));
    for (UINT index = 0; index < popups.size(); ++index) {
        RETURN_IF_FAILED(InsertPopup(made.get(), index, popups[index].get(), kPopups[index]));
        (void)popups[index].release();  // destroyed with the bar from now on
    }
    bar = std::move(made);
    return S_OK;
}

HRESULT InsertBrowserPopups(HMENU shared, const BrowserPopups& popups,
                            OLEMENUGROUPWIDTHS* widths) noexcept {
    for (UINT index = 0; index < popups.size(); ++index) {
        const HRESULT result = InsertPopup(shared, index, popups[index].get(), kPopups[index]);
        if (FAILED(result)) {
            RemoveBrowserPopups(shared, popups);
            return result;
        }
    }
    if (widths) {
        // The container's groups only (OLE's even slots); the odd ones are the view's.
        widths->width[0] = 2;
        widths->width[2] = 1;
        widths->width[4] = 0;
    }
    return S_OK;
}

bool RemoveBrowserPopups(HMENU shared, const BrowserPopups& popups) noexcept {
    bool removed = false;
    for (const UniqueMenu& popup : popups) {
        for (int position = ::GetMenuItemCount(shared) - 1; position >= 0; --position) {
            if (popup && ::GetSubMenu(shared, position) == popup.get()) {
                // RemoveMenu, not DeleteMenu: the popup stays the browser's.
                removed = ::RemoveMenu(shared, position, MF_BYPOSITION) || removed;
            }
        }
    }
    return removed;
}

HRESULT CreateBrowserAccelerators(UniqueAccelerators& table) noexcept {
    ACCEL keys[] = {{FVIRTKEY, VK_F5, kCommandRefresh},
                    {FVIRTKEY | FALT, VK_LEFT, kCommandBack},
                    {FVIRTKEY, VK_BACK, kCommandUp}};
    table.reset(::CreateAcceleratorTableW(keys, static_cast<int>(std::size(keys))));
    RETURN_IF_WIN32_BOOL_FALSE(table);
    return S_OK;
}
