// DownloadTarget: a fresh name in the user's temporary folder, reserved, created new and held.
#include "download/download_target.h"

#include <new>
#include <utility>

#include "res/resource.h"
#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/portable/text_format.h"
#include "support/read_only_file.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

namespace {

// GetTempFileNameW writes "<folder>\QRVxxxx.tmp" into MAX_PATH characters and refuses a longer
// folder; Wine does not check, so the limit is checked here before the call.
constexpr size_t kLongestReservingFolder = MAX_PATH - 14;
// Names taken by files that are not ours: after this many in a row the folder is not usable.
constexpr int kReservationAttempts = 16;

// The name a reservation stands for: its path without the extension that GetTempFileNameW gave.
std::wstring WithoutExtension(const std::wstring& path) {
    std::wstring name = path;
    const size_t dot = name.rfind(L'.');
    if (dot != std::wstring::npos && name.find(L'\\', dot) == std::wstring::npos)
        name.erase(dot);
    return name;
}

// The user's temporary folder, with its trailing backslash, of any length GetTempPathW gives.
// Where GetTempPathW fails, folder still names what TMP or TEMP says, for the message.
[[nodiscard]] HRESULT TemporaryFolder(std::wstring& folder) noexcept {
    try {
        folder.clear();
        for (int attempt = 0; attempt < 2; ++attempt) {  // the variable may grow between two calls
            const DWORD needed = ::GetTempPathW(0, nullptr);
            if (needed == 0)
                break;
            std::wstring directory(needed, L'\0');
            const DWORD length = ::GetTempPathW(needed, directory.data());
            if (length == 0)
                break;
            if (length < needed) {
                directory.resize(length);
                folder = std::move(directory);
                return S_OK;
            }
        }
        // Failures are made into HRESULTs: a bare Win32 code would pass for success.
        const HRESULT failure = LastErrorResult();
        for (const wchar_t* variable : {L"TMP", L"TEMP"}) {
            const DWORD size = ::GetEnvironmentVariableW(variable, nullptr, 0);
            if (size == 0)
                continue;
            folder.assign(size, L'\0');
            folder.resize(::GetEnvironmentVariableW(variable, folder.data(), size));
            break;
        }
        LV_LOG_AND_RETURN(failure);
    }
    CATCH_RETURN()
}

}  // namespace

DownloadTarget::DownloadTarget(DownloadTarget&& other) noexcept
    : reservation_(std::move(other.reservation_)),
      path_(std::move(other.path_)),
      written_(std::move(other.written_)),
      held_(std::move(other.held_)) {
    other.reservation_.clear();
    other.path_.clear();
    other.written_.clear();
}

DownloadTarget& DownloadTarget::operator=(DownloadTarget&& other) noexcept {
    if (this != &other) {
        Remove();
        reservation_ = std::move(other.reservation_);
        path_ = std::move(other.path_);
        written_ = std::move(other.written_);
        held_ = std::move(other.held_);
        other.reservation_.clear();
        other.path_.clear();
        other.written_.clear();
    }
    return *this;
}

HRESULT DownloadTarget::Claim(const std::wstring& reservation) noexcept {
    Remove();
    try {
        reservation_ = reservation;
        const std::wstring path = WithoutExtension(reservation);
        // Windows makes the placeholder or fails; Wine hands out a name on a read-only drive
        // without one. No placeholder means no reservation, and a folder that takes no files.
        if (::GetFileAttributesW(reservation.c_str()) == INVALID_FILE_ATTRIBUTES)
            return HRESULT_FROM_WIN32(ERROR_ACCESS_DENIED);
        // Created new, never opened or emptied: a file already there is someone else's. The hold
        // shares no deleting, so nobody can delete, rename or replace the file while it is held;
        // it must have data access for that (a handle with none restricts nobody), and reading is
        // the least, which the download's writer shares.
        held_.reset(::CreateFileW(path.c_str(), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE,
                                  nullptr, CREATE_NEW, FILE_ATTRIBUTE_NORMAL, nullptr));
        if (!held_)
            return LastErrorResult();
        path_ = path;
        return S_OK;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT DownloadTarget::Create(const std::wstring& folder, DownloadTarget& target) noexcept {
    target.Remove();
    try {
        if (folder.size() > kLongestReservingFolder)
            LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(ERROR_BUFFER_OVERFLOW));
        // A drive with no room at all would take the placeholder (it has no data) and then fail
        // the download at its first line: say so before the surveyor starts the instrument.
        ULARGE_INTEGER available{};
        if (::GetDiskFreeSpaceExW(folder.c_str(), &available, nullptr, nullptr) &&
            available.QuadPart == 0) {
            LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(ERROR_DISK_FULL));
        }
        // Names whose file someone else made keep their reservations until a free one is found,
        // so that GetTempFileNameW moves on; then they go.
        DownloadTarget taken[kReservationAttempts];
        for (DownloadTarget& attempt : taken) {
            wchar_t reservation[MAX_PATH];
            if (::GetTempFileNameW(folder.c_str(), L"QRV", 0, reservation) == 0)
                LV_LOG_AND_RETURN(LastErrorResult());
            const HRESULT claimed = attempt.Claim(reservation);
            if (SUCCEEDED(claimed)) {
                target = std::move(attempt);
                return S_OK;
            }
            if (claimed != HRESULT_FROM_WIN32(ERROR_FILE_EXISTS) &&
                claimed != HRESULT_FROM_WIN32(ERROR_ALREADY_EXISTS)) {
                LV_LOG_AND_RETURN(claimed);
            }
        }
        LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(ERROR_FILE_EXISTS));
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT DownloadTarget::AddWrittenFile(const std::wstring& file) noexcept {
    if (file.empty() || file == path_)
        return S_OK;
    try {
        written_ = file;
        return S_OK;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT DownloadTarget::OpenForReading(UniqueFileHandle& reader, uint64_t& size) const noexcept {
    RETURN_HR_IF(E_UNEXPECTED, !held_);
    // Readers only: a writer that still holds the file makes the open fail, and none can come.
    return OpenReadOnlyFile(WrittenFile(), reader, size);
}

void DownloadTarget::Remove() noexcept {
    // The hold shares no deleting, so it goes first; the reservation goes last, so that no other
    // download is handed this number while any of its files is still there. A file that cannot
    // be deleted stays in the temporary folder, which is not worth failing anything for.
    held_.reset();
    if (!written_.empty())
        (void)::DeleteFileW(written_.c_str());
    if (!path_.empty())
        (void)::DeleteFileW(path_.c_str());
    if (!reservation_.empty())
        (void)::DeleteFileW(reservation_.c_str());
    written_.clear();
    path_.clear();
    reservation_.clear();
}

HRESULT PrepareDownloadTarget(HWND owner, DownloadTarget& target) noexcept {
    try {
        std::wstring folder;
        HRESULT result = TemporaryFolder(folder);
        if (SUCCEEDED(result))
            result = DownloadTarget::Create(folder, target);
        if (SUCCEEDED(result))
            return result;
        if (folder.size() > 1 && folder.back() == L'\\')
            folder.pop_back();
        ShowMessageBox(owner,
                       FormatText(LoadUiText(IDS_TEMPORARY_FOLDER_UNUSABLE),
                                  {folder, SystemResultText(result)}),
                       LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONSTOP);
        return result;
    }
    CATCH_RETURN()
}
