// Station files that must be refused whole: each names the problem, the line and the field, and
// hands on no station at all, not even the good ones before the fault.
#include <gtest/gtest.h>

#include <string>

#include "tests/portable/station_file_samples.h"

namespace {

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
        {"more than 1 MiB", tooLarge, StationFileProblem::kTooLarge, 0, kNone},
        {"UTF-16 little-endian", std::string("\xFF\xFE[\0A\0]\0", 8), StationFileProblem::kUtf16, 0,
         kNone},
        {"UTF-16 big-endian", std::string("\xFE\xFF\0[\0A\0]", 8), StationFileProblem::kUtf16, 0,
         kNone},
        {"UTF-16 without a mark: NUL bytes", std::string("[\0A\0]\0", 6),
         StationFileProblem::kControlCharacter, 1, kNone},
        {"a stray continuation byte", kGood + "Software = \x80\n", StationFileProblem::kInvalidUtf8,
         3, kNone},
        {"Latin-1 text", kGood + "Software = Gr\xFC\xDF!\n", StationFileProblem::kInvalidUtf8, 3,
         kNone},
        {"an overlong slash", kGood + "[a\xC0\xAF]\n", StationFileProblem::kInvalidUtf8, 3, kNone},
        {"an encoded surrogate", kGood + "Software = \xED\xA0\x80\n",
         StationFileProblem::kInvalidUtf8, 3, kNone},
        {"beyond U+10FFFF", kGood + "Software = \xF4\x90\x80\x80\n",
         StationFileProblem::kInvalidUtf8, 3, kNone},
        {"a sequence cut by the end of the file", kGood + "Software = \xE2\x82",
         StationFileProblem::kInvalidUtf8, 3, kNone},
        {"a sequence cut by the end of its line", kGood + "Software = \xE2\n\x82\xAC\n",
         StationFileProblem::kInvalidUtf8, 3, kNone},
        {"a lone CR inside a line", kGood + "Software = a\rb\n",
         StationFileProblem::kControlCharacter, 3, kNone},
        {"an escape character", kGood + "Software = \x1B[0m\n",
         StationFileProblem::kControlCharacter, 3, kNone},
        {"a UTF-8 mark not at the start", kGood + "\xEF\xBB\xBF[B]\nPort = COM1\n",
         StationFileProblem::kBadLine, 3, kNone},
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
}

TEST(StationFileRefusals, WrongStructure) {
    const Refusal cases[] = {
        {"an empty file", "", StationFileProblem::kNoStations, 0, kNone},
        {"only a UTF-8 mark", "\xEF\xBB\xBF", StationFileProblem::kNoStations, 0, kNone},
        {"only comments and blanks", "; nothing\n\n  # here\n\t\n", StationFileProblem::kNoStations,
         0, kNone},
        {"a value before any section", "Port = COM1\n" + kGood,
         StationFileProblem::kValueOutsideSection, 1, WIDE_TEXT("Port")},
        {"a line that is nothing", kGood + "Port COM3\n", StationFileProblem::kBadLine, 3, kNone},
        {"an unclosed section", kGood + "[North\nPort = COM1\n", StationFileProblem::kBadSection, 3,
         kName},
        {"text after a section's ]", kGood + "[North] ; note\n", StationFileProblem::kBadSection, 3,
         kName},
        {"an empty section in the middle", kGood + "[Empty]\n; nothing\n[Next]\nPort = COM1\n",
         StationFileProblem::kEmptySection, 3, kName},
        {"a half section at the end", kGood + "[Cut]\n", StationFileProblem::kEmptySection, 3,
         kName},
        {"a half section without a line end", kGood + "[Cut]", StationFileProblem::kEmptySection, 3,
         kName},
        {"the same section twice", kGood + "[North]\nPort = COM1\n[Good]\nPort = COM1\n",
         StationFileProblem::kDuplicateSection, 5, kName},
        {"an unknown key", kGood + "Speed = 9600\n", StationFileProblem::kUnknownKey, 3,
         WIDE_TEXT("Speed")},
        {"a key that is not written", kGood + " = 9600\n", StationFileProblem::kUnknownKey, 3,
         kNone},
        {"the name as a key", kGood + "Name = Other\n", StationFileProblem::kUnknownKey, 3, kName},
        {"a key twice", kGood + "Port = COM3\n", StationFileProblem::kDuplicateKey, 3,
         WIDE_TEXT("Port")},
        {"a key twice in other letter case", kGood + "PORT = COM3\n",
         StationFileProblem::kDuplicateKey, 3, WIDE_TEXT("Port")},
        {"more than 1000 stations", Sections(kMaximumStationsInFile + 1),
         StationFileProblem::kTooManyStations, 2 * kMaximumStationsInFile + 1, kNone},
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
    EXPECT_FALSE(Read(Sections(kMaximumStationsInFile)).error) << "the limit itself is allowed";
}

TEST(StationFileRefusals, WrongNumbers) {
    const WideString baud = WIDE_TEXT("BaudRate");
    const Refusal cases[] = {
        {"empty", kGood + "BaudRate =\n", StationFileProblem::kNotANumber, 3, baud},
        {"words", kGood + "BaudRate = fast\n", StationFileProblem::kNotANumber, 3, baud},
        {"a unit", kGood + "BaudRate = 9600 baud\n", StationFileProblem::kNotANumber, 3, baud},
        {"a blank inside", kGood + "BaudRate = 96 00\n", StationFileProblem::kNotANumber, 3, baud},
        {"a sign", kGood + "BaudRate = +9600\n", StationFileProblem::kNotANumber, 3, baud},
        {"negative", kGood + "Parity = -1\n", StationFileProblem::kNotANumber, 3,
         WIDE_TEXT("Parity")},
        {"hexadecimal", kGood + "BaudRate = 0x2580\n", StationFileProblem::kNotANumber, 3, baud},
        {"quoted", kGood + "BaudRate = \"9600\"\n", StationFileProblem::kNotANumber, 3, baud},
        {"full-width digits", kGood + "BaudRate = \xEF\xBC\x99\n", StationFileProblem::kNotANumber,
         3, baud},
        {"2^32", kGood + "BaudRate = 4294967296\n", StationFileProblem::kNumberTooLarge, 3, baud},
        {"far beyond 64 bits", kGood + "Flow = 184467440737095516160\n",
         StationFileProblem::kNumberTooLarge, 3, WIDE_TEXT("Flow")},
        {"2^32 - 1", kGood + "CheckSum = 4294967295\n", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("CheckSum")},
        {"a baud rate the sheet does not offer", kGood + "BaudRate = 19200\n",
         StationFileProblem::kRefusedValue, 3, baud},
        {"baud rate 0", kGood + "BaudRate = 0\n", StationFileProblem::kRefusedValue, 3, baud},
        {"parity 3", kGood + "Parity = 3\n", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("Parity")},
        {"stop bits 3", kGood + "StopBits = 3\n", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("StopBits")},
        {"data bits 4", kGood + "DataBits = 4\n", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("DataBits")},
        {"data bits 9", kGood + "DataBits = 9\n", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("DataBits")},
        {"protocol 4", kGood + "Protocol = 4\n", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("Protocol")},
        {"flow 3", kGood + "Flow = 3\n", StationFileProblem::kRefusedValue, 3, WIDE_TEXT("Flow")},
        {"checksum 2", kGood + "CheckSum = 2\n", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("CheckSum")},
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
}

TEST(StationFileRefusals, WrongTexts) {
    const std::string tooLong(kMaximumStationTextLength + 1, 'x');
    const Refusal cases[] = {
        {"a backslash in a name", kGood + "[North\\South]\n", StationFileProblem::kRefusedValue, 3,
         kName},
        {"a slash in a name", kGood + "[North/South]\n", StationFileProblem::kRefusedValue, 3,
         kName},
        {"a double quote in a name", kGood + "[North \"7\"]\n", StationFileProblem::kRefusedValue,
         3, kName},
        {"an escaped double quote in a name", kGood + "[\"a\\\"b\"]\n",
         StationFileProblem::kRefusedValue, 3, kName},
        {"an asterisk in a name", kGood + "[North*]\n", StationFileProblem::kRefusedValue, 3,
         kName},
        {"an empty name", kGood + "[]\n", StationFileProblem::kRefusedValue, 3, kName},
        {"a name of blanks only, unquoted", kGood + "[   ]\n", StationFileProblem::kRefusedValue, 3,
         kName},
        {"a name the store could not read back", kGood + "[" + tooLong + "]\n",
         StationFileProblem::kRefusedValue, 3, kName},
        {"a text the store could not read back", kGood + "Software = " + tooLong + "\n",
         StationFileProblem::kRefusedValue, 3, WIDE_TEXT("Software")},
        {"a NUL in a text", kGood + "Manufacturer = \"a\\u0000b\"\n",
         StationFileProblem::kRefusedValue, 3, WIDE_TEXT("Manufacturer")},
        {"an unknown model", kGood + "Model = Quorvel LV-40\n", StationFileProblem::kRefusedValue,
         3, WIDE_TEXT("Model")},
        {"a model in other letter case", kGood + "Model = quorvel lv-10\n",
         StationFileProblem::kRefusedValue, 3, WIDE_TEXT("Model")},
        {"a model cut short", kGood + "Model = Quorvel LV-", StationFileProblem::kRefusedValue, 3,
         WIDE_TEXT("Model")},
        {"an unclosed quote", kGood + "Software = \"abc\n", StationFileProblem::kBadText, 3,
         WIDE_TEXT("Software")},
        {"a lone quote", kGood + "Software = \"\n", StationFileProblem::kBadText, 3,
         WIDE_TEXT("Software")},
        {"text after the closing quote", kGood + "Software = \"a\" b\n",
         StationFileProblem::kBadText, 3, WIDE_TEXT("Software")},
        {"an unknown escape", kGood + "Software = \"a\\nb\"\n", StationFileProblem::kBadText, 3,
         WIDE_TEXT("Software")},
        {"a short \\u escape", kGood + "Software = \"\\u12\"\n", StationFileProblem::kBadText, 3,
         WIDE_TEXT("Software")},
        {"a \\u escape that is not hexadecimal", kGood + "Software = \"\\u12G4\"\n",
         StationFileProblem::kBadText, 3, WIDE_TEXT("Software")},
        {"an unclosed quoted name", kGood + "[\"North]\n", StationFileProblem::kBadText, 3, kName},
    };
    for (const Refusal& test : cases)
        ExpectRefused(test);
}
