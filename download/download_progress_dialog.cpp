// CDownloadProgressDialog: start, status from the download thread's messages, finish and cancel.
#include "download/download_progress_dialog.h"

#include "res/resource.h"
#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

CDownloadProgressDialog::CDownloadProgressDialog(HWND parent, const Station& station,
                                                 const std::wstring& outputPath)
    : CProgressDialogBase(parent, station, outputPath) {}

CDownloadProgressDialog::~CDownloadProgressDialog() {
    if (thread_) {
        // A cancel during a transfer waits here until the driver has seen the stop request.
        (void)thread_->StopAndWait(INFINITE);  // an infinite wait ends only with the thread
        thread_.reset();
    }
}

HRESULT CDownloadProgressDialog::DownloadResult() const noexcept {
    // The worker records its result before it posts the message that ends the dialog.
    return thread_ ? thread_->DownloadResult() : CProgressDialogBase::DownloadResult();
}

std::wstring CDownloadProgressDialog::FailureText() const {
    std::wstring text = CProgressDialogBase::FailureText();
    if (text.empty() && thread_ && thread_->WaitExpired())
        text = LoadUiText(IDS_SERIAL_WAIT_EXPIRED);
    return text;
}

BOOL CDownloadProgressDialog::OnInitDialog() {
    // The Start button keeps its template text.
    ShowInitialTexts(IDS_DOWNLOAD_TITLE);
    return FALSE;  // the focus was set
}

bool CDownloadProgressDialog::OnCommand(WORD controlId, WORD notification) {
    if (controlId == IDC_START && notification == BN_CLICKED) {
        OnStart();
        return true;
    }
    return false;
}

bool CDownloadProgressDialog::OnMessage(UINT message, WPARAM wParam, LPARAM lParam,
                                        INT_PTR& result) {
    if (message == g_registeredMessages.downloadThreadMessage) {
        OnThreadMessage(wParam, lParam);
        result = 0;
        return true;
    }
    if (message == g_registeredMessages.downloadThreadFinished) {
        FinishTransfer();
        result = 0;
        return true;
    }
    return false;
}

void CDownloadProgressDialog::OnDestroy() {
    // Texts still queued for this window would be dropped with it: free them here.
    MSG pending;
    while (::PeekMessageW(&pending, Window(), g_registeredMessages.downloadThreadMessage,
                          g_registeredMessages.downloadThreadMessage, PM_REMOVE)) {
        CLVDownloadThread::FreeMessageText(pending.lParam);
    }
}

void CDownloadProgressDialog::OnStart() {
    // The thread opens the port now; a port that cannot be opened is reported by message and
    // the thread then closes this dialog.
    thread_ = std::make_unique<CLVDownloadThread>(Window(), station(), OutputPath());
    thread_->Start();
    EnableControl(IDC_START, false);
    SetStatus(IDS_WAITING_FOR_DOWNLOAD);
}

void CDownloadProgressDialog::OnThreadMessage(WPARAM code, LPARAM text) {
    const auto* message = reinterpret_cast<const wchar_t*>(text);
    if (!message || *message == L'\0') {
        CLVDownloadThread::FreeMessageText(text);
        return;
    }
    // A number that names no code is taken as the progress text it most likely is.
    const std::optional<MessageCode> kind = MessageCodeOfPosted(code);
    if (kind == MessageCode::Error || kind == MessageCode::PortNotOpened) {
        // The dialog stays open: the thread ends and closes it. The text is freed once the box
        // is closed, which is what the thread waits for before it shows a box of its own.
        NoteFailure(message);
        ShowMessageBox(Window(), message, LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONSTOP);
        CLVDownloadThread::FreeMessageText(text);
        return;
    }
    // The progress text only switches the status line; its percent is not shown.
    CLVDownloadThread::FreeMessageText(text);
    SetStatus(IDS_DOWNLOADING);
}
