// lvcopy: takes a station's file out of "Quorvel Digital Levels" into a folder through the same
// shell interfaces Explorer uses on paste, so the download and its progress dialog run as there.
#include <windows.h>
#include <shlobj.h>

#include <cstdio>
#include <string>

#include "tools/common/console_output.h"
#include "tools/common/shell_copy.h"

namespace {

const wchar_t kUsage[] =
    L"Usage: lvcopy STATION [FOLDER]\n"
    L"Downloads the data file of the station named STATION from its instrument and writes it into\n"
    L"FOLDER (default: the current folder) under the file's own name. The download dialog\n"
    L"appears as it does when the file is pasted in Explorer.\n"
    L"Exit codes: 0 copied, 1 the download was cancelled, 2 failure.\n";

int Fail(const std::wstring& what, HRESULT result) {
    wchar_t code[32];
    swprintf(code, ARRAYSIZE(code), L" (0x%08lX)\n", static_cast<unsigned long>(result));
    PrintUtf8(L"lvcopy: " + what + code);
    return 2;
}

int Copy(const std::wstring& station, const std::wstring& folder) {
    const StationFileCopy copy = CopyStationFile(station, folder);
    switch (copy.result) {
        case StationFileCopy::kCopied: {
            wchar_t summary[512];
            swprintf(summary, ARRAYSIZE(summary), L"Copied %ls: %llu bytes in %.1f s\n",
                     copy.target.c_str(), copy.bytes, copy.seconds);
            PrintUtf8(summary);
            return 0;
        }
        case StationFileCopy::kCancelled:
            PrintUtf8(L"The download was cancelled; nothing was written.\n");
            return 1;
        default:
            return Fail(copy.failure, copy.code);
    }
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    if (argc < 2 || argc > 3 || argv[1] == std::wstring(L"--help")) {
        PrintUtf8(kUsage);
        return argc == 2 ? 0 : 2;
    }
    std::wstring folder = argc == 3 ? argv[2] : L".";
    wchar_t full[MAX_PATH];
    if (::GetFullPathNameW(folder.c_str(), MAX_PATH, full, nullptr) == 0) {
        return Fail(L"bad folder " + folder, HRESULT_FROM_WIN32(::GetLastError()));
    }
    folder = full;
    if (!folder.empty() && folder.back() == L'\\')
        folder.pop_back();
    if (FAILED(::OleInitialize(nullptr)))
        return Fail(L"OLE could not start", E_FAIL);
    const int code = Copy(argv[1], folder);
    ::OleUninitialize();
    return code;
}
