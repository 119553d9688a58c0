// ShellViewContext: what the view's list, menus and commands share: the folder shown, the browser
// that shows it, the view window, the view mode and the sort order. The view owns the one copy and
// hands it to its parts by reference, so nothing is kept in step by hand.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include "namespace/pidl_manager.h"
#include "view/shell_view_folder.h"

// The order of the last column click. Each view has its own: two views of the folder sort
// independently. (The column widths of "Display Settings" are the process's, as stored.)
struct ViewSortOrder {
    int column = 1;     // 1-based
    int direction = 1;  // +1 ascending, -1 descending
};

struct ShellViewContext {
    explicit ShellViewContext(IShellView& shellView) noexcept : view(shellView) {}
    ShellViewContext(const ShellViewContext&) = delete;
    ShellViewContext& operator=(const ShellViewContext&) = delete;

    bool InFileDialog() const noexcept { return dialogBrowser != nullptr; }

    // The view itself, as the browser knows it: opening an item keeps it alive across the
    // browse, a file dialog is told of its default command, the drop target asks it for items.
    IShellView& view;
    // Set once, before the view window exists.
    ShellViewFolder folder;
    UniqueRelativePidl ownIdentifier;  // the folder's own: its last item names it
    // Set by CreateViewWindow.
    Microsoft::WRL::ComPtr<IShellBrowser> browser;
    // Offered by a file dialog's browser (and by Explorer's, which then says "Select").
    Microsoft::WRL::ComPtr<ICommDlgBrowser> dialogBrowser;
    UINT folderFlags = 0;  // as the browser gave them
    UINT viewMode = FVM_ICON;
    // From the view window's first message to its last; null otherwise.
    HWND window = nullptr;
    ViewSortOrder sort;
};
