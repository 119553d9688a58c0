// TAZComm through the Win32 serial API: its port set-up, and a cancel over a socat pty pair
// (COM20 ↔ COM21) with lvsim. The protocol's cases run in the portable tests, a whole download
// through the shell in the end-to-end test.
#include <gtest/gtest.h>

#include <windows.h>

#include <cstddef>
#include <cstring>
#include <fstream>
#include <iterator>

#include "download/az_comm.h"
#include "download/win32_serial_port.h"
#include "support/unique_resource.h"
#include "tests/portable/serial/fake_serial.h"

namespace {

const wchar_t kDriverPort[] = L"\\\\.\\COM20";

std::wstring ExecutablePath(const wchar_t* name) {
    wchar_t path[MAX_PATH];
    const std::wstring self(path, ::GetModuleFileNameW(nullptr, path, MAX_PATH));
    return self.substr(0, self.find_last_of(L"\\/") + 1) + name;
}

// lvsim on the other end of the cable, ended when the test is.
class Simulator {
public:
    explicit Simulator(const std::wstring& arguments) {
        STARTUPINFOW startup{};
        startup.cb = sizeof startup;
        std::wstring command =
            L"\"" + ExecutablePath(L"..\\..\\bin\\lvsim.exe") + L"\" --port COM21 " + arguments;
        PROCESS_INFORMATION process{};
        if (::CreateProcessW(nullptr, command.data(), nullptr, nullptr, FALSE, 0, nullptr, nullptr,
                             &startup, &process)) {
            process_.reset(process.hProcess);
            UniqueHandle thread(process.hThread);
        }
    }
    ~Simulator() {
        if (process_ && ::WaitForSingleObject(process_.get(), 0) == WAIT_TIMEOUT)
            ::TerminateProcess(process_.get(), 99);
    }
    bool Started() const { return static_cast<bool>(process_); }
    // Exit code, or -1 when it did not end within the time.
    int Wait(DWORD milliseconds) {
        DWORD code = 0;
        if (::WaitForSingleObject(process_.get(), milliseconds) != WAIT_OBJECT_0 ||
            !::GetExitCodeProcess(process_.get(), &code))
            return -1;
        return static_cast<int>(code);
    }

private:
    UniqueHandle process_;
};

// The line protocol at 9600 baud, 7 data bits, even parity, as the download thread asks for it.
TAZCommParams LineParams(const wchar_t* port, const std::wstring& output) {
    TAZCommParams params;
    params.DeviceControlBlock.BaudRate = 9600;
    params.DeviceControlBlock.ByteSize = 7;
    params.DeviceControlBlock.Parity = 2;
    params.DeviceControlBlock.StopBits = 0;
    wcsncpy(params.PortName, port, 14);
    params.Protocol = kProtocolBccBlocks;
    params.OutputPath = output;
    return params;
}

TEST(SerialDriver, FillsTheRecordsDeviceControlBlockAndTimeOutsEvenWhenThePortIsMissing) {
    TAZCommParams params = LineParams(L"\\\\.\\COM38", L"never.lv");  // never linked by the rig
    RecordingCallback callback;
    TAZComm driver(&callback, &params);
    EXPECT_FALSE(driver.IsPortOpen());
    EXPECT_EQ(callback.messages, OnlyMessage(50, EnglishTexts().Text(DriverText::PortNotOpened)));
    EXPECT_EQ(params.DeviceControlBlock.XonLim, 1024);
    EXPECT_FALSE(params.DeviceControlBlock.fOutX);  // selector 1: no software flow control
    EXPECT_EQ(params.Timeouts.ReadIntervalTimeout, 50u);
}

TEST(SerialDriver, CancelMidTransferReportsAndFreesThePort) {
    const std::wstring output = ExecutablePath(L"received-cancelled.lv");
    TAZCommParams params = LineParams(kDriverPort, output);
    RecordingCallback callback;
    callback.cancelWhen = [&] {  // after the third line
        return !callback.progress.empty() && callback.progress.back().second >= 10;
    };
    TAZComm driver(&callback, &params);
    ASSERT_TRUE(driver.IsPortOpen());

    Simulator simulator(L"--lines 200 --answer-timeout 300 --max-resends 2");
    ASSERT_TRUE(simulator.Started());
    EXPECT_EQ(driver.ReceiveLines(), 1u);
    EXPECT_FALSE(driver.IsPortOpen());
    EXPECT_EQ(callback.messages,
              OnlyMessage(4, L"The communication's process is interrupted by the user"));
    // Closed means free: the port opens again at once.
    UniqueFileHandle reopened(::CreateFileW(kDriverPort, GENERIC_READ | GENERIC_WRITE, 0, nullptr,
                                            OPEN_EXISTING, 0, nullptr));
    EXPECT_TRUE(reopened) << ::GetLastError();
    reopened.reset();
    EXPECT_NE(simulator.Wait(20000), 0);
    std::ifstream file(output.c_str(), std::ios::binary);
    const std::string received{std::istreambuf_iterator<char>(file), {}};
    EXPECT_EQ(std::count(received.begin(), received.end(), '\n'), 3) << "the header and two lines";
}

TEST(SerialDriverSetup, DeviceControlFlagsLandInTheirBits) {
    DCB dcb{};
    DWORD flags = 0;
    static_assert(offsetof(DCB, BaudRate) + sizeof(DWORD) == 8);
    for (const auto& [selector, expected] : {std::pair{0u, 0x1393u}, std::pair{1u, 0x1093u}}) {
        ApplyDeviceControlFields(MakeDeviceControlFields(selector), dcb);
        std::memcpy(&flags, reinterpret_cast<const uint8_t*>(&dcb) + 8, sizeof flags);
        EXPECT_EQ(flags, expected) << selector;
    }
    EXPECT_EQ(dcb.DCBlength, 28u);
    EXPECT_EQ(dcb.EvtChar, static_cast<char>(0xFE));
}

TEST(SerialDriverSetup, TheStringTableHoldsThePortableTestsEnglishTexts) {
    const StringTableDriverTexts texts;
    for (int text = 0; text <= static_cast<int>(DriverText::YModemFileInfo); ++text)
        EXPECT_EQ(texts.Text(DriverText(text)), EnglishTexts().Text(DriverText(text))) << text;
}

}  // namespace
