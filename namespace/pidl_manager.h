// The item-ID manager: creates, copies, joins, tests, names and compares the namespace's lists.
// Every list it returns comes from the shell's task allocator and is owned by the caller, handed
// over in an owner (UniqueRelativePidl, UniqueChildPidl) that frees it.
//
// Parameters and results are typed for what they are: a child is one item (PITEMID_CHILD), a
// relative list any run of items (PIDLIST_RELATIVE), which is what the namespace's own full lists
// are, as they start at its root and not at the desktop. Every pointer kind converts to a relative
// one, so the read-only operations take any list. The manager builds its lists from bytes and
// knows what each is: the only conversions between the kinds are here (AsChild), never at callers.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <string>

#include "namespace/portable/item_id_layout.h"
#include "support/unique_resource.h"

// An item-ID list owned by one holder and freed through the task allocator, which made it; one
// owner type per kind of list.
template <typename ItemIdPointer>
struct PidlTraits {
    using Type = ItemIdPointer;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::CoTaskMemFree(value); }
};
using UniqueRelativePidl = UniqueResource<PidlTraits<PIDLIST_RELATIVE>>;
using UniqueChildPidl = UniqueResource<PidlTraits<PITEMID_CHILD>>;

class CPidlMgr final {
public:
    CPidlMgr() noexcept;
    CPidlMgr(const CPidlMgr&) = delete;
    CPidlMgr& operator=(const CPidlMgr&) = delete;
    ~CPidlMgr();

    // All null-safe: a null list gives null or 0.
    PCUIDLIST_RELATIVE GetNextItem(PCUIDLIST_RELATIVE list) const noexcept;
    PCUITEMID_CHILD GetLastItem(PCUIDLIST_RELATIVE list) const noexcept;
    UINT GetItemCount(PCUIDLIST_RELATIVE list) const noexcept;
    UINT GetSize(PCUIDLIST_RELATIVE list) const noexcept;
    [[nodiscard]] UniqueRelativePidl CopyPidl(PCUIDLIST_RELATIVE list) const noexcept;
    // The first item alone.
    [[nodiscard]] UniqueChildPidl CopyItem(PCUIDLIST_RELATIVE list) const noexcept;
    // All items but the last; null for fewer than two.
    [[nodiscard]] UniqueRelativePidl CopyParent(PCUIDLIST_RELATIVE list) const noexcept;
    [[nodiscard]] UniqueRelativePidl CopyFromIndex(PCUIDLIST_RELATIVE list,
                                                   UINT index) const noexcept;
    [[nodiscard]] UniqueRelativePidl ConcatPidls(PCUIDLIST_RELATIVE first,
                                                 PCUIDLIST_RELATIVE second) const noexcept;
    [[nodiscard]] UniqueChildPidl CreateItem(DWORD kind, const void* data,
                                             UINT byteCount) const noexcept;

    // Each creation gives null when the allocator fails or the path names no item.
    // One PT_ROOT item named "Quorvel Digital Level".
    [[nodiscard]] UniqueChildPidl CreateRootPidl() const noexcept;
    // A PT_STATION item of component 1 when there is one, else a PT_ROOT item of component 0.
    [[nodiscard]] UniqueChildPidl CreateItemPidl(const wchar_t* path) const noexcept;
    // PT_ROOT of component 0, then PT_STATION of component 1 and PT_FILE of component 2.
    [[nodiscard]] UniqueRelativePidl CreatePidlFromPath(const wchar_t* path) const noexcept;
    UINT GetParsingPrefix(wchar_t* buffer, UINT capacity) const;
    // A station item is valid only while the store holds a station of exactly that name; only the
    // first item is looked at.
    bool IsValid(PCUIDLIST_RELATIVE list) const;
    // The kind tests read the list's last item.
    bool IsRoot(PCUIDLIST_RELATIVE list) const;
    bool IsFolder(PCUIDLIST_RELATIVE list) const;
    bool IsFile(PCUIDLIST_RELATIVE list) const;
    UINT GetPath(PCUIDLIST_RELATIVE list, wchar_t* buffer, UINT capacity) const;
    // 0 when either is null or the first items' kinds differ; else the case-insensitive order
    // of the two paths, multiplied by a non-zero sign.
    int ComparePidls(int sign, PCUIDLIST_RELATIVE first, PCUIDLIST_RELATIVE second) const;

    // An item is a list of one item: the widening conversion, for an owner.
    [[nodiscard]] static UniqueRelativePidl AsList(UniqueChildPidl item) noexcept;

    // Kind of a list's last item (0 for an empty list), and the name of its first item (empty
    // for an empty list).
    DWORD GetLastItemKind(PCUIDLIST_RELATIVE list) const noexcept;
    std::wstring GetItemName(PCUIDLIST_RELATIVE item) const;

    // Every item of a non-empty list is well formed (IsWellFormedItem). Lists that the shell hands
    // back are checked with this before any name in them is read.
    bool IsWellFormedList(PCUIDLIST_RELATIVE list) const noexcept;

private:
    [[nodiscard]] UniqueChildPidl CreateNamedItem(DWORD kind, WideStringView name) const noexcept;
    // The first size bytes of a list (whole items) as a new list with its terminator.
    [[nodiscard]] UniqueRelativePidl CopyLeadingBytes(PCUIDLIST_RELATIVE list,
                                                      UINT size) const noexcept;

    // A list the manager made or walked to, of exactly one item, as the child it is.
    static UniqueChildPidl AsChild(UniqueRelativePidl list) noexcept;
    static PCUITEMID_CHILD AsChild(PCUIDLIST_RELATIVE list) noexcept;

    Microsoft::WRL::ComPtr<IMalloc> allocator_;
};
