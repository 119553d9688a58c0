// CShellViewList: the view's list of the folder's items: filled on a worker thread, sorted, with
// the columns, texts and images of the view mode.
#pragma once

#include <windows.h>
#include <commctrl.h>
#include <shlobj.h>

#include <vector>

#include "namespace/pidl_manager.h"
#include "support/unique_resource.h"
#include "view/shell_view_context.h"
#include "view/shell_view_list_window.h"

// Posted to the view window after a column's width was dragged; the view hands it back to
// ReadColumnWidths.
inline constexpr UINT kReadColumnWidthsMessage = WM_APP + 1;

class CShellViewList {
public:
    // A selected item's index and identifier (null for the entry that adds a station).
    struct SelectedItem {
        int index;
        PCUITEMID_CHILD item;
    };

    // Only kept: the context is read from the calls on.
    explicit CShellViewList(ShellViewContext& context) noexcept : context_(context) {}
    CShellViewList(const CShellViewList&) = delete;
    CShellViewList& operator=(const CShellViewList&) = delete;
    ~CShellViewList() { Destroy(); }

    // Creates the control in the view window (in the chosen view mode) and registers its drop
    // target, which holds the view until the control is destroyed; false when the control could
    // not be made.
    [[nodiscard]] bool Create();
    // Waits for the fills, revokes the drop target, destroys the control and the animation.
    void Destroy() noexcept;

    HWND Window() const noexcept { return list_.Window(); }
    LRESULT Send(UINT message, WPARAM wParam = 0, LPARAM lParam = 0) const noexcept {
        return list_.Send(message, wParam, lParam);
    }
    void Resize(int width, int height) noexcept;

    // Recorded in the context before the control exists; afterwards the control's style, columns
    // and images follow.
    void SetViewMode(UINT mode);
    // The user's click settings (one click or two) may have changed.
    void ApplyViewModeStyle() noexcept;

    // Empties the list and starts a fill; E_FAIL without a control.
    [[nodiscard]] HRESULT Refresh() noexcept;
    // Starts a fill on a thread of its own, with the animation over the list until it ends.
    void StartFill();
    // The fill thread's result (the posted reference, null after a failed enumeration).
    void OnEnumeratorReady(IEnumIDList* enumerator);
    // Waits for every fill thread and releases what they posted that was not taken.
    void StopFill() noexcept;

    // The list's notifications that concern the list alone.
    void OnGetDisplayInfo(NMLVDISPINFOW& info);
    void OnDeleteItem(const NMLISTVIEW& item) noexcept;
    void OnColumnClick(int column);
    void OnHeaderEndTrack() noexcept;
    void ReadColumnWidths() noexcept;

    // In list order.
    std::vector<SelectedItem> Selection() const;

private:
    void ResetColumnsAndImages();
    void Sort(int columnArgument);

    ShellViewContext& context_;
    CPidlMgr manager_;
    CShellViewListWindow list_;
    bool dropTargetRegistered_ = false;
    UniqueWindow animation_;
    std::vector<UniqueHandle> fillThreads_;
};
