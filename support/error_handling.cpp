// The module's error log: failures appended to "LVShellExt.log" in the user's temporary folder.
#include "support/error_handling.h"

#include <cstdio>
#include <cwchar>

#include "support/unique_resource.h"

namespace {

void AppendToLog(const wchar_t* line) noexcept {
    wchar_t path[MAX_PATH + 1];
    const DWORD length = ::GetTempPathW(MAX_PATH - 16, path);
    if (length == 0 || length >= MAX_PATH - 16)
        return;
    wcscat(path, L"LVShellExt.log");
    UniqueFileHandle file(::CreateFileW(path, FILE_APPEND_DATA, FILE_SHARE_READ | FILE_SHARE_WRITE,
                                        nullptr, OPEN_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!file)
        return;
    char utf8[1024];
    const int bytes =
        ::WideCharToMultiByte(CP_UTF8, 0, line, -1, utf8, sizeof(utf8), nullptr, nullptr);
    if (bytes <= 1)
        return;
    DWORD written = 0;
    // A log line that cannot be written is dropped: logging must never fail the caller.
    ::WriteFile(file.get(), utf8, static_cast<DWORD>(bytes - 1), &written, nullptr);
}

}  // namespace

void LogFailure(HRESULT result, const char* file, const char* function, int line) noexcept {
    wchar_t text[768];
    _snwprintf(text, ARRAYSIZE(text) - 1, L"%hs - 0x%08X (%hs, %i)\r\n", file,
               static_cast<unsigned>(result), function, line);
    text[ARRAYSIZE(text) - 1] = 0;
    AppendToLog(text);
}

HRESULT LastErrorResult() noexcept {
    const DWORD error = ::GetLastError();
    return error != ERROR_SUCCESS ? HRESULT_FROM_WIN32(error) : E_FAIL;
}

HRESULT ResultFromCaughtException() noexcept {
    try {
        throw;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    } catch (...) {
        return E_FAIL;
    }
}
