// The widths of the view's first two columns: loaded when the module starts, read and changed
// by the view, saved when the library is freed. The value "Display Settings" beside the
// stations holds them.
#pragma once

#include <cstddef>

inline constexpr size_t kDisplayColumnCount = 2;

// 100 for each column until settings are loaded or set; 0 for a column that is not kept.
int DisplayColumnWidth(size_t column) noexcept;
void SetDisplayColumnWidth(size_t column, int width) noexcept;

// Both widths back to 100, then those of a well-formed stored value; false when there is none.
bool LoadDisplaySettings();
// Writes the two widths as the 12-byte binary value; false when the registry refuses.
bool SaveDisplaySettings();
