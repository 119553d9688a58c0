// CHalvekDownloadProgressDialog: library set-up step by step, completion, cancel and errors.
#include "download/halvek_download_progress_dialog.h"

#include <atomic>
#include <utility>

#include "res/resource.h"
#include "support/module_instance.h"
#include "support/portable/text_format.h"
#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

namespace {

constexpr int32_t kStartFirst = 20;
constexpr int32_t kStartSecond = 1;
constexpr UINT_PTR kCancelWaitTimer = 1;

std::atomic<DWORD> g_cancelWaitMilliseconds{kHalvekCancelWaitMilliseconds};

}  // namespace

DWORD SetHalvekCancelWait(DWORD milliseconds) noexcept {
    return g_cancelWaitMilliseconds.exchange(milliseconds);
}

CHalvekDownloadProgressDialog::CHalvekDownloadProgressDialog(HWND parent, const Station& station,
                                                             const std::wstring& outputPath,
                                                             HalvekLibraryClaim claim)
    : CProgressDialogBase(parent, station, outputPath), claim_(std::move(claim)) {}

CHalvekDownloadProgressDialog::~CHalvekDownloadProgressDialog() {
    claim_.Finish(std::move(library_), std::move(points_), OutputPath());
}

BOOL CHalvekDownloadProgressDialog::OnInitDialog() {
    claim_.RouteCompletionTo(Window());
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
    // A library that never answers must not keep the dialog, and the shell's window with it,
    // open for good: after its own time-out the dialog ends without it.
    if (!cancelling_) {
        cancelling_ = true;
        // Fails only without a window, and then there is no dialog to end.
        (void)::SetTimer(Window(), kCancelWaitTimer, g_cancelWaitMilliseconds.load(), nullptr);
    }
}

bool CHalvekDownloadProgressDialog::OnCommand(WORD controlId, WORD notification) {
    if (controlId == IDC_START && notification == BN_CLICKED) {
        OnStart();
        return true;
    }
    return false;
}

bool CHalvekDownloadProgressDialog::OnMessage(UINT message, WPARAM wParam, LPARAM lParam,
                                              INT_PTR& result) {
    if (message == WM_TIMER && wParam == kCancelWaitTimer) {
        OnCancelWaitOver();
    } else if (message == g_registeredMessages.halvekDownloadMessage) {
        OnLibraryResult(static_cast<int32_t>(lParam));
    } else {
        return false;
    }
    result = 0;
    return true;
}

void CHalvekDownloadProgressDialog::OnDestroy() {
    claim_.RouteCompletionTo(nullptr);
}

void CHalvekDownloadProgressDialog::OnStart() {
    if (!claim_) {
        FailWith(LoadUiText(IDS_LIBRARY_DOWNLOAD_RUNNING));
        return;
    }
    std::wstring errorText;
    if (FAILED(CreateHalvekObject(library_, errorText))) {
        FailWith(errorText);
        return;
    }
    if (library_->SetFilePath(HalvekFilePath(OutputPath()).c_str()) != 0) {
        FailWith(LoadUiText(IDS_UNABLE_TO_SET_FILE_PATH));
        return;
    }
    if (library_->SetTimeout(kHalvekTimeoutSeconds) != 0) {
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
    library_->SetCallback(&HalvekLibraryClaim::CompletionCallback);
    // Due before the start: the library may report its end before StartDownload returns.
    claim_.ExpectCompletion(true);
    const int32_t code = library_->StartDownload(kStartFirst, kStartSecond);
    if (code != kHalvekNoError) {
        claim_.ExpectCompletion(false);
        FailWith(HalvekResultText(code), code == kHalvekCancelled);
        return;
    }
    SetStatus(IDS_DOWNLOADING);
    EnableControl(IDC_START, false);
}

void CHalvekDownloadProgressDialog::OnLibraryResult(int32_t code) {
    if (code != kHalvekNoError) {
        FailWith(HalvekResultText(code), code == kHalvekCancelled);
        return;
    }
    // The library writes its file under the given name with ".txt" added.
    const HRESULT check = CheckReceivedFile(OutputPath() + L".txt");
    if (FAILED(check)) {
        SetDownloadResult(check);
        FailWith(FormatText(LoadUiText(IDS_DOWNLOAD_INCOMPLETE), {SystemResultText(check)}));
        return;
    }
    FinishTransfer();
}

void CHalvekDownloadProgressDialog::OnCancelWaitOver() {
    (void)::KillTimer(Window(), kCancelWaitTimer);  // once is enough; it only fails without one
    // A completion already on its way ends the dialog with its own result.
    if (claim_.CompletionArrived())
        return;
    FailWith(HalvekResultText(kHalvekCancelled), true);
}

void CHalvekDownloadProgressDialog::FailWith(const std::wstring& text, bool cancelled) {
    // One box per dialog: a result that arrives while the box is up (a late completion after the
    // cancel wait, say) finds the dialog already ending.
    if (ending_)
        return;
    ending_ = true;
    if (!cancelled)
        NoteFailure(text);
    ShowMessageBox(Window(), text, LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONEXCLAMATION);
    EndDialog(IDCANCEL);
}
