// A file group descriptor block built byte by byte, for the readers' portable tests and the drop
// tests on Windows.
#pragma once

#include <cstdint>
#include <vector>

#include "support/portable/byte_io.h"
#include "view/portable/drop_blocks.h"

// Records of {index (not stored), attributes, name}, their names' characters taken as single
// bytes; a name of 260 characters leaves no room for the terminator.
inline std::vector<uint8_t> FileGroup(bool wide, const std::vector<FileGroupEntry>& records) {
    const size_t size = wide ? sizeof(FileDescriptorWide) : sizeof(FileDescriptorAnsi);
    std::vector<uint8_t> block(4 + size * records.size(), 0);
    WriteU32(block.data(), static_cast<uint32_t>(records.size()));
    for (size_t i = 0; i < records.size(); ++i) {
        uint8_t* record = block.data() + 4 + size * i;
        WriteU32(record + 36, records[i].attributes);
        for (size_t c = 0; c < records[i].name.size(); ++c)  // the zeroed block ends the name
            record[72 + (wide ? 2 * c : c)] = static_cast<uint8_t>(records[i].name[c]);
    }
    return block;
}
