// The namespace's folder: the root folder that the shell creates, and each station folder. Here,
// above every layer, it creates the objects of the layers below: the enumerator, the bound
// folder, the view and its menu, and the per-item objects.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>

#include "namespace/quorvel_shell_folder_base.h"
#include "support/com_object.h"

// {7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}
inline constexpr CLSID CLSID_LVShellFolder = {
    0x7D3F2A61, 0x4B8E, 0x4C19, {0x9A, 0x27, 0x5E, 0x0C, 0x81, 0xB6, 0xD4, 0xF3}};

// Operations take no lock: each call works on local buffers and on fields fixed at set-up.
class CLVShellFolder final : public ComObject<CQuorvelShellFolderBase> {
public:
    CLVShellFolder() noexcept = default;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;
    IFACEMETHODIMP GetClassID(CLSID* id) override;

    // IShellFolder: the operations that create objects.
    IFACEMETHODIMP EnumObjects(HWND window, SHCONTF flags, IEnumIDList** enumerator) override;
    IFACEMETHODIMP BindToObject(PCUIDLIST_RELATIVE list, IBindCtx* bindContext, REFIID iid,
                                void** object) override;
    IFACEMETHODIMP CreateViewObject(HWND owner, REFIID iid, void** object) override;
    IFACEMETHODIMP GetUIObjectOf(HWND owner, UINT count, PCUITEMID_CHILD_ARRAY items, REFIID iid,
                                 UINT* reserved, void** object) override;

private:
    // A data object also learns where the folder is, to name the items' parent to the shell.
    [[nodiscard]] HRESULT CreateDataObject(PCUITEMID_CHILD item, REFIID iid,
                                           void** object) noexcept;

    // The object keeps its own copy of the item's full list; ours is freed on return.
    template <typename ItemObject>
    [[nodiscard]] HRESULT CreateItemObject(PCUITEMID_CHILD item, REFIID iid,
                                           void** object) noexcept;
};
