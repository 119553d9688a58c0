// Drops on a station and on the view's list: acceptance, the row under the cursor, the parse.
#include "view/lv_drop_target.h"

#include <commctrl.h>

#include "namespace/portable/item_id_layout.h"
#include "stations/station_store.h"
#include "support/clipboard_formats.h"
#include "support/error_handling.h"
#include "view/source_parser.h"

namespace {

[[nodiscard]] HRESULT QueryFormat(IDataObject* dataObject, CLIPFORMAT wanted,
                                  DWORD tymed) noexcept {
    FORMATETC format{wanted, nullptr, DVASPECT_CONTENT, -1, tymed};
    return dataObject->QueryGetData(&format);
}

// The station named by a full identifier (root item, then station), as its path's second part.
std::wstring StationNameOf(const CPidlMgr& manager, PCUIDLIST_RELATIVE fullList) {
    wchar_t path[MAX_PATH] = {};
    manager.GetPath(fullList, path, ARRAYSIZE(path));
    return StationNameFromPath(path);
}

// Parses what was dropped; the parse's result when it fails.
[[nodiscard]] HRESULT ParseDrop(IDataObject* dataObject,
                                std::shared_ptr<TSourceList>& sources) noexcept {
    try {
        TSourceParser parser(true);
        RETURN_IF_FAILED(parser.ParseDataObject(dataObject, std::wstring(), true));
        sources = parser.Sources();
        return S_OK;
    }
    CATCH_RETURN()
}

void HandOver(const DroppedSourcesReceiver& receiver, const std::wstring& station,
              const std::shared_ptr<TSourceList>& sources) {
    if (receiver)
        receiver(station, sources);
}

// Copies a receiver into a target's field: the copy may meet an allocation failure.
[[nodiscard]] HRESULT KeepReceiver(DroppedSourcesReceiver& field,
                                   const DroppedSourcesReceiver& receiver) noexcept {
    try {
        field = receiver;
        return S_OK;
    }
    CATCH_RETURN()
}

}  // namespace

HRESULT AcceptDropSource(IDataObject* dataObject) noexcept {
    if (!dataObject)
        return E_INVALIDARG;
    if (QueryFormat(dataObject, CF_HDROP, TYMED_HGLOBAL) == S_OK)
        return S_OK;
    if (QueryFormat(dataObject, RegisteredFormat(ClipboardFormat::ShellIdList), TYMED_HGLOBAL) ==
        S_OK)
        return S_OK;
    // Virtual files are only worth taking when their contents come with them.
    if (QueryFormat(dataObject, RegisteredFormat(ClipboardFormat::FileGroupDescriptor),
                    TYMED_HGLOBAL) == S_OK &&
        QueryFormat(dataObject, RegisteredFormat(ClipboardFormat::FileContents), TYMED_ISTREAM) ==
            S_OK)
        return S_OK;
    return E_INVALIDARG;
}

HRESULT CLVDropTarget::SetItem(PCUIDLIST_RELATIVE fullList) noexcept {
    RETURN_HR_IF(E_INVALIDARG, !fullList);
    item_ = manager_.CopyPidl(fullList);
    RETURN_IF_NULL_ALLOC(item_.get());
    return S_OK;
}

HRESULT CLVDropTarget::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {
        QITABENT(CLVDropTarget, IDropTarget), QITABENT(CLVDropTarget, IDroppedSourcesTarget), {}};
    return QISearch(this, table, iid, object);
}

HRESULT CLVDropTarget::SetReceiver(const DroppedSourcesReceiver& receiver) {
    return KeepReceiver(receiver_, receiver);
}

// The caller's drop effect is left as it came, accepted or not.
HRESULT CLVDropTarget::DragEnter(IDataObject* dataObject, DWORD, POINTL, DWORD*) {
    return AcceptDropSource(dataObject);
}

HRESULT CLVDropTarget::Drop(IDataObject* dataObject, DWORD, POINTL, DWORD*) {
    try {
        std::shared_ptr<TSourceList> sources;
        RETURN_IF_FAILED(ParseDrop(dataObject, sources));
        if (manager_.GetLastItemKind(item_.get()) == PT_STATION) {
            Station station;
            station.Name = StationNameOf(manager_, item_.get());
            HandOver(receiver_, station.Name, sources);
        }
        // Parsed, and nothing sent: this version hands no file to the instrument.
        return S_FALSE;
    }
    CATCH_RETURN()
}

HRESULT CLVDropTargetOnListView::SetUp(HWND list, IShellView* view,
                                       PCUIDLIST_RELATIVE folder) noexcept {
    RETURN_HR_IF(E_INVALIDARG, !list || !view || !folder);
    list_ = list;
    view_ = view;
    folder_ = manager_.CopyPidl(folder);
    RETURN_IF_NULL_ALLOC(folder_.get());
    return S_OK;
}

HRESULT CLVDropTargetOnListView::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {QITABENT(CLVDropTargetOnListView, IDropTarget),
                                  QITABENT(CLVDropTargetOnListView, IDroppedSourcesTarget),
                                  {}};
    return QISearch(this, table, iid, object);
}

HRESULT CLVDropTargetOnListView::SetReceiver(const DroppedSourcesReceiver& receiver) {
    return KeepReceiver(receiver_, receiver);
}

HRESULT CLVDropTargetOnListView::DragEnter(IDataObject* dataObject, DWORD, POINTL, DWORD*) {
    return AcceptDropSource(dataObject);
}

bool CLVDropTargetOnListView::ShowsOneStation() const noexcept {
    return manager_.GetLastItemKind(folder_.get()) == PT_STATION;
}

int CLVDropTargetOnListView::SelectStationAt(POINTL point) const noexcept {
    if (!list_)
        return -1;
    LVHITTESTINFO hit{};
    hit.pt = POINT{point.x, point.y};
    ::ScreenToClient(list_, &hit.pt);
    const int index =
        static_cast<int>(::SendMessageW(list_, LVM_HITTEST, 0, reinterpret_cast<LPARAM>(&hit)));
    // The first row is "Add New Digital Level": never a place to drop on.
    if (index <= 0)
        return -1;
    LVITEMW state{};
    state.stateMask = LVIS_SELECTED | LVIS_FOCUSED;
    state.state = 0;
    ::SendMessageW(list_, LVM_SETITEMSTATE, static_cast<WPARAM>(-1),
                   reinterpret_cast<LPARAM>(&state));
    state.state = LVIS_SELECTED | LVIS_FOCUSED;
    ::SendMessageW(list_, LVM_SETITEMSTATE, index, reinterpret_cast<LPARAM>(&state));
    return index;
}

HRESULT CLVDropTargetOnListView::DragOver(DWORD, POINTL point, DWORD* effect) {
    if (ShowsOneStation()) {
        if (effect)
            *effect = DROPEFFECT_COPY;
        return S_OK;
    }
    if (SelectStationAt(point) < 0)
        return E_INVALIDARG;
    if (effect)
        *effect = DROPEFFECT_COPY;
    return S_OK;
}

HRESULT CLVDropTargetOnListView::Drop(IDataObject* dataObject, DWORD keys, POINTL point,
                                      DWORD* effect) {
    try {
        if (!ShowsOneStation()) {
            // A drop on a station row is that station's drop.
            if (SelectStationAt(point) < 0)
                return E_INVALIDARG;
            RETURN_HR_IF(E_UNEXPECTED, !view_);
            Microsoft::WRL::ComPtr<IDropTarget> station;
            RETURN_IF_FAILED(view_->GetItemObject(SVGIO_SELECTION, IID_PPV_ARGS(&station)));
            // Whoever receives the list's drops receives the station's drop too.
            if (receiver_) {
                Microsoft::WRL::ComPtr<IDroppedSourcesTarget> handedOn;
                if (SUCCEEDED(station.As(&handedOn)))
                    RETURN_IF_FAILED(handedOn->SetReceiver(receiver_));
            }
            return station->Drop(dataObject, keys, point, effect);
        }
        std::shared_ptr<TSourceList> sources;
        RETURN_IF_FAILED(ParseDrop(dataObject, sources));
        Station station;
        station.Name = StationNameOf(manager_, folder_.get());
        // Loaded for the sending that a later version does; nothing is sent yet.
        if (SUCCEEDED(FindStation(station)))
            HandOver(receiver_, station.Name, sources);
        return E_INVALIDARG;
    }
    CATCH_RETURN()
}
