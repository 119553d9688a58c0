// "FileContents" over a scripted downloader: what the data object makes of each way a download
// ends, with no dialog run and no instrument.
#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>

#include "download/station_downloader.h"
#include "tests/data_object/data_object_fixture.h"

using Microsoft::WRL::ComPtr;

namespace {

// Answers a download with a set result after writing the given bytes, if any, to the file it
// names; records what it was asked.
class ScriptedDownloader final : public StationDownloader {
public:
    // refusesAtOnce: answers before it asks for its target, as a download that cannot run does.
    ScriptedDownloader(HRESULT result, std::optional<std::string> written,
                       bool refusesAtOnce = false)
        : result_(result), written_(std::move(written)), refusesAtOnce_(refusesAtOnce) {}

    HRESULT Download(HWND, const Station& station, const PrepareTargetFunction& prepareTarget,
                     std::wstring& file) noexcept override {
        ++runs;
        stationName = station.Name;
        if (refusesAtOnce_)
            return result_;
        std::wstring target;
        if (const HRESULT prepared = prepareTarget(target); FAILED(prepared))
            return prepared;
        file = target + L".part";
        writtenPath = file;
        if (written_) {
            UniqueFileHandle out(
                ::CreateFileW(file.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr));
            DWORD count = 0;
            EXPECT_TRUE(::WriteFile(out.get(), written_->data(),
                                    static_cast<DWORD>(written_->size()), &count, nullptr));
        }
        return result_;
    }

    int runs = 0;
    std::wstring stationName;
    std::wstring writtenPath;

private:
    const HRESULT result_;
    const std::optional<std::string> written_;
    const bool refusesAtOnce_;
};

class FileContentsDownloader : public DataObject {};

TEST_F(FileContentsDownloader, OnlyAReportedCompleteFileBecomesAStreamAndNothingIsLeftBehind) {
    const std::string partial = "A,01,Z\r\n1,0.0";
    struct Case {
        const char* what;
        HRESULT download;                    // what the downloader answers
        std::optional<std::string> written;  // what it left in the file
        HRESULT expected;                    // what GetData answers
        bool refusesAtOnce = false;          // it answers before it asks for its target
    } const cases[] = {
        {"complete", S_OK, kContent, S_OK},
        {"cancelled half way", S_FALSE, partial, S_FALSE},
        {"cancelled before any data", S_FALSE, std::nullopt, S_FALSE},
        {"refused by a full disk", HRESULT_FROM_WIN32(ERROR_DISK_FULL), partial,
         HRESULT_FROM_WIN32(ERROR_DISK_FULL)},
        {"found incomplete after the transfer", HRESULT_FROM_WIN32(ERROR_INVALID_DATA),
         std::string(), HRESULT_FROM_WIN32(ERROR_INVALID_DATA)},
        {"unable to run", E_FAIL, std::nullopt, E_FAIL},
        {"refused before its target", HRESULT_FROM_WIN32(ERROR_BUSY), std::nullopt,
         HRESULT_FROM_WIN32(ERROR_BUSY), true},
        // A success with no file behind it is no download: nothing to open, no stream.
        {"complete without a file", S_OK, std::nullopt, HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND)},
    };
    const std::vector<std::wstring> before = TemporaryDownloads();
    for (const Case& test : cases) {
        SCOPED_TRACE(test.what);
        ScriptedDialogs dialogs(IDOK);
        ScopedUserInterface scope(dialogs);
        auto downloader =
            std::make_shared<ScriptedDownloader>(test.download, test.written, test.refusesAtOnce);
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
        } else {
            EXPECT_EQ(static_cast<DWORD>(TYMED_NULL), medium.get().tymed);
            EXPECT_FALSE(FileExists(downloader->writtenPath)) << "a partial file must go";
        }
        medium.reset();
        EXPECT_FALSE(FileExists(downloader->writtenPath));
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

}  // namespace
