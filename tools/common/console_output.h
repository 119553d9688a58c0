// Console output of the command-line tools.
#pragma once

#include <string>

// Writes the text to standard output as UTF-8, so that station names outside the console's code
// page survive a pipe or a redirection, and flushes it.
void PrintUtf8(const std::wstring& text);
