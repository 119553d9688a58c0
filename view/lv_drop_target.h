// The folder's two drop targets: CLVDropTarget for one station (the folder hands it out for a
// station's item) and CLVDropTargetOnListView on the list of the folder's view. Both accept files,
// shell items and virtual files, and parse what is dropped into its sources; this version sends
// nothing to the instrument.
#pragma once

#include <windows.h>
#include <oleidl.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <functional>
#include <memory>
#include <string>

#include "namespace/pidl_manager.h"
#include "support/com_object.h"
#include "view/source_parser.h"

// Where a drop's parsed sources go: the station they were dropped on and the list. This version
// sends nothing, so nothing receives them unless a receiver is set (tests set one). Set and called
// on the thread of the views.
using DroppedSourcesReceiver =
    std::function<void(const std::wstring& station, const std::shared_ptr<TSourceList>& sources)>;
void SetDroppedSourcesReceiver(DroppedSourcesReceiver receiver);

// S_OK when the source offers files, shell items, or virtual files with their contents.
HRESULT AcceptDropSource(IDataObject* dataObject) noexcept;

class CLVDropTarget final : public ComObject<IDropTarget> {
public:
    CLVDropTarget() noexcept = default;

    // The station's internal full identifier (the root item, then the station).
    HRESULT SetItem(PCUIDLIST_RELATIVE fullList) noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;
    IFACEMETHODIMP DragEnter(IDataObject* dataObject, DWORD keys, POINTL point,
                             DWORD* effect) override;
    IFACEMETHODIMP DragOver(DWORD, POINTL, DWORD*) override { return S_OK; }
    IFACEMETHODIMP DragLeave() override { return S_OK; }
    IFACEMETHODIMP Drop(IDataObject* dataObject, DWORD keys, POINTL point, DWORD* effect) override;

private:
    CPidlMgr manager_;
    UniquePidl item_;
};

class CLVDropTargetOnListView final : public ComObject<IDropTarget> {
public:
    CLVDropTargetOnListView() noexcept = default;

    // The view's list, the view (held until the target goes, which is when the list revokes it)
    // and the internal full identifier of the view's folder.
    HRESULT SetUp(HWND list, IShellView* view, PCUIDLIST_RELATIVE folder) noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;
    IFACEMETHODIMP DragEnter(IDataObject* dataObject, DWORD keys, POINTL point,
                             DWORD* effect) override;
    IFACEMETHODIMP DragOver(DWORD keys, POINTL point, DWORD* effect) override;
    IFACEMETHODIMP DragLeave() override { return S_OK; }
    IFACEMETHODIMP Drop(IDataObject* dataObject, DWORD keys, POINTL point, DWORD* effect) override;

private:
    bool ShowsOneStation() const noexcept;
    // The station row under the point, selected and focused; -1 for no row or the first one.
    int SelectStationAt(POINTL point) const noexcept;

    CPidlMgr manager_;
    HWND list_ = nullptr;
    Microsoft::WRL::ComPtr<IShellView> view_;
    UniquePidl folder_;
};
