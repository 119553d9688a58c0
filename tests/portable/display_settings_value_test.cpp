// The "Display Settings" value as the module writes it and as another program may have left it.
#include <gtest/gtest.h>

#include <optional>
#include <vector>

#include "stations/portable/display_settings_value.h"

TEST(DisplaySettingsValue, OnlyABinaryValueOfEightToSixteenBytesGivesWidths) {
    std::vector<uint8_t> bytes(20, 0xEE);
    const uint8_t widths[8] = {0xF0, 0, 0, 0, 0x34, 0x12, 0, 0};  // 240, 0x1234
    std::copy(std::begin(widths), std::end(widths), bytes.begin());
    const std::vector<uint8_t> negative = {0xFF, 0xFF, 0xFF, 0xFF, 0, 0, 0, 0x80};
    const auto first = [&](size_t count) {
        return std::vector<uint8_t>(bytes.begin(), bytes.begin() + count);
    };
    const DisplayColumnWidths written = {240, 0x1234};
    using enum RegistryValueType;
    const struct {
        const char* what;
        RegistryValueType type;
        std::vector<uint8_t> data;
        std::optional<DisplayColumnWidths> read;
    } cases[] = {
        {"eight bytes", kBinary, first(8), written},
        {"twelve, as written", kBinary, first(12), written},
        {"sixteen, the whole buffer", kBinary, first(16), written},
        {"an odd length inside", kBinary, first(9), written},
        {"words read as signed", kBinary, negative, DisplayColumnWidths{-1, INT32_MIN}},
        {"seventeen", kBinary, first(17), std::nullopt},
        {"seven", kBinary, first(7), std::nullopt},
        {"four: one width only", kBinary, first(4), std::nullopt},
        {"empty", kBinary, {}, std::nullopt},
        {"text", kText, {'2', 0, '0', 0, '0', 0, 0, 0}, std::nullopt},
        {"a number", kNumber, first(8), std::nullopt},
        {"no type", kNone, first(8), std::nullopt},
        {"a 64-bit number", RegistryValueType(11), first(8), std::nullopt},
    };
    for (const auto& test : cases)
        EXPECT_EQ(test.read, ParseDisplaySettings(test.type, test.data)) << test.what;
}

TEST(DisplaySettingsValue, TheWrittenTwelveBytesCarryTheWidthsThenZerosAndReadBack) {
    const DisplayColumnWidths widths = {240, -5};
    const auto bytes = DisplaySettingsBytes(widths);
    const std::array<uint8_t, 12> expected = {0xF0, 0, 0, 0, 0xFB, 0xFF, 0xFF, 0xFF, 0, 0, 0, 0};
    EXPECT_EQ(expected, bytes);
    EXPECT_EQ(widths, ParseDisplaySettings(RegistryValueType::kBinary, bytes));
}
