// The browser's own menus: its menu bar, the File/Edit/View popups it lends to a view's shared
// menu, the keyboard shortcuts of its own commands, and their command ids.
#pragma once

#include <windows.h>
#include <shlobj.h>

#include <array>

#include "support/unique_resource.h"

// The browser's commands: inside the browser's range and clear of the view's (0..0x7FFF), of the
// shell's popup ids (0x8000..) and of the toolbar ids a view uses in a file dialog (0xA001..).
enum BrowserCommand : UINT {
    kCommandClose = FCIDM_BROWSERFIRST + 0x100,
    kCommandBack,
    kCommandUp,
    kCommandRefresh,
};

bool IsBrowserCommand(UINT id) noexcept;

// File, Edit and View, in menu-bar order. A view empties and refills them as it likes, so each
// insertion gets a fresh set.
using BrowserPopups = std::array<UniqueMenu, 3>;

[[nodiscard]] HRESULT CreateBrowserPopups(BrowserPopups& popups) noexcept;

// The frame's own menu bar, with a set of popups that it owns.
[[nodiscard]] HRESULT CreateBrowserMenuBar(UniqueMenu& bar) noexcept;

// Puts the popups in front of whatever the shared menu holds, each item carrying its popup's
// shell id (FCIDM_MENU_FILE, _EDIT, _VIEW) so that a view finds it by command, and fills the
// browser's groups of the widths (File and Edit, then View). All or nothing.
[[nodiscard]] HRESULT InsertBrowserPopups(HMENU shared, const BrowserPopups& popups,
                                          OLEMENUGROUPWIDTHS* widths) noexcept;

// Takes the popups out of the shared menu without destroying them; true when any was there.
bool RemoveBrowserPopups(HMENU shared, const BrowserPopups& popups) noexcept;

// F5 refreshes, Alt+Left goes back, Backspace goes up.
[[nodiscard]] HRESULT CreateBrowserAccelerators(UniqueAccelerators& table) noexcept;
