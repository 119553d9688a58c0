// The item enumerator's framework: Next, Skip and Reset over the filled list.
#include "namespace/enum_id_list_impl.h"

#include "support/error_handling.h"

CEnumIDListImpl::~CEnumIDListImpl() = default;

bool CEnumIDListImpl::AddToEnumList(LPITEMIDLIST item) noexcept {
    UniquePidl owned(item);
    if (!owned)
        return false;
    try {
        items_.push_back(std::move(owned));
        return true;
    } catch (...) {
        return false;
    }
}

void CEnumIDListImpl::DeleteList() noexcept {
    items_.clear();
    position_ = 0;
}

HRESULT CEnumIDListImpl::Next(ULONG count, PITEMID_CHILD* items, ULONG* fetched) {
    if (fetched)
        *fetched = 0;
    // Without a count to report, only one item may be asked for at a time.
    if (count > 1 && !fetched)
        return E_INVALIDARG;
    if (count > 0 && !items)
        return E_INVALIDARG;
    ULONG copied = 0;
    while (copied < count && position_ < items_.size()) {
        LPITEMIDLIST copy = manager_.CopyPidl(items_[position_].get());
        if (!copy) {
            // Nothing is handed out half: the copies are taken back and the position restored.
            for (ULONG index = 0; index < copied; ++index) {
                ::CoTaskMemFree(items[index]);
                items[index] = nullptr;
            }
            position_ -= copied;
            return E_OUTOFMEMORY;
        }
        items[copied++] = reinterpret_cast<PITEMID_CHILD>(copy);
        ++position_;
    }
    if (fetched)
        *fetched = copied;
    return copied == count ? S_OK : S_FALSE;
}

HRESULT CEnumIDListImpl::Skip(ULONG count) {
    for (ULONG skipped = 0; skipped < count; ++skipped) {
        if (position_ >= items_.size())
            return S_FALSE;
        ++position_;
    }
    return S_OK;
}

HRESULT CEnumIDListImpl::Reset() {
    position_ = 0;
    return S_OK;
}

HRESULT CEnumIDListImpl::Clone(IEnumIDList** copy) {
    if (copy)
        *copy = nullptr;
    return E_NOTIMPL;
}
