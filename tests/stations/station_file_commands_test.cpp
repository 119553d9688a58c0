// lvstations export and import over an isolated store: a round trip byte for byte, taken names,
// ports this computer does not list, and what export says about stations it cannot carry whole.
#include <windows.h>

#include <gtest/gtest.h>

#include <string>

#include "support/registry_value.h"
#include "tests/stations/station_builders.h"
#include "tests/stations/station_file_fixture.h"

namespace {

// Stations that differ in every value the file carries, texts that need quoting included.
std::vector<Station> VariedStations() {
    // The texts, then BaudRate, StopBits, Parity, Protocol, DataBits, Flow and CheckSum.
    // clang-format off
    return {
        {L"North", L"COM3", L"Quorvel", L"Quorvel LV-10", L"",
         9600, 0, 2, 1, 7, 0, 1},
        {L" South [2]; # = ", L"COM9", L"\"Maker\"", L"Quorvel LV-20", L" v2.1\t",
         300, 2, 0, 0, 5, 2, 0},
        {L"Öst 東", L"", L"C:\\Tools\\", L"Quorvel LV-30",
         L"ctrl \x01\x7F lone \xD800 pair \xD83D\xDCCF",
         4800, 1, 1, 3, 8, 1, 1},
        {L"   ", L"COM1", std::wstring(259, L'm'), L"Quorvel LV-10", L"",
         19200, 0, 0, 2, 6, 0, 0},
        {L"Fast", L"COM3", L"", L"Quorvel LV-20", L"",
         115200, 0, 2, 1, 8, 0, 1},
    };
    // clang-format on
}

}  // namespace

TEST_F(StationFileCommands, ExportThenImportGivesTheSameStoreByteForByte) {
    for (const Station& station : VariedStations())
        ASSERT_EQ(S_OK, AddStation(station));
    // Twelve keys: the registry lists "Station 10" before "Station 2", the file follows the
    // numbers, so that the key names come back.
    for (int i = 5; i < 12; ++i)
        AddStationOfModel(L"Level " + std::to_wstring(i));
    const StoreSnapshot before = SnapshotStore();
    ASSERT_EQ(12u, before.size());
    ASSERT_EQ(12u, before.begin()->second.size());

    const std::wstring file = ScratchFile(L"round-trip.txt");
    ASSERT_EQ(kExitDone, Export(file)) << AllLines();
    ASSERT_EQ(ERROR_SUCCESS, DeleteKeyRecursive(HKEY_CURRENT_USER, StationsKeyPath().c_str()));
    ASSERT_TRUE(SnapshotStore().empty());

    EXPECT_EQ(kExitDone, Import(file)) << AllLines();
    EXPECT_EQ(before, SnapshotStore()) << "key names, value names, types and bytes";
    EXPECT_EQ(1u, LinesWith({L"warning:", L"\"COM9\""}).size()) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"12 added, 0 replaced, 0 skipped."}).size()) << AllLines();
}

TEST_F(StationFileCommands, TakenNamesAreSkippedUnlessReplaceIsGiven) {
    Station north = Named(L"North");
    north.BaudRate = 1200;
    ASSERT_EQ(S_OK, AddStation(north));
    const std::wstring file = FileWith(
        "[North]\nBaudRate = 4800\nPort = COM3\n\n[South]\nPort = COM1\nModel = Quorvel LV-20\n");
    const StoreSnapshot original = SnapshotStore();

    EXPECT_EQ(kExitNotAllDone, Import(file)) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"Skipped \"North\" (line 1)", L"--replace"}).size()) << AllLines();
    StoreSnapshot afterSkip = SnapshotStore();
    EXPECT_EQ(original.at(L"Station 0"), afterSkip.at(L"Station 0")) << "North untouched";
    ASSERT_EQ(2u, afterSkip.size());
    Station south = Named(L"South");
    ASSERT_EQ(S_OK, FindStation(south));
    EXPECT_EQ(L"Quorvel LV-20", south.Model);

    EXPECT_EQ(kExitDone, Import(file, true)) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"0 added, 2 replaced, 0 skipped."}).size()) << AllLines();
    const StoreSnapshot afterReplace = SnapshotStore();
    EXPECT_EQ(2u, afterReplace.size()) << "replaced in place, no new keys";
    EXPECT_EQ((std::pair<DWORD, std::vector<BYTE>>{REG_DWORD, {0xC0, 0x12, 0, 0}}),
              afterReplace.at(L"Station 0").at(L"BaudRate"))
        << "4800 in North's own key";
    EXPECT_EQ(afterSkip.at(L"Station 1"), afterReplace.at(L"Station 1"))
        << "South rewritten with what it already held";
}

TEST_F(StationFileCommands, APortThisComputerDoesNotListIsStoredWithAWarning) {
    const std::wstring file = FileWith("[Field office]\nPort = COM9\n[Desk]\nPort = COM3\n");
    EXPECT_EQ(kExitDone, Import(file)) << AllLines();
    EXPECT_EQ(2u, SnapshotStore().size()) << "stored all the same, as written (see the round trip)";
    const auto warnings = LinesWith({L"warning:", L"line 2", L"\"Field office\"", L"\"COM9\""});
    ASSERT_EQ(1u, warnings.size()) << AllLines();
    // Several ports are listed: none stands in for the absent one.
    EXPECT_NE(std::wstring::npos, warnings[0].find(L"the download names the ports present"))
        << warnings[0];
    EXPECT_TRUE(LinesWith({L"\"Desk\"", L"warning:"}).empty()) << AllLines();
}

TEST_F(StationFileCommands, ExportSaysWhatWillNotComeBackAsStored) {
    Station fast = Named(L"Fast");
    fast.BaudRate = 28800;  // stored by a program that checks nothing; no standard rate
    ASSERT_EQ(S_OK, AddStation(fast));
    AddStationOfModel(L"Half");
    ASSERT_EQ(ERROR_SUCCESS, ::RegDeleteValueW(StationKey(L"Station 1").get(), L"Flow"));
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegSetValueExW(StationKey(L"Station 1").get(), L"Software", 0, REG_EXPAND_SZ,
                               reinterpret_cast<const BYTE*>(L"x"), 4));
    ASSERT_EQ(ERROR_SUCCESS,
              WriteDwordValue(StationKey(L"Station 2").get(), L"Port", 3));  // no Name

    const std::wstring file = ScratchFile(L"warned.txt");
    EXPECT_EQ(kExitNotAllDone, Export(file)) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"warning:", L"will not import", L"BaudRate"}).size()) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"warning:", L"\"Half\"", L"Flow is missing"}).size()) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"warning:", L"\"Half\"", L"Software", L"form of its own"}).size())
        << AllLines();
    EXPECT_EQ(1u, LinesWith({L"warning:", L"1 station key(s) without a readable Name"}).size())
        << AllLines();
    EXPECT_EQ(1u, LinesWith({L"Exported 2 station(s)"}).size()) << AllLines();
    EXPECT_NE(INVALID_FILE_ATTRIBUTES, ::GetFileAttributesW(file.c_str()))
        << "written all the same";
}

TEST_F(StationFileCommands, ExportWritesNoFileWhenThereIsNothingOrNowhereToWrite) {
    const std::wstring empty = ScratchFile(L"empty.txt");
    EXPECT_EQ(kExitNotAllDone, Export(empty)) << AllLines();
    EXPECT_EQ(INVALID_FILE_ATTRIBUTES, ::GetFileAttributesW(empty.c_str()));

    AddStationOfModel(L"North");
    const std::wstring nowhere = ScratchFile(L"no such folder\\stations.txt");
    EXPECT_EQ(kExitReadOrWriteFailed, Export(nowhere)) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"error:", L"cannot be written"}).size()) << AllLines();
}
