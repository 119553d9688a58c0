// The read-once file stream behind "FileContents".
#include "view/stream2.h"

#include <cstring>
#include <cwchar>

#include "support/error_handling.h"

namespace {

HANDLE OpenForReading(const std::wstring& path) {
    return ::CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                         FILE_ATTRIBUTE_NORMAL, nullptr);
}

}  // namespace

CStream2::~CStream2() {
    file_.reset();
    // A reader that lets go before the end (a cancelled copy, a failed write) will never read
    // the rest: the temporary download goes now rather than stay in the user's temporary folder.
    if (deleteWhenFinished_ && state_ != kFinished && !path_.empty())
        (void)::DeleteFileW(path_.c_str());  // nothing to tell anyone from a destructor
}

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
        // As an HRESULT: the bare Win32 code (2 for a vanished file) would read as success.
        if (!file_)
            return LastErrorResult();
        state_ = kReading;
    }
    if (state_ != kReading)
        return S_OK;
    if (!::ReadFile(file_.get(), buffer, wanted, &read, nullptr))
        return LastErrorResult();
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

IFACEMETHODIMP CStream2::Stat(STATSTG* statistics, DWORD flags) {
    if (!statistics)
        return E_POINTER;
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
