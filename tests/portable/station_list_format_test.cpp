// The flat station list: its exact bytes, a round trip, and hostile blocks.
#include <gtest/gtest.h>

#include <vector>

#include "stations/portable/station_list_format.h"
#include "support/portable/byte_io.h"

namespace {

Station SampleStation(const WideString& name) {
    Station station;
    station.Name = name;
    station.Port = WIDE_TEXT("COM3");
    station.Manufacturer = WIDE_TEXT("Maker");
    station.Model = WIDE_TEXT("Quorvel LV-20");
    station.Software = WIDE_TEXT("v2");
    station.BaudRate = 19200;
    station.StopBits = 2;
    station.Parity = 1;
    station.Protocol = 3;
    station.DataBits = 8;
    station.Flow = 4;
    station.CheckSum = 0;
    return station;
}

std::vector<Station> Parse(const std::vector<uint8_t>& block) {
    // Parsed from an exact-size heap copy, so that AddressSanitizer sees any read past the end.
    std::vector<uint8_t> exact(block);
    return ParseStationRecords(exact.data(), exact.size());
}

}  // namespace

TEST(StationListFormat, FlatRecordHasTheInteroperableFieldOrder) {
    Station station;
    station.Name = WIDE_TEXT("A");
    station.Port = WIDE_TEXT("C");
    station.Model = WIDE_TEXT("M");
    station.BaudRate = 0x11111111;
    station.StopBits = 0x22222222;
    station.Parity = 0x33333333;
    station.DataBits = 0x44444444;
    station.Protocol = 0x55555555;
    station.Flow = 0x66666666;
    station.CheckSum = 0x77777777;
    // 2 × (1 + 1 + 0 + 1 + 0 + 5) + 28
    ASSERT_EQ(44u, FlatStationRecordSize(station));

    const std::vector<uint8_t> block = SerializeStationRecords({station});
    // clang-format off: one row a field group
    const std::vector<uint8_t> expected = {
        1,    0,    0,    0,                          // count
        44,   0,    0,    0,                          // record size
        'A',  0,    0,    0,    'C',  0,    0,    0,  // Name, Port
        0x11, 0x11, 0x11, 0x11, 0x22, 0x22, 0x22, 0x22, 0x33, 0x33, 0x33, 0x33,
        0x44, 0x44, 0x44, 0x44,                       // BaudRate, StopBits, Parity, DataBits
        0,    0,    'M',  0,    0,    0,    0,    0,  // Manufacturer, Model, Software
        0x55, 0x55, 0x55, 0x55, 0x66, 0x66, 0x66, 0x66, 0x77, 0x77, 0x77, 0x77};  // Protocol, Flow,
    // clang-format on
    // CheckSum
    EXPECT_EQ(expected, block);
}

TEST(StationListFormat, RoundTripKeepsEveryFieldAndTheOrder) {
    const std::vector<Station> stations = {SampleStation(WIDE_TEXT("North")), Station{},
                                           SampleStation(WIDE_TEXT("Süd \u00e9"))};
    EXPECT_EQ(stations, Parse(SerializeStationRecords(stations)));
    EXPECT_EQ(std::vector<uint8_t>(4, 0), SerializeStationRecords({}));
}

TEST(StationListFormat, LyingCountsAndSizesStopWithTheCompleteRecordsBefore) {
    const std::vector<uint8_t> two =
        SerializeStationRecords({SampleStation(WIDE_TEXT("A")), SampleStation(WIDE_TEXT("B"))});
    const size_t secondSize = 4 + 4 + FlatStationRecordSize(SampleStation(WIDE_TEXT("A")));
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
        const std::vector<Station> parsed = Parse(block);
        ASSERT_EQ(test.parsed, parsed.size()) << test.offset << " " << test.value;
        for (size_t i = 0; i < parsed.size(); ++i)
            EXPECT_EQ(i ? WIDE_TEXT("B") : WIDE_TEXT("A"), parsed[i].Name);
    }
    // One record whose name fills the whole block with no terminator.
    EXPECT_TRUE(Parse({1, 0, 0, 0, 8, 0, 0, 0, 'N', 0, 'N', 0, 'N', 0, 'N', 0}).empty());
}

TEST(StationListFormat, EveryTruncationYieldsOnlyCompleteRecords) {
    const std::vector<Station> stations = {SampleStation(WIDE_TEXT("One")),
                                           SampleStation(WIDE_TEXT("Two")),
                                           SampleStation(WIDE_TEXT("Three"))};
    const std::vector<uint8_t> block = SerializeStationRecords(stations);
    size_t end = 4;
    std::vector<size_t> recordEnds;
    for (const Station& station : stations) {
        end += 4 + FlatStationRecordSize(station);
        recordEnds.push_back(end);
    }
    for (size_t length = 0; length <= block.size(); ++length) {
        const std::vector<uint8_t> prefix(block.begin(), block.begin() + length);
        size_t complete = 0;
        while (complete < recordEnds.size() && recordEnds[complete] <= length)
            ++complete;
        const std::vector<Station> parsed = Parse(prefix);
        ASSERT_EQ(complete, parsed.size()) << "length " << length;
        for (size_t i = 0; i < complete; ++i)
            EXPECT_EQ(stations[i], parsed[i]);
    }
}
