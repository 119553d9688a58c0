// The info tip framework: the tip text from the held full identifier.
#include "namespace/quorvel_query_info_base.h"

#include <cstring>
#include <cwchar>

#include "support/error_handling.h"

CQuorvelQueryInfoBase::CQuorvelQueryInfoBase() noexcept {
    // Without the allocator GetInfoTip answers out of memory.
    (void)::SHGetMalloc(&allocator_);
}

CQuorvelQueryInfoBase::~CQuorvelQueryInfoBase() = default;

HRESULT CQuorvelQueryInfoBase::SetItem(PCUIDLIST_RELATIVE fullList) noexcept {
    fullList_ = manager_.CopyPidl(fullList);
    RETURN_IF_NULL_ALLOC(fullList_.get());
    return S_OK;
}

HRESULT CQuorvelQueryInfoBase::GetInfoTip(DWORD, PWSTR* tip) {
    if (!tip)
        return E_POINTER;
    *tip = nullptr;
    wchar_t text[kMaximumPath] = {};
    manager_.GetPath(fullList_.get(), text, ARRAYSIZE(text));
    text[ARRAYSIZE(text) - 1] = L'\0';
    RETURN_IF_NULL_ALLOC(allocator_.Get());
    const size_t bytes = (wcslen(text) + 1) * sizeof(wchar_t);
    auto* copy = static_cast<wchar_t*>(allocator_->Alloc(bytes));
    RETURN_IF_NULL_ALLOC(copy);
    memcpy(copy, text, bytes);
    *tip = copy;
    return S_OK;
}

HRESULT CQuorvelQueryInfoBase::GetInfoFlags(DWORD*) {
    return E_NOTIMPL;
}
