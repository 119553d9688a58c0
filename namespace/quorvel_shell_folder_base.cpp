// The shell folder's base: parsing, attributes, names, comparison and set-up.
#include "namespace/quorvel_shell_folder_base.h"

#include <cwchar>

#include "support/error_handling.h"

namespace {

constexpr DWORD kStationAttributes = SFGAO_FOLDER | SFGAO_DROPTARGET;  // 0x20000100
constexpr DWORD kFileAttributes = SFGAO_CANCOPY;                       // 0x00000001
constexpr SHGDNF kHighFlagsButAddressBar = 0xBF00;

// Appends "\" (when asked) and the text, or nothing at all when the result would not fit.
bool AppendToPath(wchar_t* buffer, size_t capacity, bool separator, const wchar_t* text) noexcept {
    const size_t length = wcsnlen(buffer, capacity);
    const size_t added = (separator ? 1 : 0) + wcslen(text);
    if (length + added >= capacity)
        return false;
    wchar_t* end = buffer + length;
    if (separator)
        *end++ = L'\\';
    wmemcpy(end, text, wcslen(text) + 1);
    return true;
}

}  // namespace

CQuorvelShellFolderBase::CQuorvelShellFolderBase() noexcept {
    // Without the allocator no text can be returned; GetDisplayNameOf then fails as out of memory.
    (void)::SHGetMalloc(&allocator_);
}

CQuorvelShellFolderBase::~CQuorvelShellFolderBase() = default;

HRESULT CQuorvelShellFolderBase::SetUp(CQuorvelShellFolderBase* parent,
                                       PCUIDLIST_RELATIVE identifier) noexcept {
    try {
        parent_ = parent;
        ownIdentifier_ = identifier ? manager_.CopyPidl(identifier)
                                    : CPidlMgr::AsList(manager_.CreateRootPidl());
        RETURN_IF_NULL_ALLOC(ownIdentifier_.get());
        // A folder bound from a placed parent is placed below it; the root keeps its own.
        if (parent && parent->Location() && identifier) {
            location_.reset(::ILCombine(parent->Location(), identifier));
            RETURN_IF_NULL_ALLOC(location_.get());
        }
        parsingPrefix_.clear();
        if (manager_.IsRoot(ownIdentifier_.get())) {
            parsingPrefix_.resize(manager_.GetParsingPrefix(nullptr, 0));
            manager_.GetParsingPrefix(parsingPrefix_.data(),
                                      static_cast<UINT>(parsingPrefix_.size()));
            parsingPrefix_.resize(wcsnlen(parsingPrefix_.c_str(), parsingPrefix_.size()));
        }
        ownPath_.assign(manager_.GetPath(ownIdentifier_.get(), nullptr, 0), L'\0');
        manager_.GetPath(ownIdentifier_.get(), ownPath_.data(), static_cast<UINT>(ownPath_.size()));
        ownPath_.resize(wcsnlen(ownPath_.c_str(), ownPath_.size()));
        return S_OK;
    }
    CATCH_RETURN()
}

bool CQuorvelShellFolderBase::GetFolderPath(wchar_t* buffer, size_t capacity,
                                            bool withPrefix) const noexcept {
    if (!buffer || capacity == 0)
        return false;
    if (parent_) {
        if (!parent_->GetFolderPath(buffer, capacity, withPrefix))
            return false;
    } else {
        buffer[0] = L'\0';
    }
    if (withPrefix && !parsingPrefix_.empty())
        return AppendToPath(buffer, capacity, buffer[0] != L'\0', parsingPrefix_.c_str());
    if (ownPath_.empty())
        return true;
    return AppendToPath(buffer, capacity, true, ownPath_.c_str());
}

HRESULT CQuorvelShellFolderBase::CreateFullList(PCUITEMID_CHILD item,
                                                UniqueRelativePidl& fullList) const noexcept {
    wchar_t folderPath[kMaximumPath] = {};
    // A path that does not fit leaves a shorter one: the list then names fewer folders, as the
    // consumers of the full list only read names from it.
    (void)GetFolderPath(folderPath, ARRAYSIZE(folderPath), false);
    const UniqueRelativePidl folderList = manager_.CreatePidlFromPath(folderPath);
    fullList = manager_.ConcatPidls(folderList.get(), item);
    RETURN_IF_NULL_ALLOC(fullList.get());
    return S_OK;
}

HRESULT CQuorvelShellFolderBase::ParseDisplayName(HWND, IBindCtx*, LPWSTR name, ULONG*,
                                                  PIDLIST_RELATIVE* list, ULONG*) {
    // The eaten count and the attributes are neither read nor written.
    if (!list)
        return E_POINTER;
    *list = nullptr;
    if (!name)
        return E_INVALIDARG;
    try {
        wchar_t fullPath[kMaximumPath] = {};
        // A cut folder path would name items of an ancestor (a file name parsed as a station),
        // and a name too long for the buffer cannot name an item of ours.
        if (!GetFolderPath(fullPath, ARRAYSIZE(fullPath), false) ||
            !AppendToPath(fullPath, ARRAYSIZE(fullPath), true, name)) {
            return E_INVALIDARG;
        }
        const UniqueRelativePidl fullList = manager_.CreatePidlFromPath(fullPath);
        if (!fullList)
            return E_INVALIDARG;
        const size_t itemCount = manager_.GetItemCount(fullList.get());
        const size_t nameCount = SplitPathComponents(name).size();
        // A name of separators only names nothing; more components than the list holds name
        // something deeper than a file.
        if (nameCount == 0 || nameCount >= itemCount)
            return E_INVALIDARG;
        UniqueRelativePidl parsed =
            manager_.CopyFromIndex(fullList.get(), static_cast<UINT>(itemCount - nameCount));
        RETURN_IF_NULL_ALLOC(parsed.get());
        *list = parsed.release();  // the shell's now
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CQuorvelShellFolderBase::BindToStorage(PCUIDLIST_RELATIVE, IBindCtx*, REFIID,
                                               void** object) {
    if (object)
        *object = nullptr;
    return E_NOTIMPL;
}

HRESULT CQuorvelShellFolderBase::CompareIDs(LPARAM column, PCUIDLIST_RELATIVE first,
                                            PCUIDLIST_RELATIVE second) {
    if (!manager_.IsWellFormedList(first) || !manager_.IsWellFormedList(second))
        return E_INVALIDARG;
    // The comparison is the status value as it stands, negative results included: the view sorts
    // with it directly.
    const int sign = static_cast<int>(static_cast<DWORD>(column & 0xFFFFFFFF));
    return static_cast<HRESULT>(manager_.ComparePidls(sign, first, second));
}

HRESULT CQuorvelShellFolderBase::GetAttributesOf(UINT count, PCUITEMID_CHILD_ARRAY items,
                                                 SFGAOF* attributes) {
    if (!attributes)
        return E_POINTER;
    // The request decides only whether the first item is validated; it never limits the result.
    const bool validate = (*attributes & SFGAO_VALIDATE) != 0;
    *attributes = 0xFFFFFFFF;
    if (count == 0)
        return S_OK;
    if (!items)
        return E_INVALIDARG;
    for (UINT index = 0; index < count; ++index) {
        if (!manager_.IsWellFormedList(items[index]))
            return E_INVALIDARG;
    }
    try {
        for (UINT index = 0; index < count; ++index) {
            // No item value carries SFGAO_VALIDATE, so after the first item the bit is gone.
            // The validation reads the store, which allocates.
            if (validate && index == 0 && !manager_.IsValid(items[index]))
                return E_FAIL;
            DWORD value = 0;
            switch (manager_.GetLastItemKind(items[index])) {
                case PT_STATION:
                    value = kStationAttributes;
                    break;
                case PT_FILE:
                    value = kFileAttributes;
                    break;
                default:
                    value = 0;
                    break;
            }
            *attributes &= value;
        }
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CQuorvelShellFolderBase::GetDisplayNameOf(PCUITEMID_CHILD item, SHGDNF flags,
                                                  STRRET* name) {
    if (!name)
        return E_POINTER;
    if (!manager_.IsWellFormedList(item))
        return E_INVALIDARG;
    const DWORD lowByte = flags & 0xFF;
    wchar_t text[kMaximumPath] = {};
    if (flags & kHighFlagsButAddressBar) {
        if ((flags & 0xFF00) != SHGDN_FORPARSING)
            return E_INVALIDARG;
        if (lowByte == SHGDN_NORMAL) {
            // A folder path that does not fit gives a shorter name, never a longer one.
            (void)GetFolderPath(text, ARRAYSIZE(text), true);
            size_t length = wcsnlen(text, ARRAYSIZE(text));
            if (length + 1 < ARRAYSIZE(text)) {
                text[length++] = L'\\';
                manager_.GetPath(item, text + length, static_cast<UINT>(ARRAYSIZE(text) - length));
            }
        } else if (lowByte == SHGDN_INFOLDER) {
            manager_.GetPath(item, text, ARRAYSIZE(text));
        }
    } else {
        if (lowByte > SHGDN_INFOLDER)
            return E_INVALIDARG;
        manager_.GetPath(item, text, ARRAYSIZE(text));
    }
    text[ARRAYSIZE(text) - 1] = L'\0';
    if (!allocator_)
        return E_OUTOFMEMORY;
    const size_t bytes = (wcslen(text) + 1) * sizeof(wchar_t);
    auto* copy = static_cast<wchar_t*>(allocator_->Alloc(bytes));
    RETURN_IF_NULL_ALLOC(copy);
    memcpy(copy, text, bytes);
    name->uType = STRRET_WSTR;
    name->pOleStr = copy;
    return S_OK;
}

HRESULT CQuorvelShellFolderBase::SetNameOf(HWND, PCUITEMID_CHILD, LPCWSTR, SHGDNF,
                                           PITEMID_CHILD* newItem) {
    // Stations are renamed through their property sheet, never in place.
    if (newItem)
        *newItem = nullptr;
    return E_NOTIMPL;
}

HRESULT CQuorvelShellFolderBase::Initialize(PCIDLIST_ABSOLUTE location) {
    if (location) {
        location_.reset(::ILCloneFull(location));
        RETURN_IF_NULL_ALLOC(location_.get());
    } else {
        location_.reset();
    }
    return SetUp(nullptr, nullptr);
}

HRESULT CQuorvelShellFolderBase::GetCurFolder(PIDLIST_ABSOLUTE* location) {
    if (!location)
        return E_POINTER;
    *location = nullptr;
    if (!location_)
        return S_FALSE;
    *location = ::ILCloneFull(Location());
    RETURN_IF_NULL_ALLOC(*location);
    return S_OK;
}
