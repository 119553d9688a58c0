// Where a download goes before the shell copies it: a fresh name in the user's temporary folder.
#include "download/download_target.h"

#include "download/halvek_comm.h"
#include "download/portable/driver_text.h"
#include "res/resource.h"
#include "support/error_handling.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

namespace {

// The user's temporary folder, with its trailing backslash.
HRESULT TemporaryFolder(std::wstring& folder) {
    wchar_t directory[130];
    const DWORD length = ::GetTempPathW(ARRAYSIZE(directory), directory);
    // Failures are made into HRESULTs: a bare Win32 code would pass for success.
    if (length == 0)
        LV_LOG_AND_RETURN(LastErrorResult());
    if (length >= ARRAYSIZE(directory))
        LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(ERROR_BUFFER_OVERFLOW));
    folder.assign(directory, length);
    return S_OK;
}

// A unique "QRV" name in the folder, without extension, where no file is: the download writes
// the file itself. Creating the placeholder also proves that the folder exists and takes files.
HRESULT MakeDownloadTarget(const std::wstring& folder, std::wstring& target) {
    // A drive with no room at all would take the placeholder (it has no data) and then fail
    // the download at its first line: say so before the surveyor starts the instrument.
    ULARGE_INTEGER available{};
    if (::GetDiskFreeSpaceExW(folder.c_str(), &available, nullptr, nullptr) &&
        available.QuadPart == 0) {
        LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(ERROR_DISK_FULL));
    }
    wchar_t temporary[MAX_PATH];
    if (::GetTempFileNameW(folder.c_str(), L"QRV", 0, temporary) == 0)
        LV_LOG_AND_RETURN(LastErrorResult());
    // Windows makes the placeholder or fails; Wine hands out a name on a read-only drive without
    // one. No placeholder means the folder takes no files.
    if (::GetFileAttributesW(temporary) == INVALID_FILE_ATTRIBUTES)
        LV_LOG_AND_RETURN(HRESULT_FROM_WIN32(ERROR_ACCESS_DENIED));
    // Only the unique name is wanted, so the placeholder goes and the name loses its extension.
    (void)::DeleteFileW(temporary);  // a placeholder left behind is empty and harmless
    target = temporary;
    const size_t dot = target.rfind(L'.');
    if (dot != std::wstring::npos && target.find(L'\\', dot) == std::wstring::npos)
        target.erase(dot);
    return S_OK;
}

}  // namespace

HRESULT PrepareDownloadTarget(HWND owner, std::wstring& target) {
    std::wstring folder;
    HRESULT result = TemporaryFolder(folder);
    if (SUCCEEDED(result))
        result = MakeDownloadTarget(folder, target);
    if (SUCCEEDED(result))
        return result;
    if (folder.size() > 1 && folder.back() == L'\\')
        folder.pop_back();
    ShowMessageBox(owner,
                   FormatDriverText(LoadUiText(IDS_TEMPORARY_FOLDER_UNUSABLE),
                                    {folder, SystemResultText(result)}),
                   LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONSTOP);
    return result;
}
