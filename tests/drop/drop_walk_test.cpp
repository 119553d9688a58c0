// Walks over dropped folders that a user can make hostile: links back into themselves, links out
// of the tree, more entries than a drop visits, and many failing sources, dropped on both real
// targets through their Drop.
#include "tests/drop/drop_fixture.h"

#include <algorithm>

#include "namespace/pidl_manager.h"
#include "stations/station_store.h"
#include "support/error_log.h"
#include "tests/drop/directory_link.h"
#include "tests/support/registry_override.h"
#include "view/lv_drop_target.h"

namespace {

// The view that a list's target holds; a drop inside a station's folder never asks it anything.
class NoShellView final : public ComObjectImpl<false, IShellView> {
public:
    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {QITABENT(NoShellView, IShellView), {}};
        return QISearch(this, table, iid, object);
    }
    IFACEMETHODIMP GetWindow(HWND*) override { return E_NOTIMPL; }
    IFACEMETHODIMP ContextSensitiveHelp(BOOL) override { return E_NOTIMPL; }
    IFACEMETHODIMP TranslateAccelerator(MSG*) override { return E_NOTIMPL; }
    IFACEMETHODIMP EnableModeless(BOOL) override { return E_NOTIMPL; }
    IFACEMETHODIMP UIActivate(UINT) override { return E_NOTIMPL; }
    IFACEMETHODIMP Refresh() override { return E_NOTIMPL; }
    IFACEMETHODIMP CreateViewWindow(IShellView*, LPCFOLDERSETTINGS, IShellBrowser*, RECT*,
                                    HWND*) override {
        return E_NOTIMPL;
    }
    IFACEMETHODIMP DestroyViewWindow() override { return E_NOTIMPL; }
    IFACEMETHODIMP GetCurrentInfo(LPFOLDERSETTINGS) override { return E_NOTIMPL; }
    IFACEMETHODIMP AddPropertySheetPages(DWORD, LPFNSVADDPROPSHEETPAGE, LPARAM) override {
        return E_NOTIMPL;
    }
    IFACEMETHODIMP SaveViewState() override { return E_NOTIMPL; }
    IFACEMETHODIMP SelectItem(PCUITEMID_CHILD, SVSIF) override { return E_NOTIMPL; }
    IFACEMETHODIMP GetItemObject(UINT, REFIID, void**) override { return E_NOTIMPL; }
};

// The process's walk limits for one test, restored when it ends.
class WalkLimitsOverride {
public:
    WalkLimitsOverride(uint32_t entries, DWORD milliseconds)
        : entries_(SetSourceEntryLimit(entries)),
          milliseconds_(SetSourceWalkTimeLimit(milliseconds)) {}
    ~WalkLimitsOverride() {
        (void)SetSourceEntryLimit(entries_);
        (void)SetSourceWalkTimeLimit(milliseconds_);
    }

private:
    uint32_t entries_;
    DWORD milliseconds_;
};

std::vector<TSourceDescriptor> Sorted(std::vector<TSourceDescriptor> sources) {
    std::sort(sources.begin(), sources.end(),
              [](const auto& left, const auto& right) { return left.path < right.path; });
    return sources;
}

class DropWalkTest : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(S_OK, ::OleInitialize(nullptr));
        ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", scratch_.Folder(L"log").c_str());
    }
    void TearDown() override {
        ::SetEnvironmentVariableW(L"LVSHELLEXT_LOG_DIR", nullptr);
        ::OleUninitialize();
    }

    // The parser's entries in the error log so far.
    static size_t LogEntries() {
        const std::wstring text = ReadWideFile(ErrorLogPath());
        size_t count = 0;
        for (size_t at = text.find(L"SourceParser - 0x"); at != std::wstring::npos;
             at = text.find(L"SourceParser - 0x", at + 1))
            ++count;
        return count;
    }

    // Drops the paths as a drag source's file list on a station and on a station folder's list,
    // and returns what each target handed on, with the targets' results. The test's thread is a
    // single-threaded apartment, as a view's thread is; a drop that never returns is ended by the
    // test programs' watchdog, which names the case.
    struct Dropped {
        HRESULT station = E_FAIL;
        HRESULT list = E_FAIL;
        std::vector<TSourceList> received;
    };
    Dropped DropOnBothTargets(const std::vector<std::wstring>& paths) {
        Dropped dropped;
        CPidlMgr manager;
        const UniqueRelativePidl station =
            manager.CreatePidlFromPath(L"Quorvel Digital Level\\North");
        const DroppedSourcesReceiver receiver = [&](const std::wstring&,
                                                    const std::shared_ptr<TSourceList>& sources) {
            dropped.received.push_back(*sources);
        };
        const auto data = FileListObject(paths);
        DWORD effect = DROPEFFECT_COPY;

        auto onStation = MakeComObject<CLVDropTarget>();
        EXPECT_EQ(S_OK, onStation->SetItem(station.get()));
        EXPECT_EQ(S_OK, onStation->SetReceiver(receiver));
        EXPECT_EQ(S_OK, onStation->DragEnter(data.Get(), 0, {}, &effect));
        dropped.station = onStation->Drop(data.Get(), 0, {}, &effect);

        UniqueWindow list(::CreateWindowExW(0, L"STATIC", L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr,
                                            nullptr, nullptr));
        auto onList = MakeComObject<CLVDropTargetOnListView>();
        EXPECT_EQ(S_OK,
                  onList->SetUp(list.get(), MakeComObject<NoShellView>().Get(), station.get()));
        EXPECT_EQ(S_OK, onList->SetReceiver(receiver));
        dropped.list = onList->Drop(data.Get(), 0, {}, &effect);
        EXPECT_EQ(static_cast<DWORD>(DROPEFFECT_COPY), effect);
        return dropped;
    }

    RegistryOverride registry_;
    ScratchFolder scratch_;
    ScopedDirectoryLinks links_;  // goes before the folder that holds the links
};

TEST_F(DropWalkTest, AFolderWithLinksBackToItselfIsWalkedOnceOnBothTargets) {
    Station north = DefaultStation();
    north.Name = L"North";
    ASSERT_EQ(S_OK, AddStation(north));
    const std::wstring loop = scratch_.Folder(L"loop");
    const std::wstring sub = scratch_.Folder(L"loop\\sub");
    const TSourceList expected{{loop, scratch_.File(L"loop\\a.lv"), 0},
                               {loop, scratch_.File(L"loop\\b.lv"), 0},
                               {loop, scratch_.File(L"loop\\sub\\c.lv"), 0}};
    ASSERT_TRUE(links_.Make(loop, L"first", L"."));
    ASSERT_TRUE(links_.Make(loop, L"second", L"."));
    ASSERT_TRUE(links_.Make(sub, L"up", L".."));
    const size_t logBefore = LogEntries();

    const Dropped dropped = DropOnBothTargets({loop});
    EXPECT_EQ(S_FALSE, dropped.station);
    EXPECT_EQ(E_INVALIDARG, dropped.list);
    ASSERT_EQ(2u, dropped.received.size());
    for (const TSourceList& sources : dropped.received)
        EXPECT_EQ(expected, Sorted(sources));
    EXPECT_LE(LogEntries(), logBefore + 2);
}

TEST_F(DropWalkTest, ALinkInsideAFolderIsNotFollowedButARealSubfolderAndAShortcutAre) {
    const std::wstring top = scratch_.Folder(L"top");
    scratch_.Folder(L"top\\real");
    const std::wstring inReal = scratch_.File(L"top\\real\\r.lv");
    const std::wstring other = scratch_.Folder(L"other");
    const std::wstring inOther = scratch_.File(L"other\\o.lv");
    ASSERT_TRUE(links_.Make(top, L"outside", L"..\\other"));

    const std::wstring link = top + L"\\outside";
    const std::wstring shortcut = scratch_.Shortcut(L"other.lnk", other);
    const struct {
        const char* what;
        std::vector<std::wstring> dropped;
        TSourceList expected;
    } cases[] = {
        {"a link inside is passed over", {top}, {{top, inReal, 0}}},
        {"a dropped link is walked", {link}, {{link, link + L"\\o.lv", 0}}},
        {"a shortcut is followed", {top, shortcut}, {{other, inOther, 0}, {top, inReal, 0}}},
        // A link and a shortcut to one folder: walked once, whichever path reached it first.
        {"one folder by two paths", {link, shortcut}, {{link, link + L"\\o.lv", 0}}},
    };
    for (const auto& c : cases) {
        TSourceParser parser(true);
        EXPECT_EQ(S_OK, parser.ParseDataObject(FileListObject(c.dropped).Get(), L"", true))
            << c.what;
        EXPECT_EQ(c.expected, Sorted(*parser.Sources())) << c.what;
    }
}

TEST_F(DropWalkTest, EitherLimitStopsTheWholeDropWithOneLogEntry) {
    constexpr uint32_t kLowEntryLimit = 20;
    constexpr int kFilesPerFolder = 30;
    const std::wstring first = scratch_.Folder(L"first");
    const std::wstring second = scratch_.Folder(L"second");
    for (int file = 0; file < kFilesPerFolder; ++file) {
        scratch_.File(L"first\\" + std::to_wstring(file) + L".lv");
        scratch_.File(L"second\\" + std::to_wstring(file) + L".lv");
    }
    const struct {
        const char* what;
        uint32_t entryLimit;
        DWORD timeLimit;
        uint32_t visited;
        const wchar_t* logged;
    } cases[] = {
        // The first folder counts as one entry, then its files up to the limit; the second
        // folder is never entered.
        {"entries", kLowEntryLimit, kDefaultSourceWalkMilliseconds, kLowEntryLimit,
         L"SourceParser - 0x80070718 (TSourceParser::ParsePath"},
        // No time at all: not even the first folder.
        {"time", kDefaultSourceEntryLimit, 0, 0,
         L"SourceParser - 0x800705B4 (TSourceParser::ParsePath"},
    };
    for (const auto& c : cases) {
        const WalkLimitsOverride limits(c.entryLimit, c.timeLimit);
        const size_t logBefore = LogEntries();
        const auto data = FileListObject({first, second});
        TSourceParser parser(true);
        EXPECT_EQ(S_OK, parser.ParseDataObject(data.Get(), L"", true)) << c.what;
        EXPECT_TRUE(parser.WalkStopped()) << c.what;
        EXPECT_EQ(c.visited, parser.EntriesVisited()) << c.what;
        const TSourceList sources = *parser.Sources();
        EXPECT_EQ(c.visited > 0 ? c.visited - 1 : 0, sources.size()) << c.what;
        EXPECT_TRUE(std::all_of(sources.begin(), sources.end(), [&](const auto& source) {
            return source.rootPath == first;
        })) << c.what;
        EXPECT_EQ(logBefore + 1, LogEntries()) << c.what;
        EXPECT_NE(std::wstring::npos, ReadWideFile(ErrorLogPath()).find(c.logged)) << c.what;

        // The next drop starts afresh.
        EXPECT_EQ(S_OK, parser.ParseDataObject(data.Get(), L"", true)) << c.what;
        EXPECT_EQ(c.visited, parser.EntriesVisited()) << c.what;
    }
}

TEST_F(DropWalkTest, ManyFailingSourcesInOneDropWriteAFewEntriesAndOneCount) {
    constexpr int kMissing = 200;
    std::vector<std::wstring> missing;
    for (int file = 0; file < kMissing; ++file)
        missing.push_back(scratch_.Path() + L"\\gone" + std::to_wstring(file) + L".lv");
    const size_t logBefore = LogEntries();
    TSourceParser parser(true);
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND),
              parser.ParseDataObject(FileListObject(missing).Get(), L"", true));
    EXPECT_TRUE(parser.Sources()->empty());
    EXPECT_EQ(logBefore + kMaximumReportsPerDrop + 1, LogEntries());
    const std::wstring count =
        std::to_wstring(kMissing - kMaximumReportsPerDrop) + L" further failures of this drop";
    EXPECT_NE(std::wstring::npos, ReadWideFile(ErrorLogPath()).find(count));
}

}  // namespace
