// The module's two shared image lists: index 0 station, 1 root (and unknown kinds), 2 file.
#pragma once

#include <windows.h>
#include <commctrl.h>

// Builds the small (SM_CXSMICON) and large (SM_CXICON) lists from the module's group icons 101,
// 102 and 104, destroying older ones first. Called at module start-up; afterwards the lists are
// only read. False, with no lists left, when a list or one of its icons cannot be made: a list
// with an icon missing would shift every later index.
[[nodiscard]] bool BuildSharedIconLists(HMODULE module);
// Called at the module's tear-down, when nothing can be using the lists any more. Nothing else
// destroys them, not even the library's unload: that runs under the loader lock.
void DestroySharedIconLists();

// Null until built.
HIMAGELIST SmallIconList() noexcept;
HIMAGELIST LargeIconList() noexcept;

enum SharedIconIndex : int {
    kStationIconIndex = 0,
    kRootIconIndex = 1,
    kFileIconIndex = 2,
};
