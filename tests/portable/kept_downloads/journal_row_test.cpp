// The download journal's CSV rows: quoting, UTF-8, time with offset, the column values.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "download/portable/journal_row.h"

namespace {

#define W(text) WIDE_TEXT(text)

// An RFC 4180 reader of one record, as a spreadsheet reads it back.
std::vector<std::string> ReadRecord(const std::string& line) {
    std::vector<std::string> fields(1);
    bool quoted = false;
    for (size_t index = 0; index < line.size(); ++index) {
        const char c = line[index];
        if (quoted) {
            if (c == '"' && index + 1 < line.size() && line[index + 1] == '"') {
                fields.back().push_back('"');
                ++index;
            } else if (c == '"') {
                quoted = false;
            } else {
                fields.back().push_back(c);
            }
        } else if (c == '"') {
            quoted = true;
        } else if (c == ',') {
            fields.emplace_back();
        } else if (c == '\r' && line.substr(index) == "\r\n") {
            return fields;
        } else {
            fields.back().push_back(c);
        }
    }
    ADD_FAILURE() << "no record end";
    return fields;
}

TEST(JournalRow, FieldsReadBackAsWrittenWhateverTheyHold) {
    const WideString texts[] = {
        W("plain"), W("a,b"), W("say \"hi\""), W("two\r\nlines"),    W("line\nfeed"),
        W("\"\""),  W(""),    W(",\","),       W("Gr\u00FC\u00DFe"),
    };
    for (const WideString& text : texts) {
        SCOPED_TRACE(Utf8FromWide(text));
        JournalRow row;
        row.Station = text;
        row.Message = text;
        row.KeptFile = text;
        const std::vector<std::string> fields = ReadRecord(FormatJournalRow(row));
        ASSERT_EQ(12u, fields.size());
        EXPECT_EQ(Utf8FromWide(text), fields[1]);
        EXPECT_EQ(Utf8FromWide(text), fields[10]);
        EXPECT_EQ(Utf8FromWide(text), fields[11]);
    }
    EXPECT_EQ(12u, ReadRecord(JournalHeader()).size());
}

TEST(JournalRow, ColumnsInOrder) {
    JournalRow row;
    row.Start = {2026, 11, 26, 4, 5, 6, 60};
    row.Station = W("North");
    row.Port = W("COM7");
    row.Baud = 9600;
    row.Parity = 2;
    row.Model = W("Quorvel LV-10");
    row.Bytes = 6144;
    row.Seconds = 12.34;
    row.Result = JournalResult::Cancelled;
    row.Message = W("stopped");
    row.KeptFile = W("C:\\k\\a.lv");
    EXPECT_EQ(
        "2026-11-26T04:05:06+01:00,North,COM7,9600,even,Quorvel LV-10,line,6144,12.3,"
        "cancelled,stopped,C:\\k\\a.lv\r\n",
        FormatJournalRow(row));
    row.Result = JournalResult::Ok;
    row.Parity = 7;  // stored but never offered: shown as stored
    row.Procedure = JournalProcedure::Library;
    const std::vector<std::string> fields = ReadRecord(FormatJournalRow(row));
    EXPECT_EQ("7", fields[4]);
    EXPECT_EQ("library", fields[6]);
    EXPECT_EQ("ok", fields[9]);
    row.Result = JournalResult::Failed;
    EXPECT_EQ("failed", ReadRecord(FormatJournalRow(row))[9]);
}

TEST(JournalRow, TimeCarriesItsOffset) {
    struct Case {
        LocalDateTime time;
        const char* expected;
    } const cases[] = {
        {{2026, 1, 2, 3, 4, 5, 0}, "2026-01-02T03:04:05+00:00"},
        {{2026, 1, 2, 3, 4, 5, 330}, "2026-01-02T03:04:05+05:30"},
        {{2026, 1, 2, 3, 4, 5, -210}, "2026-01-02T03:04:05-03:30"},
        {{2026, 1, 2, 3, 4, 5, -600}, "2026-01-02T03:04:05-10:00"},
    };
    for (const Case& test : cases)
        EXPECT_EQ(test.expected, FormatJournalTime(test.time));
}

TEST(Utf8FromWide, EncodesEveryPlaneAndReplacesLoneSurrogates) {
    const WideChar pair[] = {0xD83D, 0xDCCF};
    EXPECT_EQ("\xF0\x9F\x93\x8F", Utf8FromWide(WideStringView(pair, 2)));
    EXPECT_EQ("a\xC3\xA9\xE2\x82\xAC", Utf8FromWide(W("a\u00E9\u20AC")));
    const WideChar lone[] = {W('a'), 0xD83D, W('b'), 0xDCCF};
    EXPECT_EQ(
        "a\xEF\xBF\xBD"
        "b\xEF\xBF\xBD",
        Utf8FromWide(WideStringView(lone, 4)));
}

}  // namespace
