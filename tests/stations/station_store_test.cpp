// The station store through its public operations, each test in its own scratch registry.
#include <windows.h>

#include <gtest/gtest.h>

#include <vector>

#include "stations/display_settings.h"
#include "stations/serial_ports.h"
#include "stations/station_list_block.h"
#include "support/error_log.h"
#include "support/registry_value.h"
#include "tests/stations/station_builders.h"
#include "tests/stations/store_refusal.h"
#include "tests/support/registry_override.h"

namespace {

using Names = std::vector<std::wstring>;

// The subkey of the station of this name; empty when the store has none.
std::wstring KeyOf(const std::wstring& name) {
    Station station = Named(name);
    wchar_t key[260] = {};
    DWORD capacity = ARRAYSIZE(key);
    return FindStation(station, key, &capacity) == S_OK ? key : L"";
}

class StationStore : public ::testing::Test {
protected:
    RegistryOverride registry_{RegistryOverride::Hives::CurrentUserAndLocalMachine};
};

}  // namespace

TEST_F(StationStore, DefaultsComeFromTheStringTableAndTheFirstAddCreatesStationZero) {
    Station probe = DefaultStation();
    EXPECT_EQ(L"Quorvel LV-10", probe.Model);
    // Other programs find the stations here.
    EXPECT_EQ(L"Software\\Quorvel\\Shell Extensions\\Quorvel LV View\\Stations", StationsKeyPath());
    probe.Name = L"North";
    ASSERT_EQ(S_OK, AddStation(probe));
    EXPECT_EQ(L"Station 0", KeyOf(L"North"));
}

TEST_F(StationStore, AddFillsTheLowestFreeNumberAndDeleteTakesTheSubkeysAlong) {
    for (const wchar_t* name : {L"A", L"B", L"C"})
        AddStationOfModel(name);
    ASSERT_EQ(S_OK, DeleteStation(Named(L"B")));
    AddStationOfModel(L"D");
    EXPECT_EQ(L"Station 1", KeyOf(L"D"));
    EXPECT_EQ(L"Station 2", KeyOf(L"C"));

    UniqueRegKey deeper;
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegCreateKeyExW(StationKey(L"Station 0").get(), L"Extra\\Deeper", 0, nullptr, 0,
                                KEY_ALL_ACCESS, nullptr, deeper.put(), nullptr));
    deeper.reset();
    EXPECT_EQ(S_OK, DeleteStation(Named(L"A")));
    EXPECT_EQ(L"", KeyOf(L"A"));
    AddStationOfModel(L"E");
    EXPECT_EQ(L"Station 0", KeyOf(L"E")) << "the whole key is gone";
}

TEST_F(StationStore, UpdateRewritesAndRenamesWithoutUniquenessCheck) {
    AddStationOfModel(L"A");
    AddStationOfModel(L"B");
    Station renamed = Named(L"C");
    renamed.BaudRate = 4800;
    ASSERT_EQ(S_OK, UpdateStation(L"A", renamed));
    EXPECT_EQ(L"", KeyOf(L"A"));
    Station found = Named(L"C");
    ASSERT_EQ(S_OK, FindStation(found));
    EXPECT_EQ(4800u, found.BaudRate);

    // The store leaves uniqueness to its callers: two stations may end up with one name.
    ASSERT_EQ(S_OK, UpdateStation(L"B", Named(L"C")));
}

TEST_F(StationStore, UniqueAndPastedNamesLookAtTheStore) {
    AddStationOfModel(L"New digital level");
    AddStationOfModel(L"Copy of New digital level");
    EXPECT_EQ(L"New digital level (2)", MakeUniqueStationName(L"New digital level"));
    const PasteOutcome pasted =
        AddPastedStations({Named(L"New digital level"), Named(L"B"), Named(L"B")}, L"Copy of ");
    EXPECT_EQ(S_OK, pasted.result);
    EXPECT_EQ((Names{L"New digital level", L"Copy of New digital level",
                     L"Copy of Copy of New digital level", L"B", L"Copy of B"}),
              ListStationNames());

    // A refused block writes nothing, the good stations before the refused one included.
    const PasteOutcome refused =
        AddPastedStations({Named(L"C"), Named(L"D"), Named(L"E/F")}, L"Copy of ");
    EXPECT_EQ(S_FALSE, refused.result);
    ASSERT_TRUE(refused.refused);
    EXPECT_EQ(2u, refused.refused->station);
    EXPECT_EQ(5u, ListStationNames().size());
}

TEST_F(StationStore, AddStationsTakesTheLowestFreeKeysAndWritesAllOrNothing) {
    // Keys of all sorts already there; key names compare without regard to case.
    for (const wchar_t* key : {L"Station 0", L"Station 2", L"station 3", L"Other"})
        (void)StationKey(key);
    ASSERT_EQ(S_OK, AddStations(std::vector<Station>{Named(L"X"), Named(L"Y"), Named(L"Z")}));
    EXPECT_EQ(L"Station 1", KeyOf(L"X"));
    EXPECT_EQ(L"Station 4", KeyOf(L"Y"));
    EXPECT_EQ(L"Station 5", KeyOf(L"Z"));
    Station found = Named(L"Z");
    ASSERT_EQ(S_OK, FindStation(found));
    EXPECT_EQ(Named(L"Z"), found);

    // A name the store could not keep refuses the batch before a key is made, alone or not (a
    // character, or a length that is valid elsewhere; every such name is the portable tests').
    for (const std::wstring& bad : {std::wstring(L"c/d"), std::wstring(260, L'L')}) {
        EXPECT_EQ(E_INVALIDARG, AddStations(std::vector<Station>{Named(L"Good"), Named(bad)}));
        EXPECT_EQ(E_INVALIDARG, AddStation(Named(bad)));
    }
    EXPECT_EQ((Names{L"X", L"Y", L"Z"}), ListStationNames());
    AddStationOfModel(L"W");
    EXPECT_EQ(L"Station 6", KeyOf(L"W"));
}

TEST_F(StationStore, FindAndListReadEachStationWholeInTheListingsOrder) {
    registry_.SetSerialPorts({L"COM3", L"COM4"});
    // The texts, then BaudRate, StopBits, Parity, Protocol, DataBits, Flow and CheckSum.
    // clang-format off
    const std::vector<Station> stored = {
        {L"North", L"COM4", L"Maker", L"Quorvel LV-30", L"2.1", 19200, 2, 0, 3, 8, 1, 0},
        {L"South", L"COM3", L"", L"Quorvel LV-10", L"", 4800, 0, 1, 1, 7, 0, 1},
        {L"East", L"COM4", L"", L"Quorvel LV-20", L"", 9600, 1, 2, 0, 5, 2, 1}};
    // clang-format on
    ASSERT_EQ(S_OK, AddStations(stored));
    ASSERT_EQ(S_OK, DeleteStation(Named(L"South")));
    ASSERT_EQ(S_OK, AddStation(stored[1]));  // back in its old key: the order stays
    const std::vector<Station> listed = ListStations();
    EXPECT_EQ(stored, listed);
    std::vector<std::wstring> names;
    for (const Station& station : listed)
        names.push_back(station.Name);
    EXPECT_EQ(ListStationNames(), names);

    Station found = Named(L"South");
    wchar_t keyName[260] = {};
    DWORD capacity = ARRAYSIZE(keyName);
    ASSERT_EQ(S_OK, FindStation(found, keyName, &capacity));
    EXPECT_EQ(stored[1], found);
    EXPECT_STREQ(L"Station 1", keyName);
    EXPECT_EQ(10u, capacity);
    // A small key-name buffer gets a cut copy, never more than its capacity.
    wchar_t small[4] = {L'#', L'#', L'#', L'#'};
    capacity = 4;
    ASSERT_EQ(S_OK, FindStation(found, small, &capacity));
    EXPECT_STREQ(L"Sta", small);
    EXPECT_EQ(4u, capacity);
}

// What another program may have written as a "Name" around the real "Site", read by the walk's
// own reader: a backslash, empty, a NUL inside, not text, or longer than a name's buffer (the
// registry refuses it) leave the key out; a text without terminator is cut at the value's end;
// other characters that a name may not hold are no separators: listed under its own name.
TEST_F(StationStore, ANameTheFolderCannotListAsItselfIsListedUnderNoOtherName) {
    const wchar_t withNul[] = L"Site\0North";
    const wchar_t raw[] = {L'R', L'a', L'w'};
    const auto writeName = [](const wchar_t* key, DWORD type, const void* data, size_t size) {
        ASSERT_EQ(ERROR_SUCCESS, ::RegSetValueExW(StationKey(key).get(), L"Name", 0, type,
                                                  static_cast<const BYTE*>(data), DWORD(size)));
    };
    ASSERT_EQ(ERROR_SUCCESS,
              WriteStringValue(StationKey(L"Station 0").get(), L"Name", L"Site\\North"));
    AddStationOfModel(L"Site");
    ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(StationKey(L"Station 2").get(), L"Name", L""));
    writeName(L"Station 3", REG_SZ, withNul, sizeof withNul);
    ASSERT_EQ(ERROR_SUCCESS,
              WriteStringValue(StationKey(L"Station 4").get(), L"Name", L"a/b \"quoted\" *"));
    const DWORD number = 0x00410041;  // "AA" if it were taken for text
    writeName(L"Station 5", REG_DWORD, &number, sizeof number);
    writeName(L"Station 6", REG_SZ, raw, sizeof raw);
    ASSERT_EQ(ERROR_SUCCESS,
              WriteStringValue(StationKey(L"Station 7").get(), L"Name", std::wstring(400, L'L')));

    ScopedErrorLog log;
    const Names names = ListStationNames();
    const std::vector<Station> stations = ListStations();

    EXPECT_EQ((Names{L"Site", L"a/b \"quoted\" *", L"Raw"}), names);
    ASSERT_EQ(3u, stations.size());
    EXPECT_EQ(L"Site", stations[0].Name);
    EXPECT_EQ(L"Station 1", KeyOf(L"Site")) << "Site is found in its own key";
    EXPECT_EQ(L"Station 6", KeyOf(L"Raw"));
    for (const std::wstring& unlisted :
         {std::wstring(L"Site\\North"), std::wstring(), std::wstring(withNul, 10),
          std::wstring(L"AA"), std::wstring(400, L'L'), std::wstring(259, L'L')}) {
        EXPECT_EQ(L"", KeyOf(unlisted)) << "found: " << unlisted.size();
    }

    // One line in the log per listing, however many keys each left out.
    const std::wstring text = log.Text();
    size_t lines = 0;
    for (size_t at = text.find(L"5 station key(s) left out"); at != std::wstring::npos;
         at = text.find(L"5 station key(s) left out", at + 1)) {
        ++lines;
    }
    EXPECT_EQ(2u, lines);
    EXPECT_NE(std::wstring::npos, text.find(L"(first: \"Station 0\")"));
}

// The rules of each value are the portable tests'; here the machine's serial ports and the
// registry's answers reach them.
TEST_F(StationStore, AnAbsentPortReadsAsTheOnlyPortTheMachineLists) {
    Station station = Named(L"A");
    station.Port = L"COM9";
    ASSERT_EQ(S_OK, AddStation(station));
    registry_.SetSerialPorts({L"COM4"});
    ASSERT_EQ(S_OK, FindStation(station));
    EXPECT_EQ(L"COM4", station.Port);
}

TEST_F(StationStore, LoadPassesAMissingValueAndOneTooLongOrOfAnotherTypeOnAsErrors) {
    AddStationOfModel(L"Half");
    UniqueRegKey half = StationKey(L"Station 0");
    ASSERT_EQ(ERROR_SUCCESS, ::RegDeleteValueW(half.get(), L"BaudRate"));
    Station station;
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND), LoadStationValues(station, half.get()));
    EXPECT_EQ(L"Half", station.Name);
    EXPECT_EQ(L"Station 0", KeyOf(L"Half")) << "FindStation still finds the half-written station";

    // A DWORD value stored with the wrong size is a failed read, not a partial one.
    AddStationOfModel(L"Typed");
    UniqueRegKey typed = StationKey(L"Station 1");
    const BYTE eightBytes[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegSetValueExW(typed.get(), L"BaudRate", 0, REG_BINARY, eightBytes, 8));
    station = Station{};
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_MORE_DATA), LoadStationValues(station, typed.get()));
    EXPECT_EQ(9600u, station.BaudRate);
    // One of the right size but another type is no number.
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegSetValueExW(typed.get(), L"BaudRate", 0, REG_BINARY, eightBytes, 4));
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_UNSUPPORTED_TYPE), LoadStationValues(station, typed.get()));
}

TEST_F(StationStore, SerialPortListStopsAtTheFirstNonTextValue) {
    registry_.SetSerialPorts({L"COM3", L"COM4"});
    UniqueRegKey key;
    ASSERT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DEVICEMAP\\SERIALCOMM",
                                             0, KEY_ALL_ACCESS, key.put()));
    ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(key.get(), L"\\Device\\Serial5", 5));
    ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(key.get(), L"\\Device\\Serial9", L"COM9"));
    // COM9 comes after the DWORD value both in the order of writing (Windows) and in the order
    // of names (Wine).
    EXPECT_EQ((Names{L"COM3", L"COM4"}), ListSerialPorts());
}

// The records' own format is tested in the portable tests; here the memory block around them.
TEST_F(StationStore, StationListBlockIsReadOnlyUpToItsRealSize) {
    std::vector<Station> stations = {Named(L"One"), Named(L"Two")};
    stations[1].Port = L"COM12";
    UniqueHGlobal block(SerializeStationList(stations));
    ASSERT_TRUE(block);
    // A block whose count lies is read only up to GlobalSize.
    {
        GlobalLockGuard lock(block.get());
        *static_cast<uint32_t*>(lock.data()) = 1000;
    }
    std::vector<Station> parsed;
    EXPECT_EQ(S_OK, ParseStationList(block.get(), parsed));
    EXPECT_EQ(stations, parsed);
    EXPECT_EQ(S_OK, ParseStationList(nullptr, parsed));
    EXPECT_TRUE(parsed.empty());
}

TEST_F(StationStore, DisplaySettingsRoundTripAndOnlyAValidValueIsRead) {
    SetDisplayColumnWidth(0, 5);
    EXPECT_FALSE(LoadDisplaySettings()) << "no value yet";
    EXPECT_EQ(100, DisplayColumnWidth(0));
    EXPECT_EQ(100, DisplayColumnWidth(1));
    // The saved form itself is checked where the module saves it at unload (server tests).
    SetDisplayColumnWidth(0, 240);
    SetDisplayColumnWidth(1, 0x1234);
    ASSERT_TRUE(SaveDisplaySettings());
    SetDisplayColumnWidth(0, 0);
    SetDisplayColumnWidth(1, 0);
    EXPECT_TRUE(LoadDisplaySettings());
    EXPECT_EQ(240, DisplayColumnWidth(0));
    EXPECT_EQ(0x1234, DisplayColumnWidth(1));

    // Values that are not the module's own leave both widths at 100. Which those are is the
    // portable tests'; here the value's real size and type reach the parse, and a value longer
    // than the buffer is refused by the registry.
    UniqueRegKey root;
    ASSERT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0,
                                             KEY_ALL_ACCESS, root.put()));
    const BYTE bytes[20] = {50, 0, 0, 0, 60, 0, 0, 0};
    const struct {
        const char* what;
        DWORD type;
        DWORD size;
    } cases[] = {
        {"short", REG_BINARY, 7},
        {"longer than the 16-byte buffer", REG_BINARY, sizeof bytes},
        {"a number", REG_QWORD, 8},
    };
    for (const auto& test : cases) {
        ASSERT_EQ(ERROR_SUCCESS, ::RegSetValueExW(root.get(), L"Display Settings", 0, test.type,
                                                  bytes, test.size));
        SetDisplayColumnWidth(0, 0);
        SetDisplayColumnWidth(1, 0);
        EXPECT_FALSE(LoadDisplaySettings()) << test.what;
        EXPECT_EQ(100, DisplayColumnWidth(0)) << test.what;
        EXPECT_EQ(100, DisplayColumnWidth(1)) << test.what;
    }
}

TEST_F(StationStore, EveryChangeTheRegistryRefusesFailsWithItsErrorIsLoggedAndChangesNothing) {
    AddStationOfModel(L"North");  // in "Station 0"
    const struct {
        const char* what;
        const wchar_t* lockedKey;  // empty: the Stations key itself
        HRESULT (*change)();
    } cases[] = {
        {"add", L"", [] { return AddStation(Named(L"South")); }},
        {"add many", L"",
         [] {
             return AddStations(std::vector<Station>{Named(L"S1"), Named(L"S2")});
         }},
        {"paste", L"",
         [] {
             return AddPastedStations({Named(L"North"), Named(L"East")}, L"Copy of ").result;
         }},
        {"update, the store locked", L"", [] { return UpdateStation(L"North", Named(L"N2")); }},
        {"update, the station locked", L"Station 0",
         [] { return UpdateStation(L"North", Named(L"N2")); }},
        {"delete, the store locked", L"", [] { return DeleteStation(Named(L"North")); }},
        {"delete, the station locked", L"Station 0", [] { return DeleteStation(Named(L"North")); }},
        {"save values", L"Station 0",
         [] {
             UniqueRegKey key;
             EXPECT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_CURRENT_USER,
                                                      (StationsKeyPath() + L"\\Station 0").c_str(),
                                                      0, KEY_READ, key.put()));
             return SaveStationValues(Named(L"N2"), key.get());
         }},
    };
    for (const auto& test : cases) {
        ScopedErrorLog log;
        {
            WriteRefusingKey locked(test.lockedKey);
            EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_ACCESS_DENIED), test.change()) << test.what;
        }
        EXPECT_NE(std::wstring::npos, log.Text().find(L"0x80070005")) << test.what;
        EXPECT_EQ(Names{L"North"}, ListStationNames()) << test.what;
        EXPECT_EQ(L"Station 0", KeyOf(L"North")) << test.what;
    }
    // Unlocked again, the same store takes the change.
    EXPECT_EQ(S_OK, UpdateStation(L"North", Named(L"N2")));
}

TEST_F(StationStore, NamesAreExactAndCaseSensitiveAndAnswersAboutThemAreNotLogged) {
    ScopedErrorLog log;
    Station free = Named(L"Free");
    EXPECT_EQ(E_FAIL, FindStation(free)) << "no store yet";
    AddStationOfModel(L"North");
    EXPECT_EQ(E_FAIL, FindStation(free));
    EXPECT_EQ(L"Free", MakeUniqueStationName(L"Free"));
    EXPECT_EQ(E_INVALIDARG, AddStation(Named(L"North")));
    EXPECT_EQ(S_OK, AddStation(Named(L"north")));
    EXPECT_EQ(L"", KeyOf(L"Nort"));
    EXPECT_EQ(L"", KeyOf(L"North "));
    EXPECT_EQ((Names{L"North", L"north"}), ListStationNames());
    EXPECT_EQ(E_INVALIDARG, AddStation(Named(L"a/b")));
    EXPECT_EQ(E_INVALIDARG, UpdateStation(L"Missing", Named(L"X")));
    EXPECT_EQ(E_INVALIDARG, DeleteStation(Named(L"Missing")));
    EXPECT_EQ(L"", log.Text());
    // Finding needs no write access: a store that refuses changes is still searched.
    WriteRefusingKey locked;
    Station north = Named(L"North");
    EXPECT_EQ(S_OK, FindStation(north));
    EXPECT_EQ(E_INVALIDARG, DeleteStation(Named(L"Missing")));
    EXPECT_EQ(L"", log.Text());
}
