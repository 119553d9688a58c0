// The download journal: the append, its turn-taking and its rotation.
#include "download/download_journal.h"

#include "support/error_handling.h"
#include "support/unique_resource.h"

namespace {

// Per logon session: the processes that share one user's journal share this name.
constexpr wchar_t kJournalMutexName[] = L"Local\\LVShellExt.DownloadJournal";
// A writer holds the journal for one open, append and close; a download has just ended on this
// thread, so waiting a little is fine, waiting on a stuck writer is not.
constexpr DWORD kJournalMutexWaitMilliseconds = 2000;
constexpr char kByteOrderMark[] = "\xEF\xBB\xBF";

[[nodiscard]] HRESULT OpenJournal(const std::wstring& path, UniqueFileHandle& file,
                                  ULONGLONG& size) noexcept {
    // Readers (a spreadsheet that has it open) may stay; nobody else writes meanwhile.
    file.reset(::CreateFileW(path.c_str(), FILE_APPEND_DATA | FILE_READ_ATTRIBUTES,
                             FILE_SHARE_READ | FILE_SHARE_DELETE, nullptr, OPEN_ALWAYS,
                             FILE_ATTRIBUTE_NORMAL, nullptr));
    RETURN_IF_WIN32_BOOL_FALSE(file.get() != INVALID_HANDLE_VALUE);
    LARGE_INTEGER length{};
    RETURN_IF_WIN32_BOOL_FALSE(::GetFileSizeEx(file.get(), &length));
    size = static_cast<ULONGLONG>(length.QuadPart);
    return S_OK;
}

[[nodiscard]] HRESULT WriteAll(HANDLE file, const std::string& bytes) noexcept {
    DWORD written = 0;
    RETURN_IF_WIN32_BOOL_FALSE(
        ::WriteFile(file, bytes.data(), static_cast<DWORD>(bytes.size()), &written, nullptr));
    RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_WRITE_FAULT), written != bytes.size());
    return S_OK;
}

}  // namespace

HRESULT AppendJournalRow(const std::wstring& folder, const JournalRow& row) noexcept {
    try {
        RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_PATH_NOT_FOUND), folder.empty());
        const std::string line = FormatJournalRow(row);
        const std::wstring path = folder + L"\\" + kJournalFileName;

        UniqueHandle mutex(::CreateMutexW(nullptr, FALSE, kJournalMutexName));
        RETURN_IF_WIN32_BOOL_FALSE(mutex.get() != nullptr);
        const DWORD waited = ::WaitForSingleObject(mutex.get(), kJournalMutexWaitMilliseconds);
        // An abandoned mutex is ours now: its holder died, the file is as it left it.
        RETURN_HR_IF(HRESULT_FROM_WIN32(ERROR_TIMEOUT),
                     waited != WAIT_OBJECT_0 && waited != WAIT_ABANDONED);
        struct Release {
            HANDLE mutex;
            ~Release() { ::ReleaseMutex(mutex); }
        } const release{mutex.get()};

        UniqueFileHandle file;
        ULONGLONG size = 0;
        RETURN_IF_FAILED(OpenJournal(path, file, size));
        if (size > 0 && size + line.size() > kJournalRotationBytes) {
            file.reset();
            const std::wstring old = folder + L"\\" + kOldJournalFileName;
            // A journal that cannot be moved aside (a reader holds it without delete sharing)
            // grows on; the row is worth more than the limit.
            if (!::MoveFileExW(path.c_str(), old.c_str(), MOVEFILE_REPLACE_EXISTING))
                LogFailure(LastErrorResult(), __FILE__, __func__, __LINE__);
            RETURN_IF_FAILED(OpenJournal(path, file, size));
        }
        if (size == 0)
            RETURN_IF_FAILED(WriteAll(file.get(), kByteOrderMark + JournalHeader()));
        RETURN_IF_FAILED(WriteAll(file.get(), line));
        return S_OK;
    }
    CATCH_RETURN()
}
