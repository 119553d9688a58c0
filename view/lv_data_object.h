// CLVDataObject: the namespace's items on the clipboard and in drag and drop. Its files are
// virtual: asking for "FileContents" runs the download there and then.
#pragma once

#include <windows.h>
#include <commctrl.h>
#include <objidl.h>
#include <oleidl.h>
#include <shlobj.h>

#include <memory>
#include <vector>

#include "download/station_downloader.h"
#include "namespace/pidl_manager.h"
#include "support/unique_resource.h"
#include "stations/portable/station.h"
#include "support/com_object.h"

class CLVDataObject final : public ComObject<IDataObject, IDropSource> {
public:
    // Its file's download goes through the downloader given, which must not be null: the
    // progress dialogs (MakeDialogStationDownloader) in the folder and its view.
    explicit CLVDataObject(std::shared_ptr<StationDownloader> downloader);
    ~CLVDataObject() override;

    // Appends a copy of one item's internal full identifier (root, station, and file if any).
    [[nodiscard]] HRESULT SetItem(PCUIDLIST_RELATIVE fullList) noexcept;
    [[nodiscard]] HRESULT AddItem(PCUIDLIST_RELATIVE fullList) noexcept {
        return SetItem(fullList);
    }
    // Where the shell has the folder the items were taken from (its identifier from the desktop):
    // the parent that "Shell IDList Array" names. Without one the format is not given, since the
    // items' own lists start inside the namespace and would be taken for the desktop's.
    [[nodiscard]] HRESULT SetFolderLocation(PCIDLIST_ABSOLUTE folder) noexcept;

    // The drag image that the view's drag start prepared; the object destroys the list when the
    // drag ends.
    void SetDragImage(HIMAGELIST images, HWND view, int xOffset, int yOffset) noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;

    // IDataObject
    IFACEMETHODIMP GetData(FORMATETC* format, STGMEDIUM* medium) override;
    IFACEMETHODIMP GetDataHere(FORMATETC*, STGMEDIUM*) override { return E_NOTIMPL; }
    IFACEMETHODIMP QueryGetData(FORMATETC* format) override;
    // Not supported; the out structure still comes back with no target device, which a caller
    // may free whatever the result.
    IFACEMETHODIMP GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) override;
    IFACEMETHODIMP SetData(FORMATETC* format, STGMEDIUM* medium, BOOL release) override;
    IFACEMETHODIMP EnumFormatEtc(DWORD direction, IEnumFORMATETC** enumerator) override;
    IFACEMETHODIMP DAdvise(FORMATETC*, DWORD, IAdviseSink*, DWORD*) override { return E_NOTIMPL; }
    IFACEMETHODIMP DUnadvise(DWORD) override { return E_NOTIMPL; }
    // Not supported; the out-pointer comes back null, as COM asks of every failure.
    IFACEMETHODIMP EnumDAdvise(IEnumSTATDATA** enumerator) override;

    // IDropSource
    IFACEMETHODIMP QueryContinueDrag(BOOL escapePressed, DWORD keyState) override;
    IFACEMETHODIMP GiveFeedback(DWORD effect) override;

private:
    [[nodiscard]] HRESULT GetPreferredDropEffect(STGMEDIUM* medium) noexcept;
    [[nodiscard]] HRESULT GetFileGroupDescriptor(STGMEDIUM* medium) noexcept;
    [[nodiscard]] HRESULT GetFileContents(LONG index, STGMEDIUM* medium) noexcept;
    [[nodiscard]] HRESULT GetShellIdListArray(STGMEDIUM* medium) noexcept;
    [[nodiscard]] HRESULT GetStationList(STGMEDIUM* medium) noexcept;

    // The station named by an item's path; the store's status when it cannot be loaded.
    [[nodiscard]] HRESULT LoadItemStation(PCUIDLIST_RELATIVE item, Station& station) const noexcept;
    void EndDragImage() noexcept;

    std::shared_ptr<StationDownloader> downloader_;
    CPidlMgr manager_;
    std::vector<UniqueRelativePidl> items_;
    UniqueAbsoluteIdList folderLocation_;

    UniqueHImageList dragImages_;
    HWND dragView_ = nullptr;
    int dragOffsetX_ = 0;
    int dragOffsetY_ = 0;
    bool dragImageStarted_ = false;
};
