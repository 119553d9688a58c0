// CShellViewCommands: what the user asks of the view: add, open, delete, edit, copy and paste
// stations, the view modes, the drag of a station's file, and the keys that ask for them.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <optional>
#include <vector>

#include "namespace/pidl_manager.h"
#include "stations/portable/pasted_stations.h"
#include "support/unique_resource.h"
#include "view/shell_view_context.h"
#include "view/shell_view_list.h"
#include "view/shell_view_menus.h"

class CLVDataObject;

class CShellViewCommands {
public:
    // The commands act on the list's selection; a new view mode is shown by the list and
    // marked in the menus. The context's view window owns the sheets and receives the keys'
    // commands. All three are only kept here.
    CShellViewCommands(ShellViewContext& context, CShellViewList& list,
                       CShellViewMenus& menus) noexcept
        : context_(context), list_(list), menus_(menus) {}
    CShellViewCommands(const CShellViewCommands&) = delete;
    CShellViewCommands& operator=(const CShellViewCommands&) = delete;

    void LoadAccelerators() noexcept;
    void UnloadAccelerators() noexcept { accelerators_.reset(); }

    // A key the browser hands the view before dispatching it.
    void TranslateAccelerator(MSG& message) noexcept;
    // A key pressed in the list that no browser translated (Wine's never call
    // TranslateAccelerator).
    void OnListKeyDown(WORD key);

    // A menu item, accelerator or IOleCommandTarget::Exec command.
    void OnCommand(UINT command);
    void OpenSelection();
    void BeginDrag();

private:
    using SelectedItem = CShellViewList::SelectedItem;

    void AddStation();
    void DeleteSelection();
    void EditSelectedStations();
    void CopySelection();
    void PasteStations();
    // Stores the block's stations under their pasted names on a worker, answering messages
    // meanwhile; a refusal (nothing stored) comes back for the caller to show.
    [[nodiscard]] std::optional<PasteRefused> PasteParsedStations(std::vector<Station> stations);
    void SetViewMode(UINT mode);
    // Shows the stored stations in this view and in every view of the same kind.
    void ChangedStations();
    // The selected items with an identifier, added to the data object by their full identifiers;
    // S_FALSE when the selection held none.
    [[nodiscard]] HRESULT AddSelectedItems(
        CLVDataObject& dataObject, const std::vector<SelectedItem>& selection) const noexcept;
    // Items' internal full identifiers: the folder's path, then the item.
    [[nodiscard]] UniqueRelativePidl CreateFullItem(PCUITEMID_CHILD item) const;

    ShellViewContext& context_;
    CShellViewList& list_;
    CShellViewMenus& menus_;
    CPidlMgr manager_;
    UniqueAccelerators accelerators_;
    // The last key that TranslateAccelerator turned into a command: when the browser goes on to
    // dispatch that same message, the list must not turn it into a command again.
    WPARAM translatedKey_ = 0;
    LONG translatedKeyTime_ = 0;
    // A paste is storing its stations: commands sent meanwhile from elsewhere are not run.
    bool pasting_ = false;
};
