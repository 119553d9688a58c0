// The folder of the download records. Only this function lives here: test programs link a copy
// with the folder override compiled in, which must replace this file's object whole.
#include "download/download_records_folder.h"

#include <windows.h>
#include <shlobj.h>

#include "support/unique_resource.h"

namespace {

bool IsFolder(const std::wstring& path) noexcept {
    const DWORD attributes = ::GetFileAttributesW(path.c_str());
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY);
}

}  // namespace

std::wstring DownloadRecordsFolder() noexcept {
    try {
#ifdef LV_DOWNLOAD_RECORDS_FOLDER_OVERRIDE
        // A variable any parent process can set must not choose where the shipped module writes.
        wchar_t chosen[MAX_PATH];
        const DWORD length = ::GetEnvironmentVariableW(L"LVSHELLEXT_DOWNLOADS_DIR", chosen, MAX_PATH);
        if (length > 0 && length < MAX_PATH)
            return std::wstring(chosen, length);
#endif
        PWSTR path = nullptr;
        const HRESULT found = ::SHGetKnownFolderPath(FOLDERID_LocalAppData, 0, nullptr, &path);
        const UniqueCoTaskMem owner(path);
        if (FAILED(found) || !path)
            return {};
        std::wstring folder = path;
        for (const wchar_t* part : {L"\\Quorvel", L"\\Digital Levels"}) {
            folder += part;
            ::CreateDirectoryW(folder.c_str(), nullptr);  // already there is fine; checked below
        }
        return IsFolder(folder) ? folder : std::wstring();
    } catch (...) {
        return {};  // no memory for a path: nothing is kept or journaled, the download goes on
    }
}
