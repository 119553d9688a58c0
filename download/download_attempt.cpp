// One download attempt: its kept copy and its journal row.
#include "download/download_attempt.h"

#include "download/download_journal.h"
#include "download/download_records_folder.h"
#include "download/kept_downloads.h"
#include "stations/station_models.h"
#include "support/error_handling.h"
#include "support/module_instance.h"

namespace {

constexpr LONGLONG kFileTimeUnitsPerMinute = 60LL * 10000000;
constexpr double kMillisecondsPerSecond = 1000.0;

LocalDateTime LocalJournalTime(const FILETIME& utc) noexcept {
    FILETIME local{};
    SYSTEMTIME parts{};
    if (!::FileTimeToLocalFileTime(&utc, &local) || !::FileTimeToSystemTime(&local, &parts))
        return {};
    ULARGE_INTEGER utcValue{{utc.dwLowDateTime, utc.dwHighDateTime}};
    ULARGE_INTEGER localValue{{local.dwLowDateTime, local.dwHighDateTime}};
    const LONGLONG offset = static_cast<LONGLONG>(localValue.QuadPart - utcValue.QuadPart);
    return {parts.wYear,
            parts.wMonth,
            parts.wDay,
            parts.wHour,
            parts.wMinute,
            parts.wSecond,
            static_cast<int>(offset / kFileTimeUnitsPerMinute)};
}

JournalResult ResultOf(HRESULT result) noexcept {
    if (result == S_OK)
        return JournalResult::Ok;
    return result == S_FALSE ? JournalResult::Cancelled : JournalResult::Failed;
}

uint64_t WrittenBytes(const DownloadTarget* target) noexcept {
    WIN32_FILE_ATTRIBUTE_DATA data{};
    if (!target || !*target ||
        !::GetFileAttributesExW(target->WrittenFile().c_str(), GetFileExInfoStandard, &data))
        return 0;
    return (static_cast<uint64_t>(data.nFileSizeHigh) << 32) | data.nFileSizeLow;
}

// The system's text for a result, line breaks and all (the CSV quotes them).
std::wstring ResultText(HRESULT result) {
    std::wstring text = SystemResultText(result);
    while (!text.empty() && (text.back() == L'\n' || text.back() == L'\r' || text.back() == L' '))
        text.pop_back();
    return text;
}

}  // namespace

DownloadAttempt::DownloadAttempt(const Station& station) noexcept : station_(station) {
    ::GetSystemTimeAsFileTime(&startUtc_);
    startTicks_ = ::GetTickCount64();
}

void DownloadAttempt::Finish(HRESULT result, const DownloadTarget* target,
                             const std::wstring& shownFailure) noexcept {
    try {
        JournalRow row;
        row.Start = LocalJournalTime(startUtc_);
        row.Station = station_.Name;
        row.Port = station_.Port;
        row.Baud = station_.BaudRate;
        row.Parity = station_.Parity;
        row.Model = station_.Model;
        row.Procedure = IsExternalLibraryModel(station_.Model) ? JournalProcedure::Library
                                                               : JournalProcedure::Line;
        row.Bytes = WrittenBytes(target);
        row.Seconds =
            static_cast<double>(::GetTickCount64() - startTicks_) / kMillisecondsPerSecond;
        row.Result = ResultOf(result);
        if (result != S_OK && !shownFailure.empty()) {
            row.Result = JournalResult::Failed;
            row.Message = shownFailure;
        } else if (FAILED(result)) {
            row.Message = ResultText(result);
        }

        if (result == S_OK && target && *target) {
            SYSTEMTIME completed{};
            ::GetLocalTime(&completed);
            const RetentionLimits limits = ReadKeepingPolicy();
            std::wstring kept;
            const HRESULT keeping = KeepDownload(station_, *target, completed, limits, kept);
            if (keeping == S_OK) {
                row.KeptFile = kept;
                PruneKeptDownloads(KeptDownloadsFolder(), limits);
            } else if (FAILED(keeping)) {
                row.Message = ResultText(keeping);  // logged where it failed
            }
        }
        // The journal is for people; a download is worth more than its row (logged inside).
        (void)AppendJournalRow(DownloadRecordsFolder(), row);
    }
    CATCH_LOG()
}
