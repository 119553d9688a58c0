// CDownloadProgressDialog: start, status from the download thread's messages, finish and cancel.
#include "download/download_progress_dialog.h"

#include "res/resource.h"
#include "stations/station_store.h"
#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

CDownloadProgressDialog::CDownloadProgressDialog(HWND parent, const Station& station,
                                                 const std::wstring& outputPath)
    : CModalDialog(IDD_DOWNLOAD_PROGRESS, parent), station_(station), outputPath_(outputPath) {
    BindText(IDC_INSTRUCTIONS, instructions_);
    BindText(IDC_STATUS_TEXT, status_);
    BindText(IDC_STATION_NAME, name_);
}

CDownloadProgressDialog::~CDownloadProgressDialog() {
    if (thread_) {
        // A cancel during a transfer waits here until the driver has seen the stop request.
        thread_->StopAndWait(INFINITE);
        thread_.reset();
    }
}

BOOL CDownloadProgressDialog::OnInitDialog() {
    instructions_ = ModelInstructionText(station_.Model);
    ::SendDlgItemMessageW(Window(), IDC_INSTRUCTIONS, WM_SETFONT,
                          reinterpret_cast<WPARAM>(::GetStockObject(DEFAULT_GUI_FONT)), TRUE);
    SetControlText(IDC_STATUS_LABEL, LoadUiText(IDS_STATUS_LABEL));
    SetControlText(IDC_FILE_NAME_LABEL, LoadUiText(IDS_FILE_NAME_LABEL));
    SetControlText(IDCANCEL, LoadUiText(IDS_CANCEL));
    name_ = station_.Name;
    status_ = LoadUiText(IDS_WAITING_FOR_START);
    ::SetWindowTextW(Window(), LoadUiText(IDS_DOWNLOAD_TITLE).c_str());
    UpdateControls();
    // The focus goes to Start, the one thing to press: on the instructions, the system would
    // select their whole text.
    ::SetFocus(::GetDlgItem(Window(), IDC_START));
    return FALSE;
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
        OnThreadFinished();
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
    thread_ = std::make_unique<CLVDownloadThread>(Window(), station_, outputPath_);
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
    if (code == kMessageError || code == kMessagePortNotOpened) {
        // The dialog stays open: the thread ends and closes it.
        const std::wstring shown(message);
        CLVDownloadThread::FreeMessageText(text);
        ShowMessageBox(Window(), shown, LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONSTOP);
        return;
    }
    // The progress text only switches the status line; its percent is not shown.
    CLVDownloadThread::FreeMessageText(text);
    SetStatus(IDS_DOWNLOADING);
}

void CDownloadProgressDialog::OnThreadFinished() {
    ::PostMessageW(Window(), WM_COMMAND, IDOK, 0);
    SetStatus(IDS_FINISHING_DOWNLOAD);
}

void CDownloadProgressDialog::SetStatus(UINT textId) {
    status_ = LoadUiText(textId);
    UpdateControls();
}
