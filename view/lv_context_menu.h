// CLVContextMenu: the menu object the folder hands out for its background. It carries one fixed
// sample command; the folder's real commands live in its view.
#pragma once

#include <windows.h>
#include <shlobj.h>

#include "support/com_object.h"

class CLVContextMenu final : public ComObject<IContextMenu> {
public:
    CLVContextMenu() noexcept = default;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override;

    IFACEMETHODIMP QueryContextMenu(HMENU menu, UINT position, UINT firstCommand, UINT lastCommand,
                                    UINT flags) override;
    IFACEMETHODIMP InvokeCommand(CMINVOKECOMMANDINFO* info) override;
    IFACEMETHODIMP GetCommandString(UINT_PTR command, UINT type, UINT* reserved, CHAR* name,
                                    UINT capacity) override;
};
