// CHalvekDownloadProgressDialog: the modal dialog of a download through the external library.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <string>

#include "download/halvek_comm.h"
#include "download/halvek_library_claim.h"
#include "download/progress_dialog_base.h"

// The library is given a time-out of this many seconds. A Cancel that the library has not
// confirmed within it and a small margin more ends the dialog all the same.
constexpr int32_t kHalvekTimeoutSeconds = 30;
constexpr DWORD kHalvekCancelMarginMilliseconds = 5000;
constexpr DWORD kHalvekCancelWaitMilliseconds =
    kHalvekTimeoutSeconds * 1000 + kHalvekCancelMarginMilliseconds;

// Sets how long a Cancel waits for the library in this process (tests shorten it); returns the
// wait it replaces.
DWORD SetHalvekCancelWait(DWORD milliseconds) noexcept;

class CHalvekDownloadProgressDialog : public CProgressDialogBase {
public:
    // parent may be null. claim is the process's one library download (HalvekLibraryClaim);
    // without it Start refuses. DoModal gives IDOK, with TransferCompleted, when the library has
    // written the file.
    CHalvekDownloadProgressDialog(HWND parent, const Station& station,
                                  const std::wstring& outputPath, HalvekLibraryClaim claim);
    // Deletes the library object and frees the points buffer, or leaves both to the claim while
    // the library may still use them; the library stays loaded.
    ~CHalvekDownloadProgressDialog() override;

protected:
    BOOL OnInitDialog() override;
    void OnCancel() override;
    bool OnCommand(WORD controlId, WORD notification) override;
    bool OnMessage(UINT message, WPARAM wParam, LPARAM lParam, INT_PTR& result) override;
    void OnDestroy() override;

private:
    void OnStart();
    void OnLibraryResult(int32_t code);
    void OnCancelWaitOver();
    // Shows the error box and ends the dialog with IDCANCEL. cancelled: the box reports the
    // surveyor's own cancel, which is no failure.
    void FailWith(const std::wstring& text, bool cancelled = false);

    HalvekLibraryClaim claim_;
    UniqueHalvekObject library_;
    std::unique_ptr<uint8_t[]> points_;
    bool cancelling_ = false;
    bool ending_ = false;
};
