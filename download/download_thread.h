// CLVDownloadThread: one download with the serial driver on a worker thread, reported to a window
// by posted registered messages.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

#include "download/az_comm.h"
#include "download/thread.h"
#include "stations/portable/station.h"

class CLVDownloadThread : public CThread, public TParserCallBack {
public:
    // Builds the connection record and opens the port through the driver. When the port cannot
    // be opened the driver has already reported it to the window, and no driver is kept.
    CLVDownloadThread(HWND notifyWindow, const Station& station, const std::wstring& outputPath);
    // Waits for a started worker to be gone, then deletes the driver (which closes the port) and
    // the texts it posted that no receiver freed.
    ~CLVDownloadThread() override;

    // The thread's exit code, whatever the receive's end: the window learns that by message.
    static constexpr DWORD kRunExitCode = 0;

    // Receives the file with the line protocol. Always kRunExitCode.
    DWORD Run() override;
    // Tells the window how the receive ended: "Download Thread Finished" for a complete file,
    // WM_CLOSE for anything else (a Run that threw included).
    void OnEnd() override;

    // TParserCallBack, called on the worker.
    // Posts "Download Thread Message" with PostedCodeOf(code) and a copy of text.
    void ShowMessage(MessageCode code, const WideChar* text) override;
    void SetProgress(uint32_t total, uint32_t current) override;
    bool IsCancelled() override;

    [[nodiscard]] bool HasDriver() const noexcept { return driver_ != nullptr; }
    // Why the output file is not complete, once Run has ended: the HRESULT of the write the
    // system refused, S_FALSE for a receive that failed otherwise (time-out, cancel), S_OK when
    // the file is complete or no receive ended yet.
    [[nodiscard]] HRESULT DownloadResult() const noexcept { return result_.load(); }
    // True once Run has shown "The waiting time of the data has expired." for a receive that
    // failed without being asked to stop (a stop is the surveyor's cancel, not a failure).
    [[nodiscard]] bool WaitExpired() const noexcept { return waitExpired_.load(); }
    const TAZCommParams& ConnectionRecord() const noexcept { return *params_; }

    // The text copies handed over with "Download Thread Message": the receiver frees each one
    // with FreeMessageText; the thread frees, when it is destroyed, those nobody received.
    // LiveMessageTexts counts those not yet freed in this process.
    static void FreeMessageText(LPARAM text) noexcept;
    static long LiveMessageTexts() noexcept;

private:
    static std::unique_ptr<TAZCommParams> MakeConnectionRecord(const Station& station,
                                                               const std::wstring& outputPath);
    void PostToWindow(UINT message, WPARAM wParam, LPARAM lParam) noexcept;
    // Returns once the dialog has freed every text this thread posted (their boxes are closed),
    // the dialog is gone, or a long time has passed.
    void WaitForShownTexts() noexcept;

    std::wstring outputPath_;
    std::unique_ptr<TAZComm> driver_;
    std::unique_ptr<TAZCommParams> params_;
    HWND notifyWindow_;
    Station station_;
    bool received_ = false;  // written and read on the worker only
    std::atomic<HRESULT> result_{S_OK};  // written by the worker before it posts its end
    std::atomic<bool> waitExpired_{false};  // likewise
};
