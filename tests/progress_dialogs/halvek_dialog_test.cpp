// The external-library dialog with the substitute library: success, every failure, cancel after
// Start, German texts; the adapter's port number, points buffer, file path and table slots.
#include "download/halvek_download_progress_dialog.h"

#include <array>
#include <cstring>
#include <cwchar>
#include <memory>
#include <utility>

#include "res/resource.h"
#include "support/text_lookup.h"
#include "tests/progress_dialogs/halvek_fixture.h"

namespace fs = std::filesystem;

TEST_F(HalvekDialog, StartEndsWithOkAndTheLibraryWroteTheFile) {
    auto dialog =
        std::make_unique<CHalvekDownloadProgressDialog>(nullptr, station_, output_.wstring(),
                                                        HalvekLibraryClaim::TryTake());
    const INT_PTR result = RunDialog(*dialog, [](HWND window) { Press(window, IDC_START); });
    dialog.reset();  // deletes the library object
    EXPECT_EQ(result, IDOK);
    EXPECT_TRUE(user_.MessageBoxes().empty());
    EXPECT_EQ(ReadAll(written_).substr(0, 10), "HVR2X,JOB,");

    const std::string log = ReadAll(log_);
    for (const char* part :
         {"CreateInstance\r\nInitialize\r\nSetFilePath ",
          "SetTimeout 30\r\nSetPoints markers=10000\r\n"
          "SetCommParams port=12 baud=9600 parity=2 stop=0 flow=0 data=7 checksum=1\r\n"
          "SetCallback\r\nStartDownload 20 1\r\n",
          "Completed 0\r\nDeleteObject 1\r\n"})
        EXPECT_NE(log.find(part), std::string::npos) << part << "\nin\n" << log;
}

TEST_F(HalvekDialog, EachFailureShowsItsTextInOneBoxAndCancelsWithoutAFile) {
    struct Case {
        const wchar_t* setting;  // of the substitute library
        const wchar_t* value;
        const wchar_t* text;
    } const cases[] = {
        // The result the library reports at the end of the transfer.
        {L"HALVEKCOMM_RESULT", L"-101", L"The waiting time of the data has expired."},
        {L"HALVEKCOMM_RESULT", L"-102", L"The communication's process is interrupted by the user"},
        {L"HALVEKCOMM_RESULT", L"-201", L"Unable to create file for saving"},
        {L"HALVEKCOMM_RESULT", L"-202", L"Unable to create file for saving"},
        {L"HALVEKCOMM_RESULT", L"-203", L"Unable to create file for saving"},
        {L"HALVEKCOMM_RESULT", L"-204", L"The checksum is incorrect"},
        {L"HALVEKCOMM_RESULT", L"-301", L"Temporary file open error"},
        {L"HALVEKCOMM_RESULT", L"-302", L"Point name or memo is wrong"},
        {L"HALVEKCOMM_RESULT", L"-7", L"Unknown error"},
        // A refused start, and each set-up step that fails: the download never starts.
        {L"HALVEKCOMM_START_RESULT", L"-204", L"The checksum is incorrect"},
        {L"HALVEKCOMM_FAIL", L"SetFilePath", L"Unable to set file path"},
        {L"HALVEKCOMM_FAIL", L"SetTimeout", L"Unable to set timeout"},
        {L"HALVEKCOMM_FAIL", L"SetPoints", L"Unable to set points"},
        {L"HALVEKCOMM_FAIL", L"SetCommParams", L"Unable to set communication parameters"},
    };
    for (const Case& test : cases) {
        SCOPED_TRACE(testing::Message() << test.setting << "=" << test.value);
        RecordingUserInterface user;
        ScopedUserInterface seam(user);
        fs::remove(log_);
        ::SetEnvironmentVariableW(test.setting, test.value);
        CHalvekDownloadProgressDialog dialog(nullptr, station_, output_.wstring(),
                                         HalvekLibraryClaim::TryTake());
        EXPECT_EQ(RunDialog(dialog, [](HWND window) { Press(window, IDC_START); }), IDCANCEL);
        ::SetEnvironmentVariableW(test.setting, nullptr);
        ExpectOneBox(user, test.text, MB_ICONEXCLAMATION);
        // The library's "interrupted by the user" is the surveyor's cancel, no failure.
        const bool cancelled = std::wcscmp(test.value, L"-102") == 0;
        EXPECT_EQ(dialog.FailureText(), cancelled ? L"" : test.text) << "the records' reason";
        EXPECT_FALSE(fs::exists(written_));
        const bool setUpFailed = std::wcscmp(test.setting, L"HALVEKCOMM_FAIL") == 0;
        EXPECT_EQ(ReadAll(log_).find("StartDownload") == std::string::npos, setUpFailed)
            << "the steps after a failed one never run";
    }
}

TEST_F(HalvekDialog, CancelAfterStartWaitsForTheLibrarysEnd) {
    ::SetEnvironmentVariableW(L"HALVEKCOMM_DELAY_MS", L"20000");
    ::SetEnvironmentVariableW(L"HALVEKCOMM_CANCEL_DELAY_MS", L"1500");
    CHalvekDownloadProgressDialog dialog(nullptr, station_, output_.wstring(),
                                         HalvekLibraryClaim::TryTake());
    const INT_PTR result = RunDialog(dialog, [](HWND window) {
        Press(window, IDC_START);
        ASSERT_TRUE(WaitForText(window, IDC_STATUS_TEXT, L"Downloading...", 5000));
        EXPECT_FALSE(IsEnabled(window, IDC_START));
        // The library takes a while to wind down; meanwhile the dialog stays open.
        Press(window, IDCANCEL);
        EXPECT_TRUE(WaitForText(window, IDC_STATUS_TEXT, L"Terminating connection...", 5000));
    });
    EXPECT_EQ(result, IDCANCEL);
    ExpectOneBox(user_, L"The communication's process is interrupted by the user",
                 MB_ICONEXCLAMATION);
    EXPECT_EQ(dialog.FailureText(), L"") << "a cancel is no failure";
    // The library ended on the honoured cancel, not on its 20-second download.
    EXPECT_NE(ReadAll(log_).find("Cancel\r\nCompleted -102\r\n"), std::string::npos);
}

// The texts both dialogs open with come from their shared base, in the user interface's language.
TEST_F(HalvekDialog, ShowsGermanTextsInAGermanUi) {
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN)));
    const std::wstring instructions = LoadUiText(IDS_INSTRUCTIONS_LV20);
    ::SetEnvironmentVariableW(L"HALVEKCOMM_RESULT", L"-204");
    CHalvekDownloadProgressDialog dialog(nullptr, station_, output_.wstring(),
                                         HalvekLibraryClaim::TryTake());
    const INT_PTR result = RunDialog(dialog, [&](HWND window) {
        EXPECT_EQ(Text(window), L"Datei vom Digitalnivellier herunterladen");
        EXPECT_EQ(Text(window, IDCANCEL), L"Abbrechen");
        EXPECT_EQ(Text(window, IDC_STATUS_TEXT), L"Warten auf Start...");
        EXPECT_EQ(Text(window, IDC_INSTRUCTIONS), instructions);
        Press(window, IDC_START);
    });
    ASSERT_TRUE(SelectThreadUiLanguage(before));
    EXPECT_EQ(result, IDCANCEL);
    ExpectOneBox(user_, L"Die Prüfsumme ist falsch", MB_ICONEXCLAMATION,
                 L"Quorvel Digitalnivelliere");
}

TEST(HalvekAdapter, PortNumberStartsAtTheFirstDigit) {
    EXPECT_EQ(HalvekPortNumber(WIDE_TEXT("COM12")), 12);
    EXPECT_EQ(HalvekPortNumber(WIDE_TEXT("\\\\.\\COM7x9")), 7);
    EXPECT_EQ(HalvekPortNumber(WIDE_TEXT("")), 0);
    EXPECT_EQ(HalvekPortNumber(WIDE_TEXT("COM99999999999")), 999999999);
}

TEST(HalvekAdapter, PointsBufferMarksEveryHalf) {
    const auto buffer = MakeHalvekPointsBuffer();
    ASSERT_NE(buffer, nullptr);
    for (size_t half : {size_t{0}, size_t{1}, size_t{9999}}) {
        int32_t marker = 0;
        std::memcpy(&marker, buffer.get() + half * 72 + 20, sizeof marker);
        EXPECT_EQ(marker, -1) << half;
    }
}

TEST(HalvekAdapter, FilePathIsCutToTheLibrarysLimit) {
    EXPECT_EQ(HalvekFilePath(L"C:\\Temp\\QRV1.tmp"), "C:\\Temp\\QRV1.tmp");
    EXPECT_LT(HalvekFilePath(std::wstring(400, L'a')).size(), 260u);
}

namespace {

// A library object whose table is written here slot by slot, as the library's maker documents
// it, independently of the header that the adapter and the substitute share: each entry records
// its own slot number.
struct SlotRecorder {
    const void* const* table;
    int calledSlot = -1;
};

template <int Slot>
intptr_t RecordSlot(SlotRecorder* self) {  // the arguments after this one are not read
    self->calledSlot = Slot;
    return 0;
}

template <int... Slot>
std::array<const void*, sizeof...(Slot)> DocumentedTable(std::integer_sequence<int, Slot...>) {
    return {reinterpret_cast<const void*>(&RecordSlot<Slot>)...};
}

const auto kDocumentedTable = DocumentedTable(std::make_integer_sequence<int, 14>());

}  // namespace

TEST(HalvekAdapter, EachOperationCallsTheLibrarysDocumentedSlot) {
    struct Case {
        const char* operation;
        int slot;
        void (*call)(IHalvekCommObject& library);
    } const cases[] = {
        {"destructor", 0, [](IHalvekCommObject& library) { library.DeleteObject(1); }},
        {"SetCommParams", 2,
         [](IHalvekCommObject& library) { library.SetCommParams(3, 9600, 2, 0, 0, 7, 0); }},
        {"Initialize", 3, [](IHalvekCommObject& library) { library.Initialize(); }},
        {"StartDownload", 4, [](IHalvekCommObject& library) { library.StartDownload(20, 1); }},
        {"SetPoints", 6, [](IHalvekCommObject& library) { library.SetPoints(nullptr); }},
        {"Cancel", 8, [](IHalvekCommObject& library) { library.Cancel(); }},
        {"SetFilePath", 9, [](IHalvekCommObject& library) { library.SetFilePath("C:\\f"); }},
        {"SetTimeout", 10, [](IHalvekCommObject& library) { library.SetTimeout(30); }},
        {"SetCallback", 13, [](IHalvekCommObject& library) { library.SetCallback(nullptr); }},
    };
    for (const Case& test : cases) {
        SlotRecorder object{kDocumentedTable.data()};
        // Seen through the adapter's declaration, as the library's own object is: a pointer to
        // a table of functions, nothing more.
        void* address = &object;
        test.call(*static_cast<IHalvekCommObject*>(address));
        EXPECT_EQ(test.slot, object.calledSlot) << test.operation;
    }
}
