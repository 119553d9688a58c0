// The strict "Shell IDList Array" reader: bounds first, then each list item by item.
#include "tools/lvconsume/portable/strict_id_list_array.h"

namespace {

uint32_t ReadU32At(const uint8_t* bytes) {
    return static_cast<uint32_t>(bytes[0]) | (static_cast<uint32_t>(bytes[1]) << 8) |
           (static_cast<uint32_t>(bytes[2]) << 16) | (static_cast<uint32_t>(bytes[3]) << 24);
}

uint16_t ReadU16At(const uint8_t* bytes) {
    return static_cast<uint16_t>(bytes[0] | (bytes[1] << 8));
}

// The length of the list at offset, terminator included; 0 with fault set when any of it lies
// outside the block.
uint32_t ListLength(const uint8_t* block, size_t size, uint32_t offset, const std::string& name,
                    std::string& fault) {
    size_t position = offset;
    for (;;) {
        if (position + 2 > size) {
            fault = name + ": the item or terminator at byte " + std::to_string(position) +
                    " does not fit in the " + std::to_string(size) + "-byte block";
            return 0;
        }
        const uint16_t cb = ReadU16At(block + position);
        if (cb == 0)
            return static_cast<uint32_t>(position + 2 - offset);
        // An item's cb counts its own two bytes: anything less would walk in place or backwards.
        if (cb < 2) {
            fault = name + ": the item at byte " + std::to_string(position) + " has cb " +
                    std::to_string(cb);
            return 0;
        }
        if (position + cb > size) {
            fault = name + ": the item at byte " + std::to_string(position) + " (cb " +
                    std::to_string(cb) + ") runs past the " + std::to_string(size) +
                    "-byte block";
            return 0;
        }
        position += cb;
    }
}

}  // namespace

StrictIdListArray ReadIdListArrayStrictly(const uint8_t* block, size_t size) {
    StrictIdListArray array;
    if (!block || size < 4) {
        array.fault = "the " + std::to_string(size) + "-byte block has no room for cidl";
        return array;
    }
    array.childCount = ReadU32At(block);
    // cidl + 1 offsets follow cidl; 64-bit arithmetic, so that a huge cidl cannot wrap around.
    const uint64_t offsetsEnd = 4 + 4 * (static_cast<uint64_t>(array.childCount) + 1);
    if (offsetsEnd > size) {
        array.fault = "cidl " + std::to_string(array.childCount) + " needs " +
                      std::to_string(offsetsEnd) + " bytes of offsets; the block has " +
                      std::to_string(size);
        return array;
    }
    for (uint32_t index = 0; index <= array.childCount; ++index) {
        const uint32_t offset = ReadU32At(block + 4 + 4 * static_cast<size_t>(index));
        const std::string name = "aoffset[" + std::to_string(index) + "] = " +
                                 std::to_string(offset);
        const uint32_t length = ListLength(block, size, offset, name, array.fault);
        if (!array.valid())
            return array;
        array.lists.push_back({offset, length});
    }
    return array;
}
