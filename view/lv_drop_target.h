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
// sends nothing, so a target has no receiver unless one is handed to it (tests hand one). Called
// on the thread that the drop arrives on.
using DroppedSourcesReceiver =
    std::function<void(const std::wstring& station, const std::shared_ptr<TSourceList>& sources)>;

// The two targets' own interface, through which a receiver reaches a target known only as an
// IDropTarget: the list's target hands its receiver on to the station's target that the view
// gives it for a drop on a station row.
struct IDroppedSourcesTarget : public IUnknown {
    // The receiver of what is dropped from now on; an empty one receives nothing.
    virtual HRESULT STDMETHODCALLTYPE SetReceiver(const DroppedSourcesReceiver& receiver) = 0;
};
// {AEAD47F9-B75A-4FF9-ACF4-888934DC8AB6}
__CRT_UUID_DECL(IDroppedSourcesTarget, 0xAEAD47F9, 0xB75A, 0x4FF9, 0xAC, 0xF4, 0x88, 0x89, 0x34,
                0xDC, 0x8A, 0xB6)

// S_OK when the source offers files, shell items, or virtual files with their contents.
[[nodiscard]] HRESULT AcceptDropSource(IDataObject* dataObject) noexcept;

class CLVDropTarget final : public ComObject<IDropTarget, IDroppedSourcesTarget> {
public:
    CLVDropTarget() noexcept = default;

    // The station's internal full identifier (the root item, then the station).
    [[nodiscard]] HRESULT SetItem(PCUIDLIST_RELATIVE fullList) noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;
    IFACEMETHODIMP DragEnter(IDataObject* dataObject, DWORD keys, POINTL point,
                             DWORD* effect) override;
    IFACEMETHODIMP DragOver(DWORD, POINTL, DWORD*) override { return S_OK; }
    IFACEMETHODIMP DragLeave() override { return S_OK; }
    IFACEMETHODIMP Drop(IDataObject* dataObject, DWORD keys, POINTL point, DWORD* effect) override;

    // IDroppedSourcesTarget
    IFACEMETHODIMP SetReceiver(const DroppedSourcesReceiver& receiver) override;

private:
    CPidlMgr manager_;
    UniqueRelativePidl item_;
    DroppedSourcesReceiver receiver_;
};

class CLVDropTargetOnListView final : public ComObject<IDropTarget, IDroppedSourcesTarget> {
public:
    CLVDropTargetOnListView() noexcept = default;

    // The view's list, the view (held until the target goes, which is when the list revokes it)
    // and the internal full identifier of the view's folder.
    [[nodiscard]] HRESULT SetUp(HWND list, IShellView* view, PCUIDLIST_RELATIVE folder) noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;
    IFACEMETHODIMP DragEnter(IDataObject* dataObject, DWORD keys, POINTL point,
                             DWORD* effect) override;
    IFACEMETHODIMP DragOver(DWORD keys, POINTL point, DWORD* effect) override;
    IFACEMETHODIMP DragLeave() override { return S_OK; }
    IFACEMETHODIMP Drop(IDataObject* dataObject, DWORD keys, POINTL point, DWORD* effect) override;

    // IDroppedSourcesTarget: the receiver is handed on to a station row's target at its drop.
    IFACEMETHODIMP SetReceiver(const DroppedSourcesReceiver& receiver) override;

private:
    bool ShowsOneStation() const noexcept;
    // The station row under the point, selected and focused; -1 for no row or the first one.
    int SelectStationAt(POINTL point) const noexcept;

    CPidlMgr manager_;
    HWND list_ = nullptr;
    Microsoft::WRL::ComPtr<IShellView> view_;
    UniqueRelativePidl folder_;
    DroppedSourcesReceiver receiver_;
};
