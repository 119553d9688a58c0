// A second process for the error log's tests, built with the shipped error log (no folder
// override):
//   error_log_helper hold READY RELEASE  takes the log's mutex, sets the event READY and keeps
//                                        the mutex until the event RELEASE is set (a minute at most)
//   error_log_helper path FILE           writes the path the log would take, as UTF-16, to FILE
#include <windows.h>
#include <shellapi.h>

#include <string>

#include "support/error_log.h"
#include "support/unique_resource.h"

namespace {

constexpr wchar_t kLogMutexName[] = L"Local\\LVShellExt.ErrorLog";
constexpr DWORD kLongestHoldMilliseconds = 60000;

enum class Exit : int { Done = 0, Usage = 2, Failed = 3 };

Exit Hold(const wchar_t* readyName, const wchar_t* releaseName) {
    UniqueHandle mutex(::CreateMutexW(nullptr, FALSE, kLogMutexName));
    UniqueHandle ready(::OpenEventW(EVENT_MODIFY_STATE, FALSE, readyName));
    UniqueHandle release(::OpenEventW(SYNCHRONIZE, FALSE, releaseName));
    if (!mutex || !ready || !release ||
        ::WaitForSingleObject(mutex.get(), kLongestHoldMilliseconds) != WAIT_OBJECT_0) {
        return Exit::Failed;
    }
    ::SetEvent(ready.get());
    ::WaitForSingleObject(release.get(), kLongestHoldMilliseconds);
    ::ReleaseMutex(mutex.get());
    return Exit::Done;
}

Exit WritePath(const wchar_t* output) {
    const std::wstring path = ErrorLogPath();
    UniqueFileHandle file(
        ::CreateFileW(output, GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr));
    DWORD written = 0;
    return file && ::WriteFile(file.get(), path.data(),
                               static_cast<DWORD>(path.size() * sizeof(wchar_t)), &written, nullptr)
               ? Exit::Done
               : Exit::Failed;
}

}  // namespace

int main() {
    int count = 0;
    UniqueLocalMemory owner(::CommandLineToArgvW(::GetCommandLineW(), &count));
    auto* arguments = static_cast<wchar_t**>(static_cast<void*>(owner.get()));
    const std::wstring mode = count > 1 ? arguments[1] : L"";
    Exit exit = Exit::Usage;
    if (mode == L"hold" && count == 4)
        exit = Hold(arguments[2], arguments[3]);
    else if (mode == L"path" && count == 3)
        exit = WritePath(arguments[2]);
    return static_cast<int>(exit);
}
