// Takes a station's file out of "Quorvel Digital Levels" into a real folder through the shell
// interfaces Explorer uses on paste, so that the download and its dialog run as they do there.
#pragma once

#include <windows.h>
#include <objidl.h>
#include <wrl/client.h>

#include <string>

struct StationFileCopy {
    enum Result { kCopied, kCancelled, kFailed };
    Result result = kFailed;
    std::wstring target;        // the file written, when copied
    unsigned long long bytes = 0;
    double seconds = 0;         // from the request for the contents to the last byte written
    std::wstring failure;       // what went wrong, when failed
    HRESULT code = S_OK;        // its result code
};

// The data object of a station's one file, as the station folder hands it to the shell on copy.
struct StationFileObject {
    Microsoft::WRL::ComPtr<IDataObject> data;  // null when it could not be had
    std::wstring failure;                      // what went wrong, when data is null
    HRESULT code = S_OK;                       // its result code
};

// Binds "Quorvel Digital Levels\STATION" through the desktop folder, lists the station's file and
// asks the station folder's GetUIObjectOf for its data object. OLE must be initialised.
StationFileObject GetStationFileDataObject(const std::wstring& station);

// OLE must be initialised on the calling thread. folder is a full path without a trailing "\".
StationFileCopy CopyStationFile(const std::wstring& station, const std::wstring& folder);
