// The one rule for a station's values, field by field, and the station file keeping to it: a
// station the rule accepts writes and reads back whole, one it refuses is refused at that field.
#include "stations/portable/station_fields.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "stations/portable/station_file.h"
#include "tests/portable/station_file_samples.h"

namespace {

struct FieldCase {
    const char* what;
    std::function<void(Station&)> change;
    std::optional<StationField> refused;  // nullopt: accepted
};

std::vector<FieldCase> Cases() {
    using F = StationField;
    std::vector<FieldCase> cases;
    for (uint32_t rate :
         {300u, 600u, 1200u, 2400u, 4800u, 9600u, 14400u, 19200u, 38400u, 57600u, 115200u}) {
        cases.push_back({"a standard rate", [rate](Station& s) { s.BaudRate = rate; }, {}});
    }
    for (uint32_t rate : {0u, 299u, 110u, 9601u, 28800u, 56000u, 128000u, 230400u, 0xFFFFFFFFu})
        cases.push_back({"another rate", [rate](Station& s) { s.BaudRate = rate; }, F::kBaudRate});
    const auto codes = [](uint32_t parity, uint32_t stopBits, uint32_t dataBits, uint32_t protocol,
                          uint32_t flow, uint32_t checkSum) {
        return [=](Station& s) {
            s.Parity = parity, s.StopBits = stopBits, s.DataBits = dataBits;
            s.Protocol = protocol, s.Flow = flow, s.CheckSum = checkSum;
        };
    };
    const FieldCase others[] = {
        {"a port this computer lacks", [](Station& s) { s.Port = WIDE_TEXT("COM99"); }, {}},
        {"no port", [](Station& s) { s.Port.clear(); }, {}},
        {"the longest text", [](Station& s) { s.Software = WideString(259, 'x'); }, {}},
        // With the defaults' codes, these take every code each field allows.
        {"the lowest codes", codes(0, 0, 5, 0, 0, 0), {}},
        {"the middle codes", codes(1, 1, 6, 2, 1, 1), {}},
        {"the highest codes", codes(2, 2, 8, 3, 2, 1), {}},
        {"the second model", [](Station& s) { s.Model = WIDE_TEXT("Quorvel LV-20"); }, {}},
        {"the third model", [](Station& s) { s.Model = WIDE_TEXT("Quorvel LV-30"); }, {}},
        {"no name", [](Station& s) { s.Name.clear(); }, F::kName},
        {"a star in the name", [](Station& s) { s.Name = WIDE_TEXT("A*"); }, F::kName},
        {"a name too long", [](Station& s) { s.Name = WideString(260, 'n'); }, F::kName},
        {"a port too long", [](Station& s) { s.Port = WideString(260, 'p'); }, F::kPort},
        {"a NUL in the maker", [](Station& s) { s.Manufacturer = WideString(2, 0); },
         F::kManufacturer},
        {"an unknown model", [](Station& s) { s.Model = WIDE_TEXT("quorvel lv-10"); }, F::kModel},
        {"parity 3", [](Station& s) { s.Parity = 3; }, F::kParity},
        {"stop bits 3", [](Station& s) { s.StopBits = 3; }, F::kStopBits},
        {"data bits 4", [](Station& s) { s.DataBits = 4; }, F::kDataBits},
        {"protocol 4", [](Station& s) { s.Protocol = 4; }, F::kProtocol},
        {"flow 3", [](Station& s) { s.Flow = 3; }, F::kFlow},
        {"checksum 2", [](Station& s) { s.CheckSum = 2; }, F::kCheckSum},
        // Several wrong: the first in the store's order is named.
        {"a wrong rate and parity", [](Station& s) { s.Parity = 9, s.BaudRate = 1; }, F::kBaudRate},
    };
    cases.insert(cases.end(), std::begin(others), std::end(others));
    return cases;
}

}  // namespace

TEST(StationFields, OneRuleForEveryFieldAndTheStationFileKeepsToIt) {
    const StationFileRules rules = Rules();
    for (const FieldCase& test : Cases()) {
        Station station = Defaults(WIDE_TEXT("Level"));
        test.change(station);
        const std::string trace =
            std::string(test.what) + ", rate " + std::to_string(station.BaudRate);
        SCOPED_TRACE(trace);
        const std::optional<StationFieldRefusal> refusal =
            RefusedStation(station, rules.modelTexts);
        ASSERT_EQ(test.refused.has_value(), refusal.has_value());
        if (refusal) {
            EXPECT_EQ(*test.refused, refusal->field);
            // A format the translations know, with a value for each of its places.
            const WideString& format = refusal->reason.format;
            const auto formats = RefusalFormats();
            EXPECT_NE(formats.end(), std::find(formats.begin(), formats.end(), format));
            size_t places = 0;
            for (size_t at = format.find(WIDE_TEXT("%s")); at != WideString::npos;
                 at = format.find(WIDE_TEXT("%s"), at + 2))
                ++places;
            EXPECT_EQ(places, refusal->reason.arguments.size());
        }
        // A name the rule refuses cannot head a section, so the file is only asked about the
        // other fields.
        if (test.refused == StationField::kName)
            continue;
        const StationFileContents back = Read(WriteStationFile({{station, {}}}), rules);
        if (!refusal) {
            ASSERT_FALSE(back.error) << ErrorText(back);
            ASSERT_EQ(1u, back.stations.size());
            EXPECT_EQ(station, back.stations[0].station) << "written and read back whole";
        } else {
            ASSERT_TRUE(back.error);
            EXPECT_EQ(StationFieldOf(refusal->field).valueName, back.error->field);
        }
    }
}

TEST(StationFields, AReasonsValuesAreFilledInOnceEvenWhenTheyHoldAPlaceOfTheirOwn) {
    Station station = Defaults(WIDE_TEXT("Level"));
    station.Model = WIDE_TEXT("%s");
    const std::optional<StationFieldRefusal> refusal = RefusedStation(station, Rules().modelTexts);
    ASSERT_TRUE(refusal);
    EXPECT_EQ(WIDE_TEXT("\"%s\" is not a model; the models are \"Quorvel LV-10\", \"Quorvel "
                        "LV-20\", \"Quorvel LV-30\""),
              refusal->reason.Text());
}
