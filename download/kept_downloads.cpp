// Kept downloads: the whole-or-nothing copy, the policy and the pruning.
#include "download/kept_downloads.h"

#include <shellapi.h>

#include <vector>

#include "download/download_records_folder.h"
#include "res/resource.h"
#include "stations/station_models.h"
#include "support/error_handling.h"
#include "support/module_instance.h"
#include "support/portable/text_format.h"
#include "support/registry_value.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"
#include "support/user_interface.h"

namespace {

// Two downloads of one station in one second are rare; a folder full of such names is not ours.
constexpr unsigned kMaxSameSecondNames = 100;
// A copy is read and written in pieces of this size.
constexpr DWORD kCopyBufferBytes = 64 * 1024;
// A walk over the kept folder stops here: it is ours, but anyone can fill it.
constexpr size_t kMaxKeptFilesVisited = 100000;
// Temporary names of copies being written; pruning leaves them alone.
constexpr wchar_t kPartPrefix[] = L"~kp";
constexpr int64_t kFileTimeUnitsPerSecond = 10000000;

// Deletes a temporary copy unless it was renamed into place.
class PartFile {
public:
    explicit PartFile(std::wstring path) : path_(std::move(path)) {}
    ~PartFile() {
        if (!path_.empty())
            (void)::DeleteFileW(path_.c_str());  // nothing more to do if it cannot go
    }
    PartFile(const PartFile&) = delete;
    PartFile& operator=(const PartFile&) = delete;
    const std::wstring& Path() const noexcept { return path_; }
    void Release() noexcept { path_.clear(); }

private:
    std::wstring path_;
};

[[nodiscard]] HRESULT EnsureFolder(const std::wstring& folder) noexcept {
    if (!::CreateDirectoryW(folder.c_str(), nullptr) && ::GetLastError() != ERROR_ALREADY_EXISTS)
        LV_LOG_AND_RETURN(LastErrorResult());
    const DWORD attributes = ::GetFileAttributesW(folder.c_str());
    // A file where the folder should be.
    RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_DIRECTORY),
                 attributes == INVALID_FILE_ATTRIBUTES || !(attributes & FILE_ATTRIBUTE_DIRECTORY));
    return S_OK;
}

[[nodiscard]] HRESULT CopyWhole(HANDLE from, HANDLE to) noexcept {
    std::vector<char> buffer;
    try {
        buffer.resize(kCopyBufferBytes);
    } catch (...) {
        return E_OUTOFMEMORY;
    }
    for (;;) {
        DWORD got = 0;
        RETURN_IF_WIN32_BOOL_FALSE(::ReadFile(from, buffer.data(), kCopyBufferBytes, &got, nullptr));
        if (got == 0)
            break;
        DWORD written = 0;
        RETURN_IF_WIN32_BOOL_FALSE(::WriteFile(to, buffer.data(), got, &written, nullptr));
        RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_WRITE_FAULT), written != got);
    }
    RETURN_IF_WIN32_BOOL_FALSE(::FlushFileBuffers(to));
    return S_OK;
}

DWORD PolicyValue(const wchar_t* name, DWORD fallback) noexcept {
    for (const HKEY hive : {HKEY_LOCAL_MACHINE, HKEY_CURRENT_USER}) {
        HKEY opened = nullptr;
        if (::RegOpenKeyExW(hive, kKeepingPolicyKey, 0, KEY_QUERY_VALUE, &opened) != ERROR_SUCCESS)
            continue;
        const UniqueRegKey key(opened);
        DWORD value = 0;
        // A value of the wrong type is no policy: the next place is asked.
        if (ReadDwordValue(key.get(), name, value) == ERROR_SUCCESS)
            return value;
    }
    return fallback;
}

std::wstring ModelExtension(const std::wstring& model) {
    const std::wstring name = StationFileName(model);
    const size_t dot = name.rfind(L'.');
    return dot == std::wstring::npos ? std::wstring() : name.substr(dot);
}

int64_t SecondsOf(const FILETIME& time) noexcept {
    ULARGE_INTEGER value;
    value.LowPart = time.dwLowDateTime;
    value.HighPart = time.dwHighDateTime;
    return static_cast<int64_t>(value.QuadPart / kFileTimeUnitsPerSecond);
}

}  // namespace

RetentionLimits ReadKeepingPolicy() noexcept {
    const RetentionLimits defaults;
    return {PolicyValue(kKeepDownloadsDaysValue, defaults.Days),
            PolicyValue(kKeepDownloadsMegabytesValue, defaults.Megabytes)};
}

std::wstring KeptDownloadsFolder() noexcept {
    try {
        const std::wstring records = DownloadRecordsFolder();
        return records.empty() ? std::wstring() : records + L"\\" + kKeptDownloadsFolderName;
    } catch (...) {
        return {};
    }
}

HRESULT KeepDownload(const Station& station, const DownloadTarget& target,
                     const SYSTEMTIME& localTime, RetentionLimits limits,
                     std::wstring& keptFile) noexcept {
    try {
        keptFile.clear();
        if (limits.Days == 0)
            return S_FALSE;
        const std::wstring downloads = KeptDownloadsFolder();
        RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_PATH_NOT_FOUND), downloads.empty());
        RETURN_IF_FAILED(EnsureFolder(downloads));
        const std::wstring folder = downloads + L"\\" + SafeFolderName(station.Name);
        RETURN_IF_FAILED(EnsureFolder(folder));

        UniqueFileHandle reader;
        uint64_t size = 0;
        RETURN_IF_FAILED(target.OpenForReading(reader, size));

        wchar_t partName[MAX_PATH];
        RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_BUFFER_OVERFLOW), folder.size() > MAX_PATH - 14);
        RETURN_IF_WIN32_BOOL_FALSE(::GetTempFileNameW(folder.c_str(), kPartPrefix, 0, partName));
        PartFile part(partName);
        {
            UniqueFileHandle writer(::CreateFileW(part.Path().c_str(), GENERIC_WRITE, 0, nullptr,
                                                  TRUNCATE_EXISTING, FILE_ATTRIBUTE_NORMAL,
                                                  nullptr));
            RETURN_IF_WIN32_BOOL_FALSE(writer.get() != INVALID_HANDLE_VALUE);
            RETURN_IF_FAILED(CopyWhole(reader.get(), writer.get()));
        }
        const LocalDateTime time{localTime.wYear, localTime.wMonth,  localTime.wDay,
                                 localTime.wHour, localTime.wMinute, localTime.wSecond};
        const std::wstring extension = ModelExtension(station.Model);
        for (unsigned sequence = 1; sequence <= kMaxSameSecondNames; ++sequence) {
            const std::wstring name = folder + L"\\" + KeptFileName(time, extension, sequence);
            // Never replacing: a name taken, even by a copy made a moment ago, means the next one.
            if (::MoveFileExW(part.Path().c_str(), name.c_str(), MOVEFILE_WRITE_THROUGH)) {
                part.Release();
                keptFile = name;
                return S_OK;
            }
            const DWORD error = ::GetLastError();
            if (error != ERROR_ALREADY_EXISTS && error != ERROR_FILE_EXISTS)
                LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(error));
        }
        LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(ERROR_FILE_EXISTS));
    }
    CATCH_RETURN()
}

void PruneKeptDownloads(const std::wstring& downloadsFolder, RetentionLimits limits) noexcept {
    try {
        std::vector<KeptFile> files;
        std::vector<std::wstring> paths;
        WIN32_FIND_DATAW station{};
        UniqueFindHandle stations(
            ::FindFirstFileW((downloadsFolder + L"\\*").c_str(), &station));
        if (stations.get() == INVALID_HANDLE_VALUE)
            return;  // nothing kept yet
        do {
            const std::wstring stationName = station.cFileName;
            if (!(station.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) ||
                (station.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) ||
                stationName == L"." || stationName == L"..")
                continue;
            const std::wstring folder = downloadsFolder + L"\\" + stationName;
            WIN32_FIND_DATAW file{};
            UniqueFindHandle found(::FindFirstFileW((folder + L"\\*").c_str(), &file));
            if (found.get() == INVALID_HANDLE_VALUE)
                continue;
            do {
                const std::wstring name = file.cFileName;
                if ((file.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) ||
                    name.starts_with(kPartPrefix))
                    continue;
                const uint64_t size =
                    (static_cast<uint64_t>(file.nFileSizeHigh) << 32) | file.nFileSizeLow;
                files.push_back({stationName, SecondsOf(file.ftLastWriteTime), size});
                paths.push_back(folder + L"\\" + name);
            } while (files.size() < kMaxKeptFilesVisited && ::FindNextFileW(found.get(), &file));
        } while (files.size() < kMaxKeptFilesVisited && ::FindNextFileW(stations.get(), &station));

        FILETIME now{};
        ::GetSystemTimeAsFileTime(&now);
        for (const size_t index : FilesToDelete(files, limits, SecondsOf(now))) {
            if (!::DeleteFileW(paths[index].c_str()))
                LogFailure(LastErrorResult(), __FILE__, __func__, __LINE__);
        }
    }
    CATCH_LOG()
}

HRESULT OpenKeptDownloadsFolder(HWND owner, int showCommand) noexcept {
    try {
        const std::wstring folder = KeptDownloadsFolder();
        const HRESULT made =
            folder.empty() ? HRESULT_FROM_WIN32(ERROR_PATH_NOT_FOUND) : EnsureFolder(folder);
        if (FAILED(made)) {
            // Without a path the user is told where it should have been.
            const std::wstring shown =
                folder.empty() ? L"%LOCALAPPDATA%\\Quorvel\\Digital Levels\\Downloads" : folder;
            ShowMessageBox(owner,
                           FormatText(LoadUiText(IDS_KEPT_DOWNLOADS_UNAVAILABLE),
                                      {shown, SystemResultText(made)}),
                           LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONSTOP);
            return made;
        }
        SHELLEXECUTEINFOW execute{};
        execute.cbSize = sizeof execute;
        // The caller (rundll32) ends its process as soon as this returns: an activation that
        // went on in the background would die with it.
        execute.fMask = SEE_MASK_NOASYNC;
        execute.hwnd = owner;
        execute.lpFile = folder.c_str();
        execute.nShow = showCommand;
        RETURN_IF_WIN32_BOOL_FALSE(::ShellExecuteExW(&execute));
        return S_OK;
    }
    CATCH_RETURN()
}
