// The name lvcopy gives a downloaded file, from a pattern of the station, the date and the time.
#pragma once

#include "support/portable/wide_text.h"
#include "support/portable/windows_file_names.h"

// What a pattern may name. fileName is the file's own name from the folder ("file1.lv").
struct OutputNameParts {
    WideString station;
    WideString fileName;
    int year = 0;
    int month = 0;
    int day = 0;
    int hour = 0;
    int minute = 0;
    int second = 0;
};

// The longest full path (folder, "\\" and name) that Windows opens without the long-path prefix:
// MAX_PATH less its terminator.
constexpr size_t kMaximumOutputPath = 259;

// Whether Windows can create a file of this name in a folder whose full path has folderLength
// characters (without its trailing backslash): no character a name cannot hold, no trailing dot
// or space, no device, at most 255 characters, and at most kMaximumOutputPath with the folder.
// False with a reason in error otherwise.
[[nodiscard]] bool IsCreatableFileName(WideStringView name, size_t folderLength, WideString& error);

// Expands {station}, {date} (YYYY-MM-DD), {time} (HHMMSS), {name} (the file's own name without its
// extension) and {ext} (its extension with the dot, ".lv" or ".hvr"); "{{" and "}}" stand for
// braces. Characters that a file name cannot hold are replaced by "_" where they come from the
// station's name, and refused where the pattern itself has them (a pattern names a file, not a
// folder). Trailing dots and spaces, which Windows drops, and device names are refused too; a
// device that the station's name makes is refused with a way around it ("_{station}"). False with
// a reason in error for a pattern that names no usable file.
[[nodiscard]] bool ExpandOutputName(WideStringView pattern, const OutputNameParts& parts,
                                    WideString& name, WideString& error);
