// DialogStationDownloader: the download as the surveyor sees it, the progress dialog of the
// station's driver run modally.
#pragma once

#include <memory>

#include "download/station_downloader.h"

class DialogStationDownloader final : public StationDownloader {
public:
    // The built-in serial driver's dialog, or the external library's for the models it reads;
    // the library's dialog checks the file the library reports before it ends with success.
    // While another download through the library runs in this process (or has not ended yet),
    // the user is told so and ERROR_BUSY is returned, before any dialog opens.
    [[nodiscard]] HRESULT Download(HWND owner, const Station& station,
                                   const PrepareTargetFunction& prepareTarget,
                                   std::wstring& file, std::wstring& shownFailure) noexcept override;
};

// The downloader that production code hands to a data object (may throw bad_alloc).
std::shared_ptr<StationDownloader> MakeDialogStationDownloader();
