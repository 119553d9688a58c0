// The item-ID manager: creates, copies, joins, tests, names and compares the namespace's lists.
// Every list it returns comes from the shell's task allocator and is owned by the caller.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include "namespace/portable/item_id_layout.h"
#include "support/unique_resource.h"

class CQuorvelPidlManagerBase {
public:
    CQuorvelPidlManagerBase() noexcept;
    CQuorvelPidlManagerBase(const CQuorvelPidlManagerBase&) = delete;
    CQuorvelPidlManagerBase& operator=(const CQuorvelPidlManagerBase&) = delete;
    virtual ~CQuorvelPidlManagerBase();

    // All null-safe: a null list gives null or 0.
    LPITEMIDLIST GetNextItem(LPCITEMIDLIST list) const noexcept;
    LPITEMIDLIST GetLastItem(LPCITEMIDLIST list) const noexcept;
    UINT GetItemCount(LPCITEMIDLIST list) const noexcept;
    UINT GetSize(LPCITEMIDLIST list) const noexcept;
    LPITEMIDLIST CopyPidl(LPCITEMIDLIST list) const noexcept;
    LPITEMIDLIST CopyItem(LPCITEMIDLIST list) const noexcept;
    LPITEMIDLIST CopyParent(LPCITEMIDLIST list) const noexcept;
    LPITEMIDLIST CopyFromIndex(LPCITEMIDLIST list, UINT index) const noexcept;
    LPITEMIDLIST ConcatPidls(LPCITEMIDLIST first, LPCITEMIDLIST second) const noexcept;
    LPITEMIDLIST CreateItem(DWORD kind, const void* data, UINT byteCount) const noexcept;
    void FreePidl(LPITEMIDLIST list) const noexcept;

protected:
    // The first size bytes of a list (whole items) as a new list with its terminator.
    LPITEMIDLIST CopyLeadingBytes(LPCITEMIDLIST list, UINT size) const noexcept;

    Microsoft::WRL::ComPtr<IMalloc> allocator_;
};

template <typename ItemKind, typename ItemData>
class CQuorvelPidlManagerImpl : public CQuorvelPidlManagerBase {
public:
    ~CQuorvelPidlManagerImpl() override = default;
    virtual LPITEMIDLIST CreateRootPidl() const = 0;
    virtual LPITEMIDLIST CreateItemPidl(const wchar_t* path) const = 0;
    virtual LPITEMIDLIST CreatePidlFromPath(const wchar_t* path) const = 0;
    virtual UINT GetParsingPrefix(wchar_t* buffer, UINT capacity) const = 0;
    virtual bool IsValid(LPCITEMIDLIST list) const = 0;
    virtual bool IsRoot(LPCITEMIDLIST list) const = 0;
    virtual bool IsFolder(LPCITEMIDLIST list) const = 0;
    virtual bool IsFile(LPCITEMIDLIST list) const = 0;
    virtual bool IsRootItem(LPCITEMIDLIST list) const = 0;
    virtual UINT GetPath(LPCITEMIDLIST list, wchar_t* buffer, UINT capacity) const = 0;
    virtual int ComparePidls(int sign, LPCITEMIDLIST first, LPCITEMIDLIST second) const = 0;
};

class CPidlMgr final : public CQuorvelPidlManagerImpl<tagPIDLTYPE, tagPIDLDATA> {
public:
    ~CPidlMgr() override = default;

    // One PT_ROOT item named "Quorvel Digital Level".
    LPITEMIDLIST CreateRootPidl() const override;
    // A PT_STATION item of component 1 when there is one, else a PT_ROOT item of component 0.
    LPITEMIDLIST CreateItemPidl(const wchar_t* path) const override;
    // PT_ROOT of component 0, then PT_STATION of component 1 and PT_FILE of component 2.
    LPITEMIDLIST CreatePidlFromPath(const wchar_t* path) const override;
    UINT GetParsingPrefix(wchar_t* buffer, UINT capacity) const override;
    // A station item is valid only while the store holds a station of exactly that name.
    bool IsValid(LPCITEMIDLIST list) const override;
    bool IsRoot(LPCITEMIDLIST list) const override;
    bool IsFolder(LPCITEMIDLIST list) const override;
    bool IsFile(LPCITEMIDLIST list) const override;
    bool IsRootItem(LPCITEMIDLIST list) const override;
    UINT GetPath(LPCITEMIDLIST list, wchar_t* buffer, UINT capacity) const override;
    // 0 when either is null or the first items' kinds differ; else the case-insensitive order
    // of the two paths, multiplied by a non-zero sign.
    int ComparePidls(int sign, LPCITEMIDLIST first, LPCITEMIDLIST second) const override;

    // Kind and name of a list's last item (kind 0 and an empty name for an empty list).
    DWORD GetLastItemKind(LPCITEMIDLIST list) const noexcept;
    std::wstring GetItemName(LPCITEMIDLIST item) const;

    // Every item of a non-empty list is well formed (IsWellFormedItem). Lists that the shell hands
    // back are checked with this before any name in them is read.
    bool IsWellFormedList(LPCITEMIDLIST list) const noexcept;

private:
    LPITEMIDLIST CreateNamedItem(DWORD kind, const std::wstring& name) const noexcept;
};

// An item-ID list owned by one holder and freed through the task allocator, which made it.
struct PidlTraits {
    using Type = LPITEMIDLIST;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::CoTaskMemFree(value); }
};
using UniquePidl = UniqueResource<PidlTraits>;
