// SourceWalkBounds: what keeps the walk over one drop's sources finite, short and quiet: each
// folder once by its identity, limits on the entries visited and the time taken, and an allowance
// of error-log entries.
#pragma once

#include <windows.h>

#include <compare>
#include <cstdint>
#include <set>
#include <string>

// Entries (dropped paths, shortcut targets, everything a folder lists) that one drop visits at
// most: past it the walk stops with one entry in the error log, and the drop keeps what it found.
inline constexpr uint32_t kDefaultSourceEntryLimit = 100000;
// Time that one drop's walk takes at most. A drop runs on the thread of the window it was dropped
// on, which must answer again within a second; a folder of many subfolders costs far more per
// entry than one of files (each is opened twice), so the entry limit alone does not keep that.
// Past it the walk stops as at the entry limit.
inline constexpr DWORD kDefaultSourceWalkMilliseconds = 800;
// Failures of one drop written to the error log at most; one more entry counts the rest.
inline constexpr uint32_t kMaximumReportsPerDrop = 8;

// Sets the entry limit of walks that begin from now on in this process (tests set a small one);
// returns the one it replaces.
uint32_t SetSourceEntryLimit(uint32_t entries) noexcept;
// The same for the time limit.
DWORD SetSourceWalkTimeLimit(DWORD milliseconds) noexcept;

class SourceWalkBounds {
public:
    // Takes the process's limits as they are now; a walk outside a drop counts its time from here.
    SourceWalkBounds() noexcept;

    // A new drop: the limits, the entry count, the clock, the stop and the log allowance start
    // afresh; the folders walked are kept for the parser's life.
    void BeginDrop() noexcept;
    // Writes one entry that counts the failures the allowance left out, if any.
    void EndDrop() noexcept;

    // Counts one entry; false once a limit is reached (the one time it is, it is logged).
    [[nodiscard]] bool VisitEntry(const std::wstring& path) noexcept;
    // True the first time a folder is met, whichever path (link, shortcut, junction) reached it.
    [[nodiscard]] bool FirstVisitOfFolder(const std::wstring& path);
    // Writes a failure to the error log while the drop's allowance lasts.
    void Report(HRESULT result, const wchar_t* function, int line,
                const wchar_t* description = nullptr) noexcept;

    bool Stopped() const noexcept { return stopped_; }
    uint32_t EntriesVisited() const noexcept { return entriesVisited_; }

private:
    // A folder as its volume knows it: serial number and file index.
    struct FolderIdentity {
        DWORD volume = 0;
        uint64_t index = 0;
        auto operator<=>(const FolderIdentity&) const = default;
    };

    std::set<FolderIdentity> walkedFolders_;
    std::set<std::wstring> walkedUnidentifiedFolders_;
    uint32_t entryLimit_;
    DWORD timeLimit_;
    ULONGLONG started_;
    uint32_t entriesVisited_ = 0;
    bool stopped_ = false;
    uint32_t reportsWritten_ = 0;
    uint32_t reportsLeftOut_ = 0;
    HRESULT lastLeftOutResult_ = S_OK;
};
