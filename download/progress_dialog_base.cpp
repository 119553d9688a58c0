// CProgressDialogBase: shared texts, status line and the completed-transfer rule.
#include "download/progress_dialog_base.h"

#include "res/resource.h"
#include "stations/station_models.h"
#include "support/text_lookup.h"

CProgressDialogBase::CProgressDialogBase(HWND parent, const Station& station,
                                         const std::wstring& outputPath)
    : CModalDialog(IDD_DOWNLOAD_PROGRESS, parent), station_(station), outputPath_(outputPath) {
    BindText(IDC_INSTRUCTIONS, instructions_);
    BindText(IDC_STATUS_TEXT, status_);
    BindText(IDC_STATION_NAME, name_);
}

void CProgressDialogBase::ShowInitialTexts(UINT titleId) {
    ::SendDlgItemMessageW(Window(), IDC_INSTRUCTIONS, WM_SETFONT,
                          reinterpret_cast<WPARAM>(::GetStockObject(DEFAULT_GUI_FONT)), TRUE);
    instructions_ = ModelInstructionText(station_.Model);
    name_ = station_.Name;
    status_ = LoadUiText(IDS_WAITING_FOR_START);
    UpdateControls();
    SetControlText(IDC_STATUS_LABEL, LoadUiText(IDS_STATUS_LABEL));
    SetControlText(IDC_FILE_NAME_LABEL, LoadUiText(IDS_FILE_NAME_LABEL));
    SetControlText(IDCANCEL, LoadUiText(IDS_CANCEL));
    ::SetWindowTextW(Window(), LoadUiText(titleId).c_str());
    // The focus goes to Start, the one thing to press: on the instructions, the system would
    // select their whole text.
    ::SetFocus(::GetDlgItem(Window(), IDC_START));
}

void CProgressDialogBase::FinishTransfer() {
    completed_ = true;
    (void)::PostMessageW(Window(), WM_COMMAND, IDOK, 0);  // only fails when the window is gone
    SetStatus(IDS_FINISHING_DOWNLOAD);
}

void CProgressDialogBase::SetStatus(UINT textId) {
    status_ = LoadUiText(textId);
    UpdateControls();
}

void CProgressDialogBase::OnOK() {
    if (completed_)
        CModalDialog::OnOK();
}
