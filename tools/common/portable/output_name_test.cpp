// Names of downloaded files from lvcopy's --name patterns.
#include <gtest/gtest.h>

#include "tools/common/portable/output_name.h"

namespace {

OutputNameParts Parts(const WideString& station, const WideString& fileName) {
    OutputNameParts parts;
    parts.station = station;
    parts.fileName = fileName;
    parts.year = 2026;
    parts.month = 3;
    parts.day = 7;
    parts.hour = 9;
    parts.minute = 5;
    parts.second = 0;
    return parts;
}

TEST(OutputName, FieldsExpandAndStationCharactersAFileCannotHoldBecomeUnderscores) {
    const struct {
        const WideChar* pattern;
        WideString station;
        WideString fileName;
        const WideChar* expected;
    } cases[] = {
        {WIDE_TEXT("{station} {date} {time}{ext}"), WIDE_TEXT("Bridge deck"), WIDE_TEXT("file1.lv"),
         WIDE_TEXT("Bridge deck 2026-03-07 090500.lv")},
        {WIDE_TEXT("{station} {date} {time}{ext}"), WIDE_TEXT("North"), WIDE_TEXT("file1.hvr"),
         WIDE_TEXT("North 2026-03-07 090500.hvr")},
        {WIDE_TEXT("{name}-{date}{ext}"), WIDE_TEXT("N"), WIDE_TEXT("file1.lv"),
         WIDE_TEXT("file1-2026-03-07.lv")},
        {WIDE_TEXT("{station}.txt"), WIDE_TEXT("A:B?<C>|"), WIDE_TEXT("file1.lv"),
         WIDE_TEXT("A_B__C__.txt")},
        {WIDE_TEXT("{{{station}}}.lv"), WIDE_TEXT("S"), WIDE_TEXT("file1.lv"), WIDE_TEXT("{S}.lv")},
        {WIDE_TEXT("plain.lv"), WIDE_TEXT("S"), WIDE_TEXT("file1.lv"), WIDE_TEXT("plain.lv")},
        {WIDE_TEXT("{name}{ext}"), WIDE_TEXT("S"), WIDE_TEXT("noextension"),
         WIDE_TEXT("noextension")},
    };
    for (const auto& test : cases) {
        WideString name, error;
        ASSERT_TRUE(ExpandOutputName(test.pattern, Parts(test.station, test.fileName), name, error))
            << std::string(error.begin(), error.end());
        EXPECT_EQ(name, test.expected);
        EXPECT_TRUE(error.empty());
    }
}

TEST(OutputName, PatternsThatNameNoUsableFileAreRefusedWithAReason) {
    const struct {
        const WideChar* pattern;
        const WideChar* reasonStart;
    } cases[] = {
        {WIDE_TEXT("{station}\\{date}.lv"), WIDE_TEXT("the pattern holds a character")},
        {WIDE_TEXT("..\\x.lv"), WIDE_TEXT("the pattern holds a character")},
        {WIDE_TEXT("C:x.lv"), WIDE_TEXT("the pattern holds a character")},
        {WIDE_TEXT("{stat}.lv"), WIDE_TEXT("unknown field {stat}")},
        {WIDE_TEXT("{station"), WIDE_TEXT("a \"{\" without")},
        {WIDE_TEXT("station}"), WIDE_TEXT("a \"}\" without")},
        {WIDE_TEXT(""), WIDE_TEXT("the pattern names no file")},
        {WIDE_TEXT(".."), WIDE_TEXT("the pattern names no file")},
        {WIDE_TEXT("{station}."), WIDE_TEXT("a file name cannot end")},
        {WIDE_TEXT("{station} "), WIDE_TEXT("a file name cannot end")},
    };
    for (const auto& test : cases) {
        WideString name = WIDE_TEXT("left over"), error;
        EXPECT_FALSE(ExpandOutputName(test.pattern, Parts(WIDE_TEXT("S"), WIDE_TEXT("file1.lv")),
                                      name, error));
        EXPECT_EQ(0u, error.find(test.reasonStart))
            << std::string(error.begin(), error.end());
    }
    WideString name, error;
    EXPECT_FALSE(ExpandOutputName(WideString(300, WIDE_TEXT('x')),
                                  Parts(WIDE_TEXT("S"), WIDE_TEXT("file1.lv")), name, error));
}

}  // namespace
