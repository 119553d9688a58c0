// Absolute item-ID lists as the browser keeps them (current folder, history) and their names.
#pragma once

#include <windows.h>
#include <shlobj.h>

#include <string>

#include "support/unique_resource.h"

// A list made by the shell's own allocator (SHParseDisplayName, ILClone, ILCombine).
struct AbsoluteIdListTraits {
    using Type = PIDLIST_ABSOLUTE;
    static Type Invalid() noexcept { return nullptr; }
    static void Close(Type value) noexcept { ::ILFree(value); }
};
using UniqueAbsoluteIdList = UniqueResource<AbsoluteIdListTraits>;

// The shell's name of the item (SIGDN_NORMALDISPLAY for a title, SIGDN_DESKTOPABSOLUTEPARSING to
// compare places); empty when the shell has none.
std::wstring ShellItemName(PCIDLIST_ABSOLUTE list, SIGDN kind);
