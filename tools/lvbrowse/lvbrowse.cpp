// lvbrowse: the folder "Quorvel Digital Levels" as Explorer sees it, through the shell namespace
// only (desktop folder, My Computer, the registered extension), never through the store itself.
#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>
#include <wrl/client.h>

#include <cstdio>
#include <string>

#include "support/error_handling.h"
#include "support/unique_resource.h"
#include "tools/common/console_output.h"

using Microsoft::WRL::ComPtr;

namespace {

const wchar_t kFolderPath[] =
    L"::{20D04FE0-3AEA-1069-A2D8-08002B30309D}\\::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}";

const wchar_t kUsage[] =
    L"Usage:\n"
    L"  lvbrowse           the folder under My Computer, its stations and their files\n"
    L"  lvbrowse STATION   one station and its file\n";

std::wstring Hex(DWORD value) {
    wchar_t text[16];
    std::swprintf(text, 16, L"0x%08lX", static_cast<unsigned long>(value));
    return text;
}

std::wstring DescribeAttributes(SFGAOF attributes) {
    static const struct {
        SFGAOF bit;
        const wchar_t* name;
    } names[] = {{SFGAO_FOLDER, L"folder"},          {SFGAO_HASSUBFOLDER, L"has subfolders"},
                 {SFGAO_DROPTARGET, L"drop target"}, {SFGAO_CANCOPY, L"can copy"},
                 {SFGAO_CANMOVE, L"can move"},       {SFGAO_CANRENAME, L"can rename"},
                 {SFGAO_CANDELETE, L"can delete"},   {SFGAO_FILESYSTEM, L"file system"}};
    std::wstring text = Hex(attributes);
    std::wstring list;
    for (const auto& name : names) {
        if (attributes & name.bit)
            list += (list.empty() ? L"" : L", ") + std::wstring(name.name);
    }
    return text + L" (" + (list.empty() ? L"none" : list) + L")";
}

std::wstring DisplayName(IShellFolder* folder, PCUITEMID_CHILD item, SHGDNF flags) {
    STRRET text{};
    if (FAILED(folder->GetDisplayNameOf(item, flags, &text)))
        return L"?";
    wchar_t* name = nullptr;
    if (FAILED(::StrRetToStrW(&text, item, &name)))
        return L"?";
    const UniqueCoTaskMem owner(name);
    return name;
}

std::wstring InfoTip(IShellFolder* folder, PCUITEMID_CHILD item) {
    ComPtr<IQueryInfo> info;
    if (FAILED(folder->GetUIObjectOf(nullptr, 1, &item, IID_IQueryInfo, nullptr,
                                     reinterpret_cast<void**>(info.GetAddressOf()))))
        return L"(none)";
    wchar_t* tip = nullptr;
    if (FAILED(info->GetInfoTip(0, &tip)) || !tip)
        return L"(none)";
    const UniqueCoTaskMem owner(tip);
    return L"\"" + std::wstring(tip) + L"\"";
}

std::wstring IconIndex(IShellFolder* folder, PCUITEMID_CHILD item) {
    ComPtr<IExtractIconW> extract;
    if (FAILED(folder->GetUIObjectOf(nullptr, 1, &item, IID_IExtractIconW, nullptr,
                                     reinterpret_cast<void**>(extract.GetAddressOf()))))
        return L"?";
    wchar_t file[MAX_PATH] = L"";
    int index = -1;
    UINT flags = 0;
    if (FAILED(extract->GetIconLocation(0, file, MAX_PATH, &index, &flags)))
        return L"?";
    return std::to_wstring(index);
}

void PrintItem(IShellFolder* folder, PCUITEMID_CHILD item, const std::wstring& indent) {
    SFGAOF attributes = 0xFFFFFFFF;
    if (FAILED(folder->GetAttributesOf(1, &item, &attributes)))
        attributes = 0;
    PrintUtf8(indent + DisplayName(folder, item, SHGDN_INFOLDER) + L"\n");
    PrintUtf8(indent + L"    parsing name: " + DisplayName(folder, item, SHGDN_FORPARSING) + L"\n");
    PrintUtf8(indent + L"    attributes:   " + DescribeAttributes(attributes) + L"\n");
    PrintUtf8(indent + L"    icon index:   " + IconIndex(folder, item) + L"\n");
    PrintUtf8(indent + L"    info tip:     " + InfoTip(folder, item) + L"\n");
}

// Lists a folder's items; each folder item is entered once more when recursing.
[[nodiscard]] HRESULT ListFolder(IShellFolder* folder, const std::wstring& indent,
                                 bool recurse) noexcept {
    try {
        ComPtr<IEnumIDList> items;
        const HRESULT result =
            folder->EnumObjects(nullptr, SHCONTF_FOLDERS | SHCONTF_NONFOLDERS, &items);
        if (result != S_OK || !items)
            return FAILED(result) ? result : S_OK;
        int count = 0;
        for (;;) {
            PITEMID_CHILD raw = nullptr;
            if (items->Next(1, &raw, nullptr) != S_OK)
                break;
            UniqueCoTaskMem item(raw);
            ++count;
            PrintItem(folder, raw, indent);
            SFGAOF attributes = SFGAO_FOLDER;
            PCUITEMID_CHILD child = raw;
            if (recurse && SUCCEEDED(folder->GetAttributesOf(1, &child, &attributes)) &&
                (attributes & SFGAO_FOLDER)) {
                ComPtr<IShellFolder> subfolder;
                if (SUCCEEDED(folder->BindToObject(raw, nullptr, IID_PPV_ARGS(&subfolder))))
                    // A subfolder that cannot be listed is left out; the listing goes on.
                    (void)ListFolder(subfolder.Get(), indent + L"        ", false);
            }
        }
        if (count == 0)
            PrintUtf8(indent + L"(empty)\n");
        return S_OK;
    }
    CATCH_RETURN()
}

int Browse(const wchar_t* station) {
    ComPtr<IShellFolder> desktop;
    if (FAILED(::SHGetDesktopFolder(&desktop)))
        return 1;
    UniqueAbsoluteIdList list;
    HRESULT result = ::SHParseDisplayName(kFolderPath, nullptr, list.put(), 0, nullptr);
    if (FAILED(result)) {
        PrintUtf8(L"The folder is not under My Computer (" + Hex(result) +
                  L"): register LVShellExt.dll with regsvr32 first.\n");
        return 1;
    }
    // The folder's entry in My Computer: its name, and the attributes the registry gives it.
    ComPtr<IShellFolder> myComputer;
    PCUITEMID_CHILD entry = nullptr;
    if (SUCCEEDED(::SHBindToParent(list.get(), IID_PPV_ARGS(&myComputer), &entry))) {
        SFGAOF attributes = SFGAO_FOLDER | SFGAO_HASSUBFOLDER;
        if (FAILED(myComputer->GetAttributesOf(1, &entry, &attributes)))
            attributes = 0;
        PrintUtf8(L"My Computer\\" + DisplayName(myComputer.Get(), entry, SHGDN_INFOLDER) + L"\n");
        PrintUtf8(L"    parsing name: " + DisplayName(myComputer.Get(), entry, SHGDN_FORPARSING) +
                  L"\n");
        PrintUtf8(L"    attributes:   " + DescribeAttributes(attributes) + L"\n");
    }

    ComPtr<IShellFolder> root;
    result = desktop->BindToObject(list.get(), nullptr, IID_PPV_ARGS(&root));
    if (FAILED(result)) {
        PrintUtf8(L"Cannot open the folder (" + Hex(result) + L").\n");
        return 1;
    }
    if (!station) {
        return SUCCEEDED(ListFolder(root.Get(), L"    ", true)) ? 0 : 1;
    }

    std::wstring name = station;
    PIDLIST_RELATIVE stationRaw = nullptr;
    result = root->ParseDisplayName(nullptr, nullptr, name.data(), nullptr, &stationRaw, nullptr);
    UniqueCoTaskMem stationList(stationRaw);
    SFGAOF attributes = SFGAO_VALIDATE;
    // A station's name parses to one item of the top folder: the list is that child.
    PCUITEMID_CHILD child = reinterpret_cast<PCUITEMID_CHILD>(stationRaw);
    if (FAILED(result) || FAILED(root->GetAttributesOf(1, &child, &attributes))) {
        PrintUtf8(L"No station named \"" + name + L"\".\n");
        return 1;
    }
    PrintItem(root.Get(), child, L"    ");
    ComPtr<IShellFolder> folder;
    result = root->BindToObject(stationRaw, nullptr, IID_PPV_ARGS(&folder));
    if (FAILED(result)) {
        PrintUtf8(L"Cannot open the station (" + Hex(result) + L").\n");
        return 1;
    }
    return SUCCEEDED(ListFolder(folder.Get(), L"        ", false)) ? 0 : 1;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    if (argc > 2 ||
        (argc == 2 && (std::wstring(argv[1]) == L"-h" || std::wstring(argv[1]) == L"--help"))) {
        PrintUtf8(kUsage);
        return 2;
    }
    if (FAILED(::CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED)))
        return 1;
    const int status = Browse(argc == 2 ? argv[1] : nullptr);
    ::CoUninitialize();
    return status;
}
