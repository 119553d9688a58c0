// TSourceParser: turns a dropped data object into the flat list of its sources (files on disk
// with shortcuts resolved and folders walked, virtual files of a file group descriptor, and shell
// items), for a sending feature to work through later, on another thread if it likes.
#pragma once

#include <windows.h>
#include <objidl.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "view/source_walk_bounds.h"

struct TSourceDescriptor {
    std::wstring rootPath;  // where the source was found
    std::wstring path;      // full path on disk, or a virtual file's name
    uint32_t index = 0;     // a virtual file's lindex for "FileContents"; 0 for files on disk

    bool operator==(const TSourceDescriptor&) const = default;
};

using TSourceList = std::vector<TSourceDescriptor>;

class TSourceParser {
public:
    // Subfolders are walked only with recurse set.
    explicit TSourceParser(bool recurse) noexcept;
    TSourceParser(const TSourceParser&) = delete;
    TSourceParser& operator=(const TSourceParser&) = delete;
    ~TSourceParser();

    // Appends the data object's sources. rootPath empty: found from the object's item IDs when it
    // offers them; deep false stops at virtual items (their own data objects are not opened).
    // Each outermost call is one drop, with its own entry and time limits and log allowance.
    [[nodiscard]] HRESULT ParseDataObject(IDataObject* dataObject, const std::wstring& rootPath,
                                          bool deep) noexcept;
    // The first parsed data object, for use on another thread: once. S_FALSE before any parse.
    [[nodiscard]] HRESULT GetDataObject(IDataObject** dataObject) noexcept;
    [[nodiscard]] HRESULT ParsePath(const std::wstring& path,
                                    const std::wstring& rootPath) noexcept;
    // A shell item given as its parent folder (absolute) and its own ID.
    [[nodiscard]] HRESULT ParsePIDL(PCIDLIST_ABSOLUTE parent, PCUITEMID_CHILD child) noexcept;

    // Wildcard patterns (as in "*.tmp") of paths to leave out; none by default.
    void SetPathFilter(std::vector<std::wstring> patterns) { filter_ = std::move(patterns); }

    // Shared, so that the list can outlive the parser.
    std::shared_ptr<TSourceList> Sources() const noexcept { return sources_; }
    uint32_t FileCount() const noexcept { return fileCount_; }
    uint32_t FolderCount() const noexcept { return folderCount_; }
    void Cancel() noexcept { cancelled_ = true; }
    bool Cancelled() const noexcept { return cancelled_; }
    // Entries visited in the current (or last) drop, and whether a limit stopped it.
    uint32_t EntriesVisited() const noexcept { return bounds_.EntriesVisited(); }
    bool WalkStopped() const noexcept { return bounds_.Stopped(); }

private:
    [[nodiscard]] HRESULT ParseSources(IDataObject* dataObject, const std::wstring& rootPath,
                                       bool deep) noexcept;
    [[nodiscard]] HRESULT ParseDropFiles(IDataObject* dataObject, const FORMATETC& format) noexcept;
    [[nodiscard]] HRESULT ParseFileGroup(IDataObject* dataObject, const FORMATETC& format,
                                         bool wide, const std::wstring& rootPath) noexcept;
    [[nodiscard]] HRESULT ParseItemArray(IDataObject* dataObject, const FORMATETC& format,
                                         bool rootOnly, std::wstring& rootPath) noexcept;
    // A path whose attributes are known (read, or found by the folder's enumeration).
    [[nodiscard]] HRESULT ParseEntry(const std::wstring& path, const std::wstring& rootPath,
                                     DWORD attributes) noexcept;
    [[nodiscard]] HRESULT ParseShortcut(const std::wstring& path, bool& parsed) noexcept;
    [[nodiscard]] HRESULT ParseFolder(const std::wstring& path,
                                      const std::wstring& rootPath) noexcept;
    [[nodiscard]] bool Filtered(const std::wstring& path) const noexcept;
    void Add(const std::wstring& rootPath, const std::wstring& path, uint32_t index);

    std::shared_ptr<TSourceList> sources_;
    std::vector<std::wstring> filter_;
    bool recurse_;
    uint32_t fileCount_ = 0;
    uint32_t folderCount_ = 0;
    Microsoft::WRL::ComPtr<IStream> marshalled_;
    bool marshalledOnce_ = false;
    bool cancelled_ = false;
    // Links and shortcuts can point back up the tree: each folder is walked once per parser,
    // known by its identity, nesting stops at a fixed depth, and a drop visits a bounded number
    // of entries in a bounded time.
    SourceWalkBounds bounds_;
    int depth_ = 0;
    // One drop: the outermost ParseDataObject and the parses nested in it.
    int parseNesting_ = 0;
};

// Folders and shortcuts nest at most this deep below a dropped source.
inline constexpr int kMaximumSourceDepth = 64;
