// Station files that must be refused whole: each names the problem, the line and the field, and
// hands on no station at all, not even the good ones before the fault.
#include <gtest/gtest.h>

#include <string>

#include "tests/portable/station_file_samples.h"

namespace {

using enum StationFileProblem;

// A good station first, so that a refusal is seen to drop it too.
const std::string kGood = "[Good]\nPort = COM1\n";  // lines 1 and 2

struct Refusal {
    const char* rule;
    std::string file;
    StationFileProblem problem;
    size_t line;
    WideString field;
};

void ExpectRefused(const Refusal& test) {
    const StationFileContents contents = Read(test.file);
    ASSERT_TRUE(contents.error) << test.rule;
    EXPECT_EQ(test.problem, contents.error->problem) << test.rule;
    EXPECT_EQ(test.line, contents.error->line) << test.rule;
    EXPECT_EQ(test.field, contents.error->field) << test.rule;
    EXPECT_FALSE(contents.error->reason.empty()) << test.rule;
    EXPECT_TRUE(contents.stations.empty()) << test.rule;
    EXPECT_TRUE(contents.warnings.empty()) << test.rule;
}

// A refusal of line 3, the line after kGood: of the key it writes, or of the name of the
// section it opens.
Refusal OfKey(const char* rule, const std::string& line, StationFileProblem problem) {
    const std::string key = line.substr(0, line.find(" ="));
    return {rule, kGood + line + "\n", problem, 3, WideString(key.begin(), key.end())};
}
Refusal OfName(const char* rule, const std::string& line, StationFileProblem problem) {
    return {rule, kGood + line + "\n", problem, 3, WIDE_TEXT("Name")};
}

std::string Sections(size_t count) {
    std::string file;
    for (size_t i = 0; i < count; ++i)
        file += "[Station " + std::to_string(i) + "]\nPort = COM1\n";
    return file;
}

const WideString kNone;
const WideString kName = WIDE_TEXT("Name");

}  // namespace

TEST(StationFileRefusals, WrongSizeOrEncoding) {
    std::string tooLarge = kGood;
    tooLarge.resize(kMaximumStationFileSize + 1, '\n');
    std::string largest = kGood;
    largest.resize(kMaximumStationFileSize, '\n');
    EXPECT_FALSE(Read(largest).error) << "the limit itself is allowed";

    const Refusal cases[] = {
        {"more than 1 MiB", tooLarge, kTooLarge, 0, kNone},
        {"UTF-16 little-endian", std::string("\xFF\xFE[\0A\0]\0", 8), kUtf16, 0, kNone},
        {"UTF-16 big-endian", std::string("\xFE\xFF\0[\0A\0]", 8), kUtf16, 0, kNone},
        {"UTF-16 without a mark: NUL bytes", std::string("[\0A\0]\0", 6), kControlCharacter, 1,
         kNone},
        {"a stray continuation byte", kGood + "Software = \x80\n", kInvalidUtf8, 3, kNone},
        {"Latin-1 text", kGood + "Software = Gr\xFC\xDF!\n", kInvalidUtf8, 3, kNone},
        {"an overlong slash", kGood + "[a\xC0\xAF]\n", kInvalidUtf8, 3, kNone},
        {"an encoded surrogate", kGood + "Software = \xED\xA0\x80\n", kInvalidUtf8, 3, kNone},
        {"beyond U+10FFFF", kGood + "Software = \xF4\x90\x80\x80\n", kInvalidUtf8, 3, kNone},
        {"a sequence cut by the end of the file", kGood + "Software = \xE2\x82", kInvalidUtf8, 3,
         kNone},
        {"a sequence cut by the end of its line", kGood + "Software = \xE2\n\x82\xAC\n",
         kInvalidUtf8, 3, kNone},
        {"a lone CR inside a line", kGood + "Software = a\rb\n", kControlCharacter, 3, kNone},
        {"an escape character", kGood + "Software = \x1B[0m\n", kControlCharacter, 3, kNone},
        {"a UTF-8 mark not at the start", kGood + "\xEF\xBB\xBF[B]\nPort = COM1\n", kBadLine, 3,
         kNone},
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
}

TEST(StationFileRefusals, WrongStructure) {
    const Refusal cases[] = {
        {"an empty file", "", kNoStations, 0, kNone},
        {"only a UTF-8 mark", "\xEF\xBB\xBF", kNoStations, 0, kNone},
        {"only comments and blanks", "; nothing\n\n  # here\n\t\n", kNoStations, 0, kNone},
        {"a value before any section", "Port = COM1\n" + kGood, kValueOutsideSection, 1,
         WIDE_TEXT("Port")},
        {"a line that is nothing", kGood + "Port COM3\n", kBadLine, 3, kNone},
        OfName("an unclosed section", "[North\nPort = COM1", kBadSection),
        OfName("text after a section's ]", "[North] ; note", kBadSection),
        OfName("an empty section in the middle", "[Empty]\n; nothing\n[Next]\nPort = COM1",
               kEmptySection),
        OfName("a half section at the end", "[Cut]", kEmptySection),
        {"a half section without a line end", kGood + "[Cut]", kEmptySection, 3, kName},
        {"the same section twice", kGood + "[North]\nPort = COM1\n[Good]\nPort = COM1\n",
         kDuplicateSection, 5, kName},
        OfKey("an unknown key", "Speed = 9600", kUnknownKey),
        {"a key that is not written", kGood + " = 9600\n", kUnknownKey, 3, kNone},
        {"the name as a key", kGood + "Name = Other\n", kUnknownKey, 3, kName},
        OfKey("a key twice", "Port = COM3", kDuplicateKey),
        {"a key twice in other letter case", kGood + "PORT = COM3\n", kDuplicateKey, 3,
         WIDE_TEXT("Port")},
        {"more than 1000 stations", Sections(kMaximumStationsInFile + 1), kTooManyStations,
         2 * kMaximumStationsInFile + 1, kNone},
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
    EXPECT_FALSE(Read(Sections(kMaximumStationsInFile)).error) << "the limit itself is allowed";
}

TEST(StationFileRefusals, WrongNumbers) {
    const Refusal cases[] = {
        OfKey("empty", "BaudRate =", kNotANumber),
        OfKey("words", "BaudRate = fast", kNotANumber),
        OfKey("a unit", "BaudRate = 9600 baud", kNotANumber),
        OfKey("a blank inside", "BaudRate = 96 00", kNotANumber),
        OfKey("a sign", "BaudRate = +9600", kNotANumber),
        OfKey("negative", "Parity = -1", kNotANumber),
        OfKey("hexadecimal", "BaudRate = 0x2580", kNotANumber),
        OfKey("quoted", "BaudRate = \"9600\"", kNotANumber),
        OfKey("full-width digits", "BaudRate = \xEF\xBC\x99", kNotANumber),
        OfKey("2^32", "BaudRate = 4294967296", kNumberTooLarge),
        OfKey("far beyond 64 bits", "Flow = 184467440737095516160", kNumberTooLarge),
        OfKey("2^32 - 1", "CheckSum = 4294967295", kRefusedValue),
        OfKey("a baud rate that is not standard", "BaudRate = 28800", kRefusedValue),
        OfKey("data bits 9", "DataBits = 9", kRefusedValue),
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
}

TEST(StationFileRefusals, WrongTexts) {
    const std::string tooLong(kMaximumStationTextLength + 1, 'x');
    const Refusal cases[] = {
        OfName("a backslash in a name", "[North\\South]", kRefusedValue),
        OfName("a slash in a name", "[North/South]", kRefusedValue),
        OfName("a double quote in a name", "[North \"7\"]", kRefusedValue),
        OfName("an escaped double quote in a name", "[\"a\\\"b\"]", kRefusedValue),
        OfName("an asterisk in a name", "[North*]", kRefusedValue),
        OfName("an empty name", "[]", kRefusedValue),
        OfName("a name of blanks only, unquoted", "[   ]", kRefusedValue),
        {"a name the store could not read back", kGood + "[" + tooLong + "]\n", kRefusedValue, 3,
         kName},
        {"a text the store could not read back", kGood + "Software = " + tooLong + "\n",
         kRefusedValue, 3, WIDE_TEXT("Software")},
        OfKey("a NUL in a text", "Manufacturer = \"a\\u0000b\"", kRefusedValue),
        OfKey("an unknown model", "Model = Quorvel LV-40", kRefusedValue),
        {"a model cut short", kGood + "Model = Quorvel LV-", kRefusedValue, 3, WIDE_TEXT("Model")},
        OfKey("an unclosed quote", "Software = \"abc", kBadText),
        OfKey("a lone quote", "Software = \"", kBadText),
        OfKey("text after the closing quote", "Software = \"a\" b", kBadText),
        OfKey("an unknown escape", "Software = \"a\\nb\"", kBadText),
        OfKey("a short \\u escape", "Software = \"\\u12\"", kBadText),
        OfKey("a \\u escape that is not hexadecimal", "Software = \"\\u12G4\"", kBadText),
        OfName("an unclosed quoted name", "[\"North]", kBadText),
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
}
