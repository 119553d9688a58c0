// The station list as the clipboard carries it ("Quorvel Total Stations"): the flat records in
// a shared memory block.
#pragma once

#include <windows.h>

#include <vector>

#include "stations/portable/station.h"

// A movable, zero-initialised, shareable block that the receiver owns; null on failure.
HGLOBAL SerializeStationList(const std::vector<Station>& stations);
// Never reads past the block's real size (GlobalSize). S_OK in every case; a block that cannot
// be read gives an empty list.
[[nodiscard]] HRESULT ParseStationList(HGLOBAL block, std::vector<Station>& stations) noexcept;
