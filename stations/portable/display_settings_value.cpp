// The "Display Settings" value's bytes.
#include "stations/portable/display_settings_value.h"

#include "support/portable/byte_io.h"

namespace {

constexpr size_t kWidthBytes = 4;

}  // namespace

std::optional<DisplayColumnWidths> ParseDisplaySettings(RegistryValueType type,
                                                        std::span<const uint8_t> data) noexcept {
    if (type != RegistryValueType::kBinary || data.size() > kDisplaySettingsReadBytes ||
        data.size() < kDisplaySettingsColumnCount * kWidthBytes) {
        return std::nullopt;
    }
    DisplayColumnWidths widths{};
    for (size_t column = 0; column < kDisplaySettingsColumnCount; ++column)
        widths[column] = static_cast<int32_t>(ReadU32(data.data() + kWidthBytes * column));
    return widths;
}

std::array<uint8_t, kDisplaySettingsWrittenBytes> DisplaySettingsBytes(
    const DisplayColumnWidths& widths) noexcept {
    std::array<uint8_t, kDisplaySettingsWrittenBytes> bytes{};
    for (size_t column = 0; column < kDisplaySettingsColumnCount; ++column)
        WriteU32(bytes.data() + kWidthBytes * column, static_cast<uint32_t>(widths[column]));
    return bytes;
}
