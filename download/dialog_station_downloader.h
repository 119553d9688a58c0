// DialogStationDownloader: the download as the surveyor sees it, the progress dialog of the
// station's driver run modally.
#pragma once

#include <memory>

#include "download/station_downloader.h"

class DialogStationDownloader final : public StationDownloader {
public:
    // The built-in serial driver's dialog, or the external library's for the models it reads;
    // the library's dialog checks the file the library reports before it ends with success.
    [[nodiscard]] HRESULT Download(HWND owner, const Station& station, const std::wstring& target,
                                   std::wstring& file) override;
};

// The downloader that production code hands to a data object (may throw bad_alloc).
std::shared_ptr<StationDownloader> MakeDialogStationDownloader();
