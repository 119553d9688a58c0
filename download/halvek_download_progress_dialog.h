// CHalvekDownloadProgressDialog: the modal dialog of a download through the external library.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

#include "download/halvek_comm.h"
#include "download/progress_dialog_base.h"

// The open dialog's window, for the library's completion callback: one dialog at a time.
extern std::atomic<HWND> g_halvekDialogWindow;

class CHalvekDownloadProgressDialog : public CProgressDialogBase {
public:
    // parent may be null. DoModal gives IDOK, with TransferCompleted, when the library has
    // written the file.
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

    UniqueHalvekObject library_;
    std::unique_ptr<uint8_t[]> points_;
};
