// Where a download goes before the shell copies it: a fresh name in the user's temporary folder.
#pragma once

#include <windows.h>

#include <string>

// A unique "QRV" name without extension in the user's temporary folder, where no file is: the
// download writes the file itself. When the folder cannot take it, the user is told which folder
// and why (owner, which may be null, owns the box) before anything else happens, and the failure
// is returned.
[[nodiscard]] HRESULT PrepareDownloadTarget(HWND owner, std::wstring& target);
