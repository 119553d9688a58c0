// The external-library dialog with the substitute library: success, every result code, set-up
// failures, cancel before and after Start; the adapter's port number and points buffer.
#include "download/halvek_download_progress_dialog.h"

#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <sstream>

#include "res/resource.h"
#include "stations/station_store.h"
#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"
#include "tests/support/recording_user_interface.h"
#include "tests/progress_dialogs/dialog_driver.h"

namespace {

namespace fs = std::filesystem;

std::string ReadAll(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::stringstream content;
    content << file.rdbuf();
    return content.str();
}

class HalvekDialog : public ::testing::Test {
protected:
    void SetUp() override {
        RegisterWindowMessages();
        wchar_t temp[MAX_PATH] = {};
        ::GetTempPathW(MAX_PATH, temp);
        const std::wstring stem = L"lv_halvek_" + std::to_wstring(::GetCurrentProcessId());
        output_ = fs::path(temp) / (stem + L".hvr");
        log_ = fs::path(temp) / (stem + L".log");
        fs::remove(output_.wstring() + L".txt");
        fs::remove(log_);
        SetVariable(L"HALVEKCOMM_LOG", log_.wstring());
        station_.Name = L"North benchmark";
        station_.Port = L"COM12";
        station_.Model = LoadUiText(IDS_MODEL_LV20);
    }
    void TearDown() override {
        for (const wchar_t* name :
             {L"HALVEKCOMM_LOG", L"HALVEKCOMM_RESULT", L"HALVEKCOMM_START_RESULT",
              L"HALVEKCOMM_FAIL", L"HALVEKCOMM_DELAY_MS", L"HALVEKCOMM_IGNORE_CANCEL",
              L"HALVEKCOMM_CANCEL_DELAY_MS"}) {
            ::SetEnvironmentVariableW(name, nullptr);
        }
        std::error_code ignored;
        fs::remove(output_.wstring() + L".txt", ignored);
        fs::remove(log_, ignored);
    }
    static void SetVariable(const wchar_t* name, const std::wstring& value) {
        ::SetEnvironmentVariableW(name, value.c_str());
    }
    // Presses Start and returns the dialog's result.
    INT_PTR StartAndRun() {
        CHalvekDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
        return RunDialog(dialog, [](DialogDriver& driver) {
            ASSERT_NE(driver.WaitForDialog(), nullptr);
            driver.Press(IDC_START);
        });
    }
    // The one error box of a failed run.
    void ExpectOneErrorBox(const std::wstring& text,
                           const std::wstring& caption = L"Quorvel Digital Levels") {
        const auto boxes = user_.MessageBoxes();
        ASSERT_EQ(boxes.size(), 1u);
        EXPECT_EQ(boxes[0].text, text);
        EXPECT_EQ(boxes[0].caption, caption);
        EXPECT_EQ(boxes[0].style, static_cast<UINT>(MB_ICONEXCLAMATION));
        EXPECT_NE(boxes[0].owner, nullptr);
    }

    Station station_;
    fs::path output_;
    fs::path log_;
    RecordingUserInterface user_;
    ScopedUserInterface seam_{user_};
};

}  // namespace

TEST_F(HalvekDialog, StartEndsWithOkAndTheLibraryWroteTheFile) {
    auto dialog =
        std::make_unique<CHalvekDownloadProgressDialog>(nullptr, station_, output_.wstring());
    const INT_PTR result = RunDialog(*dialog, [&](DialogDriver& driver) {
        ASSERT_NE(driver.WaitForDialog(), nullptr);
        EXPECT_EQ(driver.Title(), L"Download file from Digital Level");
        EXPECT_EQ(driver.Text(IDC_STATUS_TEXT), L"Waiting for start...");
        EXPECT_EQ(driver.Text(IDC_STATION_NAME), L"North benchmark");
        EXPECT_EQ(driver.Text(IDC_INSTRUCTIONS), LoadUiText(IDS_INSTRUCTIONS_LV20));
        driver.Press(IDC_START);
    });
    dialog.reset();  // deletes the library object
    EXPECT_EQ(result, IDOK);
    EXPECT_TRUE(user_.MessageBoxes().empty());
    EXPECT_EQ(ReadAll(output_.wstring() + L".txt").substr(0, 10), "HVR2X,JOB,");

    const std::string log = ReadAll(log_);
    const std::string expected[] = {
        "CreateInstance\r\nInitialize\r\nSetFilePath ",
        "SetTimeout 30\r\nSetPoints markers=10000\r\n"
        "SetCommParams port=12 baud=9600 parity=2 stop=0 flow=0 data=7 checksum=1\r\n"
        "SetCallback\r\nStartDownload 20 1\r\n",
        "Completed 0\r\nDeleteObject 1\r\n"};
    for (const std::string& part : expected)
        EXPECT_NE(log.find(part), std::string::npos) << part << "\nin\n" << log;
}

TEST_F(HalvekDialog, EachResultCodeShowsItsTextAndCancels) {
    const std::pair<int, const wchar_t*> codes[] = {
        {-101, L"The waiting time of the data has expired."},
        {-102, L"The communication's process is interrupted by the user"},
        {-201, L"Unable to create file for saving"},
        {-202, L"Unable to create file for saving"},
        {-203, L"Unable to create file for saving"},
        {-204, L"The checksum is incorrect"},
        {-301, L"Temporary file open error"},
        {-302, L"Point name or memo is wrong"},
        {-7, L"Unknown error"}};
    for (const auto& [code, text] : codes) {
        RecordingUserInterface user;
        ScopedUserInterface seam(user);
        SetVariable(L"HALVEKCOMM_RESULT", std::to_wstring(code));
        EXPECT_EQ(StartAndRun(), IDCANCEL) << code;
        const auto boxes = user.MessageBoxes();
        ASSERT_EQ(boxes.size(), 1u) << code;
        EXPECT_EQ(boxes[0].text, text) << code;
        EXPECT_FALSE(fs::exists(output_.wstring() + L".txt")) << code;
    }
    EXPECT_EQ(HalvekResultText(0), L"No error");
}

TEST_F(HalvekDialog, RefusedStartShowsTheCodesText) {
    SetVariable(L"HALVEKCOMM_START_RESULT", L"-204");
    EXPECT_EQ(StartAndRun(), IDCANCEL);
    ExpectOneErrorBox(L"The checksum is incorrect");
}

TEST_F(HalvekDialog, EachFailedSetUpStepShowsItsText) {
    const std::pair<const wchar_t*, const wchar_t*> steps[] = {
        {L"SetFilePath", L"Unable to set file path"},
        {L"SetTimeout", L"Unable to set timeout"},
        {L"SetPoints", L"Unable to set points"},
        {L"SetCommParams", L"Unable to set communication parameters"}};
    for (const auto& [operation, text] : steps) {
        RecordingUserInterface user;
        ScopedUserInterface seam(user);
        SetVariable(L"HALVEKCOMM_FAIL", operation);
        EXPECT_EQ(StartAndRun(), IDCANCEL) << operation;
        const auto boxes = user.MessageBoxes();
        ASSERT_EQ(boxes.size(), 1u) << operation;
        EXPECT_EQ(boxes[0].text, text);
    }
    // The steps after a failed one never ran.
    const std::string log = ReadAll(log_);
    EXPECT_EQ(log.find("StartDownload"), std::string::npos) << log;
}

TEST_F(HalvekDialog, CancelBeforeStartEndsAtOnce) {
    CHalvekDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
    const INT_PTR result = RunDialog(dialog, [](DialogDriver& driver) {
        ASSERT_NE(driver.WaitForDialog(), nullptr);
        driver.Press(IDCANCEL);
        EXPECT_TRUE(driver.WaitUntilClosed(5000));
    });
    EXPECT_EQ(result, IDCANCEL);
    EXPECT_TRUE(user_.MessageBoxes().empty());
    EXPECT_FALSE(fs::exists(log_));  // the library was never asked for anything
    EXPECT_EQ(g_halvekDialogWindow.load(), nullptr);
}

TEST_F(HalvekDialog, CancelAfterStartWaitsForTheLibrarysEnd) {
    SetVariable(L"HALVEKCOMM_DELAY_MS", L"20000");
    SetVariable(L"HALVEKCOMM_CANCEL_DELAY_MS", L"1500");
    CHalvekDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
    const ULONGLONG started = ::GetTickCount64();
    const INT_PTR result = RunDialog(dialog, [](DialogDriver& driver) {
        ASSERT_NE(driver.WaitForDialog(), nullptr);
        driver.Press(IDC_START);
        ASSERT_TRUE(driver.WaitForText(IDC_STATUS_TEXT, L"Downloading...", 5000));
        EXPECT_FALSE(driver.IsEnabled(IDC_START));
        // The library takes a while to wind down; meanwhile the dialog stays open.
        driver.Press(IDCANCEL);
        EXPECT_TRUE(driver.WaitForText(IDC_STATUS_TEXT, L"Terminating connection...", 5000));
    });
    EXPECT_EQ(result, IDCANCEL);
    EXPECT_LT(::GetTickCount64() - started, 15000u);
    ExpectOneErrorBox(L"The communication's process is interrupted by the user");
    EXPECT_NE(ReadAll(log_).find("Cancel\r\nCompleted -102\r\n"), std::string::npos);
}

TEST_F(HalvekDialog, ShowsGermanTextsInAGermanUi) {
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN)));
    SetVariable(L"HALVEKCOMM_RESULT", L"-204");
    CHalvekDownloadProgressDialog dialog(nullptr, station_, output_.wstring());
    const INT_PTR result = RunDialog(dialog, [](DialogDriver& driver) {
        ASSERT_NE(driver.WaitForDialog(), nullptr);
        EXPECT_EQ(driver.Title(), L"Datei vom Digitalnivellier herunterladen");
        EXPECT_EQ(driver.Text(IDCANCEL), L"Abbrechen");
        EXPECT_EQ(driver.Text(IDC_STATUS_TEXT), L"Warten auf Start...");
        driver.Press(IDC_START);
    });
    ASSERT_TRUE(SelectThreadUiLanguage(before));
    EXPECT_EQ(result, IDCANCEL);
    ExpectOneErrorBox(L"Die Prüfsumme ist falsch", L"Quorvel Digitalnivelliere");
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

const void* const kDocumentedTable[] = {
    reinterpret_cast<const void*>(&RecordSlot<0>),  reinterpret_cast<const void*>(&RecordSlot<1>),
    reinterpret_cast<const void*>(&RecordSlot<2>),  reinterpret_cast<const void*>(&RecordSlot<3>),
    reinterpret_cast<const void*>(&RecordSlot<4>),  reinterpret_cast<const void*>(&RecordSlot<5>),
    reinterpret_cast<const void*>(&RecordSlot<6>),  reinterpret_cast<const void*>(&RecordSlot<7>),
    reinterpret_cast<const void*>(&RecordSlot<8>),  reinterpret_cast<const void*>(&RecordSlot<9>),
    reinterpret_cast<const void*>(&RecordSlot<10>), reinterpret_cast<const void*>(&RecordSlot<11>),
    reinterpret_cast<const void*>(&RecordSlot<12>), reinterpret_cast<const void*>(&RecordSlot<13>),
};

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
        SlotRecorder object{kDocumentedTable};
        // Seen through the adapter's declaration, as the library's own object is: a pointer to
        // a table of functions, nothing more.
        void* address = &object;
        test.call(*static_cast<IHalvekCommObject*>(address));
        EXPECT_EQ(test.slot, object.calledSlot) << test.operation;
    }
}
