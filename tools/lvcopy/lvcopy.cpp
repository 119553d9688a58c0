// lvcopy: takes a station's file out of "Quorvel Digital Levels" into a folder through the same
// shell interfaces Explorer uses on paste, so the download and its progress dialog run as there.
#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

#include "support/unique_resource.h"
#include "tools/common/console_output.h"

using Microsoft::WRL::ComPtr;

namespace {

const wchar_t kUsage[] =
    L"Usage: lvcopy STATION [FOLDER]\n"
    L"Downloads the data file of the station named STATION from its instrument and writes it into\n"
    L"FOLDER (default: the current folder) under the file's own name. The download dialog\n"
    L"appears as it does when the file is pasted in Explorer.\n"
    L"Exit codes: 0 copied, 1 the download was cancelled, 2 failure.\n";

const wchar_t kFolderPath[] =
    L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

int Fail(const std::wstring& what, HRESULT result) {
    wchar_t code[32];
    swprintf(code, ARRAYSIZE(code), L" (0x%08lX)\n", static_cast<unsigned long>(result));
    PrintUtf8(L"lvcopy: " + what + code);
    return 2;
}

CLIPFORMAT Format(const wchar_t* name) {
    return static_cast<CLIPFORMAT>(::RegisterClipboardFormatW(name));
}

int Copy(const std::wstring& station, const std::wstring& folder) {
    ComPtr<IShellFolder> desktop;
    HRESULT result = ::SHGetDesktopFolder(&desktop);
    if (FAILED(result))
        return Fail(L"the desktop folder is not available", result);

    std::wstring path = std::wstring(kFolderPath) + L"\\" + station;
    UniqueCoTaskMem stationList;
    result =
        desktop->ParseDisplayName(nullptr, nullptr, path.data(), nullptr,
                                  reinterpret_cast<PIDLIST_RELATIVE*>(stationList.put()), nullptr);
    if (FAILED(result)) {
        return Fail(L"\"Quorvel Digital Levels\" has no station \"" + station +
                        L"\" (is the extension registered?)",
                    result);
    }
    ComPtr<IShellFolder> stationFolder;
    result = desktop->BindToObject(static_cast<PCUIDLIST_RELATIVE>(stationList.get()), nullptr,
                                   IID_PPV_ARGS(&stationFolder));
    if (FAILED(result))
        return Fail(L"the station folder cannot be opened", result);

    ComPtr<IEnumIDList> items;
    result = stationFolder->EnumObjects(nullptr, SHCONTF_NONFOLDERS, &items);
    if (result != S_OK)
        return Fail(L"the station folder cannot be listed", result);
    UniqueCoTaskMem file;
    ULONG fetched = 0;
    if (items->Next(1, reinterpret_cast<PITEMID_CHILD*>(file.put()), &fetched) != S_OK ||
        fetched != 1) {
        return Fail(L"the station folder shows no file", E_FAIL);
    }

    ComPtr<IDataObject> data;
    PCUITEMID_CHILD child = static_cast<PCUITEMID_CHILD>(file.get());
    result = stationFolder->GetUIObjectOf(nullptr, 1, &child, IID_IDataObject, nullptr, &data);
    if (FAILED(result))
        return Fail(L"the file cannot be copied", result);

    FORMATETC descriptorFormat = {Format(CFSTR_FILEDESCRIPTORW), nullptr, DVASPECT_CONTENT, -1,
                                  TYMED_HGLOBAL};
    UniqueStgMedium descriptor;
    result = data->GetData(&descriptorFormat, descriptor.put());
    if (result != S_OK)
        return Fail(L"the file has no name", result);
    std::wstring name;
    {
        GlobalLockGuard lock(descriptor.get().hGlobal);
        if (lock.size() < sizeof(FILEGROUPDESCRIPTORW))
            return Fail(L"bad file descriptor", E_FAIL);
        const auto* group = static_cast<const FILEGROUPDESCRIPTORW*>(lock.data());
        name.assign(group->fgd[0].cFileName, wcsnlen(group->fgd[0].cFileName, MAX_PATH));
    }
    if (name.empty() || name.find_first_of(L"\\/:") != std::wstring::npos) {
        return Fail(L"bad file name", E_FAIL);
    }

    const auto start = std::chrono::steady_clock::now();
    FORMATETC contentsFormat = {Format(CFSTR_FILECONTENTS), nullptr, DVASPECT_CONTENT, 0,
                                TYMED_ISTREAM};
    UniqueStgMedium contents;
    result = data->GetData(&contentsFormat, contents.put());
    if (result == S_FALSE) {
        PrintUtf8(L"The download was cancelled; nothing was written.\n");
        return 1;
    }
    if (result != S_OK || contents.get().tymed != TYMED_ISTREAM) {
        return Fail(L"the download failed", result);
    }

    const std::wstring target = folder + L"\\" + name;
    UniqueFileHandle out(::CreateFileW(target.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS,
                                       FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!out)
        return Fail(L"cannot write " + target, HRESULT_FROM_WIN32(::GetLastError()));
    // Read to the end, as the shell does: the stream removes its temporary file at the end.
    std::vector<char> buffer(4096);
    ULONGLONG total = 0;
    for (;;) {
        ULONG got = 0;
        result = contents.get().pstm->Read(buffer.data(), static_cast<ULONG>(buffer.size()), &got);
        if (result != S_OK)
            return Fail(L"reading the downloaded data failed", result);
        if (got == 0)
            break;
        DWORD written = 0;
        if (!::WriteFile(out.get(), buffer.data(), got, &written, nullptr) || written != got) {
            return Fail(L"cannot write " + target, HRESULT_FROM_WIN32(::GetLastError()));
        }
        total += got;
        if (got < buffer.size())
            break;
    }
    const double seconds =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    wchar_t summary[512];
    swprintf(summary, ARRAYSIZE(summary), L"Copied %ls: %llu bytes in %.1f s\n", target.c_str(),
             total, seconds);
    PrintUtf8(summary);
    return 0;
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
