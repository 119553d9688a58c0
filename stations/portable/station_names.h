// Naming rules of stations: unique names for new and pasted stations, the allowed characters, and
// the names the store can keep so that the folder lists them.
#pragma once

#include <cstdint>
#include <functional>

#include "stations/portable/station_fields.h"
#include "support/portable/wide_text.h"

using NameTakenPredicate = std::function<bool(const WideString& name)>;

// The store reads a name back with a buffer of 520 bytes: a longer name is a station nobody finds.
inline constexpr size_t kMaximumStationNameLength = kMaximumStationTextLength;

// The base itself, else the base followed by " (2)", " (3)", … : the first name not taken.
WideString MakeUniqueName(const WideString& base, const NameTakenPredicate& isTaken);

// The name of a pasted station: the copy prefix put in front again and again until it is free.
WideString MakePastedName(const WideString& name, const WideString& copyPrefix,
                          const NameTakenPredicate& isTaken);

// Non-empty and free of backslash, slash, double quote and asterisk.
bool IsValidStationName(WideStringView name) noexcept;

enum class StationNameProblem : uint8_t {
    kNone,
    kEmpty,
    kForbiddenCharacter,  // \ / " or *
    kTooLong,             // more than kMaximumStationNameLength characters
};

// Why a station of this name must not be written: the store could not read it back, or the
// folder could not list it as itself. kNone for a name the store may keep.
StationNameProblem CheckStationName(WideStringView name) noexcept;

// Whether a name read from the store can be listed: an item's path takes it as one whole
// component, so it is not empty and holds no backslash ("Site\North" would be listed as "Site").
// The other refused characters are not separators: a station that another program named with
// them is still listed, and found, under its own name.
bool IsListableStationName(WideStringView name) noexcept;
