// lvconsume's reading of "Shell IDList Array" and "FileGroupDescriptorW".
#include "tools/lvconsume/id_list_reader.h"

#include <shlobj.h>
#include <shobjidl.h>
#include <wrl/client.h>

#include <cstddef>
#include <cstdint>
#include <cwchar>
#include <vector>

#include "support/clipboard_formats.h"
#include "support/unique_resource.h"
#include "tools/lvconsume/portable/strict_id_list_array.h"

using Microsoft::WRL::ComPtr;

namespace {

// Every offset and every item-ID list must lie inside the block that GlobalSize measures.
bool CheckIdListArrayStrictly(IDataObject* data, FailureRecord& failure, UINT& childCount) {
    FORMATETC format = {RegisteredFormat(ClipboardFormat::ShellIdList), nullptr, DVASPECT_CONTENT,
                        -1, TYMED_HGLOBAL};
    UniqueStgMedium medium;
    const HRESULT result = data->GetData(&format, medium.put());
    if (result != S_OK || !medium.global())
        return failure.Fail(L"\"Shell IDList Array\" is not given as a memory block", result);
    GlobalLockGuard lock(medium.global());
    if (!lock.data())
        return failure.Fail(L"\"Shell IDList Array\" cannot be locked", E_HANDLE);
    const StrictIdListArray array =
        ReadIdListArrayStrictly(static_cast<const uint8_t*>(lock.data()), lock.size());
    if (!array.valid()) {
        return failure.Fail(L"\"Shell IDList Array\" (" + std::to_wstring(lock.size()) +
                                L" bytes): " + std::wstring(array.fault.begin(), array.fault.end()),
                            E_FAIL);
    }
    if (array.childCount != 1) {
        return failure.Fail(L"\"Shell IDList Array\" names " + std::to_wstring(array.childCount) +
                                L" items for one file",
                            E_FAIL);
    }
    if (array.lists[1].length <= 2)
        return failure.Fail(L"\"Shell IDList Array\" gives the file an empty item-ID list", E_FAIL);
    childCount = array.childCount;
    Step(L"Shell IDList Array, strictly: cidl " + std::to_wstring(array.childCount) + L", " +
         std::to_wstring(lock.size()) + L"-byte block, parent list " +
         std::to_wstring(array.lists[0].length) + L" bytes, file list " +
         std::to_wstring(array.lists[1].length) + L" bytes, all inside");
    return true;
}

// The system's own reading: one shell item per child, each with names it can give.
bool ReadIdListArrayThroughShell(IDataObject* data, UINT childCount, FailureRecord& failure,
                                 std::vector<std::wstring>& shownNames) {
    ComPtr<IShellItemArray> items;
    HRESULT result = ::SHCreateShellItemArrayFromDataObject(data, IID_PPV_ARGS(&items));
    if (FAILED(result))
        return failure.Fail(L"SHCreateShellItemArrayFromDataObject", result);
    DWORD count = 0;
    result = items->GetCount(&count);
    if (FAILED(result))
        return failure.Fail(L"IShellItemArray::GetCount", result);
    if (count != childCount) {
        return failure.Fail(L"the system reads " + std::to_wstring(count) + L" items; cidl says " +
                                std::to_wstring(childCount),
                            E_FAIL);
    }
    for (DWORD index = 0; index < count; ++index) {
        const std::wstring label = L"item " + std::to_wstring(index);
        ComPtr<IShellItem> item;
        result = items->GetItemAt(index, &item);
        if (FAILED(result))
            return failure.Fail(L"IShellItemArray::GetItemAt(" + std::to_wstring(index) + L")",
                                result);
        UniqueCoTaskMem parsing;
        result = item->GetDisplayName(SIGDN_DESKTOPABSOLUTEPARSING,
                                      reinterpret_cast<wchar_t**>(parsing.put()));
        if (FAILED(result) || !parsing)
            return failure.Fail(label + L" has no parsing name", result);
        UniqueCoTaskMem display;
        result =
            item->GetDisplayName(SIGDN_NORMALDISPLAY, reinterpret_cast<wchar_t**>(display.put()));
        if (FAILED(result) || !display)
            return failure.Fail(label + L" has no display name", result);
        Step(L"Shell IDList Array, through the system: " + label + L" " +
             Quoted(static_cast<const wchar_t*>(parsing.get())) + L", shown as " +
             Quoted(static_cast<const wchar_t*>(display.get())));
        shownNames.emplace_back(static_cast<const wchar_t*>(display.get()));
    }
    return true;
}

// The block must hold every record that cItems announces; the file is the first record with
// a usable name, and its position is the lindex of its contents.
bool ReadFileGroupDescriptor(IDataObject* data, FailureRecord& failure, NamedFile& file) {
    FORMATETC format = {RegisteredFormat(ClipboardFormat::FileGroupDescriptor), nullptr,
                        DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
    UniqueStgMedium medium;
    const HRESULT result = data->GetData(&format, medium.put());
    if (result != S_OK || !medium.global())
        return failure.Fail(L"\"FileGroupDescriptorW\" is not given as a memory block", result);
    GlobalLockGuard lock(medium.global());
    if (!lock.data() || lock.size() < sizeof(UINT))
        return failure.Fail(L"\"FileGroupDescriptorW\" has no room for cItems", E_FAIL);
    const auto* group = static_cast<const FILEGROUPDESCRIPTORW*>(lock.data());
    const ULONGLONG needed = offsetof(FILEGROUPDESCRIPTORW, fgd) +
                             static_cast<ULONGLONG>(group->cItems) * sizeof(FILEDESCRIPTORW);
    if (group->cItems == 0 || needed > lock.size()) {
        return failure.Fail(L"\"FileGroupDescriptorW\": cItems " + std::to_wstring(group->cItems) +
                                L" needs " + std::to_wstring(needed) + L" bytes; the block has " +
                                std::to_wstring(lock.size()),
                            E_FAIL);
    }
    for (UINT index = 0; index < group->cItems; ++index) {
        const FILEDESCRIPTORW& record = group->fgd[index];
        const size_t length = wcsnlen(record.cFileName, MAX_PATH);
        const std::wstring name(record.cFileName, length);
        const bool directory = (record.dwFlags & FD_ATTRIBUTES) != 0 &&
                               (record.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
        if (directory || length == 0 || length == MAX_PATH || name == L"." || name == L".." ||
            name.find_first_of(L"\\/:*?\"<>|") != std::wstring::npos) {
            continue;
        }
        file.name = name;
        file.index = static_cast<LONG>(index);
        Step(L"FileGroupDescriptorW: " + std::to_wstring(group->cItems) + L" record(s) in a " +
             std::to_wstring(lock.size()) + L"-byte block; " + Quoted(file.name) + L" at index " +
             std::to_wstring(file.index));
        return true;
    }
    return failure.Fail(L"\"FileGroupDescriptorW\" names no file that can be written", E_FAIL);
}

// Names that the system can fetch are not enough: they must be the file's. A parent list that
// is not fully qualified from the desktop gives the system some other item, and a paste would
// then work on that item.
bool SameFileInBothFormats(const std::vector<std::wstring>& shownNames, const NamedFile& file,
                           FailureRecord& failure) {
    const size_t index = static_cast<size_t>(file.index);
    const std::wstring shown = index < shownNames.size() ? shownNames[index] : L"";
    if (shown != file.name) {
        return failure.Fail(L"the system takes \"Shell IDList Array\" item " +
                                std::to_wstring(index) + L" for " + Quoted(shown) +
                                L", not the file " + Quoted(file.name) +
                                L" (is aoffset[0] the parent's list from the desktop?)",
                            E_FAIL);
    }
    Step(L"Shell IDList Array and FileGroupDescriptorW name the same file");
    return true;
}

}  // namespace

bool FindTheFile(IDataObject* data, FailureRecord& failure, NamedFile& file) {
    UINT childCount = 0;
    std::vector<std::wstring> shownNames;  // as the system shows the items of the array
    return CheckIdListArrayStrictly(data, failure, childCount) &&
           ReadIdListArrayThroughShell(data, childCount, failure, shownNames) &&
           ReadFileGroupDescriptor(data, failure, file) &&
           SameFileInBothFormats(shownNames, file, failure);
}
