// Bounds of the walk over dropped sources: folder identities, entry and time limits, log allowance.
#include "view/source_walk_bounds.h"

#include <atomic>
#include <cwchar>

#include "support/error_handling.h"
#include "support/error_log.h"
#include "support/unique_resource.h"

namespace {

constexpr wchar_t kSource[] = L"SourceParser";
// The results in the one log entry of a drop stopped at a limit: its quota of entries is spent,
// or its time is up.
constexpr HRESULT kEntryLimitReached = HRESULT_FROM_WIN32(ERROR_NOT_ENOUGH_QUOTA);
constexpr HRESULT kTimeLimitReached = HRESULT_FROM_WIN32(ERROR_TIMEOUT);

std::atomic<uint32_t> entryLimit{kDefaultSourceEntryLimit};
std::atomic<DWORD> timeLimit{kDefaultSourceWalkMilliseconds};

}  // namespace

uint32_t SetSourceEntryLimit(uint32_t entries) noexcept {
    return entryLimit.exchange(entries);
}

DWORD SetSourceWalkTimeLimit(DWORD milliseconds) noexcept {
    return timeLimit.exchange(milliseconds);
}

SourceWalkBounds::SourceWalkBounds() noexcept
    : entryLimit_(entryLimit), timeLimit_(timeLimit), started_(::GetTickCount64()) {}

void SourceWalkBounds::BeginDrop() noexcept {
    entryLimit_ = entryLimit;
    timeLimit_ = timeLimit;
    started_ = ::GetTickCount64();
    entriesVisited_ = 0;
    stopped_ = false;
    reportsWritten_ = 0;
    reportsLeftOut_ = 0;
}

void SourceWalkBounds::EndDrop() noexcept {
    if (reportsLeftOut_ == 0)
        return;
    wchar_t count[64] = {};
    swprintf(count, ARRAYSIZE(count), L"%u further failures of this drop not logged",
             reportsLeftOut_);
    ReportError(kSource, lastLeftOutResult_, L"TSourceParser::ParseDataObject", __LINE__, count);
    reportsLeftOut_ = 0;
}

void SourceWalkBounds::Report(HRESULT result, const wchar_t* function, int line,
                              const wchar_t* description) noexcept {
    // A folder of many failing entries must not fill the log: the first few tell the story.
    if (reportsWritten_ >= kMaximumReportsPerDrop) {
        ++reportsLeftOut_;
        lastLeftOutResult_ = result;
        return;
    }
    ++reportsWritten_;
    ReportError(kSource, result, function, line, description);
}

bool SourceWalkBounds::VisitEntry(const std::wstring& path) noexcept {
    if (stopped_)
        return false;
    const bool tooMany = entriesVisited_ >= entryLimit_;
    if (tooMany || ::GetTickCount64() - started_ >= timeLimit_) {
        stopped_ = true;
        ReportError(kSource, tooMany ? kEntryLimitReached : kTimeLimitReached,
                    L"TSourceParser::ParsePath", __LINE__, path.c_str());
        return false;
    }
    ++entriesVisited_;
    return true;
}

bool SourceWalkBounds::FirstVisitOfFolder(const std::wstring& path) {
    // Minimal access: the identity only, of a folder that others may be using in any way. The
    // open follows a link to its target, so a link and its target are one folder.
    UniqueFileHandle folder(::CreateFileW(
        path.c_str(), FILE_READ_ATTRIBUTES, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
        nullptr, OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr));
    BY_HANDLE_FILE_INFORMATION information{};
    if (folder && ::GetFileInformationByHandle(folder.get(), &information)) {
        const FolderIdentity identity{
            information.dwVolumeSerialNumber,
            (static_cast<uint64_t>(information.nFileIndexHigh) << 32) | information.nFileIndexLow};
        return walkedFolders_.insert(identity).second;
    }
    // A folder that can be listed but not opened is known by its text: links inside folders are
    // not followed and the entry limit bounds the rest, so the walk still ends.
    Report(LastErrorResult(), L"TSourceParser::ParseFolder", __LINE__, path.c_str());
    std::wstring key(path);
    ::CharUpperBuffW(key.data(), static_cast<DWORD>(key.size()));
    return walkedUnidentifiedFolders_.insert(key).second;
}
