// An item's icon for the shell, from the module's shared icon lists.
#include "namespace/lv_extract_icon.h"

#include <commctrl.h>

#include "namespace/icon_lists.h"
#include "support/error_handling.h"

HRESULT CLVExtractIcon::SetItem(PCUIDLIST_RELATIVE fullList) noexcept {
    fullList_ = manager_.CopyPidl(fullList);
    RETURN_IF_NULL_ALLOC(fullList_.get());
    return S_OK;
}

HRESULT CLVExtractIcon::GetIconLocation(UINT, PWSTR location, UINT capacity, int* index,
                                        UINT* locationFlags) {
    // The shell reads the location as a string whatever the flags say: always a terminated one,
    // empty because the icon comes from Extract, not from a file.
    if (location && capacity > 0)
        location[0] = L'\0';
    if (!index || !locationFlags)
        return E_POINTER;
    *locationFlags = GIL_NOTFILENAME;
    switch (manager_.GetLastItemKind(fullList_.get())) {
        case PT_STATION:
            *index = kStationIconIndex;
            break;
        case PT_FILE:
            *index = kFileIconIndex;
            break;
        default:
            *index = kRootIconIndex;
            break;
    }
    return S_OK;
}

HRESULT CLVExtractIcon::Extract(PCWSTR, UINT index, HICON* large, HICON* small, UINT) {
    if (large)
        *large = nullptr;
    if (small)
        *small = nullptr;
    // Without the lists the shell falls back to its own icon.
    if (!LargeIconList() || !SmallIconList())
        return E_FAIL;
    if (large)
        *large = ::ImageList_GetIcon(LargeIconList(), static_cast<int>(index), ILD_TRANSPARENT);
    if (small)
        *small = ::ImageList_GetIcon(SmallIconList(), static_cast<int>(index), ILD_TRANSPARENT);
    return S_OK;
}
