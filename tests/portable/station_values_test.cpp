// Reading a station's values from a key another program may have written: the order, where a
// missing or unreadable value stops the read, and the bounds of every text and number.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "stations/portable/registry_data.h"
#include "stations/portable/station_fields.h"
#include "stations/portable/station_values.h"
#include "tests/portable/registry_bytes.h"
#include "tests/portable/station_value_table.h"

namespace {

using Names = std::vector<WideString>;

const WideString kLv10 = WIDE_TEXT("Quorvel LV-10");
const WideString kLv20 = WIDE_TEXT("Quorvel LV-20");
const WideString kLv30 = WIDE_TEXT("Quorvel LV-30");

// Every read in the store's order, when all succeed.
const Names kFullOrder = {WIDE_TEXT("Name"),     WIDE_TEXT("Port"),         WIDE_TEXT("StopBits"),
                          WIDE_TEXT("BaudRate"), WIDE_TEXT("Parity"),       WIDE_TEXT("Parity"),
                          WIDE_TEXT("DataBits"), WIDE_TEXT("Manufacturer"), WIDE_TEXT("Model"),
                          WIDE_TEXT("Software"), WIDE_TEXT("Protocol"),     WIDE_TEXT("Flow"),
                          WIDE_TEXT("CheckSum")};

std::string Narrow(WideStringView text) {
    return std::string(text.begin(), text.end());
}

// A record whose every value differs from the defaults.
Station Written() {
    // clang-format off
    return {.Name = WIDE_TEXT("North"), .Port = WIDE_TEXT("COM4"), .Manufacturer = WIDE_TEXT("M"),
            .Model = kLv30, .Software = WIDE_TEXT("2.1"), .BaudRate = 4800, .StopBits = 2,
            .Parity = 1, .Protocol = 3, .DataBits = 8, .Flow = 2, .CheckSum = 0};
    // clang-format on
}

// Copies the field stored under this value name from one record to the other.
void CopyField(WideStringView name, const Station& from, Station& to) {
    const StationFieldInfo& info = StationFieldOf(*StationFieldNamed(name));
    if (info.text)
        to.*info.text = from.*info.text;
    else
        to.*info.number = from.*info.number;
}

// The key the store writes for Written().
StationValueTable WrittenKey() {
    StationValueTable key;
    const Station written = Written();
    for (const StationFieldInfo& info : StationFields()) {
        if (info.text)
            key.SetText(info.valueName, written.*info.text);
        else
            key.SetNumber(info.valueName, written.*info.number);
    }
    return key;
}

// A record in which every field differs from both the written key and the defaults.
Station Prior() {
    // clang-format off
    return {.Name = WIDE_TEXT("prior"), .Port = WIDE_TEXT("prior port"),
            .Manufacturer = WIDE_TEXT("prior maker"), .Model = WIDE_TEXT("prior model"),
            .Software = WIDE_TEXT("prior software"), .BaudRate = 11, .StopBits = 12, .Parity = 13,
            .Protocol = 14, .DataBits = 15, .Flow = 16, .CheckSum = 17};
    // clang-format on
}

struct Reading {
    ValueReadStatus status;
    Station station;
    size_t portListsAsked = 0;
};

Reading Read(StationValueTable& key, const std::vector<WideString>& ports = {},
             Station station = Prior()) {
    Reading reading{ValueReadStatus::kFailed, {}, 0};
    StationReadRules rules{[&] {
                               ++reading.portListsAsked;
                               return ports;
                           },
                           kLv10, kLv20, kLv30};
    reading.status = ReadStationValues(station, key, rules);
    reading.station = station;
    return reading;
}

}  // namespace

TEST(StationValues, AWrittenKeyIsReadWholeInTheStoresOrder) {
    StationValueTable key = WrittenKey();
    const Reading reading = Read(key);
    EXPECT_EQ(ValueReadStatus::kRead, reading.status);
    EXPECT_EQ(Written(), reading.station);
    EXPECT_EQ(kFullOrder, key.Asked());
    EXPECT_EQ(1u, reading.portListsAsked);
}

TEST(StationValues, AMissingValueStopsTheReadThereAndLaterFieldsKeepTheirValues) {
    // Each value in turn is missing; the fields read before it are the key's, the rest the
    // record's own. Protocol and Flow may be missing: the read goes on to CheckSum.
    const struct {
        const WideChar* missing;
        ValueReadStatus status;
        size_t readsMade;  // of kFullOrder
    } cases[] = {
        {WIDE_TEXT("Name"), ValueReadStatus::kMissing, 1},
        {WIDE_TEXT("Port"), ValueReadStatus::kMissing, 2},
        {WIDE_TEXT("StopBits"), ValueReadStatus::kMissing, 3},
        {WIDE_TEXT("BaudRate"), ValueReadStatus::kMissing, 4},
        {WIDE_TEXT("Parity"), ValueReadStatus::kMissing, 5},
        {WIDE_TEXT("DataBits"), ValueReadStatus::kMissing, 7},
        {WIDE_TEXT("Manufacturer"), ValueReadStatus::kMissing, 8},
        {WIDE_TEXT("Model"), ValueReadStatus::kMissing, 9},
        {WIDE_TEXT("Software"), ValueReadStatus::kMissing, 10},
        {WIDE_TEXT("Protocol"), ValueReadStatus::kRead, 13},
        {WIDE_TEXT("Flow"), ValueReadStatus::kRead, 13},
        {WIDE_TEXT("CheckSum"), ValueReadStatus::kMissing, 13},
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(Narrow(test.missing));
        StationValueTable key = WrittenKey();
        key.Remove(test.missing);
        const Reading reading = Read(key);
        EXPECT_EQ(test.status, reading.status);
        const Names asked(kFullOrder.begin(), kFullOrder.begin() + test.readsMade);
        EXPECT_EQ(asked, key.Asked());
        EXPECT_EQ(test.readsMade > 2 ? 1u : 0u, reading.portListsAsked)
            << "the port list is asked for only once the port is read";

        // The expected record: the key's fields up to the missing one, the prior ones after.
        Station expected = Prior();
        for (size_t read = 0; read < test.readsMade; ++read)
            if (kFullOrder[read] != test.missing)
                CopyField(kFullOrder[read], Written(), expected);
        EXPECT_EQ(expected, reading.station);
    }
}

TEST(StationValues, ValuesOfTheWrongTypeOrSizeStopTheReadWithoutTouchingTheirField) {
    using enum RegistryValueType;
    using enum ValueReadStatus;
    const std::vector<uint8_t> eight = {1, 2, 3, 4, 5, 6, 7, 8};
    const auto textList = RegistryValueType(7), unknown = RegistryValueType(0xFFFFFFFF);
    const struct {
        const char* what;
        const WideChar* name;
        RegistryValueType type;
        std::vector<uint8_t> data;
        ValueReadStatus status;
    } cases[] = {
        {"a name stored as a number", WIDE_TEXT("Name"), kNumber, {0x41, 0, 0x41, 0}, kWrongType},
        {"a name stored as binary", WIDE_TEXT("Name"), kBinary, Units(WIDE_TEXT("N")), kWrongType},
        {"a model as a list of texts", WIDE_TEXT("Model"), textList, Units(kLv20), kWrongType},
        {"a port of an unknown type", WIDE_TEXT("Port"), unknown, Units(WIDE_TEXT("COM4")),
         kWrongType},
        {"a baud rate as text", WIDE_TEXT("BaudRate"), kText, {'9', 0, '6', 0}, kWrongType},
        {"a baud rate of eight bytes", WIDE_TEXT("BaudRate"), kBinary, eight, kTooLong},
        {"a number of eight bytes", WIDE_TEXT("StopBits"), kNumber, eight, kTooLong},
        {"a number of three bytes", WIDE_TEXT("DataBits"), kNumber, {8, 0, 0}, kWrongType},
        {"an empty number", WIDE_TEXT("Parity"), kNumber, {}, kWrongType},
        {"four binary bytes", WIDE_TEXT("CheckSum"), kBinary, {0, 0, 0, 0}, kWrongType},
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(test.what);
        StationValueTable key = WrittenKey();
        key.Set(test.name, test.type, test.data);
        const Reading reading = Read(key);
        EXPECT_EQ(test.status, reading.status);
        EXPECT_EQ(test.name, key.Asked().back()) << "the read stops at the bad value";
    }
    // The field of a refused value keeps what it held.
    StationValueTable key = WrittenKey();
    key.Set(WIDE_TEXT("BaudRate"), RegistryValueType::kNumber, {0x80, 0x25});
    EXPECT_EQ(11u, Read(key).station.BaudRate);
    key.Set(WIDE_TEXT("Port"), RegistryValueType::kBinary, Units(WIDE_TEXT("COM4")));
    EXPECT_EQ(WIDE_TEXT("prior port"), Read(key).station.Port);
}

// The listing also refuses a name with text after its first NUL, which would show as another.
TEST(StationValues, TextsAreReadOnlyInsideTheirBytesAndUpTo520OfThem) {
    using enum RegistryValueType;
    using enum ValueReadStatus;
    std::vector<uint8_t> withNul = Units(WIDE_TEXT("Pre"));
    withNul.insert(withNul.end(), {0, 0, 'x', 0, 'y', 0});
    std::vector<uint8_t> padded = Terminated(WIDE_TEXT("Pad"));
    padded.insert(padded.end(), {0, 0, 0, 0, 'h'});  // NULs, then half a unit
    std::vector<uint8_t> odd = Units(WIDE_TEXT("Odd"));
    odd.push_back('!');
    const WideString units259(259, WIDE_TEXT('L'));
    const WideString units260(260, WIDE_TEXT('U'));
    const struct {
        const char* what;
        RegistryValueType type;
        std::vector<uint8_t> data;
        ValueReadStatus status;
        WideString name;  // when read
        bool textAfterEnd = false;
    } cases[] = {
        {"without terminator", kText, Units(WIDE_TEXT("Raw")), kRead, WIDE_TEXT("Raw")},
        {"an odd byte count", kText, odd, kRead, WIDE_TEXT("Odd")},
        {"one byte", kText, {'A'}, kRead, WideString()},
        {"no bytes", kText, {}, kRead, WideString()},
        {"a NUL inside", kText, withNul, kRead, WIDE_TEXT("Pre"), true},
        {"NULs after the terminator", kText, padded, kRead, WIDE_TEXT("Pad")},
        {"unexpanded", kExpandText, Units(WIDE_TEXT("%TEMP%")), kRead, WIDE_TEXT("%TEMP%")},
        {"259 units and terminator", kText, Terminated(units259), kRead, units259},
        {"260 units filling the buffer without terminator", kText, Units(units260), kRead,
         units260},
        {"260 units and terminator", kText, Terminated(units260), kTooLong, WideString()},
        {"521 bytes", kText, std::vector<uint8_t>(521, 'z'), kTooLong, WideString()},
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(test.what);
        StationValueTable key = WrittenKey();
        key.Set(WIDE_TEXT("Name"), test.type, test.data);
        const Reading reading = Read(key);
        EXPECT_EQ(test.status, reading.status);
        EXPECT_EQ(test.status == kRead ? test.name : WIDE_TEXT("prior"), reading.station.Name);
        EXPECT_EQ(test.textAfterEnd, HasTextAfterItsEnd(test.data));
    }
}

TEST(StationValues, AnAbsentPortBecomesTheOnlyPortPresentAndAnUnknownModelTheFirstModel) {
    const WideString none;
    const std::vector<WideString> one = {WIDE_TEXT("COM7")};
    const std::vector<WideString> several = {WIDE_TEXT("COM3"), WIDE_TEXT("COM4")};
    const struct {
        WideString stored;
        std::vector<WideString> ports;
        WideString read;
    } ports[] = {
        // No port present: nothing to take, the stored one stays.
        {WIDE_TEXT("COM9"), {}, WIDE_TEXT("COM9")},
        {none, {}, none},
        // One present: a renumbered adapter; a present port stays.
        {WIDE_TEXT("COM9"), one, WIDE_TEXT("COM7")},
        {none, one, WIDE_TEXT("COM7")},
        {WIDE_TEXT("com7"), one, WIDE_TEXT("COM7")},
        {WIDE_TEXT("COM7"), one, WIDE_TEXT("COM7")},
        // Several present: a present port stays, and so does an absent one.
        {WIDE_TEXT("COM4"), several, WIDE_TEXT("COM4")},
        {WIDE_TEXT("COM9"), several, WIDE_TEXT("COM9")},
        {WIDE_TEXT("com4"), several, WIDE_TEXT("com4")},
        {none, several, none},
    };
    for (const auto& test : ports) {
        StationValueTable key = WrittenKey();
        key.SetText(WIDE_TEXT("Port"), test.stored);
        EXPECT_EQ(test.read, Read(key, test.ports).station.Port)
            << Narrow(test.stored) << " with " << test.ports.size() << " port(s)";
    }
    // The port list is consulted even when a later read fails, and the port kept.
    StationValueTable key = WrittenKey();
    key.SetText(WIDE_TEXT("Port"), WIDE_TEXT("COM9"));
    key.Remove(WIDE_TEXT("StopBits"));
    EXPECT_EQ(WIDE_TEXT("COM5"), Read(key, {WIDE_TEXT("COM5")}).station.Port);

    const struct {
        std::vector<uint8_t> stored;
        WideString read;
    } models[] = {
        {Units(kLv20), kLv20},
        {Units(kLv30), kLv30},
        {Units(kLv10), kLv10},
        {Units(WIDE_TEXT("quorvel lv-20")), kLv10},
        {Units(WIDE_TEXT("Quorvel LV-20 ")), kLv10},
        {{}, kLv10},
        {Units(WIDE_TEXT("Some other level")), kLv10},
    };
    for (const auto& test : models) {
        StationValueTable modelKey = WrittenKey();
        modelKey.Set(WIDE_TEXT("Model"), RegistryValueType::kText, test.stored);
        const Reading reading = Read(modelKey);
        EXPECT_EQ(ValueReadStatus::kRead, reading.status);
        EXPECT_EQ(test.read, reading.station.Model) << Narrow(test.read);
    }
}

TEST(StationValues, ARefusedReadIsPassedOnExceptForProtocolAndFlow) {
    const struct {
        const WideChar* refused;
        ValueReadStatus status;
        uint32_t protocol;  // the record's 14 where the read stopped before it or was refused
    } cases[] = {
        {WIDE_TEXT("Software"), ValueReadStatus::kFailed, 14},
        {WIDE_TEXT("Protocol"), ValueReadStatus::kRead, 14},
        {WIDE_TEXT("Flow"), ValueReadStatus::kRead, 3},
        {WIDE_TEXT("CheckSum"), ValueReadStatus::kFailed, 3},
    };
    for (const auto& test : cases) {
        StationValueTable key = WrittenKey();
        key.Refuse(test.refused, ValueReadStatus::kFailed);
        const Reading reading = Read(key);
        EXPECT_EQ(test.status, reading.status) << Narrow(test.refused);
        EXPECT_EQ(test.protocol, reading.station.Protocol) << Narrow(test.refused);
    }
}
