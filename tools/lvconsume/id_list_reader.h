// lvconsume's reading of the formats that name the station's file: "Shell IDList Array", read
// strictly and through the system, and "FileGroupDescriptorW"; both must name the same file.
#pragma once

#include <windows.h>
#include <objidl.h>

#include <string>

#include "tools/lvconsume/consumer_steps.h"

struct NamedFile {
    std::wstring name;  // as FileGroupDescriptorW gives it
    LONG index = -1;    // its record, and so the lindex of its contents
};

// Runs every check in order, stopping at the first that fails (recorded in failure).
[[nodiscard]] bool FindTheFile(IDataObject* data, FailureRecord& failure, NamedFile& file);
