// The flat byte form of a station list, as it travels through the clipboard.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "stations/portable/station.h"

// Byte size of one flat record: 2 × (sum of the five string lengths + 5) + 28.
size_t FlatStationRecordSize(const Station& station) noexcept;

// A 32-bit count, then for each station a 32-bit record size and the flat record.
std::vector<uint8_t> SerializeStationRecords(const std::vector<Station>& stations);

// Decodes a block of the given real size. Reading never passes that size: a count or a record
// size that lies, a string without its terminator or a truncated record ends the parse with the
// complete records read so far.
std::vector<Station> ParseStationRecords(const uint8_t* block, size_t blockSize);
