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
    const RegistryValueType binary = RegistryValueType::kBinary;
    const struct {
        const char* what;
        RegistryValueType type;
        std::vector<uint8_t> data;
        std::optional<DisplayColumnWidths> read;
    } cases[] = {
        {"eight bytes",
         binary,
         {bytes.begin(), bytes.begin() + 8},
         DisplayColumnWidths{240, 0x1234}},
        {"twelve, as written",
         binary,
         {bytes.begin(), bytes.begin() + 12},
         DisplayColumnWidths{240, 0x1234}},
        {"sixteen, the whole buffer",
         binary,
         {bytes.begin(), bytes.begin() + 16},
         DisplayColumnWidths{240, 0x1234}},
        {"an odd length inside",
         binary,
         {bytes.begin(), bytes.begin() + 9},
         DisplayColumnWidths{240, 0x1234}},
        {"words read as signed", binary, negative, DisplayColumnWidths{-1, INT32_MIN}},
        {"seventeen", binary, {bytes.begin(), bytes.begin() + 17}, std::nullopt},
        {"seven", binary, {bytes.begin(), bytes.begin() + 7}, std::nullopt},
        {"four: one width only", binary, {bytes.begin(), bytes.begin() + 4}, std::nullopt},
        {"empty", binary, {}, std::nullopt},
        {"text", RegistryValueType::kText, {'2', 0, '0', 0, '0', 0, 0, 0}, std::nullopt},
        {"a number", RegistryValueType::kNumber, {bytes.begin(), bytes.begin() + 8}, std::nullopt},
        {"no type", RegistryValueType::kNone, {bytes.begin(), bytes.begin() + 8}, std::nullopt},
        {"a 64-bit number",
         static_cast<RegistryValueType>(11),
         {bytes.begin(), bytes.begin() + 8},
         std::nullopt},
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
