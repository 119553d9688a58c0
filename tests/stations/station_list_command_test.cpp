// "lvstations list" over an isolated store: thousands of stations in one walk, and names and
// texts that another program wrote to forge lines or terminal sequences printed escaped.
#include "tests/stations/station_file_fixture.h"

#include "support/registry_value.h"
#include "tests/stations/station_builders.h"
#include "tools/lvstations/station_list_command.h"

namespace {

class StationListCommand : public StationFileCommands {
protected:
    std::vector<std::wstring> List() {
        lines_.clear();
        EXPECT_EQ(
            0, ListStationsCommand([this](const std::wstring& line) { lines_.push_back(line); }));
        return lines_;
    }
};

TEST_F(StationListCommand, ThreeThousandStationsAreListedInTheStoresOrder) {
    EXPECT_EQ(std::vector<std::wstring>{L"No stations."}, List());
    std::vector<Station> stations;
    for (int number = 0; number < 3000; ++number) {
        Station station = Named(L"Level " + std::to_wstring(number));
        station.Port = number % 2 ? L"COM3" : L"COM1";
        station.Parity = number % 3;
        stations.push_back(station);
    }
    ASSERT_EQ(S_OK, AddStations(stations));
    const std::vector<std::wstring> lines = List();
    ASSERT_EQ(6000u, lines.size());
    const std::vector<std::wstring> names = ListStationNames();
    ASSERT_EQ(3000u, names.size());
    for (size_t index = 0; index < names.size(); ++index)
        EXPECT_EQ(names[index], lines[2 * index]);
    // "Level 1" is in key "Station 1", wherever the registry's order puts it.
    const auto first = std::find(lines.begin(), lines.end(), L"Level 1");
    ASSERT_NE(lines.end(), first);
    EXPECT_EQ(L"    COM3, 9600 baud, 7 data bits, parity Odd, Quorvel LV-10", *(first + 1));
}

// Which units are escaped, and how, is the printable-text tests'; here the name and the port
// another program wrote go through them. A port read back as the computer's first port would hide
// it, so this runs on a computer without a port list.
TEST_F(StationListCommand, TextsThatWouldForgeLinesOrTerminalSequencesArePrintedEscaped) {
    ASSERT_EQ(ERROR_SUCCESS,
              DeleteKeyRecursive(HKEY_LOCAL_MACHINE, L"HARDWARE\\DEVICEMAP\\SERIALCOMM"));
    Station forged = Named(L"Forged\r\nFake station");
    forged.Port = L"COM1\r\nInjected\x1B[0m";
    ASSERT_EQ(S_OK, SaveStationValues(forged, StationKey(L"Station 0").get()));
    EXPECT_EQ((std::vector<std::wstring>{L"Forged\\x0D\\x0AFake station",
                                         L"    COM1\\x0D\\x0AInjected\\x1B[0m, 9600 baud, 7 data "
                                         L"bits, parity Even, Quorvel LV-10"}),
              List());
}

}  // namespace
