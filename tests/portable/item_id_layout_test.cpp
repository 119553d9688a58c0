// Item identifier bytes: the size rule, bounded name reads and display paths.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "namespace/portable/item_id_layout.h"

namespace {

using Bytes = std::vector<uint8_t>;

// A list of items built with the creator's own writer, ended by the terminator.
Bytes MakeList(std::initializer_list<std::pair<uint32_t, WideString>> items) {
    Bytes list;
    for (const auto& [kind, name] : items) {
        const Bytes data = ItemNameBytes(name);
        Bytes item(ItemAllocationSize(data.size()));
        WriteItem(item.data(), kind, data.data(), data.size());
        list.insert(list.end(), item.begin(), item.end() - kListTerminatorSize);
    }
    list.insert(list.end(), {0, 0});
    return list;
}

WideString PathOf(const Bytes& list, size_t capacity, size_t* count = nullptr) {
    std::vector<WideChar> buffer(capacity + 1, WIDE_TEXT('#'));
    const size_t result = BuildListPath(list.data(), buffer.data(), capacity);
    if (count)
        *count = result;
    return WideString(buffer.data(), BoundedLength(buffer.data(), capacity));
}

}  // namespace

TEST(ItemLayout, SizeRuleCarriesFiveSlackBytes) {
    const Bytes data = ItemNameBytes(WIDE_TEXT("A"));
    ASSERT_EQ(4u, data.size());
    Bytes item(ItemAllocationSize(data.size()), 0xCC);
    ASSERT_EQ(25u, item.size());
    WriteItem(item.data(), PT_STATION, data.data(), data.size());

    EXPECT_EQ(23u, ItemSize(item.data()));
    EXPECT_EQ(uint32_t{PT_STATION}, ItemKind(item.data()));
    EXPECT_EQ(WIDE_TEXT("A"), ItemName(item.data()));
    EXPECT_EQ(0, item[23] | item[24]) << "the list terminator sits at offset cb";
    EXPECT_EQ('A', item[14]);
    EXPECT_TRUE(IsWellFormedItem(item.data()));
}

TEST(ItemLayout, MalformedItemsReadAsEmptyNamesAndAreRejected) {
    // cb too small to hold a kind: no kind, no name, never read beyond cb.
    const Bytes tiny = {4, 0, 2, 0, 0, 0};
    EXPECT_EQ(0u, ItemKind(tiny.data()));
    EXPECT_TRUE(ItemName(tiny.data()).empty());
    EXPECT_FALSE(IsWellFormedItem(tiny.data()));

    // A name that runs to the end of cb without a terminator: exactly cb bytes are provided so
    // that AddressSanitizer catches any read past them.
    Bytes unterminated(24, 0);
    unterminated[0] = 24;
    unterminated[2] = PT_STATION;
    for (size_t offset = kItemNameOffset; offset < 24; offset += 2)
        unterminated[offset] = 'X';
    EXPECT_TRUE(ItemName(unterminated.data()).empty());
    EXPECT_FALSE(IsWellFormedItem(unterminated.data()));

    // An unknown kind is not one of ours.
    Bytes strange = MakeList({{7, WIDE_TEXT("S")}});
    EXPECT_FALSE(IsWellFormedItem(strange.data()));
    EXPECT_EQ(WIDE_TEXT("S"), ItemName(strange.data()));
}

TEST(ItemLayout, SplitPathKeepsOnlyNonEmptyComponents) {
    using Parts = std::vector<WideString>;
    EXPECT_EQ(Parts({WIDE_TEXT("A"), WIDE_TEXT("B")}),
              SplitPathComponents(WIDE_TEXT("\\\\A\\\\B\\")));
    EXPECT_EQ(Parts({WIDE_TEXT("Station 1")}), SplitPathComponents(WIDE_TEXT("Station 1")));
    EXPECT_EQ(Parts(), SplitPathComponents(WIDE_TEXT("")));
    EXPECT_EQ(Parts(), SplitPathComponents(WIDE_TEXT("\\\\\\")));
}

TEST(ListPath, JoinsNamesWithoutOuterSeparatorsAndCountsTheNeededCapacity) {
    const Bytes list = MakeList({{PT_ROOT, kRootItemName},
                                 {PT_STATION, WIDE_TEXT("Station 1")},
                                 {PT_FILE, WIDE_TEXT("file1.lv")}});
    size_t count = 0;
    EXPECT_EQ(WIDE_TEXT("Quorvel Digital Level\\Station 1\\file1.lv"), PathOf(list, 260, &count));
    EXPECT_EQ(40u, count);
    EXPECT_EQ(42u, BuildListPath(list.data(), nullptr, 0)) << "every name and separator";
    EXPECT_EQ(WIDE_TEXT("Quorvel Digital Level\\Station 1"), PathOf(list, 32, &count));
    EXPECT_EQ(32u, count) << "a buffer that cuts the path counts the names it took";
    EXPECT_EQ(0u, BuildListPath(nullptr, nullptr, 0));
    EXPECT_EQ(WIDE_TEXT(""), PathOf({0, 0}, 260, &count));
    EXPECT_EQ(0u, count);
}

TEST(ListPath, SmallBufferIsNeverOverrun) {
    const Bytes list = MakeList({{PT_ROOT, kRootItemName}, {PT_STATION, WIDE_TEXT("S1")}});
    for (size_t capacity = 1; capacity < 30; ++capacity) {
        std::vector<WideChar> buffer(capacity + 4, WIDE_TEXT('#'));
        BuildListPath(list.data(), buffer.data(), capacity);
        EXPECT_LT(BoundedLength(buffer.data(), capacity), capacity) << capacity;
        EXPECT_EQ(std::vector<WideChar>(4, WIDE_TEXT('#')),
                  std::vector<WideChar>(buffer.begin() + capacity, buffer.end()))
            << "capacity " << capacity;
    }
    // Without a buffer: the names, the separator and the terminator.
    EXPECT_EQ(26u, BuildListPath(list.data(), nullptr, 0));
    // Ten characters hold nine and the terminator; the count is of the names taken.
    size_t count = 0;
    EXPECT_EQ(WIDE_TEXT("Quorvel D"), PathOf(list, 10, &count));
    EXPECT_EQ(22u, count);
}

TEST(ItemComparison, ScalesByTheColumnArgumentWithDefinedArithmeticForShellBits) {
    const struct {
        int32_t order;
        uint32_t column;
        int32_t expected;
    } cases[] = {
        // clang-format off
        {-3, 0, -3}, {5, 1, 5}, {-1, 2, -2}, {7, 0xFFFFFFFFu, -7},
        // SHCIDS_CANONICALONLY (0x10000000) and SHCIDS_ALLFIELDS (0x80000000): the product is
        // taken modulo 2^32 instead of overflowing an int.
        {1, 0x10000000u, 0x10000000}, {16, 0x10000000u, 0},
        {1, 0x80000000u, INT32_MIN}, {-1, 0x80000000u, INT32_MIN}, {-2, 0x80000001u, -2},
        // clang-format on
    };
    for (const auto& test : cases) {
        EXPECT_EQ(test.expected, ScaleComparison(test.order, static_cast<int32_t>(test.column)))
            << test.order << " x " << std::hex << test.column;
    }
}
