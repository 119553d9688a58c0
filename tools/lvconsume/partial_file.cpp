// The download's file under a temporary name until it is complete.
#include "tools/lvconsume/partial_file.h"

#include <shlwapi.h>

HRESULT PartialFile::Create(const std::wstring& folder) noexcept {
    wchar_t name[MAX_PATH];
    if (::GetTempFileNameW(folder.c_str(), L"lvc", 0, name) == 0)
        return HRESULT_FROM_WIN32(::GetLastError());
    try {
        path_ = name;  // the placeholder exists from here on: Discard removes it
    } catch (...) {
        (void)::DeleteFileW(name);  // no path kept to remove it by later
        return E_OUTOFMEMORY;
    }
    return ::SHCreateStreamOnFileEx(path_.c_str(), STGM_CREATE | STGM_WRITE, FILE_ATTRIBUTE_NORMAL,
                                    TRUE, nullptr, &stream_);
}

HRESULT PartialFile::Commit(const std::wstring& target) noexcept {
    stream_.Reset();
    if (!::MoveFileExW(path_.c_str(), target.c_str(), MOVEFILE_REPLACE_EXISTING))
        return HRESULT_FROM_WIN32(::GetLastError());
    path_.clear();
    return S_OK;
}

void PartialFile::Discard() noexcept {
    stream_.Reset();
    if (!path_.empty())
        (void)::DeleteFileW(path_.c_str());  // a leftover is reported by whoever looks
    path_.clear();
}
