// CLVDownloadThread: connection record, driver callbacks as posted messages, the receive run.
#include "download/download_thread.h"

#include <algorithm>
#include <cwchar>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <optional>
#include <string>
#include <unordered_map>

#include "res/resource.h"
#include "support/module_instance.h"
#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

namespace {

// The arguments of "Download Thread Finished" and WM_CLOSE: both messages carry none.
constexpr WPARAM kNoArgument = 0;

// The texts handed over with "Download Thread Message" that nobody has freed yet, with the
// thread that posted each. The receiver frees a text when it handles it, but a modal dialog's
// loop drops what it takes after EndDialog (a Cancel sent from another thread ends it between
// two posted texts), and a window that is gone receives nothing: what is left over goes with
// the thread that posted it, which outlives its window.
struct LiveTexts {
    std::mutex lock;
    std::condition_variable freed;  // notified whenever a text is freed
    std::unordered_map<wchar_t*, const CLVDownloadThread*> owners;
};

// How long a thread waits for the dialog to close the boxes of its texts before it shows its own:
// long enough for a reader, short enough that a lost text cannot hold the download's end.
constexpr auto kMessageBoxWait = std::chrono::minutes(10);

LiveTexts& PostedTexts() {
    static LiveTexts texts;
    return texts;
}

// The progress text: "%d" becomes the percent and "%%" a percent sign. A translation with any
// other conversion would be unsafe to hand to a formatter, so it is built here and refused
// (false) instead.
[[nodiscard]] bool FormatPercentText(const std::wstring& format, int percent, std::wstring& text) {
    text.clear();
    for (size_t index = 0; index < format.size(); ++index) {
        if (format[index] != L'%') {
            text.push_back(format[index]);
            continue;
        }
        const wchar_t next = index + 1 < format.size() ? format[index + 1] : L'\0';
        if (next == L'd')
            text += std::to_wstring(percent);
        else if (next == L'%')
            text.push_back(L'%');
        else
            return false;
        ++index;
    }
    return true;
}

}  // namespace

CLVDownloadThread::CLVDownloadThread(HWND notifyWindow, const Station& station,
                                     const std::wstring& outputPath)
    : outputPath_(outputPath),
      params_(MakeConnectionRecord(station, outputPath)),
      notifyWindow_(notifyWindow),
      station_(station) {
    driver_ = std::make_unique<TAZComm>(this, params_.get());
    if (!driver_->IsPortOpen())
        driver_.reset();
}

CLVDownloadThread::~CLVDownloadThread() {
    // The worker may still be between its last post and its return; the driver is its own.
    if (ThreadHandle())
        ::WaitForSingleObject(ThreadHandle(), INFINITE);
    driver_.reset();  // before the record it points to
    LiveTexts& texts = PostedTexts();
    std::lock_guard<std::mutex> guard(texts.lock);
    for (auto entry = texts.owners.begin(); entry != texts.owners.end();) {
        if (entry->second == this) {
            delete[] entry->first;
            entry = texts.owners.erase(entry);
        } else {
            ++entry;
        }
    }
}

std::unique_ptr<TAZCommParams> CLVDownloadThread::MakeConnectionRecord(
    const Station& station, const std::wstring& outputPath) {
    auto params = std::make_unique<TAZCommParams>();
    // The built-in download always runs at 7 data bits, one stop bit, with the BCC blocks'
    // selector (no XON/XOFF), whatever the station says about data bits, stop bits, protocol, flow
    // and check sum.
    params->DeviceControlBlock.BaudRate = station.BaudRate;
    params->DeviceControlBlock.ByteSize = kReceiveDataBits;
    params->DeviceControlBlock.Parity = static_cast<BYTE>(station.Parity);
    params->DeviceControlBlock.StopBits = ONESTOPBIT;
    params->Protocol = ReceiveProcedure::BccBlocks;
    const size_t length = std::min(station.Port.size(), kPortNameCapacity);
    std::copy_n(station.Port.data(), length, params->PortName);
    params->PortName[length] = L'\0';
    params->OutputPath = outputPath;
    return params;
}

DWORD CLVDownloadThread::Run() {
    // Without a driver the port's failure has been reported already: no box of our own.
    const std::optional<TransferResult> result =
        driver_ ? std::optional(driver_->ReceiveLines()) : std::nullopt;
    if (result == TransferResult::Failed) {
        // Before the box: the dialog may end while it is up, and its caller reads this then.
        waitExpired_ = !IsStopRequested();
        // The dialog shows the driver's own messages (a full disk, say) in boxes of its own: one
        // box after the other, the reason before the summary, not two at once from two threads.
        WaitForShownTexts();
        // One text for every failed receive (time-out, cancel, refused lines), as users know it.
        ShowMessageBox(notifyWindow_, LoadUiText(IDS_SERIAL_WAIT_EXPIRED),
                       LoadUiText(IDS_DIGITAL_LEVELS), MB_ICONEXCLAMATION);
    }
    received_ = result == TransferResult::Complete;
    const uint32_t fileError = driver_ ? driver_->FileError() : kFileWritten;
    if (fileError != kFileWritten)
        result_ = HRESULT_FROM_WIN32(fileError);
    else if (!received_)
        result_ = S_FALSE;
    return kRunExitCode;
}

void CLVDownloadThread::WaitForShownTexts() noexcept {
    LiveTexts& texts = PostedTexts();
    std::unique_lock<std::mutex> guard(texts.lock);
    const auto deadline = std::chrono::steady_clock::now() + kMessageBoxWait;
    const auto settled = [&] {
        // A dialog that is gone shows nothing more; texts it never took are freed with us.
        if (!::IsWindow(notifyWindow_))
            return true;
        for (const auto& [text, owner] : texts.owners)
            if (owner == this)
                return false;
        return true;
    };
    // Woken by each freed text, and every so often to notice a dialog that went away.
    while (!settled() && std::chrono::steady_clock::now() < deadline)
        texts.freed.wait_for(guard, std::chrono::milliseconds(200));
}

void CLVDownloadThread::OnEnd() {
    if (received_)
        PostToWindow(g_registeredMessages.downloadThreadFinished, kNoArgument, kNoArgument);
    else
        PostToWindow(WM_CLOSE, kNoArgument, kNoArgument);
}

void CLVDownloadThread::ShowMessage(MessageCode code, const WideChar* text) {
    if (!::IsWindow(notifyWindow_))
        return;  // the dialog is gone: no copy, nothing posted
    const size_t length = text ? std::wcslen(text) : 0;
    auto* copy = new (std::nothrow) wchar_t[length + 1];
    if (!copy)
        return;
    std::copy_n(text ? text : L"", length + 1, copy);
    try {
        LiveTexts& texts = PostedTexts();
        std::lock_guard<std::mutex> guard(texts.lock);
        texts.owners.emplace(copy, this);
    } catch (...) {
        delete[] copy;  // no room to keep track of it: the message is not sent
        return;
    }
    if (!::PostMessageW(notifyWindow_, g_registeredMessages.downloadThreadMessage,
                        PostedCodeOf(code), reinterpret_cast<LPARAM>(copy))) {
        FreeMessageText(reinterpret_cast<LPARAM>(copy));  // never delivered: still ours
    }
}

void CLVDownloadThread::SetProgress(uint32_t total, uint32_t current) {
    if (total == 0)
        return;  // no measure of progress; the line protocol never passes it
    const int percent = static_cast<int>(static_cast<double>(current) / total * 99.0);
    if (percent <= 0)
        return;
    std::wstring text;
    if (!FormatPercentText(LoadUiText(IDS_TRANSFER_PERCENT), percent, text)) {
        (void)FormatPercentText(LoadText(ThisModule(), IDS_TRANSFER_PERCENT, kEnglishLanguage),
                                percent, text);
    }
    ShowMessage(MessageCode::Information, text.c_str());
}

bool CLVDownloadThread::IsCancelled() {
    return IsStopRequested();
}

void CLVDownloadThread::PostToWindow(UINT message, WPARAM wParam, LPARAM lParam) noexcept {
    if (::IsWindow(notifyWindow_))
        (void)::PostMessageW(notifyWindow_, message, wParam, lParam);  // nothing to undo if lost
}

void CLVDownloadThread::FreeMessageText(LPARAM text) noexcept {
    if (!text)
        return;
    auto* copy = reinterpret_cast<wchar_t*>(text);
    LiveTexts& texts = PostedTexts();
    std::lock_guard<std::mutex> guard(texts.lock);
    // A text its thread already reclaimed is not freed twice.
    if (texts.owners.erase(copy) != 0) {
        delete[] copy;
        texts.freed.notify_all();
    }
}

long CLVDownloadThread::LiveMessageTexts() noexcept {
    LiveTexts& texts = PostedTexts();
    std::lock_guard<std::mutex> guard(texts.lock);
    return static_cast<long>(texts.owners.size());
}
