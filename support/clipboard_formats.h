// The clipboard formats the folder offers and reads, in one place.
//
// Each is registered by its name on every use and never kept: the system hands back the same
// number for the same name, in every process, for as long as the session lasts.
#pragma once

#include <windows.h>
#include <shlobj.h>

#include <iterator>

// The stations copied between views (the flat records of stations/station_list_block.h).
inline constexpr wchar_t kStationListFormatName[] = L"Quorvel Total Stations";

// Any format by its name; 0 when the system refuses to register it.
inline CLIPFORMAT RegisteredClipboardFormat(const wchar_t* name) noexcept {
    return static_cast<CLIPFORMAT>(::RegisterClipboardFormatW(name));
}

// The formats the folder itself names.
enum class ClipboardFormat {
    FileContents,             // a virtual file's bytes, by the file's index in the descriptor
    FileGroupDescriptor,      // the names of the virtual files, in UTF-16
    AnsiFileGroupDescriptor,  // the same in the ANSI code page
    ShellIdList,              // shell items: a parent's list from the desktop and its children
    PreferredDropEffect,      // what the source wants done with its items: always a copy for ours
    StationList,              // the stations copied between views
};

inline CLIPFORMAT RegisteredFormat(ClipboardFormat format) noexcept {
    // In the order of the enumeration.
    static constexpr const wchar_t* kNames[] = {CFSTR_FILECONTENTS,        CFSTR_FILEDESCRIPTORW,
                                                CFSTR_FILEDESCRIPTORA,     CFSTR_SHELLIDLIST,
                                                CFSTR_PREFERREDDROPEFFECT, kStationListFormatName};
    static_assert(std::size(kNames) == static_cast<size_t>(ClipboardFormat::StationList) + 1);
    return RegisteredClipboardFormat(kNames[static_cast<size_t>(format)]);
}
