// The error log: entries built from the failure and the thread's error texts, appended to a file
// in the user's local application data folder, which is moved aside when it reaches its limit.
// Nothing here may use the result macros: they log through this file.
#include "support/error_log.h"

#include <oleauto.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <atomic>
#include <cwchar>

#include "support/module_instance.h"
#include "support/unique_resource.h"

namespace {

constexpr wchar_t kLogName[] = L"LVShellExt.log";
constexpr wchar_t kOldLogName[] = L"LVShellExt.old.log";
#ifdef LV_ERROR_LOG_FOLDER_OVERRIDE
// Test programs only (support/CMakeLists.txt): a variable that any parent process can set must
// not choose where the shipped module writes and renames files, least of all in an elevated
// process of the same user. Under Wine every process is elevated, so the token cannot tell a
// test from the shell, and the shipped build has no override at all.
constexpr wchar_t kFolderOverride[] = L"LVSHELLEXT_LOG_DIR";
#endif
// Per logon session: the processes that share one user's log share this name.
constexpr wchar_t kLogMutexName[] = L"Local\\LVShellExt.ErrorLog";
// A writer holds the log for one open, append and close. Whoever holds it longer is stuck or
// hostile: the entry is dropped rather than keep the calling window frozen.
constexpr DWORD kLogMutexWaitMilliseconds = 50;
// Once a wait ran out while no other thread of this process was logging, another process holds
// the log: for this long, entries only take the log when it is free at once, so that a burst of
// failures costs one wait, not one each.
constexpr ULONGLONG kHeldElsewhereMilliseconds = 1000;
// A file that cannot be moved aside (a reader holds it without delete sharing) grows up to this
// many times the limit; entries past that are dropped.
constexpr ULONGLONG kSizeCeilingFactor = 2;
// A text longer than this is cut, so that one entry cannot fill the log on its own.
constexpr size_t kFieldLengthLimit = 2048;

std::atomic<DWORD> g_sizeLimit{kErrorLogDefaultSizeLimit};
std::atomic<int> g_writersInProcess{0};
std::atomic<ULONGLONG> g_heldElsewhereUntil{0};

struct BstrTraits {
    using Type = BSTR;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::SysFreeString(value); }
};

// Holds the log's mutex for one entry, so that two processes never both move the full file
// aside, nor both start the new one with a byte-order mark. Waits a moment at most: without the
// mutex the entry is dropped.
class LogLock {
public:
    LogLock() noexcept : mutex_(::CreateMutexW(nullptr, FALSE, kLogMutexName)) {
        const bool aloneHere = g_writersInProcess.fetch_add(1) == 0;
        if (!mutex_)
            return;
        const bool heldElsewhere = aloneHere && ::GetTickCount64() < g_heldElsewhereUntil.load();
        const DWORD outcome =
            ::WaitForSingleObject(mutex_.get(), heldElsewhere ? 0 : kLogMutexWaitMilliseconds);
        // An abandoned mutex is ours now: its holder died, the file is whole entries still.
        held_ = outcome == WAIT_OBJECT_0 || outcome == WAIT_ABANDONED;
        if (outcome == WAIT_TIMEOUT && aloneHere)
            g_heldElsewhereUntil = ::GetTickCount64() + kHeldElsewhereMilliseconds;
        else if (held_)
            g_heldElsewhereUntil = 0;
    }
    LogLock(const LogLock&) = delete;
    LogLock& operator=(const LogLock&) = delete;
    ~LogLock() {
        if (held_)
            ::ReleaseMutex(mutex_.get());
        g_writersInProcess.fetch_sub(1);
    }
    bool held() const noexcept { return held_; }

private:
    UniqueHandle mutex_;
    bool held_ = false;
};

// One line per text: a line break inside a description would read as the start of another line.
void AppendOneLine(std::wstring& entry, const wchar_t* text) {
    if (!text)
        return;
    const size_t length = wcsnlen(text, kFieldLengthLimit);
    for (size_t i = 0; i < length; ++i)
        entry += text[i] == L'\r' || text[i] == L'\n' ? L' ' : text[i];
}

void AppendDescription(std::wstring& entry, const wchar_t* label, const std::wstring& text) {
    if (text.empty())
        return;
    entry += L"\r\n";
    entry += label;
    AppendOneLine(entry, text.c_str());
}

// Reading the thread's error info clears it; it is set again at once, so that logging a failure
// leaves it for the caller's own caller, as if the log had not looked.
std::wstring ErrorInfoDescription() {
    Microsoft::WRL::ComPtr<IErrorInfo> info;
    if (::GetErrorInfo(0, info.GetAddressOf()) != S_OK || !info)
        return {};
    ::SetErrorInfo(0, info.Get());
    UniqueResource<BstrTraits> description;
    if (FAILED(info->GetDescription(description.put())) || !description)
        return {};
    return std::wstring(description.get(), ::SysStringLen(description.get()));
}

std::wstring BuildEntry(const wchar_t* source, HRESULT result, const wchar_t* function, int line,
                        const wchar_t* internalDescription) {
    SYSTEMTIME now{};
    ::GetLocalTime(&now);
    // Explorer and every program with a file dialog write here: the time and the process tell
    // a technician which entries belong to the failure that the user reports.
    wchar_t stamp[96];
    _snwprintf(stamp, ARRAYSIZE(stamp),
               L"%04u-%02u-%02u %02u:%02u:%02u.%03u, process %lu, thread %lu\r\n", now.wYear,
               now.wMonth, now.wDay, now.wHour, now.wMinute, now.wSecond, now.wMilliseconds,
               ::GetCurrentProcessId(), ::GetCurrentThreadId());
    stamp[ARRAYSIZE(stamp) - 1] = 0;

    std::wstring sourceText, functionText;
    AppendOneLine(sourceText, source);
    AppendOneLine(functionText, function);
    std::wstring first(sourceText.size() + functionText.size() + 40, L'\0');
    const int length =
        _snwprintf(first.data(), first.size(), L"%ls - 0x%08X (%ls, %i)", sourceText.c_str(),
                   static_cast<unsigned>(result), functionText.c_str(), line);
    first.resize(length > 0 ? static_cast<size_t>(length) : 0);

    std::wstring entry = stamp + first;
    AppendDescription(entry, L"System description: ",
                      SystemMessageText(static_cast<DWORD>(result)));
    AppendDescription(entry, L"IErrorInfo description: ", ErrorInfoDescription());
    AppendDescription(entry, L"Internal description: ",
                      internalDescription ? internalDescription : L"");
    entry += L"\r\n";
    return entry;
}

bool IsFolder(const std::wstring& path) noexcept {
    const DWORD attributes = ::GetFileAttributesW(path.c_str());
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY);
}

struct KnownFolder {
    wchar_t path[MAX_PATH];
    bool found;
};

KnownFolder LookUpLocalAppData() noexcept {
    KnownFolder folder{};
    PWSTR path = nullptr;
    const HRESULT result = ::SHGetKnownFolderPath(FOLDERID_LocalAppData, 0, nullptr, &path);
    const UniqueCoTaskMem owner(path);
    folder.found = SUCCEEDED(result) && path && wcslen(path) < MAX_PATH;
    if (folder.found)
        wcscpy(folder.path, path);
    return folder;
}

std::wstring LogFolder() {
    wchar_t chosen[MAX_PATH];
    DWORD length = 0;
#ifdef LV_ERROR_LOG_FOLDER_OVERRIDE
    length = ::GetEnvironmentVariableW(kFolderOverride, chosen, MAX_PATH);
    // A test's folder or none at all: a test must never write to the user's own log.
    if (length > 0) {
        if (length >= MAX_PATH)
            return {};
        ::CreateDirectoryW(chosen, nullptr);
        return IsFolder(chosen) ? std::wstring(chosen, length) : std::wstring();
    }
#endif
    // Looked up once per process: the log may be written from DllMain at unload, where the
    // shell's folder lookup is no longer safe to call.
    static const KnownFolder localAppData = LookUpLocalAppData();
    if (localAppData.found) {
        std::wstring folder = localAppData.path;
        for (const wchar_t* part : {L"\\Quorvel", L"\\Digital Levels"}) {
            folder += part;
            ::CreateDirectoryW(folder.c_str(), nullptr);  // already there is fine
        }
        if (IsFolder(folder))
            return folder;
    }
    length = ::GetTempPathW(MAX_PATH, chosen);
    if (length == 0 || length >= MAX_PATH)
        return {};
    std::wstring folder(chosen, length);
    if (folder.back() == L'\\')
        folder.pop_back();
    return folder;
}

UniqueFileHandle OpenLog(const std::wstring& path) noexcept {
    // Appends land whole at the end whoever else writes; the file may be read and moved aside
    // while it is open elsewhere.
    return UniqueFileHandle(::CreateFileW(path.c_str(), FILE_APPEND_DATA | FILE_READ_ATTRIBUTES,
                                          FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                                          nullptr, OPEN_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr));
}

void WriteEntry(const std::wstring& entry) {
    const std::wstring folder = LogFolder();
    if (folder.empty())
        return;
    const std::wstring path = folder + L'\\' + kLogName;
    const LogLock lock;
    if (!lock.held())
        return;  // a dropped entry rather than a caller kept waiting
    UniqueFileHandle file = OpenLog(path);
    LARGE_INTEGER size{};
    if (!file || !::GetFileSizeEx(file.get(), &size))
        return;
    const ULONGLONG entryBytes = entry.size() * sizeof(wchar_t);
    const ULONGLONG limit = g_sizeLimit.load();
    if (size.QuadPart > 0 && static_cast<ULONGLONG>(size.QuadPart) + entryBytes > limit) {
        file.reset();
        // When a reader holds the file without delete sharing it stays: the entry then goes on
        // its end, up to the ceiling, and the next entry tries again.
        ::MoveFileExW(path.c_str(), (folder + L'\\' + kOldLogName).c_str(),
                      MOVEFILE_REPLACE_EXISTING);
        file = OpenLog(path);
        if (!file || !::GetFileSizeEx(file.get(), &size))
            return;
        if (static_cast<ULONGLONG>(size.QuadPart) + entryBytes > limit * kSizeCeilingFactor)
            return;
    }
    std::wstring text;
    if (size.QuadPart == 0)
        text = L"\xFEFF";  // UTF-16 LE byte-order mark, so that any editor reads the file
    text += entry;
    DWORD written = 0;
    ::WriteFile(file.get(), text.data(), static_cast<DWORD>(text.size() * sizeof(wchar_t)),
                &written, nullptr);
}

}  // namespace

void ReportError(const wchar_t* source, HRESULT result, const wchar_t* function, int line,
                 const wchar_t* internalDescription) noexcept {
    const DWORD lastError = ::GetLastError();
    try {
        WriteEntry(BuildEntry(source, result, function, line, internalDescription));
    } catch (...) {
        // Out of memory while logging: the entry is dropped, the caller's failure goes on.
    }
    ::SetLastError(lastError);
}

std::wstring ErrorLogPath() noexcept {
    try {
        const std::wstring folder = LogFolder();
        return folder.empty() ? std::wstring() : folder + L'\\' + kLogName;
    } catch (...) {
        return {};
    }
}

DWORD SetErrorLogSizeLimit(DWORD bytes) noexcept {
    return g_sizeLimit.exchange(bytes);
}
