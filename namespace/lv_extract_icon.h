// An item's icon for the shell: an index into the module's shared icon lists.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>

#include "namespace/pidl_manager.h"
#include "support/com_object.h"

class CLVExtractIcon final : public ComObject<IExtractIconW> {
public:
    CLVExtractIcon() noexcept = default;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        // MinGW declares no __uuidof for this interface: the entry names its IID itself.
        static const QITAB table[] = {
            {&IID_IExtractIconW, OFFSETOFCLASS(IExtractIconW, CLVExtractIcon)}, {}};
        return QISearch(this, table, iid, object);
    }

    // Keeps a copy of the item's internal full identifier.
    [[nodiscard]] HRESULT SetItem(PCUIDLIST_RELATIVE fullList) noexcept;

    // The index follows the kind of the last item; the icon never comes from a file.
    IFACEMETHODIMP GetIconLocation(UINT flags, PWSTR file, UINT fileCapacity, int* index,
                                   UINT* locationFlags) override;
    // New icons from the shared lists at the index; the requested size is not used, as the lists
    // already hold the system's two sizes.
    IFACEMETHODIMP Extract(PCWSTR file, UINT index, HICON* large, HICON* small, UINT size) override;

private:
    UniqueRelativePidl fullList_;
    CPidlMgr manager_;
};
