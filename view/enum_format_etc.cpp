// The format enumerator handed out by the data object.
#include "view/enum_format_etc.h"

#include "support/error_handling.h"

CEnumFormatEtc::CEnumFormatEtc(const FORMATETC* entries, ULONG count, ULONG position)
    : entries_(entries, entries + count), position_(position) {}

IFACEMETHODIMP CEnumFormatEtc::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {QITABENT(CEnumFormatEtc, IEnumFORMATETC), {}};
    return QISearch(this, table, iid, object);
}

IFACEMETHODIMP CEnumFormatEtc::Next(ULONG count, FORMATETC* entries, ULONG* fetched) {
    if (entries_.empty())
        return S_FALSE;
    if (fetched)
        *fetched = 0;
    if (!fetched && count != 1)
        return E_POINTER;
    if (!entries)
        return S_FALSE;
    if (position_ >= entries_.size())
        return S_FALSE;
    ULONG copied = 0;
    while (copied < count && position_ < entries_.size())
        entries[copied++] = entries_[position_++];
    if (fetched)
        *fetched = copied;
    return S_OK;
}

IFACEMETHODIMP CEnumFormatEtc::Skip(ULONG count) {
    if (entries_.empty() || static_cast<ULONGLONG>(position_) + count >= entries_.size()) {
        return S_FALSE;
    }
    position_ += count;
    return S_OK;
}

IFACEMETHODIMP CEnumFormatEtc::Reset() {
    position_ = 0;
    return S_OK;
}

IFACEMETHODIMP CEnumFormatEtc::Clone(IEnumFORMATETC** clone) {
    if (!clone)
        return E_POINTER;
    *clone = nullptr;
    try {
        auto copy = MakeComObject<CEnumFormatEtc>(entries_.data(),
                                                  static_cast<ULONG>(entries_.size()), position_);
        *clone = copy.Detach();
        return S_OK;
    }
    CATCH_RETURN()
}
