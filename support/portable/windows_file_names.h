// What Windows refuses in a file or folder name, for the code that makes names from a user's
// text: the kept downloads' folders and lvcopy's output names.
#pragma once

#include "support/portable/wide_text.h"

// The characters no name may hold: the controls and <>:"/\|?*.
[[nodiscard]] bool IsForbiddenInFileName(WideChar character) noexcept;

// The device a name stands for in Windows, in capitals, or empty when it names a file. Windows
// takes the part before the first dot, less trailing spaces, in any case, for a device when it is
// CON, PRN, AUX, NUL, CONIN$, CONOUT$, COM0-COM9 or LPT0-LPT9 (also with a superscript 1, 2 or 3),
// whatever extension follows: "aux.lv" and "Com1 .txt" open devices, not files. The set differs
// between versions (COM0 and LPT0 are listed only by newer ones); this is the widest.
[[nodiscard]] WideString DeviceInFileName(WideStringView name);
