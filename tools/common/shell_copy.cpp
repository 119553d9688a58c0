// Copying a station's file out through the shell: parse, bind, list, data object, contents.
#include "tools/common/shell_copy.h"

#include <shlobj.h>
#include <wrl/client.h>

#include <chrono>
#include <vector>

#include "support/clipboard_formats.h"
#include "support/unique_resource.h"
#include "tools/common/portable/output_name.h"

using Microsoft::WRL::ComPtr;

namespace {

const wchar_t kFolderPath[] =
    L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

StationFileCopy Failed(const std::wstring& what, HRESULT code) {
    StationFileCopy copy;
    copy.result = StationFileCopy::kFailed;
    copy.failure = what;
    copy.code = code;
    return copy;
}

}  // namespace

StationFileObject GetStationFileDataObject(const std::wstring& station) {
    StationFileObject object;
    const auto fail = [&object](const std::wstring& what, HRESULT code) {
        object.data.Reset();
        object.failure = what;
        object.code = code;
        return std::move(object);
    };
    ComPtr<IShellFolder> desktop;
    HRESULT result = ::SHGetDesktopFolder(&desktop);
    if (FAILED(result))
        return fail(L"the desktop folder is not available", result);

    const std::wstring path = std::wstring(kFolderPath) + L"\\" + station;
    UniqueAbsoluteIdList stationList;
    result = ::SHParseDisplayName(path.c_str(), nullptr, stationList.put(), 0, nullptr);
    if (FAILED(result)) {
        return fail(L"\"Quorvel Digital Levels\" has no station \"" + station +
                        L"\" (is the extension registered?)",
                    result);
    }
    ComPtr<IShellFolder> stationFolder;
    result = desktop->BindToObject(stationList.get(), nullptr, IID_PPV_ARGS(&stationFolder));
    if (FAILED(result))
        return fail(L"the station folder cannot be opened", result);

    ComPtr<IEnumIDList> items;
    result = stationFolder->EnumObjects(nullptr, SHCONTF_NONFOLDERS, &items);
    if (result != S_OK)
        return fail(L"the station folder cannot be listed", result);
    PITEMID_CHILD child = nullptr;
    ULONG fetched = 0;
    const HRESULT next = items->Next(1, &child, &fetched);
    const UniqueCoTaskMem file(child);  // the enumerator's item is the caller's to free
    if (next != S_OK || fetched != 1)
        return fail(L"the station folder shows no file", E_FAIL);

    PCUITEMID_CHILD fileItem = child;
    result =
        stationFolder->GetUIObjectOf(nullptr, 1, &fileItem, IID_IDataObject, nullptr, &object.data);
    if (FAILED(result) || !object.data)
        return fail(L"the file cannot be copied", FAILED(result) ? result : E_POINTER);
    return object;
}

namespace {

// The copy's name: the file's own, or the pattern's with the time of the copy.
bool TargetName(const std::wstring& station, const std::wstring& fileName,
                const std::wstring& pattern, std::wstring& name, std::wstring& error) {
    if (pattern.empty()) {
        name = fileName;
        return true;
    }
    SYSTEMTIME now{};
    ::GetLocalTime(&now);
    OutputNameParts parts;
    parts.station = station;
    parts.fileName = fileName;
    parts.year = now.wYear;
    parts.month = now.wMonth;
    parts.day = now.wDay;
    parts.hour = now.wHour;
    parts.minute = now.wMinute;
    parts.second = now.wSecond;
    return ExpandOutputName(pattern, parts, name, error);
}

bool Exists(const std::wstring& path) {
    return ::GetFileAttributesW(path.c_str()) != INVALID_FILE_ATTRIBUTES;
}

// A file in the folder that goes unless it is kept: the copy until it has its name.
class PartialFile {
public:
    explicit PartialFile(std::wstring path) : path_(std::move(path)) {}
    ~PartialFile() {
        if (!kept_)
            (void)::DeleteFileW(path_.c_str());  // a failed copy leaves nothing behind
    }
    void Keep() { kept_ = true; }

private:
    std::wstring path_;
    bool kept_ = false;
};

}  // namespace

StationFileCopy CopyStationFile(const std::wstring& station, const std::wstring& folder,
                                const CopyOptions& options) {
    StationFileObject object = GetStationFileDataObject(station);
    if (!object.data)
        return Failed(object.failure, object.code);
    const ComPtr<IDataObject> data = std::move(object.data);
    HRESULT result = S_OK;

    FORMATETC descriptorFormat = {RegisteredFormat(ClipboardFormat::FileGroupDescriptor), nullptr,
                                  DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
    UniqueStgMedium descriptor;
    result = data->GetData(&descriptorFormat, descriptor.put());
    if (result != S_OK)
        return Failed(L"the file has no name", result);
    std::wstring name;
    {
        GlobalLockGuard lock(descriptor.get().hGlobal);
        if (lock.size() < sizeof(FILEGROUPDESCRIPTORW))
            return Failed(L"bad file descriptor", E_FAIL);
        const auto* group = static_cast<const FILEGROUPDESCRIPTORW*>(lock.data());
        name.assign(group->fgd[0].cFileName, wcsnlen(group->fgd[0].cFileName, MAX_PATH));
    }
    if (name.empty() || name.find_first_of(L"\\/:") != std::wstring::npos) {
        return Failed(L"bad file name", E_FAIL);
    }
    // Before the download: nobody should press keys on an instrument for a copy that cannot land.
    std::wstring targetName, nameError;
    if (!TargetName(station, name, options.namePattern, targetName, nameError) ||
        !IsCreatableFileName(targetName, folder.size(), nameError)) {
        StationFileCopy refused = Failed(nameError, HRESULT_FROM_WIN32(ERROR_INVALID_NAME));
        refused.result = StationFileCopy::kBadName;
        return refused;
    }
    const std::wstring target = folder + L"\\" + targetName;
    if (!options.overwrite && Exists(target)) {
        StationFileCopy exists;
        exists.result = StationFileCopy::kExists;
        exists.target = target;
        return exists;
    }
    // The file under its temporary name is made before the download too: a folder that takes no
    // files is found out now, not after the instrument has sent everything.
    wchar_t partialPath[MAX_PATH];
    if (::GetTempFileNameW(folder.c_str(), L"lvc", 0, partialPath) == 0)
        return Failed(L"cannot write in " + folder, HRESULT_FROM_WIN32(::GetLastError()));
    PartialFile partial(partialPath);
    UniqueFileHandle out(::CreateFileW(partialPath, GENERIC_WRITE, 0, nullptr, OPEN_EXISTING,
                                       FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!out)
        return Failed(L"cannot write in " + folder, HRESULT_FROM_WIN32(::GetLastError()));

    const auto start = std::chrono::steady_clock::now();
    FORMATETC contentsFormat = {RegisteredFormat(ClipboardFormat::FileContents), nullptr,
                                DVASPECT_CONTENT, 0, TYMED_ISTREAM};
    UniqueStgMedium contents;
    result = data->GetData(&contentsFormat, contents.put());
    if (result == S_FALSE) {
        StationFileCopy cancelled;
        cancelled.result = StationFileCopy::kCancelled;
        return cancelled;
    }
    if (result != S_OK || contents.get().tymed != TYMED_ISTREAM) {
        return Failed(L"the download failed", result);
    }

    // Read to the end, as the shell does: the stream removes its temporary file at the end.
    std::vector<char> buffer(4096);
    ULONGLONG total = 0;
    for (;;) {
        ULONG got = 0;
        result = contents.get().pstm->Read(buffer.data(), static_cast<ULONG>(buffer.size()), &got);
        if (result != S_OK)
            return Failed(L"reading the downloaded data failed", result);
        if (got == 0)
            break;
        DWORD written = 0;
        if (!::WriteFile(out.get(), buffer.data(), got, &written, nullptr) || written != got) {
            return Failed(L"cannot write " + target, HRESULT_FROM_WIN32(::GetLastError()));
        }
        total += got;
        if (got < buffer.size())
            break;
    }
    if (!::FlushFileBuffers(out.get()))
        return Failed(L"cannot write " + target, HRESULT_FROM_WIN32(::GetLastError()));
    out.reset();
    // Only a whole file takes the name, and it replaces one only when asked to. A download that
    // cannot take it (a file or folder of that name came meanwhile, the folder turned read-only)
    // is the surveyor's all the same: it stays under its temporary name.
    if (!::MoveFileExW(partialPath, target.c_str(),
                       options.overwrite ? MOVEFILE_REPLACE_EXISTING : 0)) {
        const HRESULT error = HRESULT_FROM_WIN32(::GetLastError());
        partial.Keep();
        StationFileCopy kept = Failed(L"the download could not be named " + target, error);
        kept.result = StationFileCopy::kKept;
        kept.target = target;
        kept.kept = partialPath;
        kept.bytes = total;
        return kept;
    }
    partial.Keep();
    StationFileCopy copied;
    copied.result = StationFileCopy::kCopied;
    copied.target = target;
    copied.bytes = total;
    copied.seconds =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    return copied;
}
