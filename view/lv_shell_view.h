// CLVShellView: the folder's own view in a shell browser: a list of the folder's items, its
// commands in the browser's menus, its status text, and every view of the same kind kept in step.
#pragma once

#include <windows.h>
#include <commctrl.h>
#include <docobj.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <string>
#include <vector>

#include "namespace/pidl_manager.h"
#include "support/com_object.h"
#include "support/unique_resource.h"
#include "view/portable/menu_rules.h"
#include "view/shell_view_list_window.h"
#include "view/view_notify_window.h"

class CLVDataObject;

enum class ViewActivation { Deactivated, ActiveWithoutFocus, ActiveWithFocus };

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
    LRESULT HandleMessage(UINT message, WPARAM wParam, LPARAM lParam);
    LRESULT OnNotify(const NMHDR& header);
    // A key pressed in the list that no browser translated (Wine's never call
    // TranslateAccelerator).
    void OnListKeyDown(WORD key);

    // Activation, menus and status text (shell_view_menus.cpp).
    void SetActivation(ViewActivation state);
    void RemoveMenus() noexcept;
    void BuildMenus();
    // Enabled states and radio mark of the merged items, after the selection changed.
    void UpdateMenuStates() noexcept;
    void ShowStatusText();
    void ShowPopupMenu(POINT screenPosition);
    MenuContext CurrentMenuContext() const;

    // The list (shell_view_list.cpp).
    bool CreateList();
    void ApplyViewModeStyle() noexcept;
    void ResetColumnsAndImages();
    void StartFill();
    void OnEnumeratorReady(IEnumIDList* enumerator);
    void Sort(int columnArgument);
    void OnColumnClick(int column);
    void ReadColumnWidths() noexcept;
    void OnGetDisplayInfo(NMLVDISPINFOW& info);
    void StopFillThreads() noexcept;
    static DWORD WINAPI FillThread(void* parameter);

    // Commands (shell_view_commands.cpp).
    void OnCommand(UINT command);
    void AddStation();
    void OpenSelection();
    void DeleteSelection();
    void EditSelectedStations();
    void CopySelection();
    void PasteStations();
    void SetViewMode(UINT mode);
    void BeginDrag();
    void ChangedStations();

    // The list's items: index and identifier (null for the entry) of each selected one, in list
    // order.
    struct SelectedItem {
        int index;
        PCUITEMID_CHILD item;
    };
    std::vector<SelectedItem> Selection() const;
    // The selected items with an identifier, added to the data object by their full identifiers;
    // S_FALSE when the selection held none.
    HRESULT AddSelectedItems(CLVDataObject& dataObject,
                             const std::vector<SelectedItem>& selection) const;
    // Items' internal full identifiers: the folder's path, then the item.
    LPITEMIDLIST CreateFullItem(PCUITEMID_CHILD item) const;
    bool IsTopFolder() const noexcept;

    CPidlMgr manager_;
    Microsoft::WRL::ComPtr<IShellFolder> folder_;
    UniquePidl ownIdentifier_;
    DWORD folderKind_ = 0;
    std::wstring folderPath_;  // "Quorvel Digital Level", then "\" and the station for a station

    Microsoft::WRL::ComPtr<IShellBrowser> browser_;
    Microsoft::WRL::ComPtr<ICommDlgBrowser> dialogBrowser_;
    FOLDERSETTINGS settings_{FVM_ICON, 0};
    HWND parent_ = nullptr;
    HWND window_ = nullptr;
    CShellViewListWindow list_;
    bool dropTargetRegistered_ = false;
    UniqueWindow animation_;
    CViewNotifyWindow notifyWindow_;
    UniqueAccelerators accelerators_;
    // The last key that TranslateAccelerator turned into a command: when the browser goes on to
    // dispatch that same message, the list must not turn it into a command again.
    WPARAM translatedKey_ = 0;
    LONG translatedKeyTime_ = 0;
    ViewActivation activation_ = ViewActivation::Deactivated;
    UniqueMenu menu_;
    std::vector<UniqueHandle> fillThreads_;
};
