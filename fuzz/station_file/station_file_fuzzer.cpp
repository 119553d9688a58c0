// Feeds arbitrary bytes to the station file reader. A refused file hands on nothing and names a
// line the file has; an accepted one, written out again, reads back to the same stations and
// warnings, and writing those gives the same bytes.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "stations/portable/station_file.h"

namespace {

const StationFileRules& Rules() {
    static const StationFileRules rules = {
        {WIDE_TEXT("Quorvel LV-10"), WIDE_TEXT("Quorvel LV-20"), WIDE_TEXT("Quorvel LV-30")},
        {WIDE_TEXT("COM1"), WIDE_TEXT("COM3")}};
    return rules;
}

std::vector<StationFileSection> Sections(const StationFileContents& contents) {
    std::vector<StationFileSection> sections;
    for (const StationFileEntry& entry : contents.stations)
        sections.push_back({entry.station, {}});
    return sections;
}

StationFileContents ReadCopy(const std::string& text) {
    // An exact-size copy: any read past the file's end is a heap overflow for ASan.
    const std::vector<uint8_t> bytes(text.begin(), text.end());
    return ReadStationFile(bytes.data(), bytes.size(), Rules());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string input(reinterpret_cast<const char*>(data), size);
    const StationFileContents contents = ReadCopy(input);
    const size_t lines = static_cast<size_t>(std::count(input.begin(), input.end(), '\n')) + 1;
    if (contents.error) {
        if (!contents.stations.empty() || !contents.warnings.empty() ||
            contents.error->line > lines || contents.error->reason.empty())
            abort();
        return 0;
    }
    if (contents.stations.empty() || contents.stations.size() > kMaximumStationsInFile)
        abort();
    for (const StationFileEntry& entry : contents.stations) {
        if (entry.line == 0 || entry.line > lines)
            abort();
    }

    const std::string written = WriteStationFile(Sections(contents));
    const StationFileContents again = ReadCopy(written);
    if (again.error || again.stations.size() != contents.stations.size() ||
        again.warnings.size() != contents.warnings.size())
        abort();
    for (size_t i = 0; i < contents.stations.size(); ++i) {
        if (again.stations[i].station != contents.stations[i].station)
            abort();
    }
    if (WriteStationFile(Sections(again)) != written)
        abort();
    return 0;
}
