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

UniqueChildPidl CPidlMgr::AsChild(UniqueRelativePidl list) noexcept {
    return UniqueChildPidl(reinterpret_cast<PITEMID_CHILD>(list.release()));
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

UniqueRelativePidl CPidlMgr::AsList(UniqueChildPidl item) noexcept {
    return UniqueRelativePidl(item.release());
}

UniqueRelativePidl CPidlMgr::CopyPidl(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list || !allocator_)
        return {};
    const UINT size = GetSize(list);
    auto* copy = static_cast<uint8_t*>(allocator_->Alloc(size));
    if (!copy)
        return {};
    memcpy(copy, list, size);
    return UniqueRelativePidl(ListAt(copy));
}

UniqueChildPidl CPidlMgr::CopyItem(PCUIDLIST_RELATIVE list) const noexcept {
    if (!list)
        return {};
    return AsChild(CopyLeadingBytes(list, list->mkid.cb));
}

UniqueRelativePidl CPidlMgr::CopyParent(PCUIDLIST_RELATIVE list) const noexcept {
    if (GetItemCount(list) < 2)
        return {};
    return CopyLeadingBytes(list, static_cast<UINT>(Bytes(GetLastItem(list)) - Bytes(list)));
}

UniqueRelativePidl CPidlMgr::CopyLeadingBytes(PCUIDLIST_RELATIVE list, UINT size) const noexcept {
    if (!allocator_)
        return {};
    auto* copy = static_cast<uint8_t*>(allocator_->Alloc(size + kListTerminatorSize));
    if (!copy)
        return {};
    memcpy(copy, list, size);
    memset(copy + size, 0, kListTerminatorSize);
    return UniqueRelativePidl(ListAt(copy));
}

UniqueRelativePidl CPidlMgr::CopyFromIndex(PCUIDLIST_RELATIVE list, UINT index) const noexcept {
    if (!list || index >= GetItemCount(list))
        return {};
    PCUIDLIST_RELATIVE item = list;
    for (UINT skipped = 0; skipped < index; ++skipped) {
        if (item->mkid.cb == 0)
            return {};
        item = GetNextItem(item);
    }
    return CopyPidl(item);
}

UniqueRelativePidl CPidlMgr::ConcatPidls(PCUIDLIST_RELATIVE first,
                                         PCUIDLIST_RELATIVE second) const noexcept {
    if (!first && !second)
        return {};
    if (!first)
        return CopyPidl(second);
    if (!second)
        return CopyPidl(first);
    if (!allocator_)
        return {};
    const UINT firstSize = GetSize(first) - kListTerminatorSize;
    const UINT secondSize = GetSize(second);
    auto* joined = static_cast<uint8_t*>(allocator_->Alloc(firstSize + secondSize));
    if (!joined)
        return {};
    memcpy(joined, first, firstSize);
    memcpy(joined + firstSize, second, secondSize);
    return UniqueRelativePidl(ListAt(joined));
}

UniqueChildPidl CPidlMgr::CreateItem(DWORD kind, const void* data, UINT byteCount) const noexcept {
    // cb is 16 bits wide: larger names cannot be carried.
    if (!allocator_ || byteCount + kItemSizeOverhead > 0xFFFF)
        return {};
    auto* item = static_cast<uint8_t*>(allocator_->Alloc(ItemAllocationSize(byteCount)));
    if (!item)
        return {};
    WriteItem(item, kind, data, byteCount);
    return AsChild(UniqueRelativePidl(ListAt(item)));
}

UniqueChildPidl CPidlMgr::CreateNamedItem(DWORD kind, WideStringView name) const noexcept {
    try {
        const std::vector<uint8_t> bytes = ItemNameBytes(name);
        return CreateItem(kind, bytes.data(), static_cast<UINT>(bytes.size()));
    } catch (...) {
        return {};
    }
}

UniqueChildPidl CPidlMgr::CreateRootPidl() const noexcept {
    return CreateNamedItem(PT_ROOT, kRootItemName);
}

UniqueChildPidl CPidlMgr::CreateItemPidl(const wchar_t* path) const noexcept {
    if (!path)
        return {};
    try {
        const std::vector<std::wstring> components = SplitPathComponents(path);
        if (components.empty())
            return {};
        if (components.size() > 1)
            return CreateNamedItem(PT_STATION, components[1]);
        return CreateNamedItem(PT_ROOT, components[0]);
    } catch (...) {  // out of memory splitting the path: no item, as when the allocator fails
        return {};
    }
}

UniqueRelativePidl CPidlMgr::CreatePidlFromPath(const wchar_t* path) const noexcept {
    if (!path)
        return {};
    try {
        const std::vector<std::wstring> components = SplitPathComponents(path);
        if (components.empty())
            return {};
        UniqueRelativePidl list = AsList(CreateNamedItem(PT_ROOT, components[0]));
        const DWORD kinds[] = {PT_STATION, PT_FILE};
        for (size_t index = 1; list && index < components.size() && index < 3; ++index) {
            const UniqueChildPidl item = CreateNamedItem(kinds[index - 1], components[index]);
            if (!item)
                return {};
            list = ConcatPidls(list.get(), item.get());
        }
        return list;
    } catch (...) {  // out of memory splitting the path: no list, as when the allocator fails
        return {};
    }
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
