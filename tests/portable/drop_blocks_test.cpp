// Readers of dropped blocks: well-formed blocks, and every way a source can lie about them.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/portable/byte_io.h"
#include "tests/portable/file_group_block.h"
#include "view/portable/drop_blocks.h"

#ifdef _WIN32
#include <windows.h>
#include <shlobj.h>
// The portable declarations (whose offsets drop_blocks.h asserts) must be the system's own.
static_assert(sizeof(DROPFILES) == 20 && offsetof(DROPFILES, fWide) == 16);
static_assert(offsetof(CIDA, aoffset) == 4 && offsetof(FILEGROUPDESCRIPTORW, fgd) == 4);
static_assert(sizeof(FILEDESCRIPTORW) == 592 && sizeof(FILEDESCRIPTORA) == 332);
static_assert(offsetof(FILEDESCRIPTORW, dwFileAttributes) == 36);
static_assert(offsetof(FILEDESCRIPTORW, cFileName) == 72 &&
              offsetof(FILEDESCRIPTORA, cFileName) == 72);
#endif

namespace {

using Bytes = std::vector<uint8_t>;

template <typename Result>
struct Case {
    const char* what;
    Bytes block;
    Result expected;
};

// Texts are byte strings here: a wide block gets each byte as one UTF-16 unit.
void AppendText(Bytes& block, const std::string& text, bool wide) {
    for (char c : text + '\0') {
        block.push_back(static_cast<uint8_t>(c));
        if (wide)
            block.push_back(0);
    }
}

Bytes DropFiles(bool wide, std::vector<std::string> paths, uint32_t listOffset = 20) {
    Bytes block(listOffset, 0);
    WriteU32(block.data(), listOffset);
    WriteU32(block.data() + 16, wide);
    paths.push_back("");
    for (const std::string& path : paths)
        AppendText(block, path, wide);
    return block;
}

// The parent's list first, then the children's, one after another behind the offsets.
Bytes IdListArrayOf(const std::vector<Bytes>& lists) {
    Bytes block(4 + 4 * lists.size(), 0);
    WriteU32(block.data(), static_cast<uint32_t>(lists.size() - 1));
    for (size_t i = 0; i < lists.size(); ++i) {
        WriteU32(block.data() + 4 + 4 * i, static_cast<uint32_t>(block.size()));
        block.insert(block.end(), lists[i].begin(), lists[i].end());
    }
    return block;
}

Bytes Patched(Bytes block, size_t offset, uint32_t value) {
    WriteU32(block.data() + offset, value);
    return block;
}

Bytes Cut(const Bytes& block, size_t bytes) {
    return Bytes(block.begin(), block.end() - bytes);
}

}  // namespace

TEST(DropBlocks, DropFilePathsStopAtTheBlockAndNeverLeaveIt) {
    const Bytes wide = DropFiles(true, {"C:\\a.txt", "D:\\b"}),
                ansi = DropFiles(false, {"\xe9", "x"});
    const std::vector<WideString> both = {WIDE_TEXT("C:\\a.txt"), WIDE_TEXT("D:\\b")};
    Bytes afterTheEnd = DropFiles(true, {"C:\\a.txt"});
    AppendText(afterTheEnd, "D:\\b", true);
    const Case<std::vector<WideString>> cases[] = {
        {"wide list", wide, both},
        {"ANSI list, Latin-1", ansi, {WIDE_TEXT("\u00e9"), WIDE_TEXT("x")}},
        {"list at an odd offset, after padding", DropFiles(true, {"C:\\a.txt", "D:\\b"}, 23), both},
        {"offset at the block's end", Patched(wide, 0, uint32_t(wide.size())), {}},
        {"offset inside the header", Patched(wide, 0, 19), {}},
        {"header cut short", Bytes(19, 0), {}},
        {"no final empty string", Cut(wide, 2), both},
        {"a path after the empty string", afterTheEnd, {both[0]}},
        {"last path without terminator", Cut(wide, 4), {both[0]}},
        {"odd length, half a terminator", Cut(wide, 3), {both[0]}},
        {"odd length, a stray byte after", Cut(wide, 1), both},
        {"ANSI path without terminator", Cut(ansi, 2), {WIDE_TEXT("\u00e9")}},
    };
    for (const auto& test : cases) {
        const Bytes exact = test.block;  // so that AddressSanitizer sees a read past its end
        EXPECT_EQ(test.expected, ReadDropFilePaths(exact.data(), exact.size())) << test.what;
    }
}

TEST(DropBlocks, AnsiTextGoesThroughTheGivenConversion) {
    const auto marks = [](std::string_view bytes) { return WideString(bytes.size(), '?'); };
    const Bytes ansi = DropFiles(false, {"ab"});
    const Bytes group = FileGroup(false, {{0, 0, WIDE_TEXT("abc")}});
    EXPECT_EQ(WIDE_TEXT("??"), ReadDropFilePaths(ansi.data(), ansi.size(), marks).at(0));
    EXPECT_EQ(WIDE_TEXT("???"),
              ReadFileGroupDescriptors(group.data(), group.size(), false, marks).at(0).name);
}

TEST(DropBlocks, IdListArrayKeepsOnlyListsWhollyInsideTheBlock) {
    // Items {cb, 0xFF filler}; the parent's list lies at 16, the children's at 24 and 40.
    const Bytes parent = {6, 0, 255, 255, 255, 255, 0, 0}, child1 = {4, 0, 255, 255, 0, 0};
    const Bytes child0 = {6, 0, 255, 255, 255, 255, 8, 0, 255, 255, 255, 255, 255, 255, 0, 0};
    const Bytes block = IdListArrayOf({parent, child0, child1});
    const IdListArray all = {parent, {{0, child0}, {1, child1}}};
    const Case<IdListArray> cases[] = {
        {"well-formed", block, all},
        {"desktop parent", IdListArrayOf({{0, 0}, child1}), {{0, 0}, {{0, child1}}}},
        {"no children", Patched(block, 0, 0), {parent, {}}},
        // The offsets read past the real ones are filler, all out of the block.
        {"cidl past the block", Patched(block, 0, 0xFFFFFFFF), all},
        {"parent offset past the block", Patched(block, 4, 0x7FFFFFFF), {}},
        {"child offset past the block", Patched(block, 8, 1000), {parent, {{1, child1}}}},
        {"child item runs past the block", Patched(block, 40, 200), {parent, {{0, child0}}}},
        // A cb of 1 followed by zeros would otherwise end in a terminator.
        {"child item of cb 1", Patched(block, 24, 1), {parent, {{1, child1}}}},
        {"parent item of cb 1", Patched(block, 16, 1), {}},
        {"last list without terminator", Cut(block, 1), {parent, {{0, child0}}}},
        {"no room for the parent offset", Bytes{0, 0, 0, 0, 8, 0, 0}, {}},
    };
    for (const auto& test : cases) {
        const Bytes exact = test.block;
        EXPECT_EQ(test.expected, ReadIdListArray(exact.data(), exact.size())) << test.what;
    }
}

TEST(DropBlocks, ChildrenThatAllNameOneLongListCostNoMoreThanABudget) {
    // A list of 999 empty items, and 2,000 children whose offsets all point at it.
    Bytes list;
    for (int item = 0; item < 999; ++item)
        list.insert(list.end(), {2, 0});
    list.insert(list.end(), {0, 0});
    const uint32_t children = 2000;
    Bytes block(4 + 4 * (children + 1), 0);
    const uint32_t listOffset = static_cast<uint32_t>(block.size());
    WriteU32(block.data(), children);
    for (uint32_t i = 0; i <= children; ++i)
        WriteU32(block.data() + 4 + 4 * i, listOffset);
    block.insert(block.end(), list.begin(), list.end());
    const IdListArray array = ReadIdListArray(block.data(), block.size());
    size_t copied = 0;
    for (const IdListArrayChild& child : array.children)
        copied += child.list.size();
    EXPECT_FALSE(array.children.empty());
    EXPECT_LE(copied, 5 * block.size());
    EXPECT_LT(array.children.size(), children);
}

TEST(DropBlocks, FileGroupReadsOnlyWholeRecordsWithBoundedNames) {
    using Entries = std::vector<FileGroupEntry>;
    const Entries three = {
        {0, 0x20, WIDE_TEXT("a")}, {1, 0x10, WIDE_TEXT("dir")}, {2, 0, WIDE_TEXT("\u00e9")}};
    const Entries unterminated = {{0, 0, WideString(260, 'x')}, {1, 0, WIDE_TEXT("next")}};
    for (bool wide : {true, false}) {
        const Bytes group = FileGroup(wide, three);
        const Case<Entries> cases[] = {
            {"three, a directory among them", group, three},
            {"cItems past the block", Patched(group, 0, 0xFFFFFFFF), three},
            {"cItems below the records", Patched(group, 0, 1), {three[0]}},
            {"last record cut", Cut(group, 1), {three[0], three[1]}},
            {"name without terminator", FileGroup(wide, unterminated), unterminated},
            {"no room for cItems", Bytes{3, 0, 0}, {}},
        };
        for (const auto& test : cases) {
            const Bytes exact = test.block;
            EXPECT_EQ(test.expected, ReadFileGroupDescriptors(exact.data(), exact.size(), wide))
                << test.what << (wide ? ", wide" : ", ANSI");
        }
    }
}
