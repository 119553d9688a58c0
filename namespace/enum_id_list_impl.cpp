// The item enumerator's framework: Next, Skip and Reset over the filled list.
#include "namespace/enum_id_list_impl.h"

#include <new>
#include <vector>

#include "support/error_handling.h"

CEnumIDListImpl::~CEnumIDListImpl() = default;

HRESULT CEnumIDListImpl::AddToEnumList(UniqueChildPidl item) noexcept {
    RETURN_HR_IF(E_POINTER, !item);
    try {
        items_.push_back(std::move(item));
        return S_OK;
    }
    CATCH_RETURN()
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
    // Nothing is handed out half: the copies stay owned here until all of them are made.
    std::vector<UniqueChildPidl> copies;
    try {
        for (size_t next = position_; copies.size() < count && next < items_.size(); ++next) {
            copies.push_back(manager_.CopyItem(items_[next].get()));
            // The list holds only well-formed items of its own: a copy fails for want of memory.
            if (!copies.back())
                return E_OUTOFMEMORY;
        }
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
    const ULONG copied = static_cast<ULONG>(copies.size());
    for (ULONG index = 0; index < copied; ++index)
        items[index] = copies[index].release();
    position_ += copied;
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
