// CDownloadProgressDialog: the modal dialog of a download through the built-in serial driver.
#pragma once

#include <windows.h>

#include <memory>
#include <string>

#include "download/download_thread.h"
#include "stations/portable/station.h"
#include "support/modal_dialog.h"

class CDownloadProgressDialog : public CModalDialog {
public:
    // parent may be null. DoModal gives IDOK when outputPath holds the complete file.
    CDownloadProgressDialog(HWND parent, const Station& station, const std::wstring& outputPath);
    // Stops the download thread and waits for it without limit, then deletes it.
    ~CDownloadProgressDialog() override;

protected:
    BOOL OnInitDialog() override;
    bool OnCommand(WORD controlId, WORD notification) override;
    bool OnMessage(UINT message, WPARAM wParam, LPARAM lParam, INT_PTR& result) override;
    void OnDestroy() override;

private:
    void OnStart();
    void OnThreadMessage(WPARAM code, LPARAM text);
    void OnThreadFinished();
    void SetStatus(UINT textId);

    Station station_;
    std::wstring instructions_;  // control 214
    std::wstring status_;        // control 215
    std::wstring name_;          // control 217
    std::wstring outputPath_;
    std::unique_ptr<CLVDownloadThread> thread_;
};
