// The widths of the view's first two columns: loaded when the module starts, saved by the view
// whenever they change. The value "Display Settings" beside the stations holds them.
#pragma once

#include <windows.h>

#include <cstddef>

#include "stations/portable/display_settings_value.h"

inline constexpr size_t kDisplayColumnCount = kDisplaySettingsColumnCount;

// 100 for each column until settings are loaded or set; 0 for a column that is not kept.
int DisplayColumnWidth(size_t column) noexcept;
void SetDisplayColumnWidth(size_t column, int width) noexcept;

// Both widths back to 100, then those of a well-formed stored value; false when there is none.
[[nodiscard]] bool LoadDisplaySettings();
// Writes the two widths as the 12-byte binary value; false, and logged, when the registry refuses.
[[nodiscard]] bool SaveDisplaySettings();

// The widths a view shows now. When one differs from the width kept (or an earlier write
// failed), keeps them and writes the value at once, as SaveDisplaySettings does; views on
// several threads take turns, so that the value stored is always the widths kept. A failed
// write is logged and returned; the widths are kept all the same and the next call writes.
[[nodiscard]] HRESULT StoreDisplayColumnWidths(const int (&widths)[kDisplayColumnCount]) noexcept;
