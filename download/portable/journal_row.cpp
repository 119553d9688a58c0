// The download journal's rows as CSV in UTF-8.
#include "download/portable/journal_row.h"

#include <cstdio>
#include <cstdlib>

namespace {

constexpr char32_t kReplacementCharacter = 0xFFFD;

void AppendUtf8(std::string& out, char32_t code) {
    if (code < 0x80) {
        out.push_back(static_cast<char>(code));
    } else if (code < 0x800) {
        out.push_back(static_cast<char>(0xC0 | (code >> 6)));
        out.push_back(static_cast<char>(0x80 | (code & 0x3F)));
    } else if (code < 0x10000) {
        out.push_back(static_cast<char>(0xE0 | (code >> 12)));
        out.push_back(static_cast<char>(0x80 | ((code >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (code & 0x3F)));
    } else {
        out.push_back(static_cast<char>(0xF0 | (code >> 18)));
        out.push_back(static_cast<char>(0x80 | ((code >> 12) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | ((code >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (code & 0x3F)));
    }
}

const char* ResultName(JournalResult result) noexcept {
    switch (result) {
        case JournalResult::Ok:
            return "ok";
        case JournalResult::Cancelled:
            return "cancelled";
        case JournalResult::Failed:
            break;
    }
    return "failed";
}

std::string ParityName(uint32_t parity) {
    switch (parity) {
        case 0:
            return "none";
        case 1:
            return "odd";
        case 2:
            return "even";
        default:
            return std::to_string(parity);  // a stored value the sheet does not offer, as it is
    }
}

const char* ProcedureName(JournalProcedure procedure) noexcept {
    return procedure == JournalProcedure::Library ? "library" : "line";
}

}  // namespace

std::string Utf8FromWide(WideStringView text) {
    std::string out;
    out.reserve(text.size());
    for (size_t index = 0; index < text.size(); ++index) {
        const char32_t unit = text[index];
        if (unit >= 0xD800 && unit <= 0xDBFF && index + 1 < text.size() &&
            text[index + 1] >= 0xDC00 && text[index + 1] <= 0xDFFF) {
            const char32_t low = text[++index];
            AppendUtf8(out, 0x10000 + ((unit - 0xD800) << 10) + (low - 0xDC00));
        } else if (unit >= 0xD800 && unit <= 0xDFFF) {
            AppendUtf8(out, kReplacementCharacter);
        } else {
            AppendUtf8(out, unit);
        }
    }
    return out;
}

std::string CsvField(std::string_view text) {
    if (text.find_first_of(",\"\r\n") == std::string_view::npos)
        return std::string(text);
    std::string quoted = "\"";
    for (const char c : text) {
        if (c == '"')
            quoted.push_back('"');
        quoted.push_back(c);
    }
    quoted.push_back('"');
    return quoted;
}

std::string FormatJournalTime(const LocalDateTime& time) {
    const int offset = std::abs(time.OffsetMinutes);
    char text[64];
    std::snprintf(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:%02d%c%02d:%02d", time.Year,
                  time.Month, time.Day, time.Hour, time.Minute, time.Second,
                  time.OffsetMinutes < 0 ? '-' : '+', offset / 60, offset % 60);
    return text;
}

std::string JournalHeader() {
    return "start,station,port,baud,parity,model,procedure,bytes,seconds,result,message,"
           "kept file\r\n";
}

std::string FormatJournalRow(const JournalRow& row) {
    char seconds[32];
    std::snprintf(seconds, sizeof seconds, "%.1f", row.Seconds < 0 ? 0.0 : row.Seconds);
    const std::string fields[] = {
        FormatJournalTime(row.Start),
        CsvField(Utf8FromWide(row.Station)),
        CsvField(Utf8FromWide(row.Port)),
        std::to_string(row.Baud),
        ParityName(row.Parity),
        CsvField(Utf8FromWide(row.Model)),
        CsvField(ProcedureName(row.Procedure)),
        std::to_string(row.Bytes),
        seconds,
        ResultName(row.Result),
        CsvField(Utf8FromWide(row.Message)),
        CsvField(Utf8FromWide(row.KeptFile)),
    };
    std::string line;
    for (const std::string& field : fields) {
        if (!line.empty())
            line.push_back(',');
        line += field;
    }
    return line + "\r\n";
}
