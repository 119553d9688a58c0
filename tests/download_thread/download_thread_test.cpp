// CLVDownloadThread: connection record, posted messages and their text copies, the run's end.
#include "download/download_thread.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/registered_messages.h"
#include "support/text_lookup.h"

namespace {

struct Received {
    UINT message;
    WPARAM code;
    std::wstring text;
};

// A thread that reports to a message-only window of this thread, for a station on a port that
// is never created (COM49): its constructor already posts the port's failure.
class DownloadThread : public ::testing::Test {
protected:
    void SetUp() override {
        RegisterWindowMessages();
        window_ = ::CreateWindowExW(0, L"STATIC", L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr,
                                    nullptr, nullptr);
        ASSERT_NE(window_, nullptr);
        station_.Port = L"COM49";
        station_.BaudRate = 4800;
        station_.Parity = 1;
        station_.DataBits = 8;
        station_.StopBits = 2;
        station_.Protocol = StoredSelectorOf(ReceiveProcedure::YModem);  // not taken
    }
    void TearDown() override { ::DestroyWindow(window_); }

    // What was posted to the window, each text copy freed as the dialog does.
    std::vector<Received> Pump() {
        std::vector<Received> received;
        MSG message;
        while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) {
            if (message.message == g_registeredMessages.downloadThreadMessage) {
                received.push_back({message.message, message.wParam,
                                    reinterpret_cast<const wchar_t*>(message.lParam)});
                CLVDownloadThread::FreeMessageText(message.lParam);
            } else if (message.message == g_registeredMessages.downloadThreadFinished ||
                       message.message == WM_CLOSE) {
                received.push_back({message.message, message.wParam, L""});
            } else {
                ::DispatchMessageW(&message);
            }
        }
        return received;
    }

    HWND window_ = nullptr;
    Station station_;
};

}  // namespace

TEST_F(DownloadThread, ConnectionRecordAlwaysUsesSevenDataBitsOneStopBitSelectorOne) {
    station_.Port = L"\\\\.\\COM12345678901234";
    CLVDownloadThread thread(window_, station_, L"C:\\out.lv");
    const TAZCommParams& record = thread.ConnectionRecord();
    EXPECT_EQ(record.DeviceControlBlock.BaudRate, 4800u);
    EXPECT_EQ(record.DeviceControlBlock.ByteSize, 7);
    EXPECT_EQ(record.DeviceControlBlock.Parity, 1);
    EXPECT_EQ(record.DeviceControlBlock.StopBits, ONESTOPBIT);
    EXPECT_EQ(record.Protocol, ReceiveProcedure::BccBlocks);
    EXPECT_EQ(std::wstring(record.PortName), L"\\\\.\\COM1234567");  // 14 characters
    EXPECT_EQ(record.OutputPath, L"C:\\out.lv");
    EXPECT_FALSE(thread.IsCancelled());
    thread.Stop();
    EXPECT_TRUE(thread.IsCancelled()) << "cancel is the stop request";
}

TEST_F(DownloadThread, ProgressPostsPercentTextsAndNothingAtZero) {
    CLVDownloadThread thread(window_, station_, L"C:\\out.lv");
    Pump();
    thread.SetProgress(100, 0);
    thread.SetProgress(100, 1);  // 0.99 truncates to 0
    thread.SetProgress(0, 5);
    EXPECT_TRUE(Pump().empty());
    thread.SetProgress(100, 3);
    thread.SetProgress(100, 100);
    const std::vector<Received> received = Pump();
    ASSERT_EQ(received.size(), 2u);
    EXPECT_EQ(MessageCodeOfPosted(received[0].code), MessageCode::Information);
    EXPECT_EQ(received[0].text, L"Performing file transfer - 2% done");
    EXPECT_EQ(received[1].text, L"Performing file transfer - 99% done");
}

TEST_F(DownloadThread, ProgressComesInTheCreatorsLanguage) {
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN)));
    CLVDownloadThread thread(window_, station_, L"C:\\out.lv");
    thread.SetProgress(100, 50);
    ASSERT_TRUE(SelectThreadUiLanguage(before));
    const std::vector<Received> received = Pump();
    ASSERT_EQ(received.size(), 2u);
    // The station's port is on no computer: the box says so in German.
    EXPECT_EQ(received[0].text.rfind(L"COM49 ist jetzt nicht an diesem PC.", 0), 0u)
        << received[0].text;
    EXPECT_EQ(received[1].text, L"Dateiübertragung läuft - 49% erledigt");
}

TEST_F(DownloadThread, ClosedWindowGetsNothingAndNoCopyIsMade) {
    CLVDownloadThread thread(window_, station_, L"C:\\out.lv");
    Pump();
    ::DestroyWindow(window_);
    thread.ShowMessage(MessageCode::Error, L"lost");
    thread.SetProgress(100, 50);
    EXPECT_EQ(CLVDownloadThread::LiveMessageTexts(), 0);
    const HANDLE worker = thread.Start();
    ASSERT_NE(worker, nullptr);
    ASSERT_EQ(::WaitForSingleObject(worker, INFINITE), WAIT_OBJECT_0);
    EXPECT_TRUE(Pump().empty());
}

TEST_F(DownloadThread, EveryPostedTextIsFreedOverTenThousandMessages) {
    CLVDownloadThread thread(window_, station_, L"C:\\out.lv");
    Pump();
    size_t received = 0;
    for (int message = 0; message < 10000; ++message) {
        thread.ShowMessage(message % 2 ? MessageCode::Information : MessageCode::Error,
                           message % 3 ? L"line accepted" : L"");
        if (message % 500 == 499)
            received += Pump().size();
    }
    EXPECT_EQ(received + Pump().size(), 10000u);
    EXPECT_EQ(CLVDownloadThread::LiveMessageTexts(), 0);
}
