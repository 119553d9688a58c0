// "FileContents" over a scripted downloader: what the data object makes of each way a download
// ends, with no dialog run and no instrument.
#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "download/download_journal.h"
#include "download/kept_downloads.h"
#include "download/station_downloader.h"
#include "support/module_instance.h"
#include "support/registry_value.h"
#include "tests/data_object/data_object_fixture.h"

using Microsoft::WRL::ComPtr;

namespace {

// Answers a download with a set result after writing the given bytes, if any, to the file it
// names; records what it was asked.
class ScriptedDownloader final : public StationDownloader {
public:
    // refusesAtOnce: answers before it asks for its target, as a download that cannot run does.
    // shownFailure: what the user was shown, as the dialogs report it.
    ScriptedDownloader(HRESULT result, std::optional<std::string> written,
                       bool refusesAtOnce = false, std::wstring shownFailure = {})
        : result_(result), written_(std::move(written)), refusesAtOnce_(refusesAtOnce),
          shownFailure_(std::move(shownFailure)) {}

    HRESULT Download(HWND, const Station& station, const PrepareTargetFunction& prepareTarget,
                     std::wstring& file, std::wstring& shownFailure) noexcept override {
        ++runs;
        stationName = station.Name;
        shownFailure = shownFailure_;
        if (refusesAtOnce_)
            return result_;
        std::wstring target;
        if (const HRESULT prepared = prepareTarget(target); FAILED(prepared))
            return prepared;
        file = target + L".part";
        writtenPath = file;
        if (written_)
            WriteAsTheLibraryDoes(file, *written_);
        return result_;
    }

    int runs = 0;
    std::wstring stationName;
    std::wstring writtenPath;

private:
    const HRESULT result_;
    const std::optional<std::string> written_;
    const bool refusesAtOnce_;
    const std::wstring shownFailure_;
};

namespace fs = std::filesystem;

// Reads what a download leaves in the records (kept copies, journal; the fixture's scratch
// folder).
class FileContentsDownloader : public DataObject {
protected:
    // One download of North that ends as given; the stream's content, read to its end, if any.
    std::string DownloadNorth(HRESULT result = S_OK, std::optional<std::string> written = kContent) {
        ScriptedDialogs dialogs(IDOK);
        ScopedUserInterface scope(dialogs);
        auto downloader = std::make_shared<ScriptedDownloader>(result, std::move(written));
        UniqueStgMedium medium;
        EXPECT_EQ(result, Get(Over({kNorthFile}, downloader).Get(), CFSTR_FILECONTENTS,
                              TYMED_ISTREAM, medium, 0));
        return medium.get().tymed == TYMED_ISTREAM ? ReadToEnd(medium.get().pstm) : "";
    }

    fs::path Kept(const wchar_t* station = L"North") const {
        return records_ / kKeptDownloadsFolderName / station;
    }

    // The journal's records, read as a spreadsheet reads CSV (RFC 4180); the mark is checked.
    std::vector<std::vector<std::string>> Journal() const {
        const std::string text = ContentOf(records_ / kJournalFileName);
        std::vector<std::vector<std::string>> records;
        EXPECT_EQ("\xEF\xBB\xBF", text.substr(0, 3)) << "a byte-order mark first";
        std::vector<std::string> record(1);
        bool quoted = false;
        for (size_t index = 3; index < text.size(); ++index) {
            const char c = text[index];
            if (quoted && c == '"' && index + 1 < text.size() && text[index + 1] == '"') {
                record.back().push_back('"');
                ++index;
            } else if (c == '"') {
                quoted = !quoted;
            } else if (!quoted && c == ',') {
                record.emplace_back();
            } else if (!quoted && c == '\r' && index + 1 < text.size() && text[index + 1] == '\n') {
                records.push_back(record);
                record.assign(1, std::string());
                ++index;
            } else {
                record.back().push_back(c);
            }
        }
        EXPECT_EQ(1u, record.size()) << "the last record ends its line";
        return records;
    }

    static UniqueRegKey PolicyKey(HKEY hive) {
        UniqueRegKey key;
        EXPECT_EQ(ERROR_SUCCESS, ::RegCreateKeyExW(hive, kKeepingPolicyKey, 0, nullptr, 0,
                                                   KEY_SET_VALUE, nullptr, key.put(), nullptr));
        return key;
    }
    static void SetPolicy(HKEY hive, const wchar_t* name, DWORD value) {
        ASSERT_EQ(ERROR_SUCCESS, WriteDwordValue(PolicyKey(hive).get(), name, value));
    }

    // A kept file of a station, of the given size, last written daysAgo days ago.
    fs::path PlaceKept(const wchar_t* station, const wchar_t* name, size_t size, int daysAgo) {
        fs::create_directories(Kept(station));
        const fs::path path = Kept(station) / name;
        std::ofstream(path, std::ios::binary) << std::string(size, 'k');
        fs::last_write_time(path, fs::file_time_type::clock::now() - std::chrono::days(daysAgo));
        return path;
    }
};

enum Column { kStart, kStation, kPort, kBaud, kParity, kModel, kProcedure, kBytes, kSeconds,
              kResult, kMessage, kKeptFile, kColumns };

// Each way a download ends: only a reported complete file becomes a stream, nothing is left
// behind, every attempt leaves a row in the journal and only a completed one a kept file. The row
// gives what the user was shown word for word, quotes, commas and line breaks included.
TEST_F(FileContentsDownloader, EachEndOfADownloadGivesItsStreamOrNoneAndItsJournalRow) {
    const std::string partial = "A,01,Z\r\n1,0.0";
    struct Case {
        const char* what;
        HRESULT download;                    // what the downloader answers
        std::optional<std::string> written;  // what it left in the file
        HRESULT expected;                    // what GetData answers
        const char* result;                  // the journal's word for it
        bool reason;                         // whether the row gives one
        bool refusesAtOnce = false;          // it answers before it asks for its target
        std::wstring shown = {};             // the failure the user was shown, the row's reason
    } const cases[] = {
        {"complete", S_OK, kContent, S_OK, "ok", false},
        {"cancelled half way", S_FALSE, partial, S_FALSE, "cancelled", false},
        {"refused by a full disk", HRESULT_FROM_WIN32(ERROR_DISK_FULL), partial,
         HRESULT_FROM_WIN32(ERROR_DISK_FULL), "failed", true},
        {"unable to run", E_FAIL, std::nullopt, E_FAIL, "failed", true},
        {"refused before its target", HRESULT_FROM_WIN32(ERROR_BUSY), std::nullopt,
         HRESULT_FROM_WIN32(ERROR_BUSY), "failed", true, true},
        // A success with no file behind it is no download: nothing to open, no stream, a failed row.
        {"complete without a file", S_OK, std::nullopt, HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND),
         "failed", true},
        {"a port that is not there", S_FALSE, "", S_FALSE, "failed", true, false,
         L"COM9 is not on this PC now. Ports present: COM3, COM7."},
        {"a library error shown over a system failure", HRESULT_FROM_WIN32(ERROR_DISK_FULL), "A,01",
         HRESULT_FROM_WIN32(ERROR_DISK_FULL), "failed", true, false, L"Line 1,\r\n\"2\""},
    };
    const std::vector<std::wstring> before = TemporaryDownloads();
    size_t kept = 0, rows = 1;
    for (const Case& test : cases) {
        SCOPED_TRACE(test.what);
        ScriptedDialogs dialogs(IDOK);
        ScopedUserInterface scope(dialogs);
        auto downloader = std::make_shared<ScriptedDownloader>(test.download, test.written,
                                                               test.refusesAtOnce, test.shown);
        UniqueStgMedium medium;
        EXPECT_EQ(test.expected, Get(Over({kNorthFile}, downloader).Get(), CFSTR_FILECONTENTS,
                                     TYMED_ISTREAM, medium, 0));
        EXPECT_EQ(1, downloader->runs);
        EXPECT_EQ(L"North", downloader->stationName);
        EXPECT_EQ(0, dialogs.runs);
        EXPECT_TRUE(dialogs.messages.empty());
        if (test.expected == S_OK) {
            ASSERT_EQ(static_cast<DWORD>(TYMED_ISTREAM), medium.get().tymed);
            EXPECT_EQ(kContent, ReadToEnd(medium.get().pstm));
            ++kept;
        } else {
            EXPECT_EQ(static_cast<DWORD>(TYMED_NULL), medium.get().tymed);
            EXPECT_FALSE(FileExists(downloader->writtenPath)) << "a partial file must go";
        }
        medium.reset();
        EXPECT_FALSE(FileExists(downloader->writtenPath));

        EXPECT_EQ(kept, FilesIn(Kept()).size());
        const auto journal = Journal();
        ASSERT_EQ(++rows, journal.size()) << "one header, one row each";
        const std::vector<std::string>& row = journal.back();
        EXPECT_EQ(test.result, row[kResult]);
        EXPECT_EQ("line", row[kProcedure]) << "the built-in driver's, whatever the station stores";
        if (!test.shown.empty()) {
            EXPECT_EQ(std::string(test.shown.begin(), test.shown.end()), row[kMessage]);
        } else {
            EXPECT_EQ(test.reason, !row[kMessage].empty()) << row[kMessage];
        }
        EXPECT_EQ(test.expected == S_OK, !row[kKeptFile].empty());
        EXPECT_EQ(std::to_string(test.written ? test.written->size() : 0), row[kBytes]);
    }
    EXPECT_EQ(before, TemporaryDownloads());
}

// Asking twice downloads twice, each time into a fresh name.
TEST_F(FileContentsDownloader, EachRequestRunsItsOwnDownloadUnderAFreshName) {
    ScriptedDialogs dialogs(IDOK);
    ScopedUserInterface scope(dialogs);
    auto downloader = std::make_shared<ScriptedDownloader>(S_FALSE, std::nullopt);
    ComPtr<IDataObject> data = Over({kNorthFile}, downloader);
    UniqueStgMedium medium;
    EXPECT_EQ(S_FALSE, Get(data.Get(), CFSTR_FILECONTENTS, TYMED_ISTREAM, medium, 0));
    const std::wstring first = downloader->writtenPath;
    EXPECT_EQ(S_FALSE, Get(data.Get(), CFSTR_FILECONTENTS, TYMED_ISTREAM, medium, 0));
    EXPECT_EQ(2, downloader->runs);
    EXPECT_NE(first, downloader->writtenPath);
}

TEST_F(FileContentsDownloader, ACompletedDownloadIsKeptWholeAndJournaledOk) {
    EXPECT_EQ(kContent, DownloadNorth());
    const std::vector<std::wstring> kept = FilesIn(Kept());
    ASSERT_EQ(1u, kept.size());
    // "YYYY-MM-DD HHMMSS.lv"
    EXPECT_EQ(20u, kept[0].size()) << kept[0];
    EXPECT_TRUE(kept[0].ends_with(L".lv"));
    EXPECT_EQ(kContent, ContentOf(Kept() / kept[0]));

    const auto journal = Journal();
    ASSERT_EQ(2u, journal.size());
    EXPECT_EQ("start", journal[0][kStart]);
    ASSERT_EQ(static_cast<size_t>(kColumns), journal[1].size());
    EXPECT_EQ("North", journal[1][kStation]);
    EXPECT_EQ((Kept() / kept[0]).string(), journal[1][kKeptFile]);
    EXPECT_EQ(25u, journal[1][kStart].size()) << "with its offset: " << journal[1][kStart];

    // The next one in the same folder, never over the first.
    EXPECT_EQ("second", DownloadNorth(S_OK, "second"));
    const std::vector<std::wstring> both = FilesIn(Kept());
    ASSERT_EQ(2u, both.size());
    EXPECT_EQ(kContent, ContentOf(Kept() / kept[0]));
    EXPECT_EQ(3u, Journal().size()) << "one header, one row each";
}

// A file where the folder of kept downloads should be: the download's stream is handed over all
// the same and its row names why nothing was kept; the Start menu's "Kept downloads" tells the
// user which folder and why, and opens no window on something else.
TEST_F(FileContentsDownloader, AKeptFolderThatCannotBeMadeFailsNoDownloadAndIsNamedToTheUser) {
    std::ofstream(records_ / kKeptDownloadsFolderName) << "in the way";
    EXPECT_EQ(kContent, DownloadNorth());
    const auto journal = Journal();
    ASSERT_EQ(2u, journal.size());
    EXPECT_EQ("ok", journal[1][kResult]);
    EXPECT_EQ("", journal[1][kKeptFile]);
    EXPECT_FALSE(journal[1][kMessage].empty()) << "the row names why nothing was kept";

    ScriptedDialogs dialogs(IDOK);
    ScopedUserInterface scope(dialogs);
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_DIRECTORY), OpenKeptDownloadsFolder(nullptr, SW_SHOWNORMAL));
    ASSERT_EQ(1u, dialogs.messages.size());
    const std::wstring& text = dialogs.messages[0];
    EXPECT_NE(std::wstring::npos, text.find((records_ / kKeptDownloadsFolderName).wstring()))
        << text;
    EXPECT_NE(std::wstring::npos, text.find(SystemResultText(HRESULT_FROM_WIN32(ERROR_DIRECTORY))))
        << text;
}

TEST_F(FileContentsDownloader, AJournalThatCannotBeOpenedFailsNothing) {
    std::ofstream(records_ / kJournalFileName) << "held";
    UniqueFileHandle holder(::CreateFileW((records_ / kJournalFileName).c_str(), GENERIC_READ, 0,
                                          nullptr, OPEN_EXISTING, 0, nullptr));
    ASSERT_NE(INVALID_HANDLE_VALUE, holder.get());
    EXPECT_EQ(kContent, DownloadNorth());
    EXPECT_EQ(1u, FilesIn(Kept()).size());
}

// Two writers at once (two Explorer windows, or lvcopy beside one) take turns: every row whole,
// none lost, one header.
TEST_F(FileContentsDownloader, TwoWritersAtOnceLeaveEveryRowWhole) {
    constexpr int kRowsEach = 100;
    const auto write = [&](const wchar_t* station) {
        for (int index = 0; index < kRowsEach; ++index) {
            JournalRow row;
            row.Station = station;
            row.Message = L"line one,\r\nline \"two\" " + std::to_wstring(index);
            EXPECT_EQ(S_OK, AppendJournalRow(records_.wstring(), row));
        }
    };
    std::thread first(write, L"First");
    std::thread second(write, L"Second");
    first.join();
    second.join();
    const auto journal = Journal();
    ASSERT_EQ(1u + 2 * kRowsEach, journal.size());
    std::map<std::string, int> rowsOf;
    for (size_t index = 1; index < journal.size(); ++index) {
        ASSERT_EQ(static_cast<size_t>(kColumns), journal[index].size()) << "row " << index;
        EXPECT_EQ(0u, journal[index][kMessage].rfind("line one,\r\nline \"two\" ", 0));
        ++rowsOf[journal[index][kStation]];
    }
    EXPECT_EQ(kRowsEach, rowsOf["First"]);
    EXPECT_EQ(kRowsEach, rowsOf["Second"]);
}

TEST_F(FileContentsDownloader, TheJournalRotatesAtItsLimit) {
    const std::string old = "\xEF\xBB\xBF" + std::string(kJournalRotationBytes - 20, 'x') + "\r\n";
    std::ofstream(records_ / kJournalFileName, std::ios::binary) << old;
    EXPECT_EQ("", DownloadNorth(S_FALSE, std::nullopt));
    EXPECT_EQ(old, ContentOf(records_ / kOldJournalFileName));
    const auto journal = Journal();
    ASSERT_EQ(2u, journal.size());
    EXPECT_EQ("cancelled", journal[1][kResult]);
}

// Which files go is the portable tests' rule, case by case; here the kept files' stations, ages
// and sizes reach it, with a size limit (1 MB in all) from the registry and the default 90 days.
TEST_F(FileContentsDownloader, RetentionPrunesByAgeAndSizeAndKeepsEachStationsNewest) {
    SetPolicy(HKEY_CURRENT_USER, kKeepDownloadsMegabytesValue, 1);
    const fs::path oldNorth = PlaceKept(L"North", L"2025-01-01 080000.lv", 10, 120);
    const fs::path bigNorth = PlaceKept(L"North", L"2026-11-20 080000.lv", 600 * 1024, 3);
    const fs::path newerNorth = PlaceKept(L"North", L"2026-11-21 080000.lv", 600 * 1024, 2);
    const fs::path oldEast = PlaceKept(L"East", L"2025-01-01 080000.lv", 10, 300);
    EXPECT_EQ(kContent, DownloadNorth());
    EXPECT_FALSE(fs::exists(oldNorth)) << "by age";
    EXPECT_FALSE(fs::exists(bigNorth)) << "by size: the oldest goes until the rest fit";
    EXPECT_TRUE(fs::exists(newerNorth));
    EXPECT_TRUE(fs::exists(oldEast)) << "too old, but East's only copy is its newest";
    EXPECT_EQ(2u, FilesIn(Kept()).size()) << "the newer big one and the copy made here";
}

TEST_F(FileContentsDownloader, PolicyValuesComeFromTheMachineBeforeTheUser) {
    struct Case {
        const char* what;
        std::optional<DWORD> machineDays, userDays, userMegabytes;
        uint32_t days, megabytes;
    } const cases[] = {
        {"none", std::nullopt, std::nullopt, std::nullopt, 90, 1024},
        {"the user's", std::nullopt, 30, 5, 30, 5},
        {"the machine's first", 10, 30, 5, 10, 5},
        {"off", 0, 30, std::nullopt, 0, 1024},
    };
    for (const Case& test : cases) {
        SCOPED_TRACE(test.what);
        for (const HKEY hive : {HKEY_LOCAL_MACHINE, HKEY_CURRENT_USER})
            (void)::RegDeleteTreeW(hive, kKeepingPolicyKey);  // absent at first
        if (test.machineDays)
            SetPolicy(HKEY_LOCAL_MACHINE, kKeepDownloadsDaysValue, *test.machineDays);
        if (test.userDays)
            SetPolicy(HKEY_CURRENT_USER, kKeepDownloadsDaysValue, *test.userDays);
        if (test.userMegabytes)
            SetPolicy(HKEY_CURRENT_USER, kKeepDownloadsMegabytesValue, *test.userMegabytes);
        const RetentionLimits limits = ReadKeepingPolicy();
        EXPECT_EQ(test.days, limits.Days);
        EXPECT_EQ(test.megabytes, limits.Megabytes);
    }
    // A value of the wrong type is no policy.
    ASSERT_EQ(ERROR_SUCCESS,
              WriteStringValue(PolicyKey(HKEY_LOCAL_MACHINE).get(), kKeepDownloadsDaysValue, L"7"));
    EXPECT_EQ(30u, ReadKeepingPolicy().Days);
}

TEST_F(FileContentsDownloader, KeepingOffKeepsNothingAndPrunesNothing) {
    SetPolicy(HKEY_CURRENT_USER, kKeepDownloadsDaysValue, 0);
    const fs::path old = PlaceKept(L"North", L"2020-01-01 080000.lv", 10, 2000);
    const fs::path older = PlaceKept(L"North", L"2019-01-01 080000.lv", 10, 2400);
    EXPECT_EQ(kContent, DownloadNorth());
    EXPECT_EQ(2u, FilesIn(Kept()).size());
    EXPECT_TRUE(fs::exists(old) && fs::exists(older));
    const auto journal = Journal();
    ASSERT_EQ(2u, journal.size());
    EXPECT_EQ("ok", journal[1][kResult]);
    EXPECT_EQ("", journal[1][kKeptFile]);
    EXPECT_EQ("", journal[1][kMessage]);
}

}  // namespace
