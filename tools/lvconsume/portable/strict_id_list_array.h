// A strict reading of a "Shell IDList Array" (CIDA) block, as a careful consumer must do it: the
// block comes from another program, so one offset or one item length outside it is a fault.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

// Where one item-ID list lies in the block: from its offset, its items and the 2-byte terminator.
struct IdListSpan {
    uint32_t offset = 0;
    uint32_t length = 0;  // the terminator included

    bool operator==(const IdListSpan&) const = default;
};

struct StrictIdListArray {
    std::string fault;              // empty when every offset and every list lies in the block
    uint32_t childCount = 0;        // cidl
    std::vector<IdListSpan> lists;  // aoffset[0], the parent's list, then one per child

    bool valid() const { return fault.empty(); }
};

// Reads cidl, all cidl + 1 offsets and walks every list (each SHITEMID's cb up to the 0
// terminator), reading nothing outside [block, block + size). The first fault found ends the
// reading and is described; the lists read until then are kept.
StrictIdListArray ReadIdListArrayStrictly(const uint8_t* block, size_t size);
