// One download attempt as the records see it: started when made, finished with the downloader's
// result, which keeps a copy of a completed download and journals every attempt.
#pragma once

#include <windows.h>

#include "download/download_target.h"
#include "stations/portable/station.h"

class DownloadAttempt {
public:
    // Notes the start.
    explicit DownloadAttempt(const Station& station) noexcept;

    // result is the downloader's (S_OK complete, S_FALSE cancelled, else failed); target is null
    // when the download ended before it had one; shownFailure is the failure the user was shown,
    // which makes an S_FALSE a failure and is the row's reason. A completed download is kept (and
    // the kept downloads pruned) before the row is written. Nothing here can fail the download:
    // every failure is logged, and a failure to keep is named in the row.
    void Finish(HRESULT result, const DownloadTarget* target,
                const std::wstring& shownFailure) noexcept;

private:
    const Station& station_;
    FILETIME startUtc_{};
    ULONGLONG startTicks_ = 0;
};
