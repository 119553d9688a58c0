// StationDownloader: one station's file downloaded into a named file, as the data object asks
// for it; the progress dialogs are one implementation, a test's script another.
#pragma once

#include <windows.h>

#include <string>

#include "stations/portable/station.h"

class StationDownloader {
public:
    virtual ~StationDownloader() = default;

    // Downloads the station's file to target, a name without extension that no file has yet;
    // owner (may be null) owns whatever the download shows. file is set first, whatever the
    // outcome, to where the download writes: target, or target with ".txt" added for a model
    // read through the external library, which adds it.
    // S_OK: file is complete (for the external library, CheckReceivedFile passed it).
    // S_FALSE: the surveyor cancelled, or the download ended without a file for no reason of the
    // system's. A failure: the download could not run, or the system refused the file (a full
    // disk), with its reason. Anything but S_OK may leave part of a file, which is the caller's
    // to delete.
    [[nodiscard]] virtual HRESULT Download(HWND owner, const Station& station,
                                           const std::wstring& target, std::wstring& file) = 0;
};
