// The clipboard formats the folder offers and reads, in one place.
//
// Each is registered by its name on every use and never kept: the system hands back the same
// number for the same name, in every process, for as long as the session lasts.
#pragma once

#include <windows.h>
#include <shlobj.h>

// The stations copied between views (the flat records of stations/station_list_block.h).
inline constexpr wchar_t kStationListFormatName[] = L"Quorvel Total Stations";

// Any format by its name; 0 when the system refuses to register it.
inline CLIPFORMAT RegisteredClipboardFormat(const wchar_t* name) noexcept {
    return static_cast<CLIPFORMAT>(::RegisterClipboardFormatW(name));
}

// A virtual file's bytes, asked for by the file's index in the group descriptor.
inline CLIPFORMAT FileContentsFormat() noexcept {
    return RegisteredClipboardFormat(CFSTR_FILECONTENTS);
}
// The names of the virtual files, in UTF-16 and in the ANSI code page.
inline CLIPFORMAT FileGroupDescriptorFormat() noexcept {
    return RegisteredClipboardFormat(CFSTR_FILEDESCRIPTORW);
}
inline CLIPFORMAT AnsiFileGroupDescriptorFormat() noexcept {
    return RegisteredClipboardFormat(CFSTR_FILEDESCRIPTORA);
}
// Shell items: a parent's identifier list from the desktop and its children's.
inline CLIPFORMAT ShellIdListFormat() noexcept {
    return RegisteredClipboardFormat(CFSTR_SHELLIDLIST);
}
// What the source wants done with its items: always a copy for ours.
inline CLIPFORMAT PreferredDropEffectFormat() noexcept {
    return RegisteredClipboardFormat(CFSTR_PREFERREDDROPEFFECT);
}
inline CLIPFORMAT StationListFormat() noexcept {
    return RegisteredClipboardFormat(kStationListFormatName);
}
