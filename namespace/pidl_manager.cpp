// The item-ID manager over the shell's task allocator.
#include "namespace/pidl_manager.h"

#include <cstring>
#include <cwchar>

#include "stations/station_store.h"

namespace {

const uint8_t* Bytes(PCUIDLIST_RELATIVE list) noexcept {
    return reinterpret_cast<const uint8_t*>(list);
}

// Bytes the manager wrote as a list: whole items and the terminator.
PIDLIST_RELATIVE ListAt(uint8_t* bytes) noexcept {
    return reinterpret_cast<PIDLIST_RELATIVE>(bytes);
}

}  // namespace

CPidlMgr::CPidlMgr() noexcept {
    // Without an allocator every creation below returns null, which callers already handle.
    (void)::SHGetMalloc(&allocator_);
}

CPidlMgr::~CPidlMgr() = default;

PITEMID_CHILD CPidlMgr::AsChild(PIDLIST_RELATIVE list) noexcept {
    return reinterpret_cast<PITEMID_CHILD>(list);
}

PCUITEMID_CHILD CPidlMgr::AsChild(PCUIDLIST_RELATIVE list) noexcept {
    return reinterpret_cast<PCUITEMID_CHILD>(list);
}

PCUIDLIST_RELATIVE CPidlMgr::GetNextItem(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list)
        return nullptr;
    return reinterpret_cast<PCUIDLIST_RELATIVE>(Bytes(list) + list->mkid.cb);
}

PCUITEMID_CHILD CPidlMgr::GetLastItem(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list || list->mkid.cb == 0)
        return nullptr;
    PCUIDLIST_RELATIVE last = list;
    for (PCUIDLIST_RELATIVE item = list; item->mkid.cb != 0; item = GetNextItem(item))
        last = item;
    // The last item is followed by the terminator: it is a list of one item.
    return AsChild(last);
}

UINT CPidlMgr::GetItemCount(PCUIDLIST_RELATIVE list) const noexcept {
    UINT count = 0;
    for (PCUIDLIST_RELATIVE item = list; item && item->mkid.cb != 0; item = GetNextItem(item))
        ++count;
    return count;
}

UINT CPidlMgr::GetSize(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list)
        return 0;
    UINT size = kListTerminatorSize;
    for (PCUIDLIST_RELATIVE item = list; item->mkid.cb != 0; item = GetNextItem(item)) {
        size += item->mkid.cb;
    }
    return size;
}

PIDLIST_RELATIVE CPidlMgr::CopyPidl(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list || !allocator_)
        return nullptr;
    const UINT size = GetSize(list);
    auto* copy = static_cast<uint8_t*>(allocator_->Alloc(size));
    if (!copy)
        return nullptr;
    memcpy(copy, list, size);
    return ListAt(copy);
}

PITEMID_CHILD CPidlMgr::CopyItem(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list)
        return nullptr;
    return AsChild(CopyLeadingBytes(list, list->mkid.cb));
}

PIDLIST_RELATIVE CPidlMgr::CopyParent(PCUIDLIST_RELATIVE list) const noexcept {
    if (GetItemCount(list) < 2)
        return nullptr;
    return CopyLeadingBytes(list, static_cast<UINT>(Bytes(GetLastItem(list)) - Bytes(list)));
}

PIDLIST_RELATIVE CPidlMgr::CopyLeadingBytes(PCUIDLIST_RELATIVE list, UINT size) const noexcept {
    if (!allocator_)
        return nullptr;
    auto* copy = static_cast<uint8_t*>(allocator_->Alloc(size + kListTerminatorSize));
    if (!copy)
        return nullptr;
    memcpy(copy, list, size);
    memset(copy + size, 0, kListTerminatorSize);
    return ListAt(copy);
}

PIDLIST_RELATIVE CPidlMgr::CopyFromIndex(PCUIDLIST_RELATIVE list, UINT index) const noexcept {
    if (!list || index >= GetItemCount(list))
        return nullptr;
    PCUIDLIST_RELATIVE item = list;
    for (UINT skipped = 0; skipped < index; ++skipped) {
        if (item->mkid.cb == 0)
            return nullptr;
        item = GetNextItem(item);
    }
    return CopyPidl(item);
}

PIDLIST_RELATIVE CPidlMgr::ConcatPidls(PCUIDLIST_RELATIVE first,
                                       PCUIDLIST_RELATIVE second) const noexcept {
    if (!first && !second)
        return nullptr;
    if (!first)
        return CopyPidl(second);
    if (!second)
        return CopyPidl(first);
    if (!allocator_)
        return nullptr;
    const UINT firstSize = GetSize(first) - kListTerminatorSize;
    const UINT secondSize = GetSize(second);
    auto* joined = static_cast<uint8_t*>(allocator_->Alloc(firstSize + secondSize));
    if (!joined)
        return nullptr;
    memcpy(joined, first, firstSize);
    memcpy(joined + firstSize, second, secondSize);
    return ListAt(joined);
}

PITEMID_CHILD CPidlMgr::CreateItem(DWORD kind, const void* data, UINT byteCount) const noexcept {
    // cb is 16 bits wide: larger names cannot be carried.
    if (!allocator_ || byteCount + kItemSizeOverhead > 0xFFFF)
        return nullptr;
    auto* item = static_cast<uint8_t*>(allocator_->Alloc(ItemAllocationSize(byteCount)));
    if (!item)
        return nullptr;
    WriteItem(item, kind, data, byteCount);
    return AsChild(ListAt(item));
}

void CPidlMgr::FreePidl(PIDLIST_RELATIVE list) const noexcept {
    if (list && allocator_)
        allocator_->Free(list);
}

PITEMID_CHILD CPidlMgr::CreateNamedItem(DWORD kind, const std::wstring& name) const noexcept {
    try {
        const std::vector<uint8_t> bytes = ItemNameBytes(name);
        return CreateItem(kind, bytes.data(), static_cast<UINT>(bytes.size()));
    } catch (...) {
        return nullptr;
    }
}

PITEMID_CHILD CPidlMgr::CreateRootPidl() const {
    return CreateNamedItem(PT_ROOT, kRootItemName);
}

PITEMID_CHILD CPidlMgr::CreateItemPidl(const wchar_t* path) const {
    if (!path)
        return nullptr;
    const std::vector<std::wstring> components = SplitPathComponents(path);
    if (components.empty())
        return nullptr;
    if (components.size() > 1)
        return CreateNamedItem(PT_STATION, components[1]);
    return CreateNamedItem(PT_ROOT, components[0]);
}

PIDLIST_RELATIVE CPidlMgr::CreatePidlFromPath(const wchar_t* path) const {
    if (!path)
        return nullptr;
    const std::vector<std::wstring> components = SplitPathComponents(path);
    if (components.empty())
        return nullptr;
    UniqueRelativePidl list(CreateNamedItem(PT_ROOT, components[0]));
    const DWORD kinds[] = {PT_STATION, PT_FILE};
    for (size_t index = 1; list && index < components.size() && index < 3; ++index) {
        UniqueChildPidl item(CreateNamedItem(kinds[index - 1], components[index]));
        if (!item)
            return nullptr;
        list.reset(ConcatPidls(list.get(), item.get()));
    }
    return list.release();
}

UINT CPidlMgr::GetParsingPrefix(wchar_t* buffer, UINT capacity) const {
    constexpr UINT prefixCount = ARRAYSIZE(kParsingPrefix);  // 41, with the NUL
    if (!buffer || capacity == 0)
        return prefixCount;
    const UINT copied = capacity < prefixCount ? capacity : prefixCount;
    wmemcpy(buffer, kParsingPrefix, copied);
    return copied;
}

bool CPidlMgr::IsValid(PCUIDLIST_RELATIVE list) const {
    if (!list)
        return false;
    if (ItemKind(Bytes(list)) != PT_STATION)
        return true;
    Station station;
    station.Name = ItemName(Bytes(list));
    return FindStation(station) == S_OK;
}

DWORD CPidlMgr::GetLastItemKind(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list)
        return 0;
    // An empty list reads its own first bytes, as callers never pass one.
    PCUIDLIST_RELATIVE last = GetLastItem(list);
    return ItemKind(Bytes(last ? last : list));
}

std::wstring CPidlMgr::GetItemName(PCUIDLIST_RELATIVE item) const {
    if (!item || item->mkid.cb == 0)
        return {};
    return ItemName(Bytes(item));
}

bool CPidlMgr::IsWellFormedList(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list || list->mkid.cb == 0)
        return false;
    for (PCUIDLIST_RELATIVE item = list; item->mkid.cb != 0; item = GetNextItem(item)) {
        if (!IsWellFormedItem(Bytes(item)))
            return false;
    }
    return true;
}

bool CPidlMgr::IsRoot(PCUIDLIST_RELATIVE list) const {
    return GetLastItemKind(list) == PT_ROOT;
}

bool CPidlMgr::IsFolder(PCUIDLIST_RELATIVE list) const {
    const DWORD kind = GetLastItemKind(list);
    return kind == PT_ROOT || kind == PT_STATION;
}

bool CPidlMgr::IsFile(PCUIDLIST_RELATIVE list) const {
    return GetLastItemKind(list) == PT_FILE;
}

UINT CPidlMgr::GetPath(PCUIDLIST_RELATIVE list, wchar_t* buffer, UINT capacity) const {
    try {
        return static_cast<UINT>(BuildListPath(Bytes(list), buffer, capacity));
    } catch (...) {
        if (buffer && capacity)
            buffer[0] = L'\0';
        return 0;
    }
}

int CPidlMgr::ComparePidls(int sign, PCUIDLIST_RELATIVE first, PCUIDLIST_RELATIVE second) const {
    if (!first || !second)
        return 0;
    if (ItemKind(Bytes(first)) != ItemKind(Bytes(second)))
        return 0;
    wchar_t firstPath[kMaximumPath] = {};
    wchar_t secondPath[kMaximumPath] = {};
    GetPath(first, firstPath, kMaximumPath);
    GetPath(second, secondPath, kMaximumPath);
    const int order = _wcsicmp(firstPath, secondPath);
    return ScaleComparison(order, sign);
}
