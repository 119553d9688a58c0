// The limits of a pasted station list and the names its stations are stored under.
#include "stations/portable/pasted_stations.h"

#include <algorithm>

#include "support/portable/byte_io.h"

namespace {

constexpr size_t kMessageNameLength = 64;

// Whether a text besides the name is one that the store's 520-byte reads could not take back
// whole (the station would be listed, but read only up to that value).
bool HasOverlongText(const Station& station) noexcept {
    for (const WideString* text :
         {&station.Port, &station.Manufacturer, &station.Model, &station.Software}) {
        if (text->size() > kMaximumStationTextLength)
            return true;
    }
    return false;
}

}  // namespace

std::optional<PasteRefused> CheckPastedBlock(const uint8_t* block, size_t blockSize) noexcept {
    if (blockSize > kMaximumPastedBlockSize)
        return PasteRefused{PasteRefusal::kBlockTooLarge, 0, {}};
    // The count is signed in the block's form: a negative one is an empty list.
    if (block && blockSize >= 4 &&
        static_cast<int32_t>(ReadU32(block)) > static_cast<int32_t>(kMaximumPastedStations)) {
        return PasteRefused{PasteRefusal::kTooManyStations, 0, {}};
    }
    return std::nullopt;
}

PastedNames ChoosePastedNames(std::span<const Station> stations,
                              std::unordered_set<WideString> taken, const WideString& copyPrefix) {
    PastedNames result;
    if (stations.size() > kMaximumPastedStations) {
        result.refused = PasteRefused{PasteRefusal::kTooManyStations, 0, {}};
        return result;
    }
    std::vector<WideString> names;
    names.reserve(stations.size());
    for (size_t index = 0; index < stations.size(); ++index) {
        const Station& station = stations[index];
        const StationNameProblem problem = CheckStationName(station.Name);
        if (problem != StationNameProblem::kNone || HasOverlongText(station)) {
            result.refused = PasteRefused{PasteRefusal::kUnreadable, index, station.Name, problem};
            return result;
        }
        WideString candidate = station.Name;
        // Without a prefix text a taken name stays as it is, as MakePastedName keeps it.
        while (!copyPrefix.empty() && taken.count(candidate) != 0) {
            candidate.insert(0, copyPrefix);
            const StationNameProblem copyProblem = CheckStationName(candidate);
            if (copyProblem != StationNameProblem::kNone) {
                const PasteRefusal reason = copyProblem == StationNameProblem::kTooLong
                                                ? PasteRefusal::kCopyTooLong
                                                : PasteRefusal::kUnreadable;
                result.refused = PasteRefused{reason, index, station.Name};
                return result;
            }
        }
        taken.insert(candidate);
        names.push_back(std::move(candidate));
    }
    result.names = std::move(names);
    return result;
}

WideString NameForMessage(WideStringView name) {
    WideString shown(name.substr(0, std::min(name.size(), kMessageNameLength)));
    for (WideChar& unit : shown) {
        const auto code = static_cast<uint16_t>(unit);
        if (code < 0x20 || (code >= 0x7F && code <= 0x9F))
            unit = static_cast<WideChar>(0xFFFD);
    }
    if (name.size() > kMessageNameLength)
        shown += static_cast<WideChar>(0x2026);
    return shown;
}
