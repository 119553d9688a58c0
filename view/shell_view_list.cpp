// The view's list: its styles, columns and image lists for each view mode, its asynchronous fill,
// the texts and images it asks for, and its sorting.
#include "view/shell_view_list.h"

#include <shlwapi.h>

#include <memory>

#include "namespace/icon_lists.h"
#include "namespace/portable/item_id_layout.h"
#include "res/ids_stations.h"
#include "res/ids_view.h"
#include "stations/display_settings.h"
#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "view/lv_drop_target.h"

namespace {

// The fill thread only enumerates the registry; a megabyte is what it was always given.
constexpr SIZE_T kFillThreadStackSize = 1024 * 1024;

DWORD ListViewType(UINT mode) noexcept {
    switch (mode) {
        case FVM_SMALLICON:
            return LVS_SMALLICON;
        case FVM_LIST:
            return LVS_LIST;
        case FVM_DETAILS:
            return LVS_REPORT;
        default:
            return LVS_ICON;
    }
}

// One-click activation with hot tracking unless the user chose double-click or the classic shell.
DWORD ClickStyles() noexcept {
    using GetSettingsProcedure = void(WINAPI*)(SHELLFLAGSTATE*, DWORD);
    SHELLFLAGSTATE state{};
    // Windows' default is double-click. Wine's SHGetSettings leaves both fields as the caller set
    // them, so the default must be in place before the call.
    state.fDoubleClickInWebView = TRUE;
    if (const HMODULE shell = ::GetModuleHandleW(L"shell32.dll")) {
        const auto procedure = reinterpret_cast<GetSettingsProcedure>(
            reinterpret_cast<void*>(::GetProcAddress(shell, "SHGetSettings")));
        if (procedure)
            procedure(&state, SSF_DOUBLECLICKINWEBVIEW | SSF_WIN95CLASSIC);
    }
    if (state.fWin95Classic || state.fDoubleClickInWebView)
        return 0;
    return LVS_EX_TRACKSELECT | LVS_EX_ONECLICKACTIVATE | LVS_EX_UNDERLINEHOT;
}

struct FillRequest {
    Microsoft::WRL::ComPtr<IShellFolder> folder;
    HWND window;
};

// Runs on a thread of its own: enumerates the folder and posts the enumerator to the view window.
DWORD WINAPI FillThread(void* parameter) {
    std::unique_ptr<FillRequest> request(static_cast<FillRequest*>(parameter));
    const HRESULT apartment = ::CoInitializeEx(nullptr, COINIT_MULTITHREADED);
    IEnumIDList* enumerator = nullptr;
    if (FAILED(request->folder->EnumObjects(request->window, SHCONTF_FOLDERS | SHCONTF_NONFOLDERS,
                                            &enumerator)))
        enumerator = nullptr;
    // The window owns the enumerator once the message is posted; a window that is gone takes
    // nothing, and the enumerator is released here.
    if (!::PostMessageW(request->window, g_registeredMessages.getEnumIdList, 0,
                        reinterpret_cast<LPARAM>(enumerator)) &&
        enumerator)
        enumerator->Release();
    request.reset();
    if (SUCCEEDED(apartment))
        ::CoUninitialize();
    return 0;
}

// Each list item's data is the child identifier that the fill gave it and that the item owns;
// the entry's is null. Only these two turn one into the other.
LPARAM ItemData(PITEMID_CHILD item) noexcept {
    return reinterpret_cast<LPARAM>(item);
}
PITEMID_CHILD ItemOfData(LPARAM data) noexcept {
    return reinterpret_cast<PITEMID_CHILD>(data);
}

struct SortContext {
    IShellFolder* folder;
    LPARAM column;
};

int CALLBACK CompareItems(LPARAM first, LPARAM second, LPARAM context) {
    // The entry has no identifier and stays on top in either direction.
    if (!first || !second)
        return first ? 1 : (second ? -1 : 0);
    const auto& sort = *reinterpret_cast<const SortContext*>(context);
    // The folder answers with the order itself in the status value.
    return static_cast<int>(
        sort.folder->CompareIDs(sort.column, ItemOfData(first), ItemOfData(second)));
}

}  // namespace

bool CShellViewList::Create() {
    const HWND view = context_.window;
    // Clipping its siblings keeps the animation visible over the list while a fill runs.
    const DWORD style = WS_CHILD | WS_VISIBLE | WS_TABSTOP | WS_CLIPSIBLINGS | LVS_AUTOARRANGE |
                        LVS_SHAREIMAGELISTS | LVS_SHOWSELALWAYS | ListViewType(context_.viewMode);
    // No label editing: stations are renamed in their property sheet only.
    if (!view || !list_.Create(view, style, WS_EX_CLIENTEDGE, IDC_VIEW_LIST))
        return false;
    RECT area{};
    ::GetClientRect(view, &area);
    ::MoveWindow(list_.Window(), 0, 0, area.right, area.bottom, FALSE);
    ApplyViewModeStyle();
    ResetColumnsAndImages();
    // Files dropped on a station row or into a station's folder. Without OLE (a host that did not
    // initialise it) the view simply takes no drops.
    auto dropTarget = MakeComObject<CLVDropTargetOnListView>();
    const UniqueRelativePidl folder = manager_.CreatePidlFromPath(context_.folder.path.c_str());
    if (folder && SUCCEEDED(dropTarget->SetUp(list_.Window(), &context_.view, folder.get())))
        dropTargetRegistered_ = SUCCEEDED(::RegisterDragDrop(list_.Window(), dropTarget.Get()));
    return true;
}

void CShellViewList::Destroy() noexcept {
    StopFill();
    // The drop target holds the view: revoking it ends that cycle.
    if (dropTargetRegistered_)
        (void)::RevokeDragDrop(list_.Window());
    dropTargetRegistered_ = false;
    list_.Destroy();
    animation_.reset();
}

void CShellViewList::Resize(int width, int height) noexcept {
    ::MoveWindow(list_.Window(), 0, 0, width, height, TRUE);
}

void CShellViewList::SetViewMode(UINT mode) {
    context_.viewMode = mode;
    if (!list_.Window())
        return;
    ApplyViewModeStyle();
    ResetColumnsAndImages();
}

void CShellViewList::ApplyViewModeStyle() noexcept {
    const HWND list = list_.Window();
    if (!list)
        return;
    const LONG_PTR style = ::GetWindowLongPtrW(list, GWL_STYLE);
    ::SetWindowLongPtrW(
        list, GWL_STYLE,
        (style & ~static_cast<LONG_PTR>(LVS_TYPEMASK)) | ListViewType(context_.viewMode));
    constexpr DWORD kClickMask = LVS_EX_TRACKSELECT | LVS_EX_ONECLICKACTIVATE | LVS_EX_UNDERLINEHOT;
    list_.Send(LVM_SETEXTENDEDLISTVIEWSTYLE, kClickMask, ClickStyles());
}

void CShellViewList::ResetColumnsAndImages() {
    list_.Send(LVM_DELETEALLITEMS);
    while (list_.Send(LVM_DELETECOLUMN, 0)) {
    }
    if (context_.viewMode == FVM_DETAILS) {
        std::wstring name = LoadUiText(IDS_NAME_COLUMN);
        LVCOLUMNW column{};
        column.mask = LVCF_FMT | LVCF_TEXT | LVCF_WIDTH | LVCF_SUBITEM;
        column.fmt = LVCFMT_LEFT;
        column.cx = DisplayColumnWidth(0);
        column.pszText = name.data();
        list_.Send(LVM_INSERTCOLUMNW, 0, reinterpret_cast<LPARAM>(&column));
    }
    if (context_.viewMode == FVM_ICON)
        list_.Send(LVM_SETIMAGELIST, LVSIL_NORMAL, reinterpret_cast<LPARAM>(LargeIconList()));
    else
        list_.Send(LVM_SETIMAGELIST, LVSIL_SMALL, reinterpret_cast<LPARAM>(SmallIconList()));
}

HRESULT CShellViewList::Refresh() noexcept {
    if (!list_.Window())
        return E_FAIL;
    try {
        list_.Send(LVM_DELETEALLITEMS);
        StartFill();
        return S_OK;
    }
    CATCH_RETURN()
}

void CShellViewList::StartFill() {
    // A newer fill takes the animation over; the older thread's result is still taken.
    animation_.reset();
    const HWND view = context_.window;
    RECT area{};
    ::GetClientRect(view, &area);
    animation_.reset(::CreateWindowExW(
        0, ANIMATE_CLASSW, L"", WS_CHILD | WS_VISIBLE | ACS_CENTER | ACS_TRANSPARENT | ACS_AUTOPLAY,
        0, 0, area.right, area.bottom, view,
        reinterpret_cast<HMENU>(static_cast<UINT_PTR>(IDC_VIEW_ANIMATION)), ThisModule(), nullptr));
    if (animation_) {
        ::SetWindowPos(animation_.get(), HWND_TOP, 0, 0, 0, 0, SWP_NOMOVE | SWP_NOSIZE);
        // Without its video the fill still runs; there is just nothing to watch.
        ::SendMessageW(animation_.get(), ACM_OPENW, reinterpret_cast<WPARAM>(ThisModule()),
                       reinterpret_cast<LPARAM>(MAKEINTRESOURCEW(IDR_SEARCH_ANIMATION)));
    }

    auto request = std::make_unique<FillRequest>(FillRequest{context_.folder.folder, view});
    UniqueHandle thread(::CreateThread(nullptr, kFillThreadStackSize, &FillThread, request.get(),
                                       STACK_SIZE_PARAM_IS_A_RESERVATION, nullptr));
    if (!thread) {
        // The list stays empty until the next refresh, as it would after a failed enumeration.
        animation_.reset();
        return;
    }
    request.release();  // the thread's now
    fillThreads_.push_back(std::move(thread));
}

void CShellViewList::StopFill() noexcept {
    // Each thread ends after one enumeration of the registry and one post: waiting is short, and
    // it keeps the module's code in place until the last thread has left it.
    for (UniqueHandle& thread : fillThreads_)
        ::WaitForSingleObject(thread.get(), INFINITE);
    fillThreads_.clear();
    const HWND view = context_.window;
    if (!view)
        return;
    // Results posted to a window about to go would be lost with their enumerators.
    MSG message;
    const UINT ready = g_registeredMessages.getEnumIdList;
    while (ready && ::PeekMessageW(&message, view, ready, ready, PM_REMOVE)) {
        if (auto* enumerator = reinterpret_cast<IEnumIDList*>(message.lParam))
            enumerator->Release();
    }
}

void CShellViewList::OnEnumeratorReady(IEnumIDList* enumerator) {
    Microsoft::WRL::ComPtr<IEnumIDList> owned;
    *owned.GetAddressOf() = enumerator;  // the posted reference is ours now
    animation_.reset();
    // Finished threads need no more waiting for.
    std::erase_if(fillThreads_, [](const UniqueHandle& thread) {
        return ::WaitForSingleObject(thread.get(), 0) == WAIT_OBJECT_0;
    });
    const HCURSOR previousCursor = ::SetCursor(::LoadCursorW(nullptr, IDC_WAIT));
    list_.Send(WM_SETREDRAW, FALSE);
    // Each result shows the stations as they are now: a list from an older fill that arrives
    // late replaces what is shown instead of adding to it.
    list_.Send(LVM_DELETEALLITEMS);
    int index = 0;
    if (context_.folder.IsTopFolder()) {
        std::wstring entry = LoadUiText(IDS_ADD_NEW_DIGITAL_LEVEL);
        LVITEMW item{};
        item.mask = LVIF_TEXT | LVIF_IMAGE | LVIF_PARAM;
        item.iItem = index++;
        item.pszText = entry.data();
        item.iImage = 1;
        item.lParam = 0;
        list_.Send(LVM_INSERTITEMW, 0, reinterpret_cast<LPARAM>(&item));
    }
    if (owned) {
        PITEMID_CHILD next = nullptr;
        while (owned->Next(1, &next, nullptr) == S_OK) {
            UniqueChildPidl identifier(next);
            LVITEMW item{};
            item.mask = LVIF_TEXT | LVIF_IMAGE | LVIF_PARAM;
            item.iItem = index;
            item.pszText = LPSTR_TEXTCALLBACKW;
            item.iImage = I_IMAGECALLBACK;
            item.lParam = ItemData(identifier.get());
            if (list_.Send(LVM_INSERTITEMW, 0, reinterpret_cast<LPARAM>(&item)) >= 0) {
                (void)identifier.release();  // the list's item owns it; deleting it frees it
                ++index;
            }
        }
    }
    Sort(0);
    list_.Send(WM_SETREDRAW, TRUE);
    ::InvalidateRect(list_.Window(), nullptr, TRUE);
    ::SetCursor(previousCursor);
}

void CShellViewList::Sort(int columnArgument) {
    SortContext sort{context_.folder.folder.Get(), columnArgument};
    list_.Send(LVM_SORTITEMS, reinterpret_cast<WPARAM>(&sort),
               reinterpret_cast<LPARAM>(&CompareItems));
}

void CShellViewList::OnColumnClick(int column) {
    ViewSortOrder& order = context_.sort;
    if (column + 1 == order.column)
        order.direction = -order.direction;
    order.column = column + 1;
    Sort(order.direction * order.column);
}

void CShellViewList::OnHeaderEndTrack() noexcept {
    // The header applies the new width after this notification: read it back afterwards.
    ::PostMessageW(context_.window, kReadColumnWidthsMessage, 0, 0);
}

void CShellViewList::ReadColumnWidths() noexcept {
    // The list has one column; the second width is kept as the control reports it (0).
    int widths[kDisplayColumnCount] = {};
    for (size_t column = 0; column < kDisplayColumnCount; ++column)
        widths[column] = static_cast<int>(list_.Send(LVM_GETCOLUMNWIDTH, column));
    // Stored now, while the change is fresh: the library's unload runs under the loader lock,
    // where no registry call may be made. A failed write is in the error log and is made again
    // at the next change; the view goes on with the new widths either way.
    (void)StoreDisplayColumnWidths(widths);
}

void CShellViewList::OnGetDisplayInfo(NMLVDISPINFOW& info) {
    const PCUITEMID_CHILD item = ItemOfData(info.item.lParam);
    if (!item)
        return;
    if (info.item.mask & LVIF_TEXT) {
        STRRET name{};
        if (info.item.pszText && info.item.cchTextMax > 0 &&
            SUCCEEDED(context_.folder.folder->GetDisplayNameOf(item, SHGDN_NORMAL, &name)))
            (void)::StrRetToBufW(&name, item, info.item.pszText, info.item.cchTextMax);
    }
    if (info.item.mask & LVIF_IMAGE) {
        Microsoft::WRL::ComPtr<IExtractIconW> icon;
        wchar_t location[MAX_PATH] = {};
        int index = kRootIconIndex;
        UINT flags = 0;
        const HRESULT found = context_.folder.folder->GetUIObjectOf(
            context_.window, 1, &item, IID_IExtractIconW, nullptr,
            reinterpret_cast<void**>(icon.GetAddressOf()));
        if (SUCCEEDED(found) &&
            FAILED(icon->GetIconLocation(0, location, ARRAYSIZE(location), &index, &flags)))
            index = kRootIconIndex;
        info.item.iImage = index;
    }
}

void CShellViewList::OnDeleteItem(const NMLISTVIEW& item) noexcept {
    // The item owned its identifier; the entry has none.
    UniqueChildPidl owned(ItemOfData(item.lParam));
}

std::vector<CShellViewList::SelectedItem> CShellViewList::Selection() const {
    std::vector<SelectedItem> selection;
    if (!list_.Window())
        return selection;
    int index = -1;
    while ((index = static_cast<int>(
                list_.Send(LVM_GETNEXTITEM, static_cast<WPARAM>(index), LVNI_SELECTED))) >= 0) {
        LVITEMW item{};
        item.mask = LVIF_PARAM;
        item.iItem = index;
        if (list_.Send(LVM_GETITEMW, 0, reinterpret_cast<LPARAM>(&item)))
            selection.push_back({index, ItemOfData(item.lParam)});
    }
    return selection;
}
