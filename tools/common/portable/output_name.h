// The name lvcopy gives a downloaded file, from a pattern of the station, the date and the time.
#pragma once

#include "support/portable/wide_text.h"

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

// Expands {station}, {date} (YYYY-MM-DD), {time} (HHMMSS), {name} (the file's own name without its
// extension) and {ext} (its extension with the dot, ".lv" or ".hvr"); "{{" and "}}" stand for
// braces. Characters that a file name cannot hold are replaced by "_" where they come from the
// station's name, and refused where the pattern itself has them (a pattern names a file, not a
// folder). Trailing dots and spaces, which Windows drops, are refused too. False with a reason in
// error for a pattern that names no usable file.
bool ExpandOutputName(WideStringView pattern, const OutputNameParts& parts, WideString& name,
                      WideString& error);
