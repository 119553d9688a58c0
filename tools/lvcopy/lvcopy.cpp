// lvcopy: takes a station's file out of "Quorvel Digital Levels" into a folder through the same
// shell interfaces Explorer uses on paste, so the download and its progress dialog run as there.
#include <windows.h>
#include <shlobj.h>

#include <cstdio>
#include <string>
#include <vector>

#include "support/module_instance.h"
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
    L"                  A name Windows cannot give a file is refused before the download:\n"
    L"                  a device (CON, PRN, AUX, NUL, COM1-COM9, LPT1-LPT9, with any\n"
    L"                  extension, so a station named \"Aux\" with \"{station}{ext}\"; write\n"
    L"                  \"_{station}{ext}\" instead), the characters <>:\"/\\|?*, a final dot\n"
    L"                  or space, or a path longer than 259 characters.\n"
    L"The file is written under a temporary name (lvcXXXX.tmp) in FOLDER and renamed once "
    L"complete.\n"
    L"Exit codes: 0 copied, 1 the download was cancelled, 2 failure, 3 the file exists,\n"
    L"4 the name cannot be used (nothing was downloaded), 5 downloaded but the file could not be\n"
    L"renamed: it is kept under its temporary name, which lvcopy prints.\n";

// Exit codes, as --help lists them.
enum class ExitCode : int {
    kCopied = 0,
    kCancelled = 1,
    kFailed = 2,
    kExists = 3,
    kBadName = 4,
    kKeptUnderTemporaryName = 5,
};

int Exit(ExitCode code) {
    return static_cast<int>(code);
}

std::wstring ResultCode(HRESULT result) {
    wchar_t code[32];
    swprintf(code, ARRAYSIZE(code), L" (0x%08lX)", static_cast<unsigned long>(result));
    return code;
}

// The system's words for a result ("Access is denied."), empty when it has none.
std::wstring SystemText(HRESULT result) {
    return SystemMessageText(HRESULT_FACILITY(result) == FACILITY_WIN32
                                 ? static_cast<DWORD>(HRESULT_CODE(result))
                                 : static_cast<DWORD>(result));
}

int Fail(const std::wstring& what, HRESULT result) {
    PrintUtf8(L"lvcopy: " + what + ResultCode(result) + L"\n");
    return Exit(ExitCode::kFailed);
}

int Copy(const std::wstring& station, const std::wstring& folder, const CopyOptions& options) {
    const StationFileCopy copy = CopyStationFile(station, folder, options);
    switch (copy.result) {
        case StationFileCopy::kCopied: {
            wchar_t summary[512];
            swprintf(summary, ARRAYSIZE(summary), L"Copied %ls: %llu bytes in %.1f s\n",
                     copy.target.c_str(), copy.bytes, copy.seconds);
            PrintUtf8(summary);
            return Exit(ExitCode::kCopied);
        }
        case StationFileCopy::kCancelled:
            PrintUtf8(L"The download was cancelled; nothing was written.\n");
            return Exit(ExitCode::kCancelled);
        case StationFileCopy::kExists:
            PrintUtf8(L"lvcopy: " + copy.target +
                      L" exists already; nothing was downloaded or written. Give --overwrite to "
                      L"replace it, or --name to name each copy by its date and time.\n");
            return Exit(ExitCode::kExists);
        case StationFileCopy::kBadName:
            PrintUtf8(L"lvcopy: the file cannot be named so: " + copy.failure +
                      L". Nothing was downloaded.\n");
            return Exit(ExitCode::kBadName);
        case StationFileCopy::kKept: {
            const std::wstring reason = SystemText(copy.code);
            PrintUtf8(L"lvcopy: " + copy.failure + ResultCode(copy.code) +
                      (reason.empty() ? L"" : L": " + reason) + L"\nThe download (" +
                      std::to_wstring(copy.bytes) + L" bytes) is kept as " + copy.kept + L"\n");
            return Exit(ExitCode::kKeptUnderTemporaryName);
        }
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
            return Exit(ExitCode::kCopied);
        }
        if (argument == L"--overwrite") {
            options.overwrite = true;
        } else if (argument == L"--name" && index + 1 < argc) {
            options.namePattern = argv[++index];
        } else if (argument.rfind(L"--", 0) == 0) {
            PrintUtf8(L"lvcopy: unknown option " + argument + L"\n" + kUsage);
            return Exit(ExitCode::kFailed);
        } else {
            positional.push_back(argument);
        }
    }
    if (positional.empty() || positional.size() > 2) {
        PrintUtf8(kUsage);
        return Exit(ExitCode::kFailed);
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
