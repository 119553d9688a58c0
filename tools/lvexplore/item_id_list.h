// Absolute item-ID lists as the browser keeps them (current folder, history) and their names.
#pragma once

#include <windows.h>
#include <shlobj.h>

#include <string>

#include "support/unique_resource.h"

// The shell's name of the item (SIGDN_NORMALDISPLAY for a title, SIGDN_DESKTOPABSOLUTEPARSING to
// compare places); empty when the shell has none.
std::wstring ShellItemName(PCIDLIST_ABSOLUTE list, SIGDN kind);
