// CDownloadProgressDialog: the modal dialog of a download through the built-in serial driver.
#pragma once

#include <windows.h>

#include <memory>
#include <string>

#include "download/download_thread.h"
#include "download/progress_dialog_base.h"

class CDownloadProgressDialog : public CProgressDialogBase {
public:
    // parent may be null. DoModal gives IDOK, with TransferCompleted, when outputPath holds the
    // complete file.
    CDownloadProgressDialog(HWND parent, const Station& station, const std::wstring& outputPath);
    // Stops the download thread and waits for it without limit, then deletes it.
    ~CDownloadProgressDialog() override;

    [[nodiscard]] HRESULT DownloadResult() const noexcept override;
    [[nodiscard]] std::wstring FailureText() const override;

protected:
    BOOL OnInitDialog() override;
    bool OnCommand(WORD controlId, WORD notification) override;
    bool OnMessage(UINT message, WPARAM wParam, LPARAM lParam, INT_PTR& result) override;
    void OnDestroy() override;

private:
    void OnStart();
    void OnThreadMessage(WPARAM code, LPARAM text);

    std::unique_ptr<CLVDownloadThread> thread_;
};
