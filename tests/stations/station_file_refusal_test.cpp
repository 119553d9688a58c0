// lvstations import of files that must be refused: each class of bad file writes nothing, not
// even the good stations before the fault, exits with 3 and names the line and the field.
#include <windows.h>

#include <gtest/gtest.h>

#include <string>

#include "tests/stations/station_builders.h"
#include "tests/stations/station_file_fixture.h"

namespace {

// Two good stations first (lines 1 to 4), so that a refusal is seen to drop them too.
const std::string kGood = "[Good one]\nPort = COM1\n[Good two]\nPort = COM3\n";

std::string Huge() {
    std::string file = kGood + "; padding\n";
    file.resize(1024 * 1024 + 1, ';');
    return file;
}

}  // namespace

// Every problem with its line and field is the station-file tests'; here a few of each class go
// through the command (a file is read only up to one byte past the limit), each refusal's own
// words in the printed line.
TEST_F(StationFileCommands, EveryBadFileWritesNothingAndNamesWhereItIsBad) {
    const struct {
        const char* what;
        std::string file;
        std::vector<std::wstring> named;  // in the error line
    } cases[] = {
        {"more than 1 MiB", Huge(), {L"the file is larger than 1048576 bytes"}},
        {"invalid UTF-8", kGood + "[Gr\xFC\xDF]\n", {L"line 5", L"not UTF-8"}},
        {"a section cut after its name", kGood + "[Cut]\n", {L"line 5, Name", L"no values"}},
        {"the same section twice",
         kGood + "[Good one]\nPort = COM1\n",
         {L"line 5, Name", L"line 1"}},
        {"not a number", kGood + "Parity = even\n", {L"line 5, Parity", L"not a number"}},
        {"beyond 32 bits", kGood + "Flow = 4294967296\n", {L"line 5, Flow", L"32 bits"}},
        {"an unknown key", kGood + "Speed = 9600\n", {L"line 5, Speed", L"not a value"}},
    };
    Station existing = Named(L"Good one");
    existing.BaudRate = 300;  // a taken name: not even --replace may touch it
    ASSERT_EQ(S_OK, AddStation(existing));
    const StoreSnapshot before = SnapshotStore();

    for (const auto& test : cases) {
        const std::wstring file = FileWith(test.file);
        for (bool replace : {false, true}) {
            EXPECT_EQ(kExitFileRefused, Import(file, replace)) << test.what << "\n" << AllLines();
            ASSERT_EQ(1u, lines_.size()) << test.what << "\n" << AllLines();
            EXPECT_EQ(0u, lines_[0].find(L"error: " + file + L", ")) << lines_[0];
            EXPECT_NE(std::wstring::npos, lines_[0].find(L"Nothing was imported.")) << lines_[0];
            for (const std::wstring& named : test.named)
                EXPECT_NE(std::wstring::npos, lines_[0].find(named))
                    << test.what << ": " << lines_[0];
            EXPECT_EQ(before, SnapshotStore()) << test.what;
        }
    }
}

TEST_F(StationFileCommands, AFileThatCannotBeReadWritesNothing) {
    AddStationOfModel(L"North");
    const StoreSnapshot before = SnapshotStore();
    const std::wstring missing = ScratchFile(L"never written.txt");
    EXPECT_EQ(kExitReadOrWriteFailed, Import(missing)) << AllLines();
    EXPECT_EQ(1u, LinesWith({L"error:", L"cannot be read", L"Nothing was imported."}).size())
        << AllLines();
    EXPECT_EQ(before, SnapshotStore());
}
