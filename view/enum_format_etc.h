// CEnumFormatEtc: enumerates a fixed list of clipboard formats.
#pragma once

#include <windows.h>
#include <objidl.h>

#include <vector>

#include "support/com_object.h"

class CEnumFormatEtc final : public ComObject<IEnumFORMATETC> {
public:
    // Copies the entries (the target-device pointers as they stand); starts at the first.
    CEnumFormatEtc(const FORMATETC* entries, ULONG count, ULONG position = 0);

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;
    // Copies up to count entries and answers S_OK even when fewer were left; S_FALSE at the end.
    IFACEMETHODIMP Next(ULONG count, FORMATETC* entries, ULONG* fetched) override;
    IFACEMETHODIMP Skip(ULONG count) override;
    IFACEMETHODIMP Reset() override;
    IFACEMETHODIMP Clone(IEnumFORMATETC** clone) override;

private:
    std::vector<FORMATETC> entries_;
    ULONG position_;
};
