// The item enumerator's framework: a filled list of item IDs handed out by IEnumIDList.
#pragma once

#include <windows.h>
#include <shlobj.h>

#include <vector>

#include "namespace/pidl_manager.h"

class CEnumIDListImpl : public IEnumIDList {
public:
    CEnumIDListImpl() noexcept = default;
    CEnumIDListImpl(const CEnumIDListImpl&) = delete;
    CEnumIDListImpl& operator=(const CEnumIDListImpl&) = delete;

    // Copies of the items from the current position on, each owned by the caller.
    IFACEMETHODIMP Next(ULONG count, PITEMID_CHILD* items, ULONG* fetched) override;
    IFACEMETHODIMP Skip(ULONG count) override;
    IFACEMETHODIMP Reset() override;
    IFACEMETHODIMP Clone(IEnumIDList** copy) override;

protected:
    virtual ~CEnumIDListImpl();

    // Takes the item over: S_OK; E_POINTER when there is none; E_OUTOFMEMORY (the item freed)
    // when there is no memory for it.
    [[nodiscard]] HRESULT AddToEnumList(UniqueChildPidl item) noexcept;
    void DeleteList() noexcept;

    CPidlMgr manager_;  // the enumerator's own, gone with it

private:
    std::vector<UniqueChildPidl> items_;
    size_t position_ = 0;
};
