// What a paste of another program's station list may bring in: the block's limits, and the name
// each pasted station is stored under, chosen against one reading of the store.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <unordered_set>
#include <vector>

#include "stations/portable/station.h"
#include "stations/portable/station_file.h"
#include "stations/portable/station_names.h"

// The clipboard brings in no more than a station file may (`lvstations import`): any process can
// put a block there, and the paste runs in the user's folder.
inline constexpr size_t kMaximumPastedStations = kMaximumStationsInFile;
inline constexpr size_t kMaximumPastedBlockSize = kMaximumStationFileSize;

enum class PasteRefusal : uint8_t {
    kTooManyStations,  // the block's count is over kMaximumPastedStations
    kBlockTooLarge,    // the block is over kMaximumPastedBlockSize bytes
    kUnreadable,       // a name (or another text) the store could not read back or list
    kCopyTooLong,      // the copy prefix would take a taken name past kMaximumStationNameLength
};

struct PasteRefused {
    PasteRefusal reason;
    size_t station = 0;  // its position in the block, from 0 (the block's refusals: 0)
    WideString name;     // its name as the block has it
    // The name's own problem; kNone when another text of the station, or the name of its copy,
    // is what the store could not keep.
    StationNameProblem nameProblem = StationNameProblem::kNone;
};

// Checks the block's real size and its count before anything is decoded.
std::optional<PasteRefused> CheckPastedBlock(const uint8_t* block, size_t blockSize) noexcept;

struct PastedNames {
    std::vector<WideString> names;  // one per station, in block order; empty when refused
    std::optional<PasteRefused> refused;
};

// The name each station is stored under: its own, or the copy prefix put in front while the name
// is taken, by a stored station or one chosen earlier in this paste (so a block that names a
// station twice stores "Copy of " the second time). A station the store could not keep as
// written refuses the whole block, which then writes nothing: renaming another program's station
// behind the user's back would store something nobody copied. Each station costs one look-up per
// candidate, and a candidate never grows past the longest name the store reads.
PastedNames ChoosePastedNames(std::span<const Station> stations,
                              std::unordered_set<WideString> taken, const WideString& copyPrefix);

// A name as a message may quote it: at most 64 characters (then "…"), control characters shown
// as U+FFFD, so a name from another program cannot forge lines or fill the screen.
WideString NameForMessage(WideStringView name);
