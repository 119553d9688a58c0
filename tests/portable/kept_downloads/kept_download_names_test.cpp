// Safe folder names, kept file names and the retention choice.
#include <gtest/gtest.h>

#include "download/portable/kept_download_names.h"

namespace {

#define W(text) WIDE_TEXT(text)

TEST(SafeFolderName, MakesEveryNameOneWindowsAcceptsAndNoDevice) {
    struct Case {
        const char* what;
        WideString name;
        WideString expected;
    } const cases[] = {
        {"plain", W("North"), W("North")},
        {"refused characters", W("a<b>c:d\"e/f\\g|h?i*j"), W("a_b_c_d_e_f_g_h_i_j")},
        {"controls", WideString(W("a\tb\r\nc")) + WideChar(0x1F), W("a_b__c_")},
        {"trailing dots and spaces", W("Site 4. . "), W("Site 4")},
        {"leading spaces", W("   Site"), W("Site")},
        {"only dots", W("..."), W("_")},
        {"empty", W(""), W("_")},
        {"device", W("CON"), W("_CON")},
        {"device with extension", W("aux.lv"), W("_aux.lv")},
        {"device name with a trailing dot", W("COM1."), W("_COM1")},
        {"not a device", W("COM10"), W("COM10")},
        {"a NUL character", WideString(W("a")) + WideChar(0) + W("b"), W("a_b")},
        {"long", WideString(100, W('x')), WideString(kKeptFolderNameLimit, W('x'))},
        {"long, cut before a space", WideString(63, W('x')) + W("  yy"),
         WideString(63, W('x'))},
    };
    for (const Case& test : cases) {
        SCOPED_TRACE(test.what);
        EXPECT_EQ(test.expected, SafeFolderName(test.name));
    }
}

TEST(SafeFolderName, NeverSplitsASurrogatePair) {
    WideString name(kKeptFolderNameLimit - 1, W('x'));
    name += WideChar(0xD83D);
    name += WideChar(0xDCCF);
    const WideString safe = SafeFolderName(name);
    EXPECT_EQ(kKeptFolderNameLimit - 1, safe.size());
    EXPECT_EQ(W('x'), safe.back());
}

TEST(KeptFileName, NamesTheSecondAndCountsRepeats) {
    const LocalDateTime time{2026, 3, 1, 4, 5, 9};
    EXPECT_EQ(W("2026-03-01 040509.lv"), KeptFileName(time, W(".lv"), 1));
    EXPECT_EQ(W("2026-03-01 040509 (2).lv"), KeptFileName(time, W(".lv"), 2));
    EXPECT_EQ(W("2026-03-01 040509 (13).hvr"), KeptFileName(time, W(".hvr"), 13));
    EXPECT_EQ(W("2026-12-31 235959"), KeptFileName({2026, 12, 31, 23, 59, 59}, W(""), 0));
}

constexpr int64_t kDay = 24 * 60 * 60;
constexpr uint64_t kMegabyte = 1024 * 1024;

TEST(FilesToDelete, PrunesByAgeThenSizeAndKeepsEachStationsNewest) {
    const int64_t now = 1000 * kDay;
    struct Case {
        const char* what;
        std::vector<KeptFile> files;
        RetentionLimits limits;
        std::vector<size_t> expected;
    } const cases[] = {
        {"nothing kept", {}, {90, 1024}, {}},
        {"all young and small",
         {{W("A"), now - kDay, 10}, {W("A"), now, 10}, {W("B"), now - 2 * kDay, 10}},
         {90, 1024},
         {}},
        {"too old, but the station's newest stays",
         {{W("A"), now - 200 * kDay, 10}, {W("A"), now - 100 * kDay, 10},
          {W("B"), now - 95 * kDay, 10}, {W("B"), now, 10}},
         {90, 1024},
         {0, 2}},
        {"exactly at the age limit stays",
         {{W("A"), now - 90 * kDay, 10}, {W("A"), now, 10}},
         {90, 1024},
         {}},
        {"oldest go first until the rest fit",
         {{W("A"), now - 3, kMegabyte}, {W("A"), now - 1, kMegabyte},
          {W("B"), now - 4, kMegabyte}, {W("B"), now - 2, kMegabyte}, {W("A"), now, kMegabyte}},
         {90, 3},
         {0, 2}},
        {"the newest of each station stays even over the size limit",
         {{W("A"), now, 5 * kMegabyte}, {W("B"), now - 10, 5 * kMegabyte},
          {W("B"), now - 20, kMegabyte}},
         {90, 1},
         {2}},
        {"size limit 0 leaves only each station's newest",
         {{W("A"), now - 2, 1}, {W("A"), now - 1, 1}, {W("B"), now - 3, 1}},
         {90, 0},
         {0}},
        {"a tie keeps the later listed",
         {{W("A"), now, 1}, {W("A"), now, 1}},
         {90, 0},
         {0}},
        {"keeping off deletes nothing",
         {{W("A"), now - 400 * kDay, kMegabyte}, {W("A"), now, kMegabyte}},
         {0, 0},
         {}},
        {"huge limits do not overflow",
         {{W("A"), now - 400 * kDay, kMegabyte}, {W("A"), now, kMegabyte}},
         {UINT32_MAX, UINT32_MAX},
         {}},
    };
    for (const Case& test : cases) {
        SCOPED_TRACE(test.what);
        EXPECT_EQ(test.expected, FilesToDelete(test.files, test.limits, now));
    }
}

}  // namespace
