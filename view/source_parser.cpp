// The dropped sources: the blocks a drag source hands over are read only within their real size,
// shortcuts are resolved through the shell link object, and folders are walked.
#include "view/source_parser.h"

#include <shlwapi.h>

#include "namespace/pidl_manager.h"
#include "support/clipboard_formats.h"
#include "support/error_handling.h"
#include "support/unique_resource.h"
#include "view/portable/drop_blocks.h"

namespace {

constexpr DWORD kLongPathCapacity = 32768;

FORMATETC HGlobalFormat(CLIPFORMAT format) {
    return FORMATETC{format, nullptr, DVASPECT_CONTENT, -1, TYMED_HGLOBAL};
}

// Results of several sources: S_OK when any succeeded, else the last failure, else S_OK.
class CombinedResult {
public:
    void Add(HRESULT result) noexcept {
        if (result == S_OK)
            anySucceeded_ = true;
        else if (result != S_FALSE)
            lastFailure_ = result;
    }
    HRESULT Value() const noexcept { return anySucceeded_ ? S_OK : lastFailure_; }

private:
    bool anySucceeded_ = false;
    HRESULT lastFailure_ = S_OK;
};

// 8-bit names through the system's ANSI code page, as the source wrote them.
WideString WidenAnsi(std::string_view bytes) {
    if (bytes.empty())
        return {};
    const int length =
        ::MultiByteToWideChar(CP_ACP, 0, bytes.data(), static_cast<int>(bytes.size()), nullptr, 0);
    WideString wide(static_cast<size_t>(length > 0 ? length : 0), L'\0');
    if (length > 0)
        ::MultiByteToWideChar(CP_ACP, 0, bytes.data(), static_cast<int>(bytes.size()), wide.data(),
                              length);
    return wide;
}

std::wstring DirectoryPart(const std::wstring& path) {
    const size_t separator = path.find_last_of(L"\\/");
    return separator == std::wstring::npos ? std::wstring() : path.substr(0, separator);
}

std::wstring FileSystemPath(PCIDLIST_ABSOLUTE item) {
    std::wstring path(kLongPathCapacity, L'\0');
    if (!::SHGetPathFromIDListEx(item, path.data(), kLongPathCapacity, GPFIDL_DEFAULT))
        return {};
    path.resize(wcsnlen(path.c_str(), kLongPathCapacity));
    return path;
}

// The lists of a "Shell IDList Array" as the shell's types. The reader copied each out whole,
// terminator included, and only when it lay inside the block; these are the only places where
// the block's bytes become item-ID lists.
PCIDLIST_ABSOLUTE AbsoluteListOf(const std::vector<uint8_t>& bytes) noexcept {
    return reinterpret_cast<PCIDLIST_ABSOLUTE>(bytes.data());
}
PCUITEMID_CHILD ChildListOf(const std::vector<uint8_t>& bytes) noexcept {
    return reinterpret_cast<PCUITEMID_CHILD>(bytes.data());
}

// Hands the bytes of the data object's block in that format to read, within the block's own
// size, while the block is locked; a block that cannot be fetched or locked is a failure.
template <typename Read>
[[nodiscard]] HRESULT ReadBlock(IDataObject* dataObject, const FORMATETC& format, Read&& read) {
    FORMATETC request = format;
    UniqueStgMedium medium;
    RETURN_IF_FAILED(dataObject->GetData(&request, medium.put()));
    GlobalLockGuard lock(medium.global());
    RETURN_HR_IF(E_INVALIDARG, !lock.data());
    read(static_cast<const uint8_t*>(lock.data()), lock.size());
    return S_OK;
}

// Counts the nested parses of one drop, also when one ends in an exception.
class NestingGuard {
public:
    explicit NestingGuard(int& nesting) noexcept : nesting_(nesting) { ++nesting_; }
    NestingGuard(const NestingGuard&) = delete;
    NestingGuard& operator=(const NestingGuard&) = delete;
    ~NestingGuard() { --nesting_; }

private:
    int& nesting_;
};

}  // namespace

TSourceParser::TSourceParser(bool recurse) noexcept
    : sources_(std::make_shared<TSourceList>()), recurse_(recurse) {}

TSourceParser::~TSourceParser() {
    // A stream never unmarshalled still holds the data object's marshalling data.
    if (marshalled_)
        (void)::CoReleaseMarshalData(marshalled_.Get());
}

void TSourceParser::Add(const std::wstring& rootPath, const std::wstring& path, uint32_t index) {
    sources_->push_back({rootPath, path, index});
    ++fileCount_;
}

bool TSourceParser::Filtered(const std::wstring& path) const noexcept {
    for (const std::wstring& pattern : filter_) {
        if (::PathMatchSpecW(path.c_str(), pattern.c_str()))
            return true;
    }
    return false;
}

HRESULT TSourceParser::ParseDataObject(IDataObject* dataObject, const std::wstring& rootPath,
                                       bool deep) noexcept {
    try {
        const bool outermost = parseNesting_ == 0;
        if (outermost)
            bounds_.BeginDrop();
        cancelled_ = false;
        // Refused before any walk: the drop has nothing for EndDrop to count yet.
        RETURN_HR_IF(E_INVALIDARG, !dataObject);
        if (!marshalledOnce_) {
            RETURN_IF_FAILED(::CoMarshalInterThreadInterfaceInStream(
                IID_IDataObject, dataObject, marshalled_.ReleaseAndGetAddressOf()));
            marshalledOnce_ = true;
        }
        HRESULT result = S_OK;
        {
            NestingGuard nesting(parseNesting_);
            result = ParseSources(dataObject, rootPath, deep);
        }
        if (outermost)
            bounds_.EndDrop();
        return result;
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParseSources(IDataObject* dataObject, const std::wstring& rootPath,
                                    bool deep) noexcept {
    try {
        // Some sources render lazily and want their formats asked for once before any data.
        Microsoft::WRL::ComPtr<IEnumFORMATETC> formats;
        if (SUCCEEDED(dataObject->EnumFormatEtc(DATADIR_GET, &formats)) && formats) {
            FORMATETC format{};
            while (formats->Next(1, &format, nullptr) == S_OK) {
                // Nothing is taken from the walk; the target device each entry carries is ours.
                const UniqueCoTaskMem targetDevice(format.ptd);
            }
        }

        FORMATETC dropFiles = HGlobalFormat(CF_HDROP);
        if (dataObject->QueryGetData(&dropFiles) == S_OK)
            return ParseDropFiles(dataObject, dropFiles);

        std::wstring root = rootPath;
        FORMATETC items = HGlobalFormat(RegisteredFormat(ClipboardFormat::ShellIdList));
        const bool offersItems = dataObject->QueryGetData(&items) == S_OK;
        if (root.empty() && offersItems)
            (void)ParseItemArray(dataObject, items, true, root);  // a failure leaves the root empty

        FORMATETC ansiGroup =
            HGlobalFormat(RegisteredFormat(ClipboardFormat::AnsiFileGroupDescriptor));
        if (dataObject->QueryGetData(&ansiGroup) == S_OK)
            return ParseFileGroup(dataObject, ansiGroup, false, root);
        FORMATETC wideGroup = HGlobalFormat(RegisteredFormat(ClipboardFormat::FileGroupDescriptor));
        const HRESULT offersWideGroup = dataObject->QueryGetData(&wideGroup);
        if (offersWideGroup == S_OK)
            return ParseFileGroup(dataObject, wideGroup, true, root);
        if (deep && offersItems)
            return ParseItemArray(dataObject, items, false, root);
        return offersWideGroup;
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParseDropFiles(IDataObject* dataObject, const FORMATETC& format) noexcept {
    try {
        std::vector<WideString> paths;
        const HRESULT read = ReadBlock(dataObject, format, [&](const uint8_t* bytes, size_t size) {
            paths = ReadDropFilePaths(bytes, size, WidenAnsi);
        });
        if (FAILED(read))
            return read;  // logged where it failed
        CombinedResult result;
        for (const WideString& path : paths) {
            if (cancelled_ || bounds_.Stopped())
                break;
            result.Add(ParsePath(path, path));
        }
        return result.Value();
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParseFileGroup(IDataObject* dataObject, const FORMATETC& format, bool wide,
                                      const std::wstring& rootPath) noexcept {
    try {
        std::vector<FileGroupEntry> entries;
        const HRESULT read = ReadBlock(dataObject, format, [&](const uint8_t* bytes, size_t size) {
            entries = ReadFileGroupDescriptors(bytes, size, wide, WidenAnsi);
        });
        if (FAILED(read))
            return read;  // logged where it failed
        for (const FileGroupEntry& entry : entries) {
            // Directories come with their files listed after them; only the files are sources.
            if (entry.attributes & FILE_ATTRIBUTE_DIRECTORY)
                continue;
            Add(rootPath, entry.name, entry.index);
        }
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParseItemArray(IDataObject* dataObject, const FORMATETC& format,
                                      bool rootOnly, std::wstring& rootPath) noexcept {
    try {
        IdListArray array;
        const HRESULT read = ReadBlock(dataObject, format, [&](const uint8_t* bytes, size_t size) {
            array = ReadIdListArray(bytes, size);
        });
        if (FAILED(read))
            return read;  // logged where it failed
        RETURN_HR_IF(E_INVALIDARG, array.parent.empty());
        const PCIDLIST_ABSOLUTE parent = AbsoluteListOf(array.parent);
        if (rootOnly) {
            RETURN_HR_IF(E_INVALIDARG, array.children.empty());
            UniqueAbsoluteIdList first(
                ::ILCombine(parent, ChildListOf(array.children.front().list)));
            RETURN_IF_NULL_ALLOC(first.get());
            rootPath = DirectoryPart(FileSystemPath(first.get()));
            return S_OK;
        }
        CombinedResult result;
        for (const IdListArrayChild& child : array.children) {
            if (cancelled_ || bounds_.Stopped())
                break;
            result.Add(ParsePIDL(parent, ChildListOf(child.list)));
        }
        return result.Value();
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParsePIDL(PCIDLIST_ABSOLUTE parent, PCUITEMID_CHILD child) noexcept {
    try {
        Microsoft::WRL::ComPtr<IShellFolder> desktop;
        Microsoft::WRL::ComPtr<IShellFolder> folder;
        HRESULT result = ::SHGetDesktopFolder(&desktop);
        if (SUCCEEDED(result)) {
            // The desktop's own list is empty: its items need no bind.
            result = ::ILIsEmpty(parent)
                         ? desktop.CopyTo(folder.GetAddressOf())
                         : desktop->BindToObject(parent, nullptr, IID_PPV_ARGS(&folder));
        }
        if (FAILED(result)) {
            bounds_.Report(result, L"TSourceParser::ParsePIDL", __LINE__);
            return result;
        }
        UniqueAbsoluteIdList item(::ILCombine(parent, child));
        RETURN_IF_NULL_ALLOC(item.get());
        const std::wstring path = FileSystemPath(item.get());
        if (!path.empty())
            return ParsePath(path, path);

        // A virtual item: its own data object says what it holds, one level deep only.
        STRRET name{};
        wchar_t itemName[MAX_PATH] = {};
        if (SUCCEEDED(folder->GetDisplayNameOf(child, SHGDN_FORPARSING, &name)))
            (void)::StrRetToBufW(&name, child, itemName, ARRAYSIZE(itemName));
        Microsoft::WRL::ComPtr<IDataObject> itemData;
        result = folder->GetUIObjectOf(nullptr, 1, &child, IID_IDataObject, nullptr,
                                       reinterpret_cast<void**>(itemData.GetAddressOf()));
        if (FAILED(result)) {
            bounds_.Report(result, L"TSourceParser::ParsePIDL", __LINE__);
            return result;
        }
        return ParseDataObject(itemData.Get(), DirectoryPart(itemName), false);
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParsePath(const std::wstring& path, const std::wstring& rootPath) noexcept {
    try {
        if (Filtered(path))
            return S_OK;
        if (!bounds_.VisitEntry(path))
            return S_FALSE;
        const DWORD attributes = ::GetFileAttributesW(path.c_str());
        if (attributes == INVALID_FILE_ATTRIBUTES) {
            const HRESULT result = LastErrorResult();
            bounds_.Report(result, L"TSourceParser::ParsePath", __LINE__, path.c_str());
            return result;
        }
        return ParseEntry(path, rootPath, attributes);
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParseEntry(const std::wstring& path, const std::wstring& rootPath,
                                  DWORD attributes) noexcept {
    try {
        if (attributes & FILE_ATTRIBUTE_DIRECTORY)
            return ParseFolder(path, rootPath);
        if (::CompareStringOrdinal(::PathFindExtensionW(path.c_str()), -1, L".LNK", -1, TRUE) ==
            CSTR_EQUAL) {
            bool parsed = false;
            const HRESULT result = ParseShortcut(path, parsed);
            if (parsed)
                return result;
        }
        if (cancelled_)
            return S_FALSE;
        Add(rootPath, path, 0);
        return S_OK;
    }
    CATCH_RETURN()
}

// parsed false: the shortcut could not be followed and counts as a plain file.
HRESULT TSourceParser::ParseShortcut(const std::wstring& path, bool& parsed) noexcept {
    try {
        parsed = false;
        if (depth_ >= kMaximumSourceDepth)
            return S_OK;
        Microsoft::WRL::ComPtr<IShellLinkW> link;
        Microsoft::WRL::ComPtr<IPersistFile> file;
        if (FAILED(::CoCreateInstance(CLSID_ShellLink, nullptr, CLSCTX_INPROC_SERVER,
                                      IID_PPV_ARGS(&link))) ||
            FAILED(link.As(&file)) || FAILED(file->Load(path.c_str(), 0)) ||
            FAILED(link->Resolve(nullptr, 0)))
            return S_OK;
        wchar_t target[MAX_PATH] = {};
        ++depth_;
        HRESULT result = S_OK;
        if (SUCCEEDED(link->GetPath(target, ARRAYSIZE(target), nullptr, 0)) && target[0]) {
            // A target that is gone leaves the shortcut itself as the source.
            if (::GetFileAttributesW(target) != INVALID_FILE_ATTRIBUTES) {
                parsed = true;
                result = ParsePath(target, target);
            }
        } else {
            PIDLIST_ABSOLUTE raw = nullptr;
            if (SUCCEEDED(link->GetIDList(&raw)) && raw) {
                UniqueAbsoluteIdList parent(raw);
                UniqueChildPidl child(::ILCloneChild(::ILFindLastID(parent.get())));
                if (child && ::ILRemoveLastID(parent.get())) {
                    parsed = true;
                    result = ParsePIDL(parent.get(), child.get());
                }
            }
        }
        --depth_;
        return result;
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::ParseFolder(const std::wstring& path,
                                   const std::wstring& rootPath) noexcept {
    try {
        // A folder reached again (through a shortcut or a link to itself or a parent) or too deep
        // is not walked again: the walk must end. Folders are told apart by their identity, not by
        // the path that reached them: two links back to a folder give each nesting level new path
        // texts, and a walk that compared texts grew exponentially until the depth limit (a frozen
        // drop).
        if (depth_ >= kMaximumSourceDepth || !bounds_.FirstVisitOfFolder(path))
            return S_OK;
        ++folderCount_;
        WIN32_FIND_DATAW found{};
        const std::wstring pattern = path + L"\\*";
        UniqueFindHandle search(::FindFirstFileW(pattern.c_str(), &found));
        if (!search)
            return S_OK;  // nothing in it
        ++depth_;
        CombinedResult result;
        do {
            const std::wstring name = found.cFileName;
            if (name == L"." || name == L"..")
                continue;
            const std::wstring entry = path + L"\\" + name;
            if (!bounds_.VisitEntry(entry))
                break;
            if ((found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) && !recurse_)
                continue;
            // Links and junctions met inside a folder are not followed (a dropped one, or a
            // shortcut's target, is): they lead anywhere, the folder itself included. Wine reports
            // its links with the attribute but no reparse tag, so the attribute decides.
            if ((found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) &&
                (found.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT))
                continue;
            if (Filtered(entry))
                continue;
            result.Add(ParseEntry(entry, rootPath, found.dwFileAttributes));
        } while (!cancelled_ && !bounds_.Stopped() && ::FindNextFileW(search.get(), &found));
        --depth_;
        return result.Value();
    }
    CATCH_RETURN()
}

HRESULT TSourceParser::GetDataObject(IDataObject** dataObject) noexcept {
    RETURN_HR_IF(E_INVALIDARG, !dataObject);
    *dataObject = nullptr;
    if (!marshalled_)
        return S_FALSE;
    // The stream is used up by this: the object can be fetched once.
    return ::CoGetInterfaceAndReleaseStream(marshalled_.Detach(), IID_PPV_ARGS(dataObject));
}
