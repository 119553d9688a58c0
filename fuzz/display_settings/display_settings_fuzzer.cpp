// Reads the "Display Settings" value another program may have written with any type and length.
// Only a binary value of 8 to 16 bytes gives widths, and then its first two little-endian words;
// the widths written back read the same.
// Input: a 32-bit type, then the value's bytes.
#include <cstdint>
#include <cstdlib>
#include <optional>
#include <vector>

#include "stations/portable/display_settings_value.h"
#include "support/portable/byte_io.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 4)
        return 0;
    const auto type = static_cast<RegistryValueType>(ReadU32(data));
    // An exact-size copy: any read past the value's end is a heap overflow for ASan.
    const std::vector<uint8_t> value(data + 4, data + size);
    const std::optional<DisplayColumnWidths> widths = ParseDisplaySettings(type, value);

    const bool ours = type == RegistryValueType::kBinary && value.size() >= 8 && value.size() <= 16;
    if (widths.has_value() != ours)
        abort();
    if (!widths)
        return 0;
    if (static_cast<uint32_t>((*widths)[0]) != ReadU32(value.data()) ||
        static_cast<uint32_t>((*widths)[1]) != ReadU32(value.data() + 4))
        abort();
    const auto written = DisplaySettingsBytes(*widths);
    if (ParseDisplaySettings(RegistryValueType::kBinary, written) != widths ||
        !std::equal(written.begin(), written.begin() + 8, value.begin()) ||
        ReadU32(written.data() + 8) != 0)
        abort();
    return 0;
}
