// The flat station list: its exact bytes, a round trip, and hostile blocks.
#include <gtest/gtest.h>

#include <vector>

#include "stations/portable/station_list_format.h"
#include "support/portable/byte_io.h"

namespace {

Station SampleStation(const WideString& name) {
    // The texts, then BaudRate, StopBits, Parity, Protocol, DataBits, Flow and CheckSum.
    // clang-format off
    return {name, WIDE_TEXT("COM3"), WIDE_TEXT("Maker"), WIDE_TEXT("Quorvel LV-20"), WIDE_TEXT("v2"),
            19200, 2, 1, 3, 8, 4, 0};
    // clang-format on
}

std::vector<Station> Parse(const std::vector<uint8_t>& block) {
    // Parsed from an exact-size heap copy, so that AddressSanitizer sees any read past the end.
    std::vector<uint8_t> exact(block);
    return ParseStationRecords(exact.data(), exact.size());
}

}  // namespace

TEST(StationListFormat, FlatRecordHasTheInteroperableFieldOrder) {
    // One row a field group.
    // clang-format off
    const Station station = {.Name = WIDE_TEXT("A"), .Port = WIDE_TEXT("C"),
                             .Manufacturer = WIDE_TEXT(""), .Model = WIDE_TEXT("M"),
                             .Software = WIDE_TEXT(""), .BaudRate = 0x11111111,
                             .StopBits = 0x22222222, .Parity = 0x33333333, .Protocol = 0x55555555,
                             .DataBits = 0x44444444, .Flow = 0x66666666, .CheckSum = 0x77777777};
    const std::vector<uint8_t> expected = {
        1, 0, 0, 0,  44, 0, 0, 0,                           // count, record size
        'A', 0, 0, 0,  'C', 0, 0, 0,                        // Name, Port
        0x11, 0x11, 0x11, 0x11,  0x22, 0x22, 0x22, 0x22,    // BaudRate, StopBits
        0x33, 0x33, 0x33, 0x33,  0x44, 0x44, 0x44, 0x44,    // Parity, DataBits
        0, 0,  'M', 0, 0, 0,  0, 0,                         // Manufacturer, Model, Software
        0x55, 0x55, 0x55, 0x55,  0x66, 0x66, 0x66, 0x66,    // Protocol, Flow
        0x77, 0x77, 0x77, 0x77};                            // CheckSum
    // clang-format on
    // 2 × (1 + 1 + 0 + 1 + 0 + 5) + 28
    EXPECT_EQ(44u, FlatStationRecordSize(station));
    EXPECT_EQ(expected, SerializeStationRecords({station}));
}

TEST(StationListFormat, RoundTripKeepsEveryFieldAndTheOrder) {
    const std::vector<Station> stations = {SampleStation(WIDE_TEXT("North")), Station{},
                                           SampleStation(WIDE_TEXT("Süd \u00e9"))};
    EXPECT_EQ(stations, Parse(SerializeStationRecords(stations)));
    EXPECT_EQ(std::vector<uint8_t>(4, 0), SerializeStationRecords({}));
}

TEST(StationListFormat, LyingCountsAndSizesStopWithTheCompleteRecordsBefore) {
    const std::vector<Station> stations = {SampleStation(WIDE_TEXT("A")), Station{}};
    const std::vector<uint8_t> two = SerializeStationRecords(stations);
    const size_t secondSize = 4 + 4 + FlatStationRecordSize(stations[0]);
    const struct {
        size_t offset;
        uint32_t value;
        size_t parsed;
    } cases[] = {
        {0, 0xFFFFFFFF, 0},           // count -1
        {0, 0x80000000, 0},           // most negative count
        {0, 0, 0},                    // no records
        {0, 1000000, 2},              // more records than the block holds
        {secondSize, 0x7FFFFFF0, 1},  // a record size past the block
        {4, 10, 0},                   // a size too small for the strings' terminators
    };
    for (const auto& test : cases) {
        std::vector<uint8_t> block = two;
        WriteU32(block.data() + test.offset, test.value);
        EXPECT_EQ(std::vector<Station>(stations.begin(), stations.begin() + test.parsed),
                  Parse(block))
            << test.offset << " " << test.value;
    }
    // One record whose name fills the whole block with no terminator.
    EXPECT_TRUE(Parse({1, 0, 0, 0, 8, 0, 0, 0, 'N', 0, 'N', 0, 'N', 0, 'N', 0}).empty());
}
