// The "Display Settings" value: the widths of the view's first two columns as two 32-bit
// little-endian numbers, column 0 first. Another program may have written any type and length.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

#include "stations/portable/registry_data.h"

inline constexpr size_t kDisplaySettingsColumnCount = 2;
inline constexpr int32_t kDefaultDisplayColumnWidth = 100;
// The value is read with a buffer of this many bytes; a longer one is not read at all.
inline constexpr size_t kDisplaySettingsReadBytes = 16;
// Written: the two widths and four bytes that carry nothing (zeros, ignored when read).
inline constexpr size_t kDisplaySettingsWrittenBytes = 12;

using DisplayColumnWidths = std::array<int32_t, kDisplaySettingsColumnCount>;

// The two widths of a REG_BINARY value of 8 to 16 bytes; nullopt for any other, which leaves the
// widths at their defaults (text read as widths would give columns millions of pixels wide).
std::optional<DisplayColumnWidths> ParseDisplaySettings(RegistryValueType type,
                                                        std::span<const uint8_t> data) noexcept;

std::array<uint8_t, kDisplaySettingsWrittenBytes> DisplaySettingsBytes(
    const DisplayColumnWidths& widths) noexcept;
