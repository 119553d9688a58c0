// The lookup that every user-visible text passes through: string-table text in English, shown
// without its translator's note.
#pragma once

#include <windows.h>

#include <string>

// The English text of a string-table id of the given module (LANGID 1033); empty when missing.
std::wstring LoadEnglishString(HMODULE module, UINT id);

// The text to show for a string-table id of this module.
std::wstring LoadUiText(UINT id);
