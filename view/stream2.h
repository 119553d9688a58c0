// CStream2: a read-once stream over a file, which it deletes once it has been read to the end.
#pragma once

#include <windows.h>
#include <objidl.h>

#include <string>

#include "support/com_object.h"
#include "support/unique_resource.h"

class CStream2 final : public ComObject<IStream> {
public:
    CStream2() = default;
    // Deletes the file when asked to at binding and it was not read to the end.
    ~CStream2() override;

    // Keeps the path and takes the file's size now (0 when it cannot be opened); the file itself
    // is opened at the first Read. Always succeeds.
    HRESULT Bind(const std::wstring& path, bool deleteWhenFinished);

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;

    // A short read is the end: the file is closed and, if asked, deleted. Failures give the
    // Win32 error as an HRESULT.
    IFACEMETHODIMP Read(void* buffer, ULONG wanted, ULONG* got) override;
    IFACEMETHODIMP Write(const void*, ULONG, ULONG*) override { return E_NOTIMPL; }
    // The stream only goes forward: seeking is accepted and does nothing.
    IFACEMETHODIMP Seek(LARGE_INTEGER, DWORD, ULARGE_INTEGER*) override { return S_OK; }
    IFACEMETHODIMP SetSize(ULARGE_INTEGER) override { return E_NOTIMPL; }
    IFACEMETHODIMP CopyTo(IStream*, ULARGE_INTEGER, ULARGE_INTEGER*, ULARGE_INTEGER*) override {
        return E_NOTIMPL;
    }
    IFACEMETHODIMP Commit(DWORD) override { return E_NOTIMPL; }
    IFACEMETHODIMP Revert() override { return E_NOTIMPL; }
    IFACEMETHODIMP LockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override { return E_NOTIMPL; }
    IFACEMETHODIMP UnlockRegion(ULARGE_INTEGER, ULARGE_INTEGER, DWORD) override {
        return E_NOTIMPL;
    }
    // A stream of the size taken at binding; its file name only when the flags ask for a name.
    IFACEMETHODIMP Stat(STATSTG* statistics, DWORD flags) override;
    IFACEMETHODIMP Clone(IStream**) override { return E_NOTIMPL; }

private:
    enum State : DWORD { kNotOpened = 0, kReading = 2, kFinished = 3 };

    std::wstring path_;
    DWORD size_ = 0;
    State state_ = kNotOpened;
    UniqueFileHandle file_;
    bool deleteWhenFinished_ = false;
};
