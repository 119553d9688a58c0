// The station store through its public operations, each test in its own scratch registry.
#include <windows.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "stations/display_settings.h"
#include "stations/serial_ports.h"
#include "stations/station_list_block.h"
#include "stations/station_models.h"
#include "stations/station_store.h"
#include "support/registry_value.h"
#include "support/unique_resource.h"
#include "tests/support/registry_override.h"

namespace {

Station Named(const std::wstring& name) {
    Station station = DefaultStation();
    station.Name = name;
    return station;
}

std::vector<std::wstring> StationSubkeys() {
    UniqueRegKey key;
    std::vector<std::wstring> names;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ, key.put()) !=
        ERROR_SUCCESS) {
        return names;
    }
    wchar_t name[260];
    for (DWORD index = 0;; ++index) {
        DWORD length = ARRAYSIZE(name);
        if (::RegEnumKeyExW(key.get(), index, name, &length, nullptr, nullptr, nullptr, nullptr) !=
            ERROR_SUCCESS) {
            break;
        }
        names.emplace_back(name);
    }
    return names;
}

UniqueRegKey OpenStationKey(const std::wstring& subkey) {
    UniqueRegKey key;
    EXPECT_EQ(ERROR_SUCCESS,
              ::RegCreateKeyExW(HKEY_CURRENT_USER, (StationsKeyPath() + L"\\" + subkey).c_str(), 0,
                                nullptr, 0, KEY_ALL_ACCESS, nullptr, key.put(), nullptr));
    return key;
}

bool Exists(const std::wstring& name) {
    Station probe;
    probe.Name = name;
    return FindStation(probe) == S_OK;
}

class StationStore : public ::testing::Test {
protected:
    RegistryOverride registry_{RegistryOverride::Hives::CurrentUserAndLocalMachine};
};

}  // namespace

TEST_F(StationStore, DefaultsComeFromTheStringTableAndTheFirstAddCreatesStationZero) {
    const Station station = DefaultStation();
    EXPECT_EQ(L"COM1", station.Port);
    EXPECT_EQ(L"Quorvel LV-10", station.Model);
    EXPECT_EQ(L"Software\\Quorvel\\Shell Extensions\\Quorvel LV View\\Stations", StationsKeyPath());
    EXPECT_FALSE(Exists(L"North"));
    ASSERT_EQ(S_OK, AddStation(Named(L"North")));
    EXPECT_EQ(std::vector<std::wstring>{L"Station 0"}, StationSubkeys());
}

TEST_F(StationStore, FindFillsTheWholeRecordAndTheSubkeyName) {
    Station stored = Named(L"North");
    stored.Port = L"COM4";
    stored.Manufacturer = L"Maker";
    stored.Model = L"Quorvel LV-30";
    stored.Software = L"2.1";
    stored.BaudRate = 19200;
    stored.StopBits = 2;
    stored.Parity = 0;
    stored.Protocol = 3;
    stored.DataBits = 8;
    stored.Flow = 1;
    stored.CheckSum = 0;
    registry_.SetSerialPorts({L"COM3", L"COM4"});
    ASSERT_EQ(S_OK, AddStation(Named(L"South")));
    ASSERT_EQ(S_OK, AddStation(stored));

    Station found;
    found.Name = L"North";
    wchar_t keyName[260] = {};
    DWORD capacity = ARRAYSIZE(keyName);
    ASSERT_EQ(S_OK, FindStation(found, keyName, &capacity));
    EXPECT_EQ(stored, found);
    EXPECT_STREQ(L"Station 1", keyName);
    EXPECT_EQ(10u, capacity);

    // A small key-name buffer gets a cut copy, never more than its capacity.
    wchar_t small[4] = {L'#', L'#', L'#', L'#'};
    capacity = 4;
    ASSERT_EQ(S_OK, FindStation(found, small, &capacity));
    EXPECT_STREQ(L"Sta", small);
    EXPECT_EQ(4u, capacity);
}

TEST_F(StationStore, NamesAreExactAndCaseSensitive) {
    ASSERT_EQ(S_OK, AddStation(Named(L"North")));
    EXPECT_EQ(E_INVALIDARG, AddStation(Named(L"North")));
    EXPECT_EQ(S_OK, AddStation(Named(L"north")));
    EXPECT_FALSE(Exists(L"Nort"));
    EXPECT_FALSE(Exists(L"North "));
    EXPECT_EQ((std::vector<std::wstring>{L"North", L"north"}), ListStationNames());
}

TEST_F(StationStore, AddFillsTheLowestFreeNumber) {
    for (const wchar_t* name : {L"A", L"B", L"C"})
        ASSERT_EQ(S_OK, AddStation(Named(name)));
    ASSERT_EQ(S_OK, DeleteStation(Named(L"B")));
    EXPECT_EQ((std::vector<std::wstring>{L"Station 0", L"Station 2"}), StationSubkeys());
    ASSERT_EQ(S_OK, AddStation(Named(L"D")));
    wchar_t keyName[260];
    DWORD capacity = ARRAYSIZE(keyName);
    Station found = Named(L"D");
    ASSERT_EQ(S_OK, FindStation(found, keyName, &capacity));
    EXPECT_STREQ(L"Station 1", keyName);
}

TEST_F(StationStore, UpdateRewritesAndRenamesWithoutUniquenessCheck) {
    ASSERT_EQ(S_OK, AddStation(Named(L"A")));
    ASSERT_EQ(S_OK, AddStation(Named(L"B")));
    Station renamed = Named(L"C");
    renamed.BaudRate = 4800;
    ASSERT_EQ(S_OK, UpdateStation(L"A", renamed));
    EXPECT_FALSE(Exists(L"A"));
    Station found = Named(L"C");
    ASSERT_EQ(S_OK, FindStation(found));
    EXPECT_EQ(4800u, found.BaudRate);

    // The store leaves uniqueness to its callers: two stations may end up with one name.
    ASSERT_EQ(S_OK, UpdateStation(L"B", Named(L"C")));
    EXPECT_EQ(E_INVALIDARG, UpdateStation(L"missing", Named(L"X")));
    EXPECT_EQ(E_INVALIDARG, DeleteStation(Named(L"missing")));
}

TEST_F(StationStore, DeleteRemovesTheKeyWithItsSubkeys) {
    ASSERT_EQ(S_OK, AddStation(Named(L"A")));
    {
        UniqueRegKey station = OpenStationKey(L"Station 0");
        UniqueRegKey child;
        ASSERT_EQ(ERROR_SUCCESS, ::RegCreateKeyExW(station.get(), L"Extra\\Deeper", 0, nullptr, 0,
                                                   KEY_ALL_ACCESS, nullptr, child.put(), nullptr));
    }
    EXPECT_EQ(S_OK, DeleteStation(Named(L"A")));
    EXPECT_TRUE(StationSubkeys().empty());
    EXPECT_FALSE(Exists(L"A"));
}

TEST_F(StationStore, UniqueAndPastedNamesLookAtTheStore) {
    ASSERT_EQ(S_OK, AddStation(Named(L"New digital level")));
    ASSERT_EQ(S_OK, AddStation(Named(L"Copy of New digital level")));
    EXPECT_EQ(L"New digital level (2)", MakeUniqueStationName(L"New digital level"));
    EXPECT_EQ(L"Copy of Copy of New digital level", MakePastedStationName(L"New digital level"));
}

TEST_F(StationStore, PortFallsBackToTheFirstListedPort) {
    Station station = Named(L"A");
    station.Port = L"COM9";
    ASSERT_EQ(S_OK, AddStation(station));

    // No serial ports on the machine: the stored port stays.
    Station found = Named(L"A");
    ASSERT_EQ(S_OK, FindStation(found));
    EXPECT_EQ(L"COM9", found.Port);

    registry_.SetSerialPorts({L"COM3", L"COM4"});
    EXPECT_EQ((std::vector<std::wstring>{L"COM3", L"COM4"}), ListSerialPorts());
    ASSERT_EQ(S_OK, FindStation(found));
    EXPECT_EQ(L"COM3", found.Port);
}

TEST_F(StationStore, UnknownModelsReadBackAsTheFirstModel) {
    ASSERT_EQ(S_OK, AddStation(Named(L"A")));
    UniqueRegKey key = OpenStationKey(L"Station 0");
    for (const wchar_t* stored : {L"Some other level", L"", L"quorvel lv-20", L"Quorvel LV-20"}) {
        ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(key.get(), L"Model", stored));
        Station found = Named(L"A");
        ASSERT_EQ(S_OK, FindStation(found));
        EXPECT_EQ(stored == std::wstring(L"Quorvel LV-20") ? stored : L"Quorvel LV-10", found.Model)
            << stored;
    }
}

TEST_F(StationStore, LoadStopsAtTheFirstMissingValueAndKeepsTheRest) {
    UniqueRegKey key = OpenStationKey(L"Station 0");
    ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(key.get(), L"Name", L"Half"));
    ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(key.get(), L"Port", L"COM7"));
    ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(key.get(), L"StopBits", 2));
    ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(key.get(), L"Parity", 1));  // BaudRate is missing

    Station station;
    station.Parity = 77;
    EXPECT_EQ(ERROR_FILE_NOT_FOUND, LoadStationValues(station, key.get()));
    EXPECT_EQ(L"Half", station.Name);
    EXPECT_EQ(L"COM7", station.Port);
    EXPECT_EQ(2u, station.StopBits);
    EXPECT_EQ(77u, station.Parity) << "reads after the failing one are not made";

    // FindStation still finds the half-written station.
    Station found;
    found.Name = L"Half";
    EXPECT_EQ(S_OK, FindStation(found));
    EXPECT_EQ(L"COM7", found.Port);
}

TEST_F(StationStore, MissingProtocolAndFlowDoNotFailTheLoad) {
    ASSERT_EQ(S_OK, AddStation(Named(L"A")));
    UniqueRegKey key = OpenStationKey(L"Station 0");
    ASSERT_EQ(ERROR_SUCCESS, ::RegDeleteValueW(key.get(), L"Protocol"));
    ASSERT_EQ(ERROR_SUCCESS, ::RegDeleteValueW(key.get(), L"Flow"));
    Station station;
    EXPECT_EQ(ERROR_SUCCESS, LoadStationValues(station, key.get()));
    ASSERT_EQ(ERROR_SUCCESS, ::RegDeleteValueW(key.get(), L"CheckSum"));
    EXPECT_EQ(ERROR_FILE_NOT_FOUND, LoadStationValues(station, key.get()));
}

TEST_F(StationStore, HostileRegistryValuesNeverOverrunAndNeverMatch) {
    // "Name" as REG_DWORD, a name without terminator, an over-long name.
    UniqueRegKey wrongType = OpenStationKey(L"Station 0");
    ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(wrongType.get(), L"Name", 0x00410041));
    UniqueRegKey unterminated = OpenStationKey(L"Station 1");
    const wchar_t raw[] = {L'R', L'a', L'w'};
    ASSERT_EQ(ERROR_SUCCESS, ::RegSetValueExW(unterminated.get(), L"Name", 0, REG_SZ,
                                              reinterpret_cast<const BYTE*>(raw), sizeof(raw)));
    UniqueRegKey overLong = OpenStationKey(L"Station 2");
    ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(overLong.get(), L"Name", std::wstring(400, L'L')));

    EXPECT_FALSE(Exists(L"AA"));
    EXPECT_TRUE(Exists(L"Raw")) << "a stored text without terminator is cut at the value's end";
    EXPECT_FALSE(Exists(std::wstring(400, L'L')));
    EXPECT_FALSE(Exists(std::wstring(259, L'L')));
    EXPECT_EQ(std::vector<std::wstring>{L"Raw"}, ListStationNames())
        << "unreadable names are left out";

    // A DWORD value stored with the wrong size is a failed read, not a partial one.
    ASSERT_EQ(S_OK, AddStation(Named(L"Typed")));
    UniqueRegKey typed = OpenStationKey(L"Station 3");
    const BYTE eightBytes[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegSetValueExW(typed.get(), L"BaudRate", 0, REG_BINARY, eightBytes, 8));
    Station station;
    EXPECT_NE(ERROR_SUCCESS, LoadStationValues(station, typed.get()));
    EXPECT_EQ(9600u, station.BaudRate);
}

TEST_F(StationStore, SerialPortListStopsAtTheFirstNonTextValue) {
    registry_.SetSerialPorts({L"COM3"});
    UniqueRegKey key;
    ASSERT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DEVICEMAP\\SERIALCOMM",
                                             0, KEY_ALL_ACCESS, key.put()));
    ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(key.get(), L"\\Device\\Serial5", 5));
    ASSERT_EQ(ERROR_SUCCESS, WriteStringValue(key.get(), L"\\Device\\Serial9", L"COM9"));
    // COM9 comes after the DWORD value both in the order of writing (Windows) and in the order
    // of names (Wine).
    EXPECT_EQ(std::vector<std::wstring>{L"COM3"}, ListSerialPorts());
}

TEST_F(StationStore, StationListBlockRoundTripsAndIsBoundByItsRealSize) {
    std::vector<Station> stations = {Named(L"One"), Named(L"Two")};
    stations[1].Port = L"COM12";
    UniqueHGlobal block(SerializeStationList(stations));
    ASSERT_TRUE(block);
    // 4 + (4 + 78) + (4 + 80) bytes of content; GlobalSize may round up.
    EXPECT_GE(::GlobalSize(block.get()), 170u);
    std::vector<Station> parsed;
    EXPECT_EQ(S_OK, ParseStationList(block.get(), parsed));
    EXPECT_EQ(stations, parsed);

    // A block whose count lies is read only up to GlobalSize.
    {
        GlobalLockGuard lock(block.get());
        *static_cast<uint32_t*>(lock.data()) = 1000;
    }
    EXPECT_EQ(S_OK, ParseStationList(block.get(), parsed));
    EXPECT_EQ(2u, parsed.size());
    EXPECT_EQ(S_OK, ParseStationList(nullptr, parsed));
    EXPECT_TRUE(parsed.empty());
}

TEST_F(StationStore, DisplaySettingsAreTwelveBinaryBytesAndOnlyAValidValueIsRead) {
    SetDisplayColumnWidth(0, 5);
    EXPECT_FALSE(LoadDisplaySettings());
    EXPECT_EQ(100, DisplayColumnWidth(0));
    EXPECT_EQ(100, DisplayColumnWidth(1));
    SetDisplayColumnWidth(0, 240);
    SetDisplayColumnWidth(1, 0x1234);
    ASSERT_TRUE(SaveDisplaySettings());
    UniqueRegKey root;
    ASSERT_EQ(ERROR_SUCCESS, ::RegOpenKeyExW(HKEY_CURRENT_USER, StationRootKeyPath().c_str(), 0,
                                             KEY_ALL_ACCESS, root.put()));
    BYTE data[32] = {};
    DWORD size = sizeof data, type = REG_NONE;
    ASSERT_EQ(ERROR_SUCCESS,
              ::RegQueryValueExW(root.get(), L"Display Settings", nullptr, &type, data, &size));
    EXPECT_EQ(static_cast<DWORD>(REG_BINARY), type);
    const std::vector<BYTE> expected = {240, 0, 0, 0, 0x34, 0x12, 0, 0, 0, 0, 0, 0};
    EXPECT_EQ(expected, std::vector<BYTE>(data, data + size));
    SetDisplayColumnWidth(0, 0);
    SetDisplayColumnWidth(1, 0);
    EXPECT_TRUE(LoadDisplaySettings());
    EXPECT_EQ(240, DisplayColumnWidth(0));
    EXPECT_EQ(0x1234, DisplayColumnWidth(1));

    // Values that are not the module's own leave both widths at 100.
    const BYTE eight[8] = {50, 0, 0, 0, 60, 0, 0, 0};
    const BYTE longer[20] = {50, 0, 0, 0, 60, 0, 0, 0};
    struct Case {
        const char* what;
        DWORD type;
        const BYTE* bytes;
        DWORD size;
    } const cases[] = {
        {"short", REG_BINARY, eight, 7},
        {"longer than the 16-byte buffer", REG_BINARY, longer, sizeof longer},
        {"text", REG_SZ, reinterpret_cast<const BYTE*>(L"2000000"), 16},
        {"a number", REG_QWORD, eight, 8},
    };
    for (const Case& test : cases) {
        ASSERT_EQ(ERROR_SUCCESS, ::RegSetValueExW(root.get(), L"Display Settings", 0, test.type,
                                                  test.bytes, test.size));
        SetDisplayColumnWidth(0, 0);
        SetDisplayColumnWidth(1, 0);
        EXPECT_FALSE(LoadDisplaySettings()) << test.what;
        EXPECT_EQ(100, DisplayColumnWidth(0)) << test.what;
        EXPECT_EQ(100, DisplayColumnWidth(1)) << test.what;
    }
    // Exactly eight binary bytes are enough.
    ASSERT_EQ(ERROR_SUCCESS, ::RegSetValueExW(root.get(), L"Display Settings", 0, REG_BINARY,
                                              eight, sizeof eight));
    EXPECT_TRUE(LoadDisplaySettings());
    EXPECT_EQ(50, DisplayColumnWidth(0));
    EXPECT_EQ(60, DisplayColumnWidth(1));
}

TEST_F(StationStore, ModelRulesFollowTheStringTablesTexts) {
    // The instructions are the string table's, whatever the model's case or spelling.
    EXPECT_EQ(0u, ModelInstructionText(L"anything else")
                      .find(L"1. Push [SET] key and enter the set mode.\r\n2. Push [DOWN]"));
    EXPECT_EQ(0u, ModelInstructionText(L"Quorvel LV-30")
                      .find(L"1. Push 'Menu' key and select <Job>\r\n"));
    EXPECT_TRUE(IsExternalLibraryModel(L"Quorvel LV-20"));
    EXPECT_FALSE(IsExternalLibraryModel(L"quorvel lv-20"));
    EXPECT_EQ(L"file1.hvr", StationFileName(L"Quorvel LV-30"));
}
