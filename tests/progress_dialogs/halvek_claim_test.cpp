// One download through the external library at a time: a second one in the same process is
// refused before anything starts, the first ends with its own result, and a Cancel that the
// library never answers ends the dialog while the claim waits for the library's late end.
#include "download/dialog_station_downloader.h"
#include "download/halvek_download_progress_dialog.h"

#include <atomic>
#include <chrono>
#include <future>
#include <memory>
#include <string>
#include <utility>

#include "support/module_lock.h"
#include "tests/progress_dialogs/halvek_fixture.h"

namespace {

namespace fs = std::filesystem;

const wchar_t kRefusal[] =
    L"Another file is being downloaded from a Quorvel LV-20 or LV-30, or that download has not "
    L"ended yet. Only one such download can run at a time: wait until it has ended, then copy "
    L"the file again.";

// The target the data object would make, at a fixed path; records that it was asked for.
PrepareTargetFunction FixedTarget(const std::wstring& path, bool* asked = nullptr) {
    return [path, asked](std::wstring& target) {
        if (asked)
            *asked = true;
        target = path;
        return S_OK;
    };
}

// The data object's call: the downloader runs the dialog of the station's model modally.
struct LibraryDownload {
    LibraryDownload(const Station& station, std::wstring target)
        : station(station), target(std::move(target)) {}

    const Station& station;
    std::wstring target;
    std::wstring file;
    std::wstring shownFailure;
    HRESULT result = E_UNEXPECTED;

    INT_PTR DoModal() {
        result = DialogStationDownloader().Download(nullptr, station, FixedTarget(target), file,
                                                    shownFailure);
        return 0;
    }
};

// A second download on a thread of its own, as from a second Explorer window; a dialog that it
// opens after all is closed, so that a failing test ends. A refused download never asks for its
// target, so no file of it is made.
HRESULT DownloadOnAnotherThread(const Station& station, const std::wstring& target) {
    std::atomic<DWORD> thread{0};
    bool targetAsked = false;
    std::wstring shownFailure;
    auto second = std::async(std::launch::async, [&] {
        thread = ::GetCurrentThreadId();
        std::wstring file;
        return DialogStationDownloader().Download(
            nullptr, station, FixedTarget(target, &targetAsked), file, shownFailure);
    });
    if (second.wait_for(std::chrono::seconds(10)) != std::future_status::ready) {
        ADD_FAILURE() << "the second download opened a dialog";
        while (second.wait_for(std::chrono::milliseconds(100)) != std::future_status::ready) {
            if (const HWND window = VisibleDialogOf(thread))
                ::PostMessageW(window, WM_CLOSE, 0, 0);
        }
    }
    const HRESULT result = second.get();
    EXPECT_EQ(result != HRESULT_FROM_WIN32(ERROR_BUSY), targetAsked)
        << "a refused download asked for its target";
    if (result == HRESULT_FROM_WIN32(ERROR_BUSY))
        EXPECT_EQ(LoadUiText(IDS_LIBRARY_DOWNLOAD_RUNNING), shownFailure) << "the records' reason";
    return result;
}

size_t Count(const std::string& text, const std::string& part) {
    size_t count = 0;
    for (size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + 1))
        ++count;
    return count;
}

class HalvekClaim : public HalvekDialog {
protected:
    void TearDown() override {
        std::error_code ignored;
        fs::remove(second_.wstring() + L".txt", ignored);
        HalvekDialog::TearDown();
    }
    const fs::path second_ = TemporaryFile(L"second.hvr");
};

}  // namespace

TEST_F(HalvekClaim, ASecondLibraryDownloadIsRefusedAndTheFirstEndsWithItsOwnFile) {
    ::SetEnvironmentVariableW(L"HALVEKCOMM_DELAY_MS", L"1500");
    LibraryDownload first{station_, output_.wstring()};
    RunDialog(first, [&](HWND window) {
        EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_BUSY),
                  DownloadOnAnotherThread(station_, second_.wstring()));
        // Refused before the first was even started, and again while it runs.
        Press(window, IDC_START);
        ASSERT_TRUE(WaitForText(window, IDC_STATUS_TEXT, L"Downloading...", 5000));
        EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_BUSY),
                  DownloadOnAnotherThread(station_, second_.wstring()));
    });
    EXPECT_EQ(S_OK, first.result);
    EXPECT_EQ(written_.wstring(), first.file);
    EXPECT_EQ(ReadAll(written_).substr(0, 10), "HVR2X,JOB,");
    EXPECT_FALSE(fs::exists(second_.wstring() + L".txt"));

    const auto boxes = user_.MessageBoxes();
    ASSERT_EQ(2u, boxes.size());
    for (const auto& box : boxes) {
        EXPECT_EQ(kRefusal, box.text);
        EXPECT_EQ(L"Quorvel Digital Levels", box.caption);
        EXPECT_EQ(static_cast<UINT>(MB_ICONEXCLAMATION), box.style);
    }
    const std::string log = ReadAll(log_);
    EXPECT_EQ(1u, Count(log, "CreateInstance")) << "the refused downloads never touched it";
    EXPECT_EQ(1u, Count(log, "Completed 0"));
    EXPECT_TRUE(HalvekLibraryClaim::TryTake()) << "the first download's end lets the next run";
}

TEST_F(HalvekClaim, CancelEndsTheDialogWhenTheLibraryDoesNotAnswerAndItsLateEndReachesNoOne) {
    // The library ignores Cancel and reports only after four seconds, long after the dialog
    // gave up on it (its wait shortened here from the library's time-out).
    ::SetEnvironmentVariableW(L"HALVEKCOMM_IGNORE_CANCEL", L"1");
    ::SetEnvironmentVariableW(L"HALVEKCOMM_DELAY_MS", L"4000");
    const DWORD wait = SetHalvekCancelWait(300);
    const LONG moduleLocks = ModuleLockCount();
    LibraryDownload first{station_, output_.wstring()};
    RunDialog(first, [&](HWND window) {
        Press(window, IDC_START);
        ASSERT_TRUE(WaitForText(window, IDC_STATUS_TEXT, L"Downloading...", 5000));
        Press(window, IDCANCEL);
        EXPECT_TRUE(WaitFor([&] { return !::IsWindow(window); }, 3000))
            << "the dialog waited for a library that does not answer";
    });
    SetHalvekCancelWait(wait);
    EXPECT_EQ(S_FALSE, first.result);
    ExpectOneBox(user_, L"The communication's process is interrupted by the user",
                 MB_ICONEXCLAMATION);

    // The library still runs: its object is kept, the module with it, and no other library
    // download starts that its completion could be taken for.
    std::string log = ReadAll(log_);
    EXPECT_EQ(std::string::npos, log.find("DeleteObject")) << log;
    EXPECT_EQ(std::string::npos, log.find("Completed")) << log;
    EXPECT_EQ(moduleLocks + 1, ModuleLockCount());
    EXPECT_EQ(HRESULT_FROM_WIN32(ERROR_BUSY),
              DownloadOnAnotherThread(station_, second_.wstring()));
    EXPECT_EQ(2u, user_.MessageBoxes().size());

    // Its late end lets the next download run, and the file it wrote too late goes.
    EXPECT_TRUE(WaitFor([&] { return ReadAll(log_).find("Completed 0") != std::string::npos; },
                        15000));
    EXPECT_TRUE(WaitFor([] { return static_cast<bool>(HalvekLibraryClaim::TryTake()); }, 5000));
    EXPECT_FALSE(fs::exists(written_));
    EXPECT_EQ(moduleLocks, ModuleLockCount());
    log = ReadAll(log_);
    EXPECT_NE(std::string::npos, log.find("Completed 0\r\nDeleteObject 1\r\n"))
        << "the kept object is deleted once the library is done with it:\n"
        << log;
}

// The first dialog, cancelled before Start, ends at once; it holds the claim until it goes, and a
// second dialog made meanwhile has none and refuses to start.
TEST_F(HalvekClaim, ADialogHoldsTheClaimUntilItGoesAndOneWithoutItRefusesToStart) {
    auto first = std::make_unique<CHalvekDownloadProgressDialog>(
        nullptr, station_, output_.wstring(), HalvekLibraryClaim::TryTake());
    EXPECT_EQ(IDCANCEL, RunDialog(*first, [](HWND window) {
                  Press(window, IDCANCEL);
                  EXPECT_TRUE(WaitFor([&] { return !::IsWindow(window); }, 5000));
              }));
    EXPECT_TRUE(user_.MessageBoxes().empty());
    CHalvekDownloadProgressDialog second(nullptr, station_, output_.wstring(),
                                         HalvekLibraryClaim::TryTake());
    EXPECT_EQ(IDCANCEL, RunDialog(second, [](HWND window) { Press(window, IDC_START); }));
    ExpectOneBox(user_, kRefusal, MB_ICONEXCLAMATION);
    EXPECT_FALSE(fs::exists(log_)) << "the library was never asked for anything";
    first.reset();
    EXPECT_TRUE(HalvekLibraryClaim::TryTake());
}
