// The download journal: one CSV row per download attempt in "downloads.csv" of the download
// records, UTF-8 with a byte-order mark and a header row, rotated to "downloads.old.csv".
#pragma once

#include <windows.h>

#include <string>

#include "download/portable/journal_row.h"

constexpr wchar_t kJournalFileName[] = L"downloads.csv";
constexpr wchar_t kOldJournalFileName[] = L"downloads.old.csv";
// A journal that would grow past this is moved aside first.
constexpr ULONGLONG kJournalRotationBytes = 1024 * 1024;

// Appends the row to the journal in folder, making the file (mark and header) when it is missing
// or was moved aside. Processes that journal at once take turns through a named mutex, waited
// for a bounded time. A failure is logged and returned; it fails no download.
[[nodiscard]] HRESULT AppendJournalRow(const std::wstring& folder, const JournalRow& row) noexcept;
