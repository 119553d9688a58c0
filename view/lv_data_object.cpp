// The data object: formats, the virtual file's download, and the drag source.
#include "view/lv_data_object.h"

#include <shlobj.h>

#include <cstring>
#include <cwchar>

#include "download/download_attempt.h"
#include "download/download_target.h"
#include "stations/station_list_block.h"
#include "stations/station_models.h"
#include "stations/station_store.h"
#include "support/clipboard_formats.h"
#include "support/error_handling.h"
#include "support/unique_resource.h"
#include "view/enum_format_etc.h"
#include "view/stream2.h"

namespace {

constexpr UINT kSharedMemoryFlags = GMEM_MOVEABLE | GMEM_ZEROINIT | GMEM_SHARE;

bool IsHGlobalRequest(const FORMATETC& format, CLIPFORMAT wanted) noexcept {
    return format.cfFormat == wanted && format.tymed == TYMED_HGLOBAL;
}

bool IsStreamRequest(const FORMATETC& format) noexcept {
    return format.cfFormat == RegisteredFormat(ClipboardFormat::FileContents) &&
           (format.tymed & TYMED_ISTREAM) != 0;
}

// Hands a filled block to the caller as an HGLOBAL medium.
HRESULT ReturnHGlobal(UniqueHGlobal block, STGMEDIUM* medium) noexcept {
    medium->tymed = TYMED_HGLOBAL;
    medium->hGlobal = block.release();
    medium->pUnkForRelease = nullptr;
    return S_OK;
}

// The path of an item's identifier list as the data object names it: every name and a
// backslash, until the characters taken reach the path limit; one trailing backslash dropped.
std::wstring ItemPath(const CPidlMgr& manager, PCUIDLIST_RELATIVE list) {
    std::wstring path;
    size_t taken = 0;
    for (PCUIDLIST_RELATIVE item = list; item && item->mkid.cb != 0 && taken < kMaximumPath;
         item = manager.GetNextItem(item)) {
        const std::wstring name = manager.GetItemName(item);
        path += name;
        path += L'\\';
        taken += name.size() + 1;
    }
    if (path.size() >= kMaximumPath)
        path.resize(kMaximumPath - 1);
    if (!path.empty() && path.back() == L'\\')
        path.pop_back();
    return path;
}

}  // namespace

CLVDataObject::CLVDataObject(std::shared_ptr<StationDownloader> downloader)
    : downloader_(std::move(downloader)) {}

CLVDataObject::~CLVDataObject() {
    EndDragImage();
}

HRESULT CLVDataObject::SetItem(PCUIDLIST_RELATIVE fullList) noexcept {
    RETURN_HR_IF(E_INVALIDARG, !fullList);
    try {
        UniqueRelativePidl copy = manager_.CopyPidl(fullList);
        RETURN_IF_NULL_ALLOC(copy.get());
        items_.push_back(std::move(copy));
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVDataObject::SetFolderLocation(PCIDLIST_ABSOLUTE folder) noexcept {
    folderLocation_.reset();
    if (!folder)
        return S_OK;
    folderLocation_.reset(::ILCloneFull(folder));
    RETURN_IF_NULL_ALLOC(folderLocation_.get());
    return S_OK;
}

void CLVDataObject::SetDragImage(HIMAGELIST images, HWND view, int xOffset, int yOffset) noexcept {
    dragImages_.reset(images);  // a list handed in earlier goes
    dragView_ = view;
    dragOffsetX_ = xOffset;
    dragOffsetY_ = yOffset;
    dragImageStarted_ = false;
}

IFACEMETHODIMP CLVDataObject::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {
        QITABENT(CLVDataObject, IDataObject), QITABENT(CLVDataObject, IDropSource), {}};
    return QISearch(this, table, iid, object);
}

HRESULT CLVDataObject::LoadItemStation(PCUIDLIST_RELATIVE item, Station& station) const noexcept {
    try {
        station = DefaultStation();
        station.Name = StationNameFromPath(ItemPath(manager_, item));
        return FindStation(station);
    }
    CATCH_RETURN()
}

IFACEMETHODIMP CLVDataObject::GetData(FORMATETC* format, STGMEDIUM* medium) {
    if (!format || !medium)
        return E_INVALIDARG;
    try {
        *medium = {};
        if (IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::PreferredDropEffect))) {
            return GetPreferredDropEffect(medium);
        }
        if (IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::FileGroupDescriptor))) {
            return GetFileGroupDescriptor(medium);
        }
        if (IsStreamRequest(*format))
            return GetFileContents(format->lindex, medium);
        if (IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::ShellIdList)))
            return GetShellIdListArray(medium);
        if (IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::StationList)))
            return GetStationList(medium);
        return E_INVALIDARG;
    }
    CATCH_RETURN()
}

HRESULT CLVDataObject::GetPreferredDropEffect(STGMEDIUM* medium) noexcept {
    UniqueHGlobal block(::GlobalAlloc(kSharedMemoryFlags, sizeof(DWORD)));
    RETURN_IF_NULL_ALLOC(block.get());
    {
        GlobalLockGuard lock(block.get());
        RETURN_IF_NULL_ALLOC(lock.data());
        // Taking a file out of an instrument is always a copy, never a move.
        *static_cast<DWORD*>(lock.data()) = DROPEFFECT_COPY;
    }
    return ReturnHGlobal(std::move(block), medium);
}

HRESULT CLVDataObject::GetFileGroupDescriptor(STGMEDIUM* medium) noexcept {
    try {
        if (items_.empty())
            return S_FALSE;
        const size_t size = sizeof(UINT) + sizeof(FILEDESCRIPTORW) * items_.size();
        UniqueHGlobal block(::GlobalAlloc(kSharedMemoryFlags, size));
        RETURN_IF_NULL_ALLOC(block.get());
        {
            GlobalLockGuard lock(block.get());
            RETURN_IF_NULL_ALLOC(lock.data());
            auto* group = static_cast<FILEGROUPDESCRIPTORW*>(lock.data());
            group->cItems = static_cast<UINT>(items_.size());
            for (size_t index = 0; index < items_.size(); ++index) {
                Station station;
                // A station that cannot be loaded still names its file, as the default model's.
                const std::wstring name = LoadItemStation(items_[index].get(), station) == S_OK
                                              ? StationFileName(station.Model)
                                              : StationFileName(std::wstring());
                // No size, time or attributes are announced: the file does not exist yet.
                wcsncpy(group->fgd[index].cFileName, name.c_str(), MAX_PATH - 1);
            }
        }
        return ReturnHGlobal(std::move(block), medium);
    }
    CATCH_RETURN()
}

HRESULT CLVDataObject::GetFileContents(LONG index, STGMEDIUM* medium) noexcept {
    try {
        if (items_.empty() || index < 0 || static_cast<size_t>(index) >= items_.size())
            return S_FALSE;
        PCUIDLIST_RELATIVE item = items_[index].get();
        if (!manager_.IsFile(item))
            return S_FALSE;

        Station station;
        const HRESULT loaded = LoadItemStation(item, station);
        if (loaded != S_OK)
            return loaded;

        // The caller's active window, if any, owns the dialog so that it stays in front of it.
        const HWND owner = ::GetActiveWindow();
        RETURN_HR_IF(E_UNEXPECTED, !downloader_);
        // A fresh temporary name for every request: asking twice downloads twice. The downloader
        // asks for it once it can run, so that a download refused at once leaves no file.
        DownloadTarget target;
        const auto prepareTarget = [&](std::wstring& path) -> HRESULT {
            const HRESULT prepared = PrepareDownloadTarget(owner, target);  // shows and logs
            if (SUCCEEDED(prepared))
                path = target.Path();
            return prepared;
        };
        std::wstring file;
        std::wstring shownFailure;
        DownloadAttempt attempt(station);
        const HRESULT downloaded =
            downloader_->Download(owner, station, prepareTarget, file, shownFailure);
        // A download that ended before its target was made has nothing to clean up; its failure
        // (shown where it happened) fails the copy.
        if (!target) {
            attempt.Finish(downloaded, nullptr, shownFailure);
            if (FAILED(downloaded))
                LV_LOG_AND_RETURN(downloaded);
            return S_FALSE;
        }
        // Whatever the download wrote goes with the target: a partial file when the download did
        // not complete (the target's end deletes it), the file the stream reads when it did.
        RETURN_IF_FAILED(target.AddWrittenFile(file));
        // A success with no readable file behind it is no download: its row and the copy both
        // say why, rather than the row saying "ok" over a copy that fails.
        HRESULT outcome = downloaded;
        if (outcome == S_OK) {
            UniqueFileHandle reader;
            uint64_t size = 0;
            outcome = target.OpenForReading(reader, size);
        }
        // Kept (when complete) and journaled before the shell can lose it; this never fails it.
        attempt.Finish(outcome, &target, shownFailure);
        if (outcome != S_OK) {
            // A failure fails the copy with its reason, so that the caller reports a failure rather
            // than a cancel.
            if (FAILED(outcome))
                LV_LOG_AND_RETURN(outcome);
            return S_FALSE;
        }

        // The stream takes the target over and reads the file from here on, so that nobody writes,
        // renames or replaces it between the download and the last read. A file that cannot be
        // opened now (taken since the check above) is no download: no stream over nothing (its
        // release removes the target).
        auto stream = MakeComObject<CStream2>();
        RETURN_IF_FAILED(stream->Bind(std::move(target)));
        medium->tymed = TYMED_ISTREAM;
        medium->pstm = stream.Detach();
        medium->pUnkForRelease = nullptr;
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVDataObject::GetShellIdListArray(STGMEDIUM* medium) noexcept {
    try {
        if (items_.empty())
            return S_FALSE;
        // The parent is the folder's identifier from the desktop, as readers of the format bind it:
        // the items' own lists start inside the namespace, and a reader would take them for items
        // of the desktop. Items must still name a parent inside the namespace, as always.
        const UniqueRelativePidl internalParent = manager_.CopyParent(items_.front().get());
        if (!internalParent || !folderLocation_)
            return S_FALSE;
        PCIDLIST_ABSOLUTE parent = folderLocation_.get();

        // The block: cidl, then one offset for the parent and one for each child (aoffset), then
        // the parent's list and each child's one-item list, each with its terminator. Every child
        // has its own offset, unlike the one shared slot that older versions wrote: an offset left
        // 0 makes any reader walk the header as an item-ID list and run past the block.
        const UINT parentSize = manager_.GetSize(parent);
        std::vector<UniqueChildPidl> children;
        const size_t headerSize = sizeof(UINT) * (items_.size() + 2);
        size_t size = headerSize + parentSize;
        for (const UniqueRelativePidl& item : items_) {
            children.push_back(manager_.CopyItem(manager_.GetLastItem(item.get())));
            RETURN_IF_NULL_ALLOC(children.back().get());
            size += manager_.GetSize(children.back().get());
        }

        UniqueHGlobal block(::GlobalAlloc(kSharedMemoryFlags, size));
        RETURN_IF_NULL_ALLOC(block.get());
        {
            GlobalLockGuard lock(block.get());
            RETURN_IF_NULL_ALLOC(lock.data());
            auto* bytes = static_cast<BYTE*>(lock.data());
            // Written as bytes: CIDA declares a one-entry aoffset that the block outgrows.
            const auto writeHeaderValue = [bytes](size_t slot, size_t value) {
                const UINT field = static_cast<UINT>(value);
                memcpy(bytes + sizeof(UINT) * slot, &field, sizeof field);
            };
            writeHeaderValue(0, items_.size());
            size_t offset = headerSize;
            writeHeaderValue(1, offset);
            memcpy(bytes + offset, parent, parentSize);
            offset += parentSize;
            for (size_t index = 0; index < children.size(); ++index) {
                const UINT childSize = manager_.GetSize(children[index].get());
                writeHeaderValue(index + 2, offset);
                memcpy(bytes + offset, children[index].get(), childSize);
                offset += childSize;
            }
        }
        return ReturnHGlobal(std::move(block), medium);
    }
    CATCH_RETURN()
}

HRESULT CLVDataObject::GetStationList(STGMEDIUM* medium) noexcept {
    try {
        std::vector<Station> stations;
        for (const UniqueRelativePidl& item : items_) {
            Station station;
            // Stations that no longer load are left out silently.
            if (LoadItemStation(item.get(), station) == S_OK)
                stations.push_back(station);
        }
        UniqueHGlobal block(SerializeStationList(stations));
        RETURN_IF_NULL_ALLOC(block.get());
        return ReturnHGlobal(std::move(block), medium);
    }
    CATCH_RETURN()
}

IFACEMETHODIMP CLVDataObject::QueryGetData(FORMATETC* format) {
    if (!format)
        return E_INVALIDARG;
    if (IsStreamRequest(*format) ||
        IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::FileGroupDescriptor)) ||
        IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::ShellIdList)) ||
        IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::PreferredDropEffect)) ||
        IsHGlobalRequest(*format, RegisteredFormat(ClipboardFormat::StationList))) {
        return S_OK;
    }
    return S_FALSE;
}

IFACEMETHODIMP CLVDataObject::GetCanonicalFormatEtc(FORMATETC* format, FORMATETC* canonical) {
    if (canonical) {
        // The request itself is the most general form of every format offered (none depends on
        // a device); its target device is never handed back, since the caller frees it.
        *canonical = format ? *format : FORMATETC{};
        canonical->ptd = nullptr;
    }
    return E_NOTIMPL;
}

IFACEMETHODIMP CLVDataObject::EnumDAdvise(IEnumSTATDATA** enumerator) {
    if (enumerator)
        *enumerator = nullptr;
    return E_NOTIMPL;
}

IFACEMETHODIMP CLVDataObject::SetData(FORMATETC* format, STGMEDIUM* medium, BOOL release) {
    // Nothing is stored: the object only offers data. The shell tells it "Performed DropEffect"
    // and "Paste Succeeded" on every paste and hands the medium over with release set; keeping
    // it would leak one block a paste, so it is released as the contract asks.
    if (format) {
        wchar_t name[260];
        (void)::GetClipboardFormatNameW(format->cfFormat, name, ARRAYSIZE(name));
    }
    if (release && medium)
        ::ReleaseStgMedium(medium);
    return S_OK;
}

IFACEMETHODIMP CLVDataObject::EnumFormatEtc(DWORD, IEnumFORMATETC** enumerator) {
    if (!enumerator)
        return E_POINTER;
    *enumerator = nullptr;
    try {
        // "Preferred DropEffect" is answered but not listed.
        const FORMATETC formats[] = {
            {RegisteredFormat(ClipboardFormat::FileContents), nullptr, DVASPECT_CONTENT, -1,
             TYMED_ISTREAM},
            {RegisteredFormat(ClipboardFormat::FileGroupDescriptor), nullptr, DVASPECT_CONTENT, -1,
             TYMED_HGLOBAL},
            {RegisteredFormat(ClipboardFormat::ShellIdList), nullptr, DVASPECT_CONTENT, -1,
             TYMED_HGLOBAL},
            {RegisteredFormat(ClipboardFormat::StationList), nullptr, DVASPECT_CONTENT, -1,
             TYMED_HGLOBAL},
        };
        *enumerator = MakeComObject<CEnumFormatEtc>(formats, ARRAYSIZE(formats)).Detach();
        return S_OK;
    }
    CATCH_RETURN()
}

void CLVDataObject::EndDragImage() noexcept {
    if (!dragImages_)
        return;
    ::ImageList_EndDrag();
    ::ImageList_DragLeave(dragView_);
    dragImages_.reset();
    dragImageStarted_ = false;
}

IFACEMETHODIMP CLVDataObject::QueryContinueDrag(BOOL escapePressed, DWORD keyState) {
    if (keyState == 0)
        EndDragImage();
    if (escapePressed)
        return DRAGDROP_S_CANCEL;
    return (keyState & MK_LBUTTON) ? S_OK : DRAGDROP_S_DROP;
}

IFACEMETHODIMP CLVDataObject::GiveFeedback(DWORD) {
    if (!dragImages_)
        return DRAGDROP_S_USEDEFAULTCURSORS;
    if (!dragImageStarted_) {
        ::ImageList_DragEnter(dragView_, 0, 0);
        ::ImageList_BeginDrag(dragImages_.get(), 0, 0, 0);
        dragImageStarted_ = true;
        return DRAGDROP_S_USEDEFAULTCURSORS;
    }
    POINT cursor;
    if (!::GetCursorPos(&cursor))
        return DRAGDROP_S_USEDEFAULTCURSORS;
    const HWND under = ::WindowFromPoint(cursor);
    if (under != dragView_ && !::IsChild(dragView_, under)) {
        ::ImageList_DragShowNolock(FALSE);
    } else {
        ::ImageList_DragMove(dragOffsetX_ + cursor.x, cursor.y + dragOffsetY_);
        ::ImageList_DragShowNolock(TRUE);
    }
    return DRAGDROP_S_USEDEFAULTCURSORS;
}
