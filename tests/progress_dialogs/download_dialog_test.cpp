// The built-in download dialog: texts, a stray IDOK, a missing port, and transfers from the
// instrument simulator over the virtual cable COM40-COM41, completed and cancelled midway.
#include "download/download_progress_dialog.h"

#include <optional>

#include "res/resource.h"
#include "support/text_lookup.h"
#include "tests/progress_dialogs/dialog_driver.h"
#include "tests/serial/instrument.h"
#include "tests/support/registry_override.h"

namespace {

// Ports above COM9 are only reachable under their device names.
constexpr wchar_t kDialogPort[] = L"\\\\.\\COM40";      // the receiving end of the virtual cable
constexpr wchar_t kInstrumentPort[] = L"\\\\.\\COM41";  // the simulator's end
constexpr wchar_t kMissingPort[] = L"COM49";            // never created

class DownloadDialog : public DialogTest {
protected:
    void SetUp() override {
        DialogTest::SetUp();
        station_.Name = L"Site 4 level";
        station_.Port = kDialogPort;
        station_.Model = LoadUiText(IDS_MODEL_LV10);
        station_.BaudRate = 9600;
        station_.Parity = 2;
    }
    void TearDown() override {
        std::error_code ignored;
        std::filesystem::remove(output_, ignored);
    }

    Station station_;
    const std::filesystem::path output_ = TemporaryFile(L"download.lv");
};

}  // namespace

TEST_F(DownloadDialog, AStrayOkBeforeStartIsIgnoredAndTextsQueuedAtCloseAreFreed) {
    CDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
    Station missing = station_;
    missing.Port = kMissingPort;
    // A worker that keeps talking while the user closes the dialog; it outlives the window, as
    // the dialog's own thread does.
    std::optional<CLVDownloadThread> talker;
    const INT_PTR result = RunDialog(dialog, [&](HWND window) {
        // What Enter in the instructions sends on Windows: the dialog must stay.
        ::SendMessageW(window, WM_COMMAND, IDOK, 0);
        EXPECT_TRUE(::IsWindow(window));
        EXPECT_FALSE(dialog.TransferCompleted());
        // The sent Cancel is handled before the posted texts, which are still queued when the
        // window goes (and the one the dialog's loop takes right after EndDialog is dropped).
        talker.emplace(window, missing, output_.wstring());
        for (int text = 0; text < 10000; ++text)
            talker->ShowMessage(MessageCode::Information, L"line accepted");
        ::SendMessageW(window, WM_COMMAND, IDCANCEL, 0);
    });
    EXPECT_EQ(result, IDCANCEL);
    talker.reset();
    EXPECT_EQ(CLVDownloadThread::LiveMessageTexts(), 0) << "every text was freed";
}

TEST_F(DownloadDialog, ShowsItsTextsUntilStartWhenAMissingPortShowsItsBoxAndTheDialogCloses) {
    RegistryOverride registry(RegistryOverride::Hives::CurrentUserAndLocalMachine);
    registry.SetSerialPorts({L"COM40", L"COM41"});
    station_.Port = kMissingPort;
    CDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
    const INT_PTR result = RunDialog(dialog, [](HWND window) {
        EXPECT_EQ(Text(window), L"Download file from Digital Level");
        EXPECT_EQ(Text(window, IDC_INSTRUCTIONS), LoadUiText(IDS_INSTRUCTIONS_LV10));
        EXPECT_EQ(Text(window, IDC_STATION_NAME), L"Site 4 level");
        EXPECT_EQ(Text(window, IDC_STATUS_TEXT), L"Waiting for start...");
        // A progress message without a text, or with an empty one, leaves the status as it is.
        static const wchar_t empty[] = L"";
        for (LPARAM text : {LPARAM{0}, reinterpret_cast<LPARAM>(empty)})
            ::SendMessageW(window, g_registeredMessages.downloadThreadMessage, 1, text);
        EXPECT_EQ(Text(window, IDC_STATUS_TEXT), L"Waiting for start...");
        Press(window, IDC_START);
    });
    EXPECT_EQ(result, IDCANCEL);
    // The box names the ports the computer lists when Start is pressed; the records take it as
    // the reason.
    const wchar_t* const shown =
        L"COM49 is not on this PC now. Ports present: COM40, COM41. Check the instrument's cable "
        L"and its USB adapter, or choose one of these ports in the station's properties.";
    ExpectOneBox(user_, shown, MB_ICONSTOP);
    EXPECT_EQ(dialog.FailureText(), shown);
}

TEST_F(DownloadDialog, TransferFromTheInstrumentEndsWithOkAndTheExactFile) {
    Instrument instrument(kInstrumentPort, 9600, 24, 20);
    ASSERT_TRUE(instrument.Open()) << "no virtual cable: run through run_dialog_tests";
    CDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
    const INT_PTR result = RunDialog(dialog, [&](HWND window) {
        Press(window, IDC_START);
        // Until the header line is accepted there is no progress text.
        EXPECT_TRUE(WaitForText(window, IDC_STATUS_TEXT, L"Waiting for download...", 5000));
        EXPECT_FALSE(IsEnabled(window, IDC_START));
        instrument.Play();
        EXPECT_TRUE(WaitForText(window, IDC_STATUS_TEXT, L"Downloading...", 10000));
    });
    EXPECT_EQ(result, IDOK);
    EXPECT_EQ(instrument.Finish(), TransferResult::Complete);
    EXPECT_TRUE(user_.MessageBoxes().empty());
    EXPECT_EQ(ReadAll(output_), instrument.ExpectedFile());
    EXPECT_EQ(CLVDownloadThread::LiveMessageTexts(), 0);
}

TEST_F(DownloadDialog, CancelDuringTransferWaitsForTheDriverToStop) {
    Instrument instrument(kInstrumentPort, 1200, 200, 3);
    ASSERT_TRUE(instrument.Open()) << "no virtual cable: run through run_dialog_tests";
    {
        CDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
        const INT_PTR result = RunDialog(dialog, [&](HWND window) {
            Press(window, IDC_START);
            instrument.Play();
            ASSERT_TRUE(WaitForText(window, IDC_STATUS_TEXT, L"Downloading...", 10000));
            Press(window, IDCANCEL);
        });
        EXPECT_EQ(result, IDCANCEL);
        EXPECT_EQ(dialog.FailureText(), L"") << "the surveyor's cancel is no failure";
    }
    // The dialog is gone: its destructor waited until the driver saw the stop and ended the
    // receive, which the thread reports with its one failure box, a cancel included.
    ExpectOneBox(user_, L"The waiting time of the data has expired.", MB_ICONEXCLAMATION);
    const std::string partial = ReadAll(output_);
    EXPECT_EQ(partial.rfind("A,01,Z\r\n", 0), 0u);
    EXPECT_LT(partial.size(), instrument.ExpectedFile().size());
    // The instrument's lines were never all acknowledged.
    EXPECT_EQ(instrument.Finish(), TransferResult::Failed);
    EXPECT_EQ(CLVDownloadThread::LiveMessageTexts(), 0);
}
