// Follows a pasted station-list block past its decoder: the limits checked before decoding, then
// the names its stations are stored under, chosen against the names a store already holds.
// Input: a 16-bit byte count, that many bytes of a block whose names the store holds, one byte
// choosing the copy prefix, then the pasted block.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <set>
#include <unordered_set>
#include <vector>

#include "stations/portable/pasted_stations.h"
#include "stations/portable/station_list_format.h"
#include "support/portable/byte_io.h"

namespace {

const WideString kPrefixes[] = {WIDE_TEXT("Copy of "), WIDE_TEXT("Kopie von "), WIDE_TEXT("C"),
                                WIDE_TEXT("")};

void Require(bool condition) {
    if (!condition)
        abort();
}

bool StartsWith(const WideString& text, const WideString& start) {
    return text.size() >= start.size() && text.compare(0, start.size(), start) == 0;
}

bool HasOverlongText(const Station& station) {
    return std::max({station.Port.size(), station.Manufacturer.size(), station.Model.size(),
                     station.Software.size()}) > kMaximumStationTextLength;
}

// An accepted paste: one readable name each, none stored before, none twice, each the station's
// own name behind as few prefixes as the names taken before it ask for.
void CheckAccepted(const std::vector<Station>& stations, const std::vector<WideString>& stored,
                   const WideString& prefix, const std::vector<WideString>& names) {
    Require(names.size() == stations.size());
    std::set<WideString> taken(stored.begin(), stored.end());
    for (size_t index = 0; index < names.size(); ++index) {
        const WideString& own = stations[index].Name;
        const WideString& name = names[index];
        Require(CheckStationName(name) == StationNameProblem::kNone);
        Require(!HasOverlongText(stations[index]));
        Require(IsListableStationName(name));
        Require(name.size() >= own.size() &&
                name.compare(name.size() - own.size(), own.size(), own) == 0);
        if (!prefix.empty())
            Require(taken.count(name) == 0);
        // Without a prefix the name stays; with one it is the prefix put in front of a taken name.
        if (name != own) {
            Require(!prefix.empty() && StartsWith(name, prefix));
            Require(taken.count(name.substr(prefix.size())) != 0);
        }
        taken.insert(name);
    }
}

// A refused paste names the first station that the store cannot keep, with its real reason: the
// stations before it, pasted alone, are accepted.
void CheckRefused(const std::vector<Station>& stations, const std::vector<WideString>& stored,
                  const WideString& prefix, const PastedNames& chosen) {
    Require(chosen.names.empty());
    const PasteRefused& refused = *chosen.refused;
    if (refused.reason == PasteRefusal::kTooManyStations) {
        Require(stations.size() > kMaximumPastedStations);
        return;
    }
    Require(refused.station < stations.size());
    const Station& station = stations[refused.station];
    Require(refused.name == station.Name);
    const std::vector<Station> before(stations.begin(), stations.begin() + refused.station);
    const PastedNames earlier = ChoosePastedNames(
        before, std::unordered_set<WideString>(stored.begin(), stored.end()), prefix);
    Require(!earlier.refused);
    CheckAccepted(before, stored, prefix, earlier.names);
    const StationNameProblem problem = CheckStationName(station.Name);
    if (refused.reason == PasteRefusal::kUnreadable) {
        Require(refused.nameProblem == problem);
        Require(problem != StationNameProblem::kNone || HasOverlongText(station));
        return;
    }
    // Only a taken name grows, and it stops only past the limit.
    Require(refused.reason == PasteRefusal::kCopyTooLong);
    Require(problem == StationNameProblem::kNone && !HasOverlongText(station) && !prefix.empty());
    Require(station.Name.size() + prefix.size() > kMaximumStationNameLength);
    Require(std::find(stored.begin(), stored.end(), station.Name) != stored.end() ||
            std::find(earlier.names.begin(), earlier.names.end(), station.Name) !=
                earlier.names.end());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 3)
        return 0;
    const size_t storedSize = std::min<size_t>(ReadU16(data), size - 3);
    const std::vector<uint8_t> storedBlock(data + 2, data + 2 + storedSize);
    const WideString& prefix = kPrefixes[data[2 + storedSize] % std::size(kPrefixes)];
    const std::vector<uint8_t> pasted(data + 3 + storedSize, data + size);

    std::vector<WideString> stored;
    for (const Station& station : ParseStationRecords(storedBlock.data(), storedBlock.size()))
        stored.push_back(station.Name);

    const std::optional<PasteRefused> blockRefused = CheckPastedBlock(pasted.data(), pasted.size());
    const std::vector<Station> stations = ParseStationRecords(pasted.data(), pasted.size());
    if (blockRefused) {
        Require(pasted.size() > kMaximumPastedBlockSize ||
                (pasted.size() >= 4 && static_cast<int32_t>(ReadU32(pasted.data())) >
                                           static_cast<int32_t>(kMaximumPastedStations)));
        return 0;
    }
    // A block within the limits decodes to no more stations than a paste may bring.
    Require(stations.size() <= kMaximumPastedStations);
    const PastedNames chosen = ChoosePastedNames(
        stations, std::unordered_set<WideString>(stored.begin(), stored.end()), prefix);
    if (chosen.refused)
        CheckRefused(stations, stored, prefix, chosen);
    else
        CheckAccepted(stations, stored, prefix, chosen.names);
    return 0;
}
