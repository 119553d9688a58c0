// The download journal's rows as CSV (RFC 4180) in UTF-8, without I/O.
#pragma once

#include <cstdint>
#include <string>

#include "download/portable/local_date_time.h"
#include "support/portable/wide_text.h"

enum class JournalResult { Ok, Cancelled, Failed };

// How the data came: the built-in driver always receives with the line protocol, whatever
// selector the station stores; the LV-20 and LV-30 go through the maker's library.
enum class JournalProcedure { Line, Library };

struct JournalRow {
    LocalDateTime Start;
    WideString Station;
    WideString Port;
    uint32_t Baud = 0;
    uint32_t Parity = 0;  // the station's stored code: 0 none, 1 odd, 2 even
    WideString Model;
    JournalProcedure Procedure = JournalProcedure::Line;
    uint64_t Bytes = 0;
    double Seconds = 0;
    JournalResult Result = JournalResult::Failed;
    WideString Message;
    WideString KeptFile;
};

// The header row, CRLF-terminated.
[[nodiscard]] std::string JournalHeader();

// One row, CRLF-terminated; fields with a comma, a quote or a line break are quoted, quotes
// doubled.
[[nodiscard]] std::string FormatJournalRow(const JournalRow& row);

// "2026-03-01T14:05:09+01:00"
[[nodiscard]] std::string FormatJournalTime(const LocalDateTime& time);

// UTF-16 to UTF-8; a lone surrogate becomes U+FFFD.
[[nodiscard]] std::string Utf8FromWide(WideStringView text);

// One CSV field, quoted when it must be.
[[nodiscard]] std::string CsvField(std::string_view text);
