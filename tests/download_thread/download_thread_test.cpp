// CLVDownloadThread: connection record, posted messages and their text copies, the run's end.
#include "download/download_thread.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/registered_messages.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"
#include "tests/support/recording_user_interface.h"

namespace {

constexpr LANGID kGerman = MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN);
constexpr wchar_t kMissingPort[] = L"COM49";  // never created by the tests' port pairs

struct Received {
    UINT message;
    WPARAM code;
    std::wstring text;
};

// A message-only window that keeps what arrives and frees each text copy as the dialog does.
class NotifyWindow {
public:
    NotifyWindow() {
        static const ATOM windowClass = [] {
            WNDCLASSW description{};
            description.lpfnWndProc = &NotifyWindow::Procedure;
            description.hInstance = ::GetModuleHandleW(nullptr);
            description.lpszClassName = L"LVDownloadThreadTestWindow";
            return ::RegisterClassW(&description);
        }();
        EXPECT_NE(windowClass, 0);
        window_ = ::CreateWindowExW(0, L"LVDownloadThreadTestWindow", L"", 0, 0, 0, 0, 0,
                                    HWND_MESSAGE, nullptr, ::GetModuleHandleW(nullptr), this);
        ::SetWindowLongPtrW(window_, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(this));
    }
    ~NotifyWindow() { Destroy(); }
    void Destroy() {
        if (window_)
            ::DestroyWindow(window_);
        window_ = nullptr;
    }
    HWND get() const { return window_; }

    // Dispatches whatever is queued for this thread.
    void Pump() {
        MSG message;
        while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE))
            ::DispatchMessageW(&message);
    }
    // Pumps until a message of that kind arrived or the time is up.
    bool PumpUntil(UINT kind, DWORD milliseconds) {
        const ULONGLONG end = ::GetTickCount64() + milliseconds;
        while (::GetTickCount64() < end) {
            Pump();
            for (const Received& message : received)
                if (message.message == kind)
                    return true;
            ::MsgWaitForMultipleObjects(0, nullptr, FALSE, 20, QS_ALLINPUT);
        }
        return false;
    }

    std::vector<Received> received;

private:
    static LRESULT CALLBACK Procedure(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
        auto* self = reinterpret_cast<NotifyWindow*>(::GetWindowLongPtrW(window, GWLP_USERDATA));
        if (self && message == g_registeredMessages.downloadThreadMessage) {
            self->received.push_back({message, wParam, reinterpret_cast<const wchar_t*>(lParam)});
            CLVDownloadThread::FreeMessageText(lParam);
            return 0;
        }
        if (self &&
            (message == g_registeredMessages.downloadThreadFinished || message == WM_CLOSE)) {
            self->received.push_back({message, wParam, L""});
            return 0;
        }
        return ::DefWindowProcW(window, message, wParam, lParam);
    }

    HWND window_ = nullptr;
};

Station MissingPortStation() {
    Station station;
    station.Name = L"Level";
    station.Port = kMissingPort;
    station.BaudRate = 4800;
    station.Parity = 1;
    station.DataBits = 8;
    station.StopBits = 2;
    station.Protocol = 2;
    return station;
}

class DownloadThread : public ::testing::Test {
protected:
    void SetUp() override { RegisterWindowMessages(); }
};

}  // namespace

TEST_F(DownloadThread, ConnectionRecordAlwaysUsesSevenDataBitsOneStopBitSelectorOne) {
    NotifyWindow window;
    Station station = MissingPortStation();
    station.Port = L"\\\\.\\COM12345678901234";
    CLVDownloadThread thread(window.get(), station, L"C:\\out.lv");
    const TAZCommParams& record = thread.ConnectionRecord();
    EXPECT_EQ(record.DeviceControlBlock.BaudRate, 4800u);
    EXPECT_EQ(record.DeviceControlBlock.ByteSize, 7);
    EXPECT_EQ(record.DeviceControlBlock.Parity, 1);
    EXPECT_EQ(record.DeviceControlBlock.StopBits, ONESTOPBIT);
    EXPECT_EQ(record.Protocol, 1u);
    EXPECT_EQ(std::wstring(record.PortName), L"\\\\.\\COM1234567");  // 14 characters
    EXPECT_EQ(record.OutputPath, L"C:\\out.lv");
    EXPECT_FALSE(thread.IsCancelled());
    thread.Stop();
    EXPECT_TRUE(thread.IsCancelled()) << "cancel is the stop request";
    window.Pump();
}

TEST_F(DownloadThread, MissingPortReportsCodeFiftyThenClosesTheWindow) {
    NotifyWindow window;
    RecordingUserInterface boxes;
    ScopedUserInterface seam(boxes);
    CLVDownloadThread thread(window.get(), MissingPortStation(), L"C:\\out.lv");
    EXPECT_FALSE(thread.HasDriver());
    ASSERT_NE(thread.Start(), nullptr);
    ASSERT_TRUE(window.PumpUntil(WM_CLOSE, 5000));
    ASSERT_GE(window.received.size(), 2u);
    const Received& portMessage = window.received[window.received.size() - 2];
    EXPECT_EQ(portMessage.code, 50u);
    EXPECT_EQ(portMessage.text, L"Can not open COM port. Port is already open by another program");
    EXPECT_EQ(window.received.back().message, static_cast<UINT>(WM_CLOSE));
    // The state turns finished just before the thread's own end: poll the exit code.
    for (int tries = 0; tries < 500 && thread.GetExitCode() == STILL_ACTIVE; ++tries)
        ::Sleep(10);
    EXPECT_EQ(thread.GetStatus(), CThread::kFinished);
    EXPECT_EQ(thread.GetExitCode(), 0u);
    // Only a failed receive shows the time-out box; no driver is not a receive.
    EXPECT_TRUE(boxes.MessageBoxes().empty());
}

TEST_F(DownloadThread, ProgressPostsPercentTextsAndNothingAtZero) {
    NotifyWindow window;
    CLVDownloadThread thread(window.get(), MissingPortStation(), L"C:\\out.lv");
    window.Pump();
    window.received.clear();
    thread.SetProgress(100, 0);
    thread.SetProgress(100, 1);  // 0.99 truncates to 0
    window.Pump();
    EXPECT_TRUE(window.received.empty());
    thread.SetProgress(100, 3);
    thread.SetProgress(100, 100);
    thread.SetProgress(0, 5);
    window.Pump();
    ASSERT_EQ(window.received.size(), 2u);
    EXPECT_EQ(window.received[0].code, 1u);
    EXPECT_EQ(window.received[0].text, L"Performing file transfer - 2% done");
    EXPECT_EQ(window.received[1].text, L"Performing file transfer - 99% done");
}

TEST_F(DownloadThread, ProgressComesInTheCreatorsLanguage) {
    NotifyWindow window;
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(kGerman));
    CLVDownloadThread thread(window.get(), MissingPortStation(), L"C:\\out.lv");
    thread.SetProgress(100, 50);
    ASSERT_TRUE(SelectThreadUiLanguage(before));
    window.Pump();
    ASSERT_EQ(window.received.size(), 2u);
    EXPECT_EQ(window.received[0].text,
              L"COM-Port kann nicht geöffnet werden. Der Port wird bereits von einem anderen "
              L"Programm verwendet");
    EXPECT_EQ(window.received[1].text, L"Dateiübertragung läuft - 49% erledigt");
}

TEST_F(DownloadThread, ClosedWindowGetsNothingAndNoCopyIsMade) {
    NotifyWindow window;
    CLVDownloadThread thread(window.get(), MissingPortStation(), L"C:\\out.lv");
    window.Pump();
    window.received.clear();
    const long live = CLVDownloadThread::LiveMessageTexts();
    window.Destroy();
    thread.ShowMessage(4, L"lost");
    thread.SetProgress(100, 50);
    EXPECT_EQ(CLVDownloadThread::LiveMessageTexts(), live);
    ASSERT_NE(thread.Start(), nullptr);
    EXPECT_EQ(thread.Wait(INFINITE), WAIT_OBJECT_0);
    window.Pump();
    EXPECT_TRUE(window.received.empty());
}

TEST_F(DownloadThread, EveryPostedTextIsFreedOverTenThousandMessages) {
    NotifyWindow window;
    CLVDownloadThread thread(window.get(), MissingPortStation(), L"C:\\out.lv");
    window.Pump();
    window.received.clear();
    const long live = CLVDownloadThread::LiveMessageTexts();
    for (int message = 0; message < 10000; ++message) {
        thread.ShowMessage(message % 2 ? 1 : 4, message % 3 ? L"line accepted" : L"");
        if (message % 500 == 499)
            window.Pump();
    }
    window.Pump();
    EXPECT_EQ(window.received.size(), 10000u);
    EXPECT_EQ(CLVDownloadThread::LiveMessageTexts(), live);
    EXPECT_EQ(live, 0);
}
