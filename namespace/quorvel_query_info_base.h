// The info tip framework: an item's tip is the display path of its internal full identifier.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include "namespace/pidl_manager.h"

class CQuorvelQueryInfoBase : public IQueryInfo {
public:
    CQuorvelQueryInfoBase() noexcept;
    CQuorvelQueryInfoBase(const CQuorvelQueryInfoBase&) = delete;
    CQuorvelQueryInfoBase& operator=(const CQuorvelQueryInfoBase&) = delete;

    // Keeps a copy of the item's internal full identifier.
    [[nodiscard]] HRESULT SetItem(PCUIDLIST_RELATIVE fullList) noexcept;

    // e.g. Quorvel Digital Level\Station 1; the flags are not used.
    IFACEMETHODIMP GetInfoTip(DWORD flags, PWSTR* tip) override;
    IFACEMETHODIMP GetInfoFlags(DWORD* flags) override;

protected:
    virtual ~CQuorvelQueryInfoBase();

private:
    UniqueRelativePidl fullList_;
    Microsoft::WRL::ComPtr<IMalloc> allocator_;
    CPidlMgr manager_;
};
