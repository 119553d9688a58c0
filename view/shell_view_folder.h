// ShellViewFolder: what the parts of a view know of the folder it shows: the folder, its kind
// and its path.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <string>

#include "namespace/portable/item_id_layout.h"

struct ShellViewFolder {
    Microsoft::WRL::ComPtr<IShellFolder> folder;
    DWORD kind = 0;     // the kind of the folder's own item: the top folder's, or a station's
    std::wstring path;  // "Quorvel Digital Level", then "\" and the station for a station

    bool IsTopFolder() const noexcept { return kind == PT_ROOT; }
};
