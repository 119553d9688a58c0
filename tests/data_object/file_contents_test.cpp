// "FileContents" end to end inside the data object: the real progress dialogs run modally and a
// timer on their thread plays the transfer's side (the file written, then how the transfer ended).
#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "download/halvek_download_progress_dialog.h"
#include "download/progress_dialog_base.h"
#include "support/module_instance.h"
#include "support/registered_messages.h"
#include "tests/data_object/data_object_fixture.h"

namespace {

// Runs each progress dialog for real and, once it is up, writes what a download would have
// written to its output file; then reports the transfer's end, or sends a stray IDOK and Cancel.
class PlayedDialogs : public ScriptedDialogs {
public:
    explicit PlayedDialogs(bool completes, std::string content = kContent)
        : ScriptedDialogs(-1), completes_(completes), content_(std::move(content)) {}

    INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent, DLGPROC procedure,
                           LPARAM parameter) override {
        dialog_ = dynamic_cast<CProgressDialogBase*>(reinterpret_cast<CModalDialog*>(parameter));
        if (!dialog_)
            return -1;
        current_ = this;
        const UINT_PTR timer = ::SetTimer(nullptr, 0, 50, &PlayedDialogs::OnTimer);
        result =
            ::DialogBoxParamW(instance, MAKEINTRESOURCEW(templateId), parent, procedure, parameter);
        ::KillTimer(nullptr, timer);
        return result;
    }

    std::wstring writtenPath;  // the file the transfer wrote
    INT_PTR result = 0;        // how the dialog ended

private:
    static void CALLBACK OnTimer(HWND, UINT, UINT_PTR, DWORD) {
        if (current_->dialog_->Window() && current_->writtenPath.empty())
            current_->Play(current_->dialog_->Window());
    }

    void Play(HWND window) {
        // The external library writes under the given name with ".txt" added.
        const bool external = dynamic_cast<CHalvekDownloadProgressDialog*>(dialog_) != nullptr;
        writtenPath = dialog_->OutputPath() + (external ? L".txt" : L"");
        if (external)
            WriteAsTheLibraryDoes(writtenPath, content_);
        else  // the serial driver's own output file, into the target that the data object holds
            WriteAsTheDriverDoes(writtenPath, content_);
        if (!completes_) {
            ::PostMessageW(window, WM_COMMAND, IDOK, 0);
            ::PostMessageW(window, WM_COMMAND, IDCANCEL, 0);
        } else {
            ::PostMessageW(window,
                           external ? g_registeredMessages.halvekDownloadMessage
                                    : g_registeredMessages.downloadThreadFinished,
                           0, 0);
        }
    }

    static inline PlayedDialogs* current_ = nullptr;
    const bool completes_;
    const std::string content_;
    CProgressDialogBase* dialog_ = nullptr;
};

class FileContents : public DataObject {};

}  // namespace

// The external library's word is not taken for a file either: one that is empty when the library
// reports success fails the copy with a failure result, after the surveyor was told.
TEST_F(FileContents, OnlyACompletedTransferGivesAStreamAndNoOutcomeLeavesADownloadBehind) {
    struct Case {
        const wchar_t* item;
        bool completes;            // or a stray IDOK, then Cancel
        const wchar_t* extension;  // of the file the transfer writes
        HRESULT expected;
        INT_PTR ended;  // how the dialog ends
        std::string content = kContent;
        const wchar_t* told = nullptr;  // the start of the one message box shown, if any
    } const cases[] = {
        {kNorthFile, true, L"", S_OK, IDOK},
        {kSouthFile, true, L".txt", S_OK, IDOK},
        {kNorthFile, false, L"", S_FALSE, IDCANCEL},
        {kSouthFile, false, L".txt", S_FALSE, IDCANCEL},
        {kSouthFile, true, L".txt", HRESULT_FROM_WIN32(ERROR_INVALID_DATA), IDCANCEL, "",
         L"The downloaded file is not complete"},
    };
    const std::vector<std::wstring> before = TemporaryDownloads();
    for (const Case& test : cases) {
        SCOPED_TRACE(testing::Message() << test.item << (test.completes ? " completed" : " cancelled")
                                        << " with " << test.content.size() << " bytes");
        PlayedDialogs dialogs(test.completes, test.content);
        ScopedUserInterface scope(dialogs);
        UniqueStgMedium medium;
        ASSERT_EQ(test.expected, DownloadFile(test.item, medium));
        EXPECT_EQ(test.ended, dialogs.result) << "a stray IDOK must not end the download";
        ASSERT_EQ(test.told ? 1u : 0u, dialogs.messages.size());
        if (test.told) {
            EXPECT_EQ(0u, dialogs.messages[0].find(test.told)) << dialogs.messages[0];
        }

        // A unique "QRV" name in the temporary folder without an extension of its own.
        const std::wstring name = dialogs.writtenPath.substr(dialogs.writtenPath.rfind(L'\\') + 1);
        EXPECT_EQ(0u, name.find(L"QRV")) << name;
        const size_t dot = name.find(L'.');
        EXPECT_EQ(test.extension, dot == std::wstring::npos ? L"" : name.substr(dot));
        if (test.expected == S_OK) {
            ASSERT_EQ(static_cast<DWORD>(TYMED_ISTREAM), medium.get().tymed);
            EXPECT_EQ(nullptr, medium.get().pUnkForRelease);
            EXPECT_EQ(kContent, ReadToEnd(medium.get().pstm));
        } else {
            EXPECT_EQ(static_cast<DWORD>(TYMED_NULL), medium.get().tymed);
        }
        EXPECT_FALSE(FileExists(dialogs.writtenPath)) << "read to the end, or never handed out";
    }
    EXPECT_EQ(before, TemporaryDownloads());
}

TEST_F(FileContents, ADialogThatCannotRunIsAFailureAndCancelIsNoFile) {
    const std::vector<std::wstring> before = TemporaryDownloads();
    // IDOK from a dialog whose transfer never reported its end is no file either.
    const std::pair<INT_PTR, HRESULT> cases[] = {
        {-1, E_FAIL}, {IDCANCEL, S_FALSE}, {IDOK, S_FALSE}};
    for (const auto& [answer, expected] : cases) {
        ScriptedDialogs dialogs(answer);
        ScopedUserInterface scope(dialogs);
        UniqueStgMedium medium;
        EXPECT_EQ(expected, DownloadFile(kNorthFile, medium)) << answer;
        EXPECT_EQ(static_cast<DWORD>(TYMED_NULL), medium.get().tymed);
        EXPECT_EQ(1, dialogs.runs);
    }
    EXPECT_EQ(before, TemporaryDownloads());
}

namespace {

// Points the process's temporary folder (TMP, which GetTempPathW reads first) elsewhere for a
// test, and back.
class TemporaryFolderOverride {
public:
    explicit TemporaryFolderOverride(const std::wstring& folder) {
        saved_.resize(MAX_PATH);
        saved_.resize(::GetEnvironmentVariableW(L"TMP", saved_.data(), MAX_PATH));
        EXPECT_TRUE(::SetEnvironmentVariableW(L"TMP", folder.c_str()));
    }
    ~TemporaryFolderOverride() { ::SetEnvironmentVariableW(L"TMP", saved_.c_str()); }

private:
    std::wstring saved_;
};

// A real folder whose path has exactly `length` characters, in the temporary folder.
std::wstring MakeFolderOfLength(size_t length) {
    const std::wstring base = std::filesystem::temp_directory_path().wstring();
    std::wstring folder = base + (base.back() == L'\\' ? L"" : L"\\");
    folder += std::wstring(length - folder.size(), L'T');
    std::filesystem::create_directories(folder);
    return folder;
}

}  // namespace

// A temporary folder of any length Windows gives takes the download: the whole file arrives.
TEST_F(FileContents, ALongTemporaryFolderTakesTheWholeDownload) {
    const std::wstring folder = MakeFolderOfLength(140);
    ASSERT_EQ(140u, folder.size());
    {
        TemporaryFolderOverride temporary(folder);
        for (const wchar_t* item : {kNorthFile, kSouthFile}) {
            SCOPED_TRACE(testing::Message() << item);
            PlayedDialogs dialogs(true);
            ScopedUserInterface scope(dialogs);
            UniqueStgMedium medium;
            ASSERT_EQ(S_OK, DownloadFile(item, medium));
            EXPECT_TRUE(dialogs.messages.empty());
            EXPECT_EQ(0u, dialogs.writtenPath.rfind(folder + L"\\QRV", 0)) << dialogs.writtenPath;
            EXPECT_EQ(kContent, ReadToEnd(medium.get().pstm));
            EXPECT_FALSE(FileExists(dialogs.writtenPath));
        }
    }
    EXPECT_TRUE(std::filesystem::is_empty(folder)) << "no file or reservation is left";
    std::filesystem::remove(folder);
}

TEST_F(FileContents, TemporaryFolderFailuresAreFailureResultsNamedWithTheirReasonAndRunNoDialog) {
    // With its backslash one character longer than GetTempFileNameW takes, and real: only the
    // length is wrong.
    const std::wstring tooLong = MakeFolderOfLength(MAX_PATH - 14);
    const struct {
        std::wstring folder;
        HRESULT expected;  // 0: any failure
    } cases[] = {
        {tooLong, HRESULT_FROM_WIN32(ERROR_BUFFER_OVERFLOW)},
        {L"C:\\no such folder for downloads", 0},
    };
    for (const auto& test : cases) {
        TemporaryFolderOverride temporary(test.folder);
        ScriptedDialogs dialogs(IDOK);
        ScopedUserInterface scope(dialogs);
        UniqueStgMedium medium;
        const HRESULT result = DownloadFile(kNorthFile, medium);
        EXPECT_TRUE(FAILED(result))
            << std::hex << result << ": a bare Win32 code passes for success";
        if (test.expected != 0) {
            EXPECT_EQ(test.expected, result);
        }
        EXPECT_EQ(0, dialogs.runs);
        // The surveyor is told which folder and why, before any dialog asks for the instrument.
        ASSERT_EQ(1u, dialogs.messages.size());
        const std::wstring& message = dialogs.messages[0];
        EXPECT_EQ(0u, message.find(L"The download cannot be saved in the temporary folder "))
            << message;
        EXPECT_NE(std::wstring::npos, message.find(test.folder)) << message;
        if (test.expected != 0) {
            const std::wstring reason = SystemMessageText(HRESULT_CODE(test.expected));
            ASSERT_FALSE(reason.empty());
            EXPECT_NE(std::wstring::npos, message.find(reason)) << message;
        }
    }
    std::filesystem::remove(tooLong);
}
