// CHalvekDownloadProgressDialog: library set-up step by step, completion, cancel and errors.
#include "download/halvek_download_progress_dialog.h"

#include "download/portable/driver_text.h"
#include "res/resource.h"
#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

std::atomic<HWND> g_halvekDialogWindow{nullptr};

namespace {
constexpr int32_t kStartFirst = 20;
constexpr int32_t kStartSecond = 1;
constexpr int32_t kTimeout = 30;
}  // namespace

CHalvekDownloadProgressDialog::CHalvekDownloadProgressDialog(HWND parent, const Station& station,
                                                             const std::wstring& outputPath)
    : CProgressDialogBase(parent, station, outputPath) {}

CHalvekDownloadProgressDialog::~CHalvekDownloadProgressDialog() {
    library_.reset();  // before the buffer the library may still point to
    points_.reset();
}

void CHalvekDownloadProgressDialog::CompletionCallback(int32_t result) {
    const HWND window = g_halvekDialogWindow.load();
    if (window) {
        (void)::PostMessageW(window, g_registeredMessages.halvekDownloadMessage, 0,
                             static_cast<LPARAM>(result));  // a closed dialog waits for nothing
    }
}

BOOL CHalvekDownloadProgressDialog::OnInitDialog() {
    g_halvekDialogWindow = Window();
    ShowInitialTexts(IDS_HALVEK_DOWNLOAD_TITLE);
    SetControlText(IDC_START, LoadUiText(IDS_START));
    return FALSE;  // the focus was set
}

void CHalvekDownloadProgressDialog::OnCancel() {
    if (!library_) {
        EndDialog(IDCANCEL);
        return;
    }
    // The library ends the transfer itself and reports it (normally -102) through the callback.
    SetStatus(IDS_TERMINATING_CONNECTION);
    (void)library_->Cancel();  // the answer comes through the callback
}

bool CHalvekDownloadProgressDialog::OnCommand(WORD controlId, WORD notification) {
    if (controlId == IDC_START && notification == BN_CLICKED) {
        OnStart();
        return true;
    }
    return false;
}

bool CHalvekDownloadProgressDialog::OnMessage(UINT message, WPARAM, LPARAM lParam,
                                              INT_PTR& result) {
    if (message != g_registeredMessages.halvekDownloadMessage)
        return false;
    OnLibraryResult(static_cast<int32_t>(lParam));
    result = 0;
    return true;
}

void CHalvekDownloadProgressDialog::OnDestroy() {
    g_halvekDialogWindow = nullptr;
}

void CHalvekDownloadProgressDialog::OnStart() {
    std::wstring errorText;
    if (FAILED(CreateHalvekObject(library_, errorText))) {
        FailWith(errorText);
        return;
    }
    if (library_->SetFilePath(HalvekFilePath(OutputPath()).c_str()) != 0) {
        FailWith(LoadUiText(IDS_UNABLE_TO_SET_FILE_PATH));
        return;
    }
    if (library_->SetTimeout(kTimeout) != 0) {
        FailWith(LoadUiText(IDS_UNABLE_TO_SET_TIMEOUT));
        return;
    }
    points_ = MakeHalvekPointsBuffer();
    if (!points_) {
        FailWith(SystemResultText(E_OUTOFMEMORY));
        return;
    }
    if (library_->SetPoints(points_.get()) != 0) {
        FailWith(LoadUiText(IDS_UNABLE_TO_SET_POINTS));
        return;
    }
    if (library_->SetCommParams(
            HalvekPortNumber(station().Port), static_cast<int32_t>(station().BaudRate),
            static_cast<int32_t>(station().Parity), static_cast<int32_t>(station().StopBits),
            static_cast<int32_t>(station().Flow), static_cast<int32_t>(station().DataBits),
            static_cast<int32_t>(station().CheckSum)) != 0) {
        FailWith(LoadUiText(IDS_UNABLE_TO_SET_COMM_PARAMS));
        return;
    }
    library_->SetCallback(&CHalvekDownloadProgressDialog::CompletionCallback);
    const int32_t code = library_->StartDownload(kStartFirst, kStartSecond);
    if (code != kHalvekNoError) {
        FailWith(HalvekResultText(code));
        return;
    }
    SetStatus(IDS_DOWNLOADING);
    EnableControl(IDC_START, false);
}

void CHalvekDownloadProgressDialog::OnLibraryResult(int32_t code) {
    if (code != kHalvekNoError) {
        FailWith(HalvekResultText(code));
        return;
    }
    // The library writes its file under the given name with ".txt" added.
    const HRESULT check = CheckReceivedFile(OutputPath() + L".txt");
    if (FAILED(check)) {
        SetDownloadResult(check);
        FailWith(FormatDriverText(LoadUiText(IDS_DOWNLOAD_INCOMPLETE), {SystemResultText(check)}));
        return;
    }
    FinishTransfer();
}

void CHalvekDownloadProgressDialog::FailWith(const std::wstring& text) {
    ShowMessageBox(Window(), text, LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONEXCLAMATION);
    EndDialog(IDCANCEL);
}
