// Kept downloads: a copy of every completed download in the user's "Downloads" folder of the
// download records, one folder per station, pruned by the administrator's limits.
#pragma once

#include <windows.h>

#include <string>

#include "download/download_target.h"
#include "download/portable/kept_download_names.h"
#include "stations/portable/station.h"

// Policy values (REG_DWORD) under this key, the local machine's before the user's.
constexpr wchar_t kKeepingPolicyKey[] = L"Software\\Policies\\Quorvel\\Digital Levels";
constexpr wchar_t kKeepDownloadsDaysValue[] = L"KeepDownloadsDays";
constexpr wchar_t kKeepDownloadsMegabytesValue[] = L"KeepDownloadsMB";
constexpr wchar_t kKeptDownloadsFolderName[] = L"Downloads";

// The limits in force: each value from the local machine's policy, else the user's, else the
// default.
[[nodiscard]] RetentionLimits ReadKeepingPolicy() noexcept;

// Copies what the target's download wrote to "<records>\Downloads\<safe station>\<name><ext>",
// named after localTime, whole or not at all: written under a temporary name in the same folder,
// flushed, then renamed without replacing anything. keptFile is set to the copy's path.
// S_FALSE and nothing written when keeping is off; a failure leaves no file behind.
[[nodiscard]] HRESULT KeepDownload(const Station& station, const DownloadTarget& target,
                                   const SYSTEMTIME& localTime, RetentionLimits limits,
                                   std::wstring& keptFile) noexcept;

// Deletes the kept files the limits let go (download/portable/kept_download_names.h), by their
// last write time. Failures are logged and skipped.
void PruneKeptDownloads(const std::wstring& downloadsFolder, RetentionLimits limits) noexcept;

// "<records>\Downloads", empty when the records folder cannot be had.
[[nodiscard]] std::wstring KeptDownloadsFolder() noexcept;

// Opens "<records>\Downloads" in a shell window (the Start menu's "Kept downloads"), created first
// so that it opens before the first download too. A folder that cannot be had is shown to the
// user over owner; a shell that cannot open it shows its own message.
[[nodiscard]] HRESULT OpenKeptDownloadsFolder(HWND owner, int showCommand) noexcept;
