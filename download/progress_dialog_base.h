// CProgressDialogBase: what the two download dialogs share, and the rule that only a completed
// transfer ends them with IDOK.
#pragma once

#include <windows.h>

#include <string>

#include "stations/portable/station.h"
#include "support/modal_dialog.h"

class CProgressDialogBase : public CModalDialog {
public:
    // True once the transfer reported a complete file. An IDOK result means nothing without it:
    // the caller hands the shell a file only when both hold.
    bool TransferCompleted() const noexcept { return completed_; }
    const std::wstring& OutputPath() const noexcept { return outputPath_; }
    // Why a dialog ended without a file, once DoModal has returned: a failure HRESULT when the
    // download failed for a reason of the system's (the disk refused the file), so that the
    // caller can fail the copy with it rather than report a cancel; S_OK or S_FALSE otherwise.
    [[nodiscard]] virtual HRESULT DownloadResult() const noexcept { return downloadResult_; }
    // The text of the failure the dialog showed the user (a port that could not be opened, a
    // time-out, the library's error), once DoModal has returned; empty after a completion or the
    // surveyor's cancel. The download records take it as the reason.
    [[nodiscard]] virtual std::wstring FailureText() const { return failureText_; }

protected:
    // parent may be null (the data object runs the dialog without one).
    CProgressDialogBase(HWND parent, const Station& station, const std::wstring& outputPath);

    // The texts both dialogs show when they open: instructions for the station's model in the
    // default GUI font, the station's name, "Waiting for start...", the labels, Cancel and the
    // title; the focus goes to Start.
    void ShowInitialTexts(UINT titleId);
    // The transfer is complete: remember it, say "Finishing download..." and end with IDOK
    // through a posted command, so that pending messages are handled first.
    void FinishTransfer();
    void SetStatus(UINT textId);
    void SetDownloadResult(HRESULT result) noexcept { downloadResult_ = result; }
    // Keeps the first failure shown: the reason comes before any summary after it.
    void NoteFailure(const std::wstring& text) {
        if (failureText_.empty())
            failureText_ = text;
    }

    // An IDOK that did not come from FinishTransfer is ignored: on Windows, Enter in the
    // multi-line instructions (no ES_WANTRETURN) sends one, and a stray command must not pass a
    // missing file off as a download.
    void OnOK() override;

    const Station& station() const noexcept { return station_; }

private:
    Station station_;
    std::wstring instructions_;  // control 214
    std::wstring status_;        // control 215
    std::wstring name_;          // control 217
    std::wstring outputPath_;
    bool completed_ = false;
    HRESULT downloadResult_ = S_OK;
    std::wstring failureText_;
};
