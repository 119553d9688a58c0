// The namespace's folder, composed here from the folder framework and the classes of every layer
// below: the root folder that the shell creates, and each station folder.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>

#include "namespace/lv_enum_id_list.h"
#include "namespace/lv_extract_icon.h"
#include "namespace/lv_query_info.h"
#include "namespace/quorvel_shell_folder_impl.h"
#include "support/com_object.h"
#include "view/lv_context_menu.h"
#include "view/lv_data_object.h"
#include "view/lv_drop_target.h"
#include "view/lv_shell_view.h"

// {7D3F2A61-4B8E-4C19-9A27-5E0C81B6D4F3}
inline constexpr CLSID CLSID_LVShellFolder = {
    0x7D3F2A61, 0x4B8E, 0x4C19, {0x9A, 0x27, 0x5E, 0x0C, 0x81, 0xB6, 0xD4, 0xF3}};

class CLVShellFolder;

using CLVShellFolderImpl =
    CQuorvelShellFolderImpl<CLVShellFolder, CLVShellView, CLVEnumIDList, CLVContextMenu,
                            CLVExtractIcon, CLVQueryInfo, CLVDataObject, CLVDropTarget>;

// Operations take no lock: each call works on local buffers and on fields fixed at set-up.
class CLVShellFolder final : public ComObject<CLVShellFolderImpl> {
public:
    CLVShellFolder() noexcept = default;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;
    IFACEMETHODIMP GetClassID(CLSID* id) override;
};
