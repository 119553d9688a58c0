// DownloadTarget: the file a download goes to before the shell copies it, a fresh name in the
// user's temporary folder that stays ours from its creation until it is deleted.
#pragma once

#include <windows.h>

#include <cstdint>
#include <string>

#include "support/unique_resource.h"

// The name GetTempFileNameW reserved ("…\QRV1A2B.tmp", its placeholder kept as the reservation
// so that no other download is handed the same number) and the file under that name without its
// extension ("…\QRV1A2B"), created new and held open for reading until it is removed. The hold
// shares reading and writing (the download opens the file by name to write it, sharing it with
// readers) but not deleting, so that nobody can delete, rename or swap the file meanwhile.
// Move-only; removing is done once, by Remove or the destructor.
class DownloadTarget {
public:
    DownloadTarget() = default;
    ~DownloadTarget() { Remove(); }
    DownloadTarget(DownloadTarget&& other) noexcept;
    DownloadTarget& operator=(DownloadTarget&& other) noexcept;
    DownloadTarget(const DownloadTarget&) = delete;
    DownloadTarget& operator=(const DownloadTarget&) = delete;

    // Reserves a "QRV" name in folder (with or without its trailing backslash) and creates its
    // file. A file already under a reserved name is never touched: the next number is tried.
    // ERROR_BUFFER_OVERFLOW for a folder longer than GetTempFileNameW takes.
    [[nodiscard]] static HRESULT Create(const std::wstring& folder,
                                        DownloadTarget& target) noexcept;

    // Creates the file of a reservation that exists ("…\QRV1A2B.tmp" names "…\QRV1A2B") and holds
    // both; the reservation is the target's to delete from then on, even when this fails.
    // ERROR_FILE_EXISTS, and the file left as it was, when the name is taken.
    [[nodiscard]] HRESULT Claim(const std::wstring& reservation) noexcept;

    explicit operator bool() const noexcept { return static_cast<bool>(held_); }
    // The name the download writes to, without extension.
    const std::wstring& Path() const noexcept { return path_; }
    const std::wstring& Reservation() const noexcept { return reservation_; }

    // What the download wrote: the file added, else Path().
    const std::wstring& WrittenFile() const noexcept { return written_.empty() ? path_ : written_; }

    // Where the download wrote, when that is not Path() (the external library adds ".txt"): the
    // target deletes it with its own file.
    [[nodiscard]] HRESULT AddWrittenFile(const std::wstring& file) noexcept;

    // Opens WrittenFile() for reading, sharing it
    // with readers only: from here on nobody can write it. The reader is the caller's; it must be
    // closed before Remove.
    [[nodiscard]] HRESULT OpenForReading(UniqueFileHandle& reader, uint64_t& size) const noexcept;

    // Lets go of the file and deletes it, what the download wrote beside it, and then the
    // reservation; a second call does nothing.
    void Remove() noexcept;

private:
    std::wstring reservation_;
    std::wstring path_;
    std::wstring written_;  // the file the download wrote beside the target, if any
    UniqueFileHandle held_;
};

// A fresh target in the user's temporary folder. When the folder cannot take it, the user is told
// which folder and why (owner, which may be null, owns the box) before anything else happens,
// and the failure is returned.
[[nodiscard]] HRESULT PrepareDownloadTarget(HWND owner, DownloadTarget& target) noexcept;
