// "FileContents" end to end inside the data object: the real progress dialogs run modally and a
// timer on their thread plays the transfer's side (the file written, then how the transfer ended).
#include <windows.h>
#include <shlobj.h>

#include <gtest/gtest.h>

#include <string>

#include "download/halvek_download_progress_dialog.h"
#include "download/progress_dialog_base.h"
#include "support/registered_messages.h"
#include "tests/data_object/data_object_fixture.h"

using Microsoft::WRL::ComPtr;

namespace {

enum class Ending { kCompleted, kStrayOkThenCancel };

// Runs each progress dialog for real and, once it is up, writes what a download would have
// written to its output file and ends the transfer as asked.
class PlayedDialogs : public UserInterface {
public:
    PlayedDialogs(Ending ending, std::string content)
        : ending_(ending), content_(std::move(content)) {}

    int ShowMessageBox(HWND, const std::wstring&, const std::wstring&, UINT) override {
        return IDOK;
    }
    INT_PTR RunModalDialog(HINSTANCE instance, UINT templateId, HWND parent, DLGPROC procedure,
                           LPARAM parameter) override {
        dialog_ = dynamic_cast<CProgressDialogBase*>(reinterpret_cast<CModalDialog*>(parameter));
        if (!dialog_)
            return -1;
        current_ = this;
        const UINT_PTR timer = ::SetTimer(nullptr, 0, 50, &PlayedDialogs::OnTimer);
        const INT_PTR result = ::DialogBoxParamW(instance, MAKEINTRESOURCEW(templateId), parent,
                                                 procedure, parameter);
        ::KillTimer(nullptr, timer);
        current_ = nullptr;
        return result;
    }

    std::wstring writtenPath;       // the file the transfer wrote
    bool openAfterStrayOk = false;  // the dialog was still up after the stray IDOK

private:
    static void CALLBACK OnTimer(HWND, UINT, UINT_PTR, DWORD) {
        if (current_ && current_->dialog_->Window())
            current_->Play(current_->dialog_->Window());
    }

    void Play(HWND window) {
        const bool external = dynamic_cast<CHalvekDownloadProgressDialog*>(dialog_) != nullptr;
        switch (step_++) {
            case 0: {
                // The external library writes under the given name with ".txt" added.
                writtenPath = dialog_->OutputPath() + (external ? L".txt" : L"");
                UniqueFileHandle file(::CreateFileW(writtenPath.c_str(), GENERIC_WRITE, 0,
                                                    nullptr, CREATE_ALWAYS, 0, nullptr));
                DWORD written = 0;
                EXPECT_TRUE(::WriteFile(file.get(), content_.data(),
                                        static_cast<DWORD>(content_.size()), &written, nullptr));
                if (ending_ == Ending::kStrayOkThenCancel) {
                    ::PostMessageW(window, WM_COMMAND, IDOK, 0);
                } else if (external) {
                    ::PostMessageW(window, g_registeredMessages.halvekDownloadMessage, 0, 0);
                } else {
                    ::PostMessageW(window, g_registeredMessages.downloadThreadFinished, 0, 0);
                }
                break;
            }
            case 1:
                openAfterStrayOk = ::IsWindow(window) != FALSE;
                ::PostMessageW(window, WM_COMMAND, IDCANCEL, 0);
                break;
            default:
                break;
        }
    }

    static inline PlayedDialogs* current_ = nullptr;
    const Ending ending_;
    const std::string content_;
    CProgressDialogBase* dialog_ = nullptr;
    int step_ = 0;
};

std::string ReadToEnd(IStream* stream) {
    std::string content;
    char buffer[7];
    ULONG got = 0;
    do {
        EXPECT_EQ(S_OK, stream->Read(buffer, sizeof buffer, &got));
        content.append(buffer, got);
    } while (got == sizeof buffer);
    return content;
}

bool FileExists(const std::wstring& path) {
    return ::GetFileAttributesW(path.c_str()) != INVALID_FILE_ATTRIBUTES;
}

class FileContents : public DataObject {
protected:
    void SetUp() override {
        DataObject::SetUp();
        RegisterWindowMessages();
    }
};

}  // namespace

TEST_F(FileContents, OnlyACompletedTransferGivesAStreamAndNoOutcomeLeavesADownloadBehind) {
    struct Case {
        const wchar_t* item;
        Ending ending;
        HRESULT expected;
        const wchar_t* extension;  // of the file the transfer writes
    } const cases[] = {
        {L"Quorvel Digital Level\\North\\file1.lv", Ending::kCompleted, S_OK, L""},
        {L"Quorvel Digital Level\\South\\file1.hvr", Ending::kCompleted, S_OK, L".txt"},
        {L"Quorvel Digital Level\\North\\file1.lv", Ending::kStrayOkThenCancel, S_FALSE, L""},
        {L"Quorvel Digital Level\\South\\file1.hvr", Ending::kStrayOkThenCancel, S_FALSE, L".txt"},
    };
    const std::vector<std::wstring> before = TemporaryDownloads();
    for (const Case& test : cases) {
        SCOPED_TRACE(testing::Message() << test.item << " ending " << static_cast<int>(test.ending));
        PlayedDialogs dialogs(test.ending, "A,01,Z\r\n1,0.000,12.5,!,\r\n");
        ScopedUserInterface scope(dialogs);
        ComPtr<IDataObject> data = Over({test.item});
        FORMATETC format = Request(CFSTR_FILECONTENTS, TYMED_ISTREAM, 0);
        UniqueStgMedium medium;
        ASSERT_EQ(test.expected, data->GetData(&format, medium.put()));

        // A unique "QRV" name in the temporary folder without an extension of its own.
        const std::wstring name = dialogs.writtenPath.substr(dialogs.writtenPath.rfind(L'\\') + 1);
        EXPECT_EQ(0u, name.find(L"QRV")) << name;
        const size_t dot = name.find(L'.');
        EXPECT_EQ(test.extension, dot == std::wstring::npos ? L"" : name.substr(dot));
        if (test.expected == S_OK) {
            ASSERT_EQ(static_cast<DWORD>(TYMED_ISTREAM), medium.get().tymed);
            EXPECT_EQ(nullptr, medium.get().pUnkForRelease);
            EXPECT_EQ("A,01,Z\r\n1,0.000,12.5,!,\r\n", ReadToEnd(medium.get().pstm));
        } else {
            EXPECT_TRUE(dialogs.openAfterStrayOk) << "a stray IDOK must not end the download";
            EXPECT_EQ(static_cast<DWORD>(TYMED_NULL), medium.get().tymed);
        }
        EXPECT_FALSE(FileExists(dialogs.writtenPath)) << "read to the end, or never handed out";
    }
    EXPECT_EQ(before, TemporaryDownloads());
}

TEST_F(FileContents, ADialogThatCannotRunIsAFailureAndCancelIsNoFile) {
    const std::vector<std::wstring> before = TemporaryDownloads();
    const std::pair<INT_PTR, HRESULT> cases[] = {{-1, E_FAIL}, {IDCANCEL, S_FALSE}, {IDOK, S_FALSE}};
    for (const auto& [answer, expected] : cases) {
        ScriptedDialogs dialogs(answer);
        ScopedUserInterface scope(dialogs);
        ComPtr<IDataObject> data = Over({L"Quorvel Digital Level\\North\\file1.lv"});
        FORMATETC format = Request(CFSTR_FILECONTENTS, TYMED_ISTREAM, 0);
        UniqueStgMedium medium;
        // IDOK from a dialog whose transfer never reported its end is no file either.
        EXPECT_EQ(expected, data->GetData(&format, medium.put())) << answer;
        EXPECT_EQ(static_cast<DWORD>(TYMED_NULL), medium.get().tymed);
        EXPECT_EQ(1, dialogs.runs);
    }
    EXPECT_EQ(before, TemporaryDownloads());
}

TEST_F(FileContents, TemporaryFolderFailuresAreFailureResultsAndRunNoDialog) {
    wchar_t saved[MAX_PATH] = {};
    ASSERT_NE(0u, ::GetEnvironmentVariableW(L"TMP", saved, MAX_PATH));
    struct Case {
        std::wstring folder;
        HRESULT expected;  // 0: any failure
    } const cases[] = {
        // Longer than the 130 characters the temporary path may have.
        {L"C:\\" + std::wstring(140, L'x'), HRESULT_FROM_WIN32(ERROR_BUFFER_OVERFLOW)},
        {L"C:\\no such folder for downloads", 0},
    };
    for (const Case& test : cases) {
        ASSERT_TRUE(::SetEnvironmentVariableW(L"TMP", test.folder.c_str()));
        ScriptedDialogs dialogs(IDOK);
        ScopedUserInterface scope(dialogs);
        ComPtr<IDataObject> data = Over({L"Quorvel Digital Level\\North\\file1.lv"});
        FORMATETC format = Request(CFSTR_FILECONTENTS, TYMED_ISTREAM, 0);
        UniqueStgMedium medium;
        const HRESULT result = data->GetData(&format, medium.put());
        EXPECT_TRUE(FAILED(result)) << std::hex << result << ": a bare Win32 code passes for success";
        if (test.expected != 0) {
            EXPECT_EQ(test.expected, result);
        }
        EXPECT_EQ(0, dialogs.runs);
    }
    ASSERT_TRUE(::SetEnvironmentVariableW(L"TMP", saved));
}

namespace {

// Counts the releases that a medium's pUnkForRelease receives.
class ReleaseCounter final : public IUnknown {
public:
    IFACEMETHODIMP QueryInterface(REFIID, void** object) override {
        *object = nullptr;
        return E_NOINTERFACE;
    }
    IFACEMETHODIMP_(ULONG) AddRef() override { return 2; }
    IFACEMETHODIMP_(ULONG) Release() override { return static_cast<ULONG>(++releases); }
    int releases = 0;
};

}  // namespace

TEST_F(DataObject, SetDataReleasesTheMediumOnlyWhenItIsHandedOver) {
    ComPtr<IDataObject> data = Over({L"Quorvel Digital Level\\North\\file1.lv"});
    for (const BOOL handedOver : {FALSE, TRUE}) {
        ReleaseCounter owner;
        UniqueHGlobal block(::GlobalAlloc(GMEM_MOVEABLE, sizeof(DWORD)));
        STGMEDIUM medium{};
        medium.tymed = TYMED_HGLOBAL;
        medium.hGlobal = block.get();
        medium.pUnkForRelease = &owner;  // releasing the medium releases this, not the block
        FORMATETC format = Request(L"Performed DropEffect", TYMED_HGLOBAL);
        EXPECT_EQ(S_OK, data->SetData(&format, &medium, handedOver));
        EXPECT_EQ(handedOver ? 1 : 0, owner.releases) << handedOver;
    }
}
