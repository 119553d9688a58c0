// The progress dialogs behind the data object's download: which one runs, and what its end means.
#include "download/dialog_station_downloader.h"

#include <utility>

#include "download/download_progress_dialog.h"
#include "download/halvek_download_progress_dialog.h"
#include "res/resource.h"
#include "stations/station_models.h"
#include "support/error_handling.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

HRESULT DialogStationDownloader::Download(HWND owner, const Station& station,
                                          const PrepareTargetFunction& prepareTarget,
                                          std::wstring& file,
                                          std::wstring& shownFailure) noexcept {
    try {
        const bool external = IsExternalLibraryModel(station.Model);
        INT_PTR answer = -1;
        bool completed = false;
        HRESULT downloadResult = S_OK;
        const auto run = [&](CProgressDialogBase&& dialog) {
            answer = dialog.DoModal();
            completed = dialog.TransferCompleted();
            downloadResult = dialog.DownloadResult();
            shownFailure = dialog.FailureText();
        };
        // One library download per process: the library's completion says nothing of which download
        // it ends. A second one is refused before its target, its dialog or the library is touched.
        HalvekLibraryClaim claim;
        if (external) {
            claim = HalvekLibraryClaim::TryTake();
            if (!claim) {
                shownFailure = LoadUiText(IDS_LIBRARY_DOWNLOAD_RUNNING);
                ShowMessageBox(owner, shownFailure, LoadUiText(IDS_DIGITAL_LEVELS),
                               MB_ICONEXCLAMATION);
                return HRESULT_FROM_WIN32(ERROR_BUSY);
            }
        }
        std::wstring target;
        if (const HRESULT prepared = prepareTarget(target); FAILED(prepared))
            return prepared;  // shown and logged where it failed
        // The library writes its file under the given name with ".txt" added.
        file = external ? target + L".txt" : target;
        if (external)
            run(CHalvekDownloadProgressDialog(owner, station, target, std::move(claim)));
        else
            run(CDownloadProgressDialog(owner, station, target));
        // The dialogs are gone, and with them the download thread: nothing writes the file now.
        // Only a transfer that reported its end makes a file; an IDOK from anywhere else, a cancel
        // or a dialog that could not run leaves at most a partial file.
        if (answer == IDOK && completed)
            return S_OK;
        // The dialog could not be created: logged, since the user saw nothing.
        RETURN_HR_IF(E_FAIL, answer == -1);
        // A download the system refused (a full disk) fails with its reason, so that the copy is
        // reported as a failure rather than a cancel; the user has seen the reason.
        if (FAILED(downloadResult))
            return downloadResult;
        return S_FALSE;
    }
    CATCH_RETURN()
}

std::shared_ptr<StationDownloader> MakeDialogStationDownloader() {
    return std::make_shared<DialogStationDownloader>();
}
