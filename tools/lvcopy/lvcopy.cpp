// lvcopy: takes a station's file out of "Quorvel Digital Levels" into a folder through the same
// shell interfaces Explorer uses on paste, so the download and its progress dialog run as there.
#include <windows.h>
#include <shlobj.h>

#include <cstdio>
#include <string>
#include <vector>

#include "tools/common/console_output.h"
#include "tools/common/shell_copy.h"

namespace {

const wchar_t kUsage[] =
    L"Usage: lvcopy STATION [FOLDER] [--overwrite] [--name PATTERN]\n"
    L"Downloads the data file of the station named STATION from its instrument and writes it into\n"
    L"FOLDER (default: the current folder) under the file's own name. The download dialog\n"
    L"appears as it does when the file is pasted in Explorer. A file of that name already in\n"
    L"FOLDER is left alone, and nothing is downloaded, unless --overwrite is given.\n"
    L"  --name PATTERN  names the file from the station and the time of the copy:\n"
    L"                  {station} the station's name, {date} YYYY-MM-DD, {time} HHMMSS,\n"
    L"                  {name} the file's own name without extension, {ext} its extension\n"
    L"                  (.lv, or .hvr for the LV-20 and LV-30). Example for a daily download\n"
    L"                  that keeps every day: --name \"{station} {date} {time}{ext}\"\n"
    L"Exit codes: 0 copied, 1 the download was cancelled, 2 failure, 3 the file exists.\n";

int Fail(const std::wstring& what, HRESULT result) {
    wchar_t code[32];
    swprintf(code, ARRAYSIZE(code), L" (0x%08lX)\n", static_cast<unsigned long>(result));
    PrintUtf8(L"lvcopy: " + what + code);
    return 2;
}

int Copy(const std::wstring& station, const std::wstring& folder, const CopyOptions& options) {
    const StationFileCopy copy = CopyStationFile(station, folder, options);
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
        case StationFileCopy::kExists:
            PrintUtf8(L"lvcopy: " + copy.target +
                      L" exists already; nothing was downloaded or written. Give --overwrite to "
                      L"replace it, or --name to name each copy by its date and time.\n");
            return 3;
        default:
            return Fail(copy.failure, copy.code);
    }
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    std::vector<std::wstring> positional;
    CopyOptions options;
    for (int index = 1; index < argc; ++index) {
        const std::wstring argument = argv[index];
        if (argument == L"--help") {
            PrintUtf8(kUsage);
            return 0;
        }
        if (argument == L"--overwrite") {
            options.overwrite = true;
        } else if (argument == L"--name" && index + 1 < argc) {
            options.namePattern = argv[++index];
        } else if (argument.rfind(L"--", 0) == 0) {
            PrintUtf8(L"lvcopy: unknown option " + argument + L"\n" + kUsage);
            return 2;
        } else {
            positional.push_back(argument);
        }
    }
    if (positional.empty() || positional.size() > 2) {
        PrintUtf8(kUsage);
        return 2;
    }
    std::wstring folder = positional.size() == 2 ? positional[1] : L".";
    wchar_t full[MAX_PATH];
    if (::GetFullPathNameW(folder.c_str(), MAX_PATH, full, nullptr) == 0) {
        return Fail(L"bad folder " + folder, HRESULT_FROM_WIN32(::GetLastError()));
    }
    folder = full;
    if (!folder.empty() && folder.back() == L'\\')
        folder.pop_back();
    if (FAILED(::OleInitialize(nullptr)))
        return Fail(L"OLE could not start", E_FAIL);
    const int code = Copy(positional[0], folder, options);
    ::OleUninitialize();
    return code;
}
