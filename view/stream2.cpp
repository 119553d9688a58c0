// The read-once file stream behind "FileContents".
#include "view/stream2.h"

namespace {

HANDLE OpenForReading(const std::wstring& path) {
    return ::CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                         FILE_ATTRIBUTE_NORMAL, nullptr);
}

}  // namespace

HRESULT CStream2::Bind(const std::wstring& path, bool deleteWhenFinished) {
    path_ = path;
    deleteWhenFinished_ = deleteWhenFinished;
    UniqueFileHandle file(OpenForReading(path_));
    // The stream announces 32-bit sizes; a file it cannot open announces 0.
    size_ = file ? ::GetFileSize(file.get(), nullptr) : 0;
    if (size_ == INVALID_FILE_SIZE)
        size_ = 0;
    return S_OK;
}

IFACEMETHODIMP CStream2::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {
        QITABENT(CStream2, IStream), QITABENT(CStream2, ISequentialStream), {}};
    return QISearch(this, table, iid, object);
}

IFACEMETHODIMP CStream2::Read(void* buffer, ULONG wanted, ULONG* got) {
    ULONG read = 0;
    if (got)
        *got = 0;
    if (state_ == kNotOpened) {
        file_.reset(OpenForReading(path_));
        // Readers of this stream have always received the bare Win32 code here.
        if (!file_)
            return static_cast<HRESULT>(::GetLastError());
        state_ = kReading;
    }
    if (state_ != kReading)
        return S_OK;
    if (!::ReadFile(file_.get(), buffer, wanted, &read, nullptr)) {
        return static_cast<HRESULT>(::GetLastError());
    }
    if (got)
        *got = read;
    if (read == wanted)
        return S_OK;
    state_ = kFinished;
    file_.reset();
    // The temporary download is gone once it has been read; a failed delete leaves it in the
    // user's temporary folder, which is not worth failing the copy for.
    if (deleteWhenFinished_)
        (void)::DeleteFileW(path_.c_str());
    return S_OK;
}

IFACEMETHODIMP CStream2::Stat(STATSTG* statistics, DWORD) {
    if (!statistics)
        return E_POINTER;
    statistics->cbSize.QuadPart = size_;
    return S_OK;
}
