// CLVShellView: the folder's own view in a shell browser: its COM face and its window, which hands
// the list's notifications and the browser's keys and commands to the view's list, menus and
// commands, and keeps every view of the same kind in step.
#pragma once

#include <windows.h>
#include <commctrl.h>
#include <docobj.h>
#include <shlobj.h>
#include <wrl/client.h>

#include "support/com_object.h"
#include "support/unique_resource.h"
#include "view/shell_view_commands.h"
#include "view/shell_view_context.h"
#include "view/shell_view_list.h"
#include "view/shell_view_menus.h"
#include "view/view_notify_window.h"

class CLVShellView final : public ComObject<IShellView, IOleCommandTarget> {
public:
    CLVShellView() noexcept = default;
    ~CLVShellView() override;

    // The folder whose items the view shows, and the folder's own identifier (the top folder's
    // root item, or a station item): its kind decides what the view lists.
    [[nodiscard]] HRESULT SetUp(IShellFolder* folder, PCUIDLIST_RELATIVE own) noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;

    // IOleWindow
    IFACEMETHODIMP GetWindow(HWND* window) override;
    IFACEMETHODIMP ContextSensitiveHelp(BOOL) override { return E_NOTIMPL; }

    // IShellView
    IFACEMETHODIMP TranslateAccelerator(MSG* message) override;
    IFACEMETHODIMP EnableModeless(BOOL) override { return E_NOTIMPL; }
    IFACEMETHODIMP UIActivate(UINT state) override;
    IFACEMETHODIMP Refresh() override;
    IFACEMETHODIMP CreateViewWindow(IShellView* previous, LPCFOLDERSETTINGS settings,
                                    IShellBrowser* browser, RECT* area, HWND* window) override;
    IFACEMETHODIMP DestroyViewWindow() override;
    IFACEMETHODIMP GetCurrentInfo(LPFOLDERSETTINGS settings) override;
    IFACEMETHODIMP AddPropertySheetPages(DWORD, LPFNSVADDPROPSHEETPAGE, LPARAM) override {
        return E_NOTIMPL;
    }
    IFACEMETHODIMP SaveViewState() override { return S_OK; }
    IFACEMETHODIMP SelectItem(PCUITEMID_CHILD, SVSIF) override { return E_NOTIMPL; }
    IFACEMETHODIMP GetItemObject(UINT item, REFIID iid, void** object) override;

    // IOleCommandTarget
    IFACEMETHODIMP QueryStatus(const GUID* group, ULONG count, OLECMD* commands,
                               OLECMDTEXT* text) override;
    IFACEMETHODIMP Exec(const GUID* group, DWORD command, DWORD options, VARIANT* in,
                        VARIANT* out) override;

private:
    static LRESULT CALLBACK WindowProcedure(HWND window, UINT message, WPARAM wParam,
                                            LPARAM lParam);
    LRESULT HandleMessage(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
    LRESULT OnNotify(const NMHDR& header);
    // The view window, from its first message to its last; the parts that act through it are told.
    void SetViewWindow(HWND window) noexcept;
    // The view or its list got the focus: the browser must know which view to send its keys to.
    void ActivateWithFocus();

    // The one order that matters: the context comes first, as every part keeps a reference to it
    // and the list's destructor still reads it. The parts only keep their references to each
    // other when constructed and use them from the calls on, so their own order is free.
    ShellViewContext context_{*this};
    CShellViewList list_{context_};
    CShellViewMenus menus_{context_, list_};
    CShellViewCommands commands_{context_, list_, menus_};
    CViewNotifyWindow notifyWindow_;
    // Declared last: should the members go while the window is still there, it goes first.
    UniqueWindow window_;
};
