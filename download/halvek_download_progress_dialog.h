// CHalvekDownloadProgressDialog: the modal dialog of a download through the external library.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

#include "download/halvek_comm.h"
#include "stations/portable/station.h"
#include "support/modal_dialog.h"

// The open dialog's window, for the library's completion callback: one dialog at a time.
extern std::atomic<HWND> g_halvekDialogWindow;

class CHalvekDownloadProgressDialog : public CModalDialog {
public:
    // parent may be null. DoModal gives IDOK when the library has written the file.
    CHalvekDownloadProgressDialog(HWND parent, const Station& station,
                                  const std::wstring& outputPath);
    // Deletes the library object and frees the points buffer; the library stays loaded.
    ~CHalvekDownloadProgressDialog() override;

    // The completion function handed to the library.
    static void CompletionCallback(int32_t result);

protected:
    BOOL OnInitDialog() override;
    void OnCancel() override;
    bool OnCommand(WORD controlId, WORD notification) override;
    bool OnMessage(UINT message, WPARAM wParam, LPARAM lParam, INT_PTR& result) override;
    void OnDestroy() override;

private:
    void OnStart();
    void OnLibraryResult(int32_t code);
    // Shows the error box and ends the dialog with IDCANCEL.
    void FailWith(const std::wstring& text);
    void SetStatus(UINT textId);

    Station station_;
    std::wstring instructions_;  // control 214
    std::wstring status_;        // control 215
    std::wstring name_;          // control 217
    std::wstring outputPath_;
    UniqueHalvekObject library_;
    std::unique_ptr<uint8_t[]> points_;
};
