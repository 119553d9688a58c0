// StationDownloader: one station's file downloaded into a named file, as the data object asks
// for it; the progress dialogs are one implementation, a test's script another.
#pragma once

#include <windows.h>

#include <functional>
#include <string>

#include "stations/portable/station.h"

// Makes the download's target, a name without extension that no file has yet, and hands it out.
// A failure has been shown to the user already.
using PrepareTargetFunction = std::function<HRESULT(std::wstring& target)>;

class StationDownloader {
public:
    virtual ~StationDownloader() = default;

    // Downloads the station's file; owner (may be null) owns whatever the download shows. The
    // target is asked for through prepareTarget only once the download can run, so that a
    // download refused at once (another one holds what it needs) leaves no file behind; its
    // failure ends the download with it. file is set, once the target exists, to where the
    // download writes: the target, or the target with ".txt" added for a model read through the
    // external library, which adds it.
    // S_OK: file is complete (for the external library, CheckReceivedFile passed it).
    // S_FALSE: the surveyor cancelled, or the download ended without a file for no reason of the
    // system's. A failure: the download could not run, or the system refused the file (a full
    // disk), with its reason. Anything but S_OK may leave part of a file, which is the caller's
    // to delete. shownFailure is set to the text of the failure the user was shown (a port that
    // is not there, a time-out), if any: with S_FALSE too, since the user has seen it and the
    // shell must not report it again, but the download records call it a failure.
    [[nodiscard]] virtual HRESULT Download(HWND owner, const Station& station,
                                           const PrepareTargetFunction& prepareTarget,
                                           std::wstring& file, std::wstring& shownFailure) noexcept = 0;
};
