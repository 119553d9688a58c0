// CStream2: a read-once stream over a file, which it deletes once it has been read to the end.
#pragma once

#include <windows.h>
#include <objidl.h>

#include <cstdint>
#include <mutex>
#include <string>

#include "download/download_target.h"
#include "support/com_object.h"
#include "support/unique_resource.h"

// The shell's copy engine sizes the stream (Stat, or Seek to the end and back), then reads it
// with Read or CopyTo, possibly from another thread than the one that got it. Every operation
// it relies on either does what IStream promises or fails; none answers S_OK with nothing done.
class CStream2 final : public ComObject<IStream> {
public:
    CStream2() = default;
    // Deletes the file when asked to at binding and it was not read to the end.
    ~CStream2() override;

    // Opens the file and takes its size. Fails with the open's HRESULT when the file cannot be
    // read: a stream over a missing file would hand the caller an empty file as a good one.
    [[nodiscard]] HRESULT Bind(const std::wstring& path, bool deleteWhenFinished) noexcept;
    // Takes a download's target over: reads what the download wrote, and removes the target (its
    // files and its reservation) once, when read to the end or when the stream goes. Fails with
    // the open's HRESULT, the target then removed when the stream goes.
    [[nodiscard]] HRESULT Bind(DownloadTarget target) noexcept;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;

    // A short read is the end: the file is closed and, if asked, deleted. Failures give the
    // Win32 error as an HRESULT.
    IFACEMETHODIMP Read(void* buffer, ULONG wanted, ULONG* got) override;
    IFACEMETHODIMP Write(const void*, ULONG, ULONG*) override { return E_NOTIMPL; }
    // Moves within the file and reports the position. Once the file is gone only a seek that
    // stays where the stream ended can be honoured; any other fails with STG_E_INVALIDFUNCTION.
    IFACEMETHODIMP Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override;
    IFACEMETHODIMP SetSize(ULARGE_INTEGER) override { return E_NOTIMPL; }
    // Copies up to `count` bytes from the position on; a copy that reaches the end ends the
    // stream as a read to the end does.
    IFACEMETHODIMP CopyTo(IStream* target, ULARGE_INTEGER count, ULARGE_INTEGER* read,
                          ULARGE_INTEGER* written) override;
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

    // After a bind's open: the stream reads from the start once the open succeeded.
    [[nodiscard]] HRESULT StartReading(HRESULT opened) noexcept;
    [[nodiscard]] HRESULT ReadLocked(void* buffer, ULONG wanted, ULONG* got) noexcept;
    // Closes the file and, when asked at binding, deletes it; the state ends finished.
    void Finish() noexcept;
    // Closes the file and deletes what the stream was asked to delete, once.
    void Discard() noexcept;

    std::mutex lock_;  // the caller may share the stream between threads
    std::wstring path_;
    uint64_t size_ = 0;
    uint64_t position_ = 0;
    State state_ = kNotOpened;
    UniqueFileHandle file_;
    bool deleteWhenFinished_ = false;
    DownloadTarget download_;  // when bound to a download: what goes at the end
};
