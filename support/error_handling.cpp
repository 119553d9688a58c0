// The result macros' entry to the error log, and the conversions of failures to HRESULTs.
#include "support/error_handling.h"

namespace {

// The compiler's names (__FILE__, __func__) are UTF-8; widened into the caller's buffer, with no
// allocation on a path that may be reporting an allocation failure. Empty when it does not fit.
template <size_t Size>
const wchar_t* Widen(const char* text, wchar_t (&buffer)[Size]) noexcept {
    buffer[0] = 0;
    if (text && ::MultiByteToWideChar(CP_UTF8, 0, text, -1, buffer, Size) == 0)
        buffer[0] = 0;
    return buffer;
}

const char* FileNameOnly(const char* path) noexcept {
    const char* name = path;
    for (const char* at = path; at && *at; ++at)
        if (*at == '/' || *at == '\\')
            name = at + 1;
    return name;
}

}  // namespace

void LogFailure(HRESULT result, const char* file, const char* function, int line) noexcept {
    wchar_t source[MAX_PATH];
    wchar_t functionName[256];
    ReportError(Widen(FileNameOnly(file), source), result, Widen(function, functionName), line);
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
