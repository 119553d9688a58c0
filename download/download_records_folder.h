// Where the download records live: the user's "Quorvel\Digital Levels" folder under the local
// application data, which holds the kept downloads and the download journal.
#pragma once

#include <string>

// The folder, created when missing; empty when it cannot be had. Test programs may point it
// elsewhere with LVSHELLEXT_DOWNLOADS_DIR (download/CMakeLists.txt); the shipped code never
// reads that variable.
std::wstring DownloadRecordsFolder() noexcept;
