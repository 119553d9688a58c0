// The error log: failures written as UTF-16 text entries to a bounded file that a user can find.
#pragma once

#include <windows.h>

#include <string>

// An entry that would take the log past this size first moves the file aside to
// LVShellExt.old.log (replacing the one before) and starts a new file: at most 1 MiB each.
constexpr DWORD kErrorLogDefaultSizeLimit = 1024 * 1024;

// Appends one entry to the log, in one write (several threads and processes may log at once),
// under a mutex taken with a short wait: while another process holds it, the entry is dropped.
// Past twice the size limit (the full file could not be moved aside) entries are dropped too.
//   2024-05-01 14:03:07.123, process 1234, thread 5678
//   SourceParser - 0x80070005 (TSourceParser::ParseDataObject, 120)
//   System description: Access is denied.
//   IErrorInfo description: (the thread's error info, which is left set)
//   Internal description: (internalDescription)
// each description line only where there is a text. Leaves the thread's last error as it was.
// Never fails the caller: an entry that cannot be written is dropped.
void ReportError(const wchar_t* source, HRESULT result, const wchar_t* function, int line,
                 const wchar_t* internalDescription = nullptr) noexcept;

// The file the next entry goes to: "%LOCALAPPDATA%\Quorvel\Digital Levels\LVShellExt.log", its
// folders created as needed; in the temporary folder when those cannot be had. Test programs
// built with LV_ERROR_LOG_FOLDER_OVERRIDE take the folder that the environment variable
// LVSHELLEXT_LOG_DIR names, when set; the shipped module never reads it. Empty when no folder
// can be found.
std::wstring ErrorLogPath() noexcept;

// Sets the size limit for this process (tests set a small one); returns the one it replaces.
DWORD SetErrorLogSizeLimit(DWORD bytes) noexcept;
