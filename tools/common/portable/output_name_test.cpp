// Names of downloaded files from lvcopy's --name patterns.
#include <gtest/gtest.h>

#include "tools/common/portable/output_name.h"

namespace {

std::string Narrow(const WideString& text) {
    std::string narrow;
    for (const WideChar character : text)
        narrow.push_back(character < 0x80 ? static_cast<char>(character) : '?');
    return narrow;
}

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
            << Narrow(error);
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
            << Narrow(error);
    }
    WideString name, error;
    EXPECT_FALSE(ExpandOutputName(WideString(300, WIDE_TEXT('x')),
                                  Parts(WIDE_TEXT("S"), WIDE_TEXT("file1.lv")), name, error));
}

TEST(OutputName, OnlyNamesWindowsCanCreateInTheFolderPass) {
    const WideString longest(255, WIDE_TEXT('n'));
    const struct {
        WideString name;
        size_t folderLength;
        const WideChar* reasonStart;  // null: creatable
    } cases[] = {
        {WIDE_TEXT("file1.lv"), 3, nullptr},
        {WIDE_TEXT("_Aux.lv"), 3, nullptr},
        {longest, 3, nullptr},
        {longest + WIDE_TEXT("n"), 3, WIDE_TEXT("the name is longer than 255")},
        // With the folder and its backslash: 259 characters are the most a path has.
        {WIDE_TEXT("file1.lv"), kMaximumOutputPath - 9, nullptr},
        {WIDE_TEXT("file1.lv"), kMaximumOutputPath - 8, WIDE_TEXT("the name is too long for")},
        {WIDE_TEXT("a<b.lv"), 3, WIDE_TEXT("a file name cannot hold")},
        {WIDE_TEXT("a\x1f") WIDE_TEXT("b.lv"), 3, WIDE_TEXT("a file name cannot hold")},
        {WIDE_TEXT("file1."), 3, WIDE_TEXT("a file name cannot end")},
        {WIDE_TEXT("file1 "), 3, WIDE_TEXT("a file name cannot end")},
        {WIDE_TEXT("Aux.lv"), 3, WIDE_TEXT("\"Aux.lv\" is the device AUX")},
        {WIDE_TEXT("com\u00B3.hvr"), 3, WIDE_TEXT("\"com\u00B3.hvr\" is the device COM\u00B3")},
        {WIDE_TEXT(""), 3, WIDE_TEXT("the pattern names no file")},
    };
    for (const auto& test : cases) {
        WideString error = WIDE_TEXT("left over");
        const bool creatable = IsCreatableFileName(test.name, test.folderLength, error);
        EXPECT_EQ(test.reasonStart == nullptr, creatable) << Narrow(test.name);
        if (test.reasonStart) {
            EXPECT_EQ(0u, error.find(test.reasonStart)) << Narrow(error);
        } else {
            EXPECT_TRUE(error.empty()) << Narrow(error);
        }
    }
}

// A device that the station's name makes is the station's, with a way around it that works; one
// the pattern names whatever the station is the pattern's.
TEST(OutputName, DevicesAreRefusedAndTheRefusalSaysWhetherStationOrPatternMadeThem) {
    const struct {
        const WideChar* pattern;
        const WideChar* station;
        const WideChar* reasonStart;  // null: accepted
        const WideChar* expected;     // the name, when accepted
    } cases[] = {
        {WIDE_TEXT("{station}{ext}"), WIDE_TEXT("Aux"),
         WIDE_TEXT("the station's name \"Aux\" makes \"Aux.lv\", which Windows takes for the "
                   "device AUX"),
         nullptr},
        {WIDE_TEXT("{station}{ext}"), WIDE_TEXT("CON"), WIDE_TEXT("the station's name \"CON\""),
         nullptr},
        {WIDE_TEXT("{station}.{name}"), WIDE_TEXT("lpt\u00B9"),
         WIDE_TEXT("the station's name \"lpt\u00B9\""), nullptr},
        {WIDE_TEXT("_{station}{ext}"), WIDE_TEXT("Aux"), nullptr, WIDE_TEXT("_Aux.lv")},
        {WIDE_TEXT("{station} {date}{ext}"), WIDE_TEXT("CON"), nullptr,
         WIDE_TEXT("CON 2026-03-07.lv")},
        {WIDE_TEXT("NUL{ext}"), WIDE_TEXT("North"), WIDE_TEXT("the pattern names the device NUL"),
         nullptr},
        {WIDE_TEXT("COM\u00B2{ext}"), WIDE_TEXT("North"),
         WIDE_TEXT("the pattern names the device COM\u00B2"), nullptr},
        {WIDE_TEXT("aux {station}"), WIDE_TEXT(""), WIDE_TEXT("a file name cannot end"), nullptr},
    };
    for (const auto& test : cases) {
        WideString name, error;
        const bool accepted =
            ExpandOutputName(test.pattern, Parts(test.station, WIDE_TEXT("file1.lv")), name, error);
        EXPECT_EQ(test.reasonStart == nullptr, accepted) << Narrow(test.pattern);
        if (test.reasonStart) {
            EXPECT_EQ(0u, error.find(test.reasonStart)) << Narrow(error);
        } else {
            EXPECT_EQ(WideString(test.expected), name);
        }
    }
    // The way around that the refusal names is one the check accepts.
    WideString name, error;
    ASSERT_FALSE(ExpandOutputName(WIDE_TEXT("{station}{ext}"),
                                  Parts(WIDE_TEXT("Aux"), WIDE_TEXT("file1.lv")), name, error));
    EXPECT_NE(WideString::npos, error.find(WIDE_TEXT("\"_{station}{ext}\""))) << Narrow(error);
}

}  // namespace
