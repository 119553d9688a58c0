// "lvstations export" and "lvstations import": the current user's stations to a station file and
// back, with the exit codes that administrators' scripts test.
#pragma once

#include <functional>
#include <string>

// Exit codes of both commands.
enum StationFileExit : int {
    kExitDone = 0,        // warnings (ports this computer does not list) allowed
    kExitNotAllDone = 1,  // import: some names were taken and skipped; export: no stations, or
                          // a value that cannot come back as it is stored (see the warnings)
    kExitUsage = 2,
    kExitFileRefused = 3,        // import: the file is not a good station file; nothing was written
    kExitReadOrWriteFailed = 4,  // a file could not be read or written, or the store refused a
                                 // station (the stations before it were stored)
};

// Every line the commands print, without its line end: "Added ...", "warning: ...", "error: ...".
using PrintLine = std::function<void(const std::wstring& line)>;

int ExportStations(const std::wstring& path, const PrintLine& print);

// Adds the file's stations in file order once the whole file is read and checked; a name already
// taken is skipped, or rewritten in place when replace is set.
int ImportStations(const std::wstring& path, bool replace, const PrintLine& print);
