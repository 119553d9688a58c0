// Takes a station's file out of "Quorvel Digital Levels" into a real folder through the shell
// interfaces Explorer uses on paste, so that the download and its dialog run as they do there.
#pragma once

#include <windows.h>
#include <objidl.h>
#include <wrl/client.h>

#include <string>

struct StationFileCopy {
    // kExists: the target is there already and was left alone; nothing was downloaded.
    // kBadName: the name cannot be a file in the folder (a device, a character, the length);
    // nothing was downloaded. kKept: the download is complete but could not take its name; it is
    // kept under a temporary name in the folder.
    enum Result { kCopied, kCancelled, kFailed, kExists, kBadName, kKept };
    Result result = kFailed;
    std::wstring target;  // the file written, when copied; the name wanted otherwise
    std::wstring kept;    // where the download is, when kept under its temporary name
    unsigned long long bytes = 0;
    double seconds = 0;    // from the request for the contents to the last byte written
    std::wstring failure;  // what went wrong, when failed, refused or kept
    HRESULT code = S_OK;   // its result code
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

struct CopyOptions {
    bool overwrite = false;    // replace a file of the same name; otherwise it is kExists
    std::wstring namePattern;  // the copy's name (see output_name.h); empty: the file's own
};

// OLE must be initialised on the calling thread. folder is a full path without a trailing "\".
// The name is checked, and the file under a temporary name made in the folder, before the
// download starts: nobody presses keys on an instrument for a copy that cannot land. The file
// takes its own name only once every byte is there, so a failed copy leaves no short file, and
// an existing file of that name is replaced only when the options say so. A download that
// cannot take its name then stays under the temporary one (kKept), never lost.
StationFileCopy CopyStationFile(const std::wstring& station, const std::wstring& folder,
                                const CopyOptions& options = {});
