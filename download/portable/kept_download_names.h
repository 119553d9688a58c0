// Kept downloads without I/O: a station's name made safe as a folder name, the kept file's name,
// and which kept files the retention limits let go.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "download/portable/local_date_time.h"
#include "support/portable/wide_text.h"

// The longest folder name made from a station's name, in UTF-16 units: room for the rest of the
// path under the user's profile within the classic path limit.
constexpr size_t kKeptFolderNameLimit = 64;

// A station's name as a folder name Windows accepts and that names no device: characters Windows
// refuses (<>:"/\|?* and controls) become '_', trailing dots and spaces go, the length is bounded
// (never splitting a surrogate pair), and a device name (CON, PRN, AUX, NUL, COM1-9, LPT1-9, with
// or without an extension) gets a '_' in front. Never empty.
[[nodiscard]] WideString SafeFolderName(WideStringView stationName);

// "<YYYY-MM-DD HHMMSS><extension>", and for the second and later file of the same second
// "<YYYY-MM-DD HHMMSS> (2)<extension>" and so on; sequence 1 is the plain name.
[[nodiscard]] WideString KeptFileName(const LocalDateTime& time, WideStringView extension,
                                      unsigned sequence);

// One kept file as retention sees it.
struct KeptFile {
    WideString Station;    // its folder
    int64_t Time = 0;      // seconds on any clock shared with "now"
    uint64_t Size = 0;     // bytes
};

struct RetentionLimits {
    uint32_t Days = 90;  // 0: keeping is off
    uint32_t Megabytes = 1024;
};

// The indexes (ascending) of the files to delete: those older than Days, then the oldest ones
// until all left fit in Megabytes. The newest file of each station is always kept. With keeping
// off nothing is deleted: what was kept before stays the user's.
[[nodiscard]] std::vector<size_t> FilesToDelete(const std::vector<KeptFile>& files,
                                                RetentionLimits limits, int64_t now);
