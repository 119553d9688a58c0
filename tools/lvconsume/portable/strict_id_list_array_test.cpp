// The strict "Shell IDList Array" reader: well-formed blocks read whole, and every way an offset
// or an item length can leave the block is a fault, never a read past its end.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tools/lvconsume/portable/strict_id_list_array.h"

namespace {

using Bytes = std::vector<uint8_t>;

void PutU32(Bytes& bytes, uint32_t value) {
    for (int shift = 0; shift < 32; shift += 8)
        bytes.push_back(static_cast<uint8_t>(value >> shift));
}

// One SHITEMID of cb bytes (cb counts its own two), filled with a marker byte.
Bytes Item(uint16_t cb) {
    Bytes item{static_cast<uint8_t>(cb), static_cast<uint8_t>(cb >> 8)};
    item.resize(cb < 2 ? 2 : cb, 0xAB);
    return item;
}

Bytes ListOf(std::initializer_list<uint16_t> sizes) {
    Bytes list;
    for (uint16_t cb : sizes) {
        const Bytes item = Item(cb);
        list.insert(list.end(), item.begin(), item.end());
    }
    list.push_back(0);
    list.push_back(0);
    return list;
}

// cidl, the offsets, then the parent's and the children's lists one after another.
Bytes ArrayOf(const std::vector<Bytes>& lists) {
    Bytes block;
    PutU32(block, static_cast<uint32_t>(lists.size() - 1));
    uint32_t offset = static_cast<uint32_t>(4 + 4 * lists.size());
    for (const Bytes& list : lists) {
        PutU32(block, offset);
        offset += static_cast<uint32_t>(list.size());
    }
    for (const Bytes& list : lists)
        block.insert(block.end(), list.begin(), list.end());
    return block;
}

Bytes WithU32At(Bytes block, size_t at, uint32_t value) {
    for (int i = 0; i < 4; ++i)
        block[at + i] = static_cast<uint8_t>(value >> (8 * i));
    return block;
}

Bytes Truncated(Bytes block, size_t bytes) {
    block.resize(block.size() - bytes);
    return block;
}

// The parent "My Computer\Quorvel Digital Levels\Station" and one file, as a station folder gives
// them: three 20-byte items, then one of 30 bytes.
const Bytes kParent = ListOf({20, 20, 20});
const Bytes kChild = ListOf({30});
const Bytes kOneFile = ArrayOf({kParent, kChild});  // offsets 12 and 74, 106 bytes in all

TEST(StrictIdListArray, ReadsEveryListOfWellFormedBlocks) {
    struct Case {
        const char* what;
        Bytes block;
        uint32_t childCount;
        std::vector<IdListSpan> lists;
    };
    const Case cases[] = {
        {"one file under a station", kOneFile, 1, {{12, 62}, {74, 32}}},
        {"the desktop as parent (empty list), two children",
         ArrayOf({ListOf({}), ListOf({4}), ListOf({6, 2})}),
         2,
         {{16, 2}, {18, 6}, {24, 10}}},
        {"no children at all", ArrayOf({ListOf({8})}), 0, {{8, 10}}},
        {"a block longer than its lists", [] {
             Bytes block = kOneFile;
             block.resize(block.size() + 16, 0xEE);
             return block;
         }(),
         1,
         {{12, 62}, {74, 32}}},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        const StrictIdListArray array = ReadIdListArrayStrictly(c.block.data(), c.block.size());
        EXPECT_TRUE(array.valid()) << array.fault;
        EXPECT_EQ(array.childCount, c.childCount);
        EXPECT_EQ(array.lists, c.lists);
    }
}

TEST(StrictIdListArray, FaultsWhenAnyOffsetOrItemLeavesTheBlock) {
    struct Case {
        const char* what;
        Bytes block;
        const char* faultNames;  // a part of the description that says where
    };
    const Case cases[] = {
        {"no room for cidl", Bytes{1, 0, 0}, "no room for cidl"},
        {"more offsets than the block holds", WithU32At(kOneFile, 0, 30), "cidl 30"},
        {"the child's offset cut off by the block's end", Bytes{1, 0, 0, 0, 8, 0, 0, 0, 0, 0},
         "cidl 1 needs 12 bytes"},
        {"a cidl that would wrap a 32-bit size", WithU32At(kOneFile, 0, 0xFFFFFFFF),
         "cidl 4294967295"},
        {"the parent's offset past the end", WithU32At(kOneFile, 4, 500), "aoffset[0] = 500"},
        {"a child's offset exactly at the end", WithU32At(kOneFile, 8, 106), "aoffset[1] = 106"},
        {"a child's offset on the last byte", WithU32At(kOneFile, 8, 105), "aoffset[1] = 105"},
        {"the last item runs past the end", Truncated(kOneFile, 3), "(cb 30) runs past"},
        {"the terminator is missing", Truncated(kOneFile, 2), "terminator at byte 104"},
        {"half a terminator", Truncated(kOneFile, 1), "terminator at byte 104"},
        {"an item's cb larger than the rest of the block", [] {
             Bytes block = kOneFile;
             block[74] = 0xFF;  // the file's item claims 255 bytes
             return block;
         }(),
         "(cb 255) runs past"},
        {"an item whose cb cannot hold its own size", [] {
             Bytes block = kOneFile;
             block[32] = 1;  // the parent's second item
             block[33] = 0;
             return block;
         }(),
         "has cb 1"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        const StrictIdListArray array = ReadIdListArrayStrictly(c.block.data(), c.block.size());
        EXPECT_FALSE(array.valid());
        EXPECT_NE(array.fault.find(c.faultNames), std::string::npos) << array.fault;
    }
}

TEST(StrictIdListArray, KeepsTheListsReadBeforeTheFault) {
    const Bytes block = Truncated(kOneFile, 2);
    const StrictIdListArray array = ReadIdListArrayStrictly(block.data(), block.size());
    EXPECT_FALSE(array.valid());
    EXPECT_EQ(array.lists, (std::vector<IdListSpan>{{12, 62}}));
}

}  // namespace
