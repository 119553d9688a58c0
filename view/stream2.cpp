// The read-once file stream behind "FileContents".
#include "view/stream2.h"

#include <algorithm>
#include <cstring>
#include <cwchar>
#include <memory>
#include <new>

#include "support/error_handling.h"
#include "support/read_only_file.h"

namespace {

// CopyTo's piece: large enough that a copy of a survey takes a few calls, small enough to keep
// off the stack of a shell thread.
constexpr ULONG kCopyPieceBytes = 64 * 1024;

}  // namespace

CStream2::~CStream2() {
    // A reader that lets go before the end (a cancelled copy, a failed write) will never read
    // the rest: the temporary download goes now rather than stay in the user's temporary folder.
    if (state_ != kFinished)
        Discard();
}

void CStream2::Discard() noexcept {
    file_.reset();
    if (download_)
        download_.Remove();  // its files, then its reservation
    else if (deleteWhenFinished_ && !path_.empty())
        (void)::DeleteFileW(path_.c_str());  // nothing to tell anyone when it fails
    deleteWhenFinished_ = false;
}

HRESULT CStream2::Bind(const std::wstring& path, bool deleteWhenFinished) noexcept {
    try {
        std::lock_guard<std::mutex> guard(lock_);
        path_ = path;
        deleteWhenFinished_ = deleteWhenFinished;
        // Kept open from here on: the size announced and the bytes read are those of one file.
        return StartReading(OpenReadOnlyFile(path_, file_, size_));
    }
    CATCH_RETURN()
}

HRESULT CStream2::Bind(DownloadTarget target) noexcept {
    try {
        std::lock_guard<std::mutex> guard(lock_);
        RETURN_HR_IF(E_INVALIDARG, !target);
        path_ = target.WrittenFile();
        download_ = std::move(target);
        deleteWhenFinished_ = true;
        // Held from the download's end to the stream's: the size announced and the bytes read
        // are those of the file the download wrote, which nobody can write, rename or delete
        // meanwhile.
        return StartReading(download_.OpenForReading(file_, size_));
    }
    CATCH_RETURN()
}

HRESULT CStream2::StartReading(HRESULT opened) noexcept {
    if (FAILED(opened))
        return opened;
    position_ = 0;
    state_ = kReading;
    return S_OK;
}

IFACEMETHODIMP CStream2::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {
        QITABENT(CStream2, IStream), QITABENT(CStream2, ISequentialStream), {}};
    return QISearch(this, table, iid, object);
}

void CStream2::Finish() noexcept {
    state_ = kFinished;
    // The temporary download is gone once it has been read; a failed delete leaves it in the
    // user's temporary folder, which is not worth failing the copy for.
    Discard();
}

HRESULT CStream2::ReadLocked(void* buffer, ULONG wanted, ULONG* got) noexcept {
    if (got)
        *got = 0;
    if (state_ == kFinished)
        return S_OK;
    // Bound streams hold their file open until they finish: without one there is nothing to read.
    if (!file_)
        return E_UNEXPECTED;
    DWORD read = 0;
    if (!::ReadFile(file_.get(), buffer, wanted, &read, nullptr))
        return LastErrorResult();
    position_ += read;
    if (got)
        *got = read;
    // A short read is the end.
    if (read < wanted)
        Finish();
    return S_OK;
}

IFACEMETHODIMP CStream2::Read(void* buffer, ULONG wanted, ULONG* got) {
    if (!buffer && wanted != 0)
        return STG_E_INVALIDPOINTER;
    std::lock_guard<std::mutex> guard(lock_);
    return ReadLocked(buffer, wanted, got);
}

IFACEMETHODIMP CStream2::Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) {
    std::lock_guard<std::mutex> guard(lock_);
    uint64_t base = 0;
    switch (origin) {
        case STREAM_SEEK_SET:
            break;
        case STREAM_SEEK_CUR:
            base = position_;
            break;
        case STREAM_SEEK_END:
            base = size_;
            break;
        default:
            return STG_E_INVALIDFUNCTION;
    }
    // Before the start, or beyond what 64 bits hold, is no position.
    uint64_t target = base;
    if (move.QuadPart < 0) {
        const uint64_t back = 0 - static_cast<uint64_t>(move.QuadPart);
        if (back > base)
            return STG_E_INVALIDFUNCTION;
        target = base - back;
    } else {
        target = base + static_cast<uint64_t>(move.QuadPart);
        if (target < base || target > static_cast<uint64_t>(INT64_MAX))
            return STG_E_INVALIDFUNCTION;
    }
    // Read to its end, the file is gone: only staying where the stream ended can be honoured.
    if (state_ == kFinished && target != position_)
        return STG_E_INVALIDFUNCTION;
    if (file_) {
        LARGE_INTEGER to{};
        to.QuadPart = static_cast<LONGLONG>(target);
        if (!::SetFilePointerEx(file_.get(), to, nullptr, FILE_BEGIN))
            return LastErrorResult();
    }
    position_ = target;
    if (position)
        position->QuadPart = position_;
    return S_OK;
}

IFACEMETHODIMP CStream2::CopyTo(IStream* target, ULARGE_INTEGER count, ULARGE_INTEGER* read,
                                ULARGE_INTEGER* written) {
    if (read)
        read->QuadPart = 0;
    if (written)
        written->QuadPart = 0;
    if (!target)
        return STG_E_INVALIDPOINTER;
    std::unique_ptr<uint8_t[]> piece(new (std::nothrow) uint8_t[kCopyPieceBytes]);
    RETURN_IF_NULL_ALLOC(piece.get());
    std::lock_guard<std::mutex> guard(lock_);
    uint64_t left = count.QuadPart;
    uint64_t totalRead = 0;
    uint64_t totalWritten = 0;
    while (left > 0 && state_ != kFinished) {
        const ULONG wanted = static_cast<ULONG>(std::min<uint64_t>(left, kCopyPieceBytes));
        ULONG got = 0;
        RETURN_IF_FAILED(ReadLocked(piece.get(), wanted, &got));
        totalRead += got;
        if (read)
            read->QuadPart = totalRead;
        if (got > 0) {
            ULONG moved = 0;
            RETURN_IF_FAILED(target->Write(piece.get(), got, &moved));
            totalWritten += moved;
            if (written)
                written->QuadPart = totalWritten;
            // A target that takes less than it was given has run out of room.
            if (moved != got)
                LV_LOG_AND_RETURN(STG_E_MEDIUMFULL);
        }
        left -= got;
    }
    // A copy that took the last byte is a read to the end, even when it asked for no more.
    if (state_ != kFinished && position_ >= size_)
        Finish();
    return S_OK;
}

IFACEMETHODIMP CStream2::Stat(STATSTG* statistics, DWORD flags) {
    if (!statistics)
        return STG_E_INVALIDPOINTER;
    std::lock_guard<std::mutex> guard(lock_);
    // The whole record: a caller may free pwcsName whenever it did not pass STATFLAG_NONAME.
    *statistics = {};
    statistics->type = STGTY_STREAM;
    statistics->cbSize.QuadPart = size_;
    statistics->grfMode = STGM_READ | STGM_SHARE_DENY_WRITE;
    if ((flags & STATFLAG_NONAME) != 0)
        return S_OK;
    // The file's own name, without its folder: a copy the caller frees with CoTaskMemFree.
    const size_t slash = path_.find_last_of(L'\\');
    const wchar_t* name = path_.c_str() + (slash == std::wstring::npos ? 0 : slash + 1);
    const size_t bytes = (wcslen(name) + 1) * sizeof(wchar_t);
    statistics->pwcsName = static_cast<LPOLESTR>(::CoTaskMemAlloc(bytes));
    RETURN_IF_NULL_ALLOC(statistics->pwcsName);
    memcpy(statistics->pwcsName, name, bytes);
    return S_OK;
}
