// The station file as administrators write it and as export writes it: what reads back, the
// defaults of missing keys, the port warnings, and texts that only survive in quotes.
#include "stations/portable/station_file.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/portable/station_file_samples.h"

TEST(StationFile, ReadsWhatAnAdministratorWrites) {
    const std::string file =
        "\xEF\xBB\xBF; Site office, 2 stations\r\n"
        "\r\n"
        "  [North level]  \r\n"
        "# blanks around keys and values do not count; keys are compared as the registry does\n"
        "Port=COM3\r\n"
        "  baudrate =   4800\t\r\n"
        "Model = Quorvel LV-20\r\n"
        "Manufacturer = Quorvel; Bremen # a whole line is a comment, part of one is text\r\n"
        "Software = C:\\Survey\\lv.exe =2\r\n"
        "Parity = 0\r\n"
        "StopBits = 2\r\n"
        "DataBits = 0008\r\n"
        "Protocol = 3\r\n"
        "Flow = 2\r\n"
        "CheckSum = 0\r\n"
        "[ South ]\r\n"
        "Manufacturer =\r\n"
        "Software = last";  // the last line needs no line end
    const StationFileContents contents = Read(file);
    ASSERT_FALSE(contents.error) << ErrorText(contents);
    ASSERT_EQ(2u, contents.stations.size());

    // clang-format off
    const Station north = {.Name = WIDE_TEXT("North level"), .Port = WIDE_TEXT("COM3"),
        .Manufacturer =
            WIDE_TEXT("Quorvel; Bremen # a whole line is a comment, part of one is text"),
        .Model = WIDE_TEXT("Quorvel LV-20"), .Software = WIDE_TEXT("C:\\Survey\\lv.exe =2"),
        .BaudRate = 4800, .StopBits = 2, .Parity = 0, .Protocol = 3, .DataBits = 8, .Flow = 2,
        .CheckSum = 0};
    // clang-format on
    EXPECT_EQ(north, contents.stations[0].station);
    EXPECT_EQ(3u, contents.stations[0].line);

    // Missing keys take the store's defaults (pinned by what export writes for them, below); an
    // empty text is a text.
    Station south = Defaults(WIDE_TEXT("South"));
    south.Software = WIDE_TEXT("last");
    EXPECT_EQ(south, contents.stations[1].station);
    EXPECT_EQ(16u, contents.stations[1].line);
}

TEST(StationFile, WarnsOfEveryPortThisComputerDoesNotList) {
    const std::string file =
        "[Listed]\nPort = COM3\n"
        "[Elsewhere]\nBaudRate = 1200\nPort = COM9\n"
        "[Default port]\nBaudRate = 1200\n"
        "[Case differs]\nPort = com3\n";
    const StationFileContents contents = Read(file, Rules({WIDE_TEXT("COM3")}));
    ASSERT_FALSE(contents.error);
    EXPECT_EQ(4u, contents.stations.size()) << "a warning refuses nothing";
    ASSERT_EQ(3u, contents.warnings.size());
    const struct {
        size_t line;
        WideString station, port;
    } expected[] = {{5, WIDE_TEXT("Elsewhere"), WIDE_TEXT("COM9")},
                    {6, WIDE_TEXT("Default port"), WIDE_TEXT("COM1")},  // the line of its section
                    {9, WIDE_TEXT("Case differs"), WIDE_TEXT("com3")}};
    for (size_t i = 0; i < 3; ++i) {
        EXPECT_EQ(expected[i].line, contents.warnings[i].line);
        EXPECT_EQ(expected[i].station, contents.warnings[i].station);
        EXPECT_EQ(expected[i].port, contents.warnings[i].port);
    }
    EXPECT_EQ(4u, Read(file, Rules({})).warnings.size()) << "a computer without ports";
}

TEST(StationFile, WritesEveryValueByItsRegistryNameInTheStoresOrder) {
    Station station = Defaults(WIDE_TEXT("North"));
    station.Port = WIDE_TEXT("COM3");
    station.Manufacturer = WIDE_TEXT("Quorvel");
    const std::string written = WriteStationFile({{station, {}}});
    const std::string expected =
        "\r\n[North]\r\nPort = COM3\r\nBaudRate = 9600\r\nStopBits = 0\r\nParity = 2\r\n"
        "DataBits = 7\r\nManufacturer = Quorvel\r\nModel = Quorvel LV-10\r\nSoftware =\r\n"
        "Protocol = 1\r\nFlow = 0\r\nCheckSum = 1\r\n";
    ASSERT_GE(written.size(), expected.size());
    EXPECT_EQ(expected, written.substr(written.size() - expected.size()));
    EXPECT_EQ(';', written.front()) << "it opens with a comment that says what it is";
}

TEST(StationFile, LeavesOutTheValuesAStationKeyLacks) {
    const std::string written = WriteStationFile(
        {{Defaults(WIDE_TEXT("Half")), {StationField::kFlow, StationField::kPort}}});
    EXPECT_EQ(std::string::npos, written.find("Flow"));
    EXPECT_EQ(std::string::npos, written.find("Port"));
    EXPECT_NE(std::string::npos, written.find("CheckSum = 1"));
}

TEST(StationFile, EveryValidNameAndEveryTextComesBackExactly) {
    const WideString names[] = {
        WIDE_TEXT("North"),
        WIDE_TEXT("north"),  // names differing in case are two stations
        WIDE_TEXT(" blank at the start"),
        WIDE_TEXT("blank at the end "),
        WIDE_TEXT("   "),
        WIDE_TEXT("[in brackets]"),
        WIDE_TEXT("ends with ]"),
        WIDE_TEXT("; or # first"),
        WIDE_TEXT("tab\there"),
        WIDE_TEXT("Vermessung Süd"),
        WIDE_TEXT("a=b"),
        WideString(kMaximumStationTextLength, WideChar('n')),
    };
    const WideString texts[] = {
        WIDE_TEXT(""),
        WIDE_TEXT(" leading and trailing blanks "),
        WIDE_TEXT("\ttabs\tinside and at the ends\t"),
        WIDE_TEXT("\"starts with a quote"),
        WIDE_TEXT("ends with a quote\""),
        WIDE_TEXT("back\\slash \\t \\u0041 stays literal"),
        WIDE_TEXT("; looks like a comment"),
        WIDE_TEXT("# and so does this"),
        WIDE_TEXT("key = value"),
        WIDE_TEXT("[brackets]"),
        WIDE_TEXT("Grüße, Øst, 東京"),
        WIDE_TEXT("outside the BMP: \xD83D\xDCCF"),
        WIDE_TEXT("lone surrogates \xD800 and \xDFFF"),
        WIDE_TEXT("controls \x01\x1B\x7F\r\n line ends too"),
        WideString(kMaximumStationTextLength, WideChar('x')),
    };
    std::vector<StationFileSection> sections;
    for (const WideString& name : names)
        sections.push_back({Defaults(name), {}});
    for (const WideString& text : texts) {
        Station station = Defaults(WIDE_TEXT("Texts ") + WideString(sections.size(), '+'));
        station.Manufacturer = text;
        station.Software = text;
        station.Port = text;
        sections.push_back({station, {}});
    }
    const StationFileContents contents = Read(WriteStationFile(sections), Rules({}));
    ASSERT_FALSE(contents.error) << ErrorText(contents);
    ASSERT_EQ(sections.size(), contents.stations.size());
    for (size_t i = 0; i < sections.size(); ++i)
        EXPECT_EQ(sections[i].station, contents.stations[i].station) << "section " << i;
}

TEST(StationFile, QuotedTextsReadAsAdministratorsWriteThem) {
    const struct {
        const char* written;
        WideString text;
    } cases[] = {
        {"\"  padded  \"", WIDE_TEXT("  padded  ")},
        {"\"say \\\"hi\\\"\"", WIDE_TEXT("say \"hi\"")},
        {"\"C:\\\\Survey\"", WIDE_TEXT("C:\\Survey")},
        {"\"a\\tb\"", WIDE_TEXT("a\tb")},
        {"\"\\u00e9\\u00C9\"", WIDE_TEXT("éÉ")},
        {"\"\"", WIDE_TEXT("")},
        {"mid \"quote\" stays", WIDE_TEXT("mid \"quote\" stays")},
    };
    for (const auto& test : cases) {
        const StationFileContents contents =
            Read(std::string("[A]\nSoftware = ") + test.written + "\n");
        ASSERT_FALSE(contents.error) << test.written;
        EXPECT_EQ(test.text, contents.stations[0].station.Software) << test.written;
    }
}

TEST(StationFile, ACutFileNeverChangesTheStationsBeforeTheCut) {
    std::vector<StationFileSection> sections;
    for (const WideChar* name : {WIDE_TEXT("First"), WIDE_TEXT("Second"), WIDE_TEXT("Third")}) {
        Station station = Defaults(name);
        station.BaudRate = 2400;
        station.Software = WIDE_TEXT("\"quoted\" text");
        sections.push_back({station, {}});
    }
    const std::string whole = WriteStationFile(sections);
    for (size_t cut = 0; cut < whole.size(); ++cut) {
        const StationFileContents contents = Read(whole.substr(0, cut));
        if (contents.error)
            continue;
        // Only the last station read may be cut short, and only in a value that still reads.
        ASSERT_LE(contents.stations.size(), sections.size()) << cut;
        for (size_t i = 0; i + 1 < contents.stations.size(); ++i)
            EXPECT_EQ(sections[i].station, contents.stations[i].station) << "cut at " << cut;
        EXPECT_EQ(sections[contents.stations.size() - 1].station.Name,
                  contents.stations.back().station.Name);
    }
    // Cut right after a section's name, the half section is refused.
    const size_t afterHeader = whole.find("[Third]\r\n") + 9;
    EXPECT_EQ(StationFileProblem::kEmptySection,
              Read(whole.substr(0, afterHeader)).error.value().problem);
}

TEST(StationFile, DescribesAnErrorByLineAndField) {
    const StationFileContents contents = Read("[A]\n\nBaudRate = 28800\n");
    ASSERT_TRUE(contents.error);
    EXPECT_EQ(WIDE_TEXT("line 3, BaudRate: 28800 is not one of the baud rates 300, 600, 1200, "
                        "2400, 4800, 9600, 14400, 19200, 38400, 57600, 115200"),
              DescribeStationFileError(*contents.error));
    EXPECT_EQ(WIDE_TEXT("the file is UTF-16 text; save it as UTF-8"),
              DescribeStationFileError(*Read(std::string("\xFF\xFE[\0A\0]\0", 8)).error));
}
