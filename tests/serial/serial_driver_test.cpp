// TAZComm through the Win32 serial API over a socat pty pair (COM20 ↔ COM21) with lvsim.
#include <gtest/gtest.h>

#include <windows.h>

#include <cstddef>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "download/az_comm.h"
#include "download/win32_serial_port.h"
#include "support/unique_resource.h"

namespace {

const wchar_t kDriverPort[] = L"\\\\.\\COM20";
const wchar_t kSimulatorPort[] = L"COM21";
const wchar_t kMissingPort[] = L"\\\\.\\COM38";  // never linked by the rig

std::wstring ExecutableDirectory() {
    wchar_t path[MAX_PATH];
    const DWORD length = ::GetModuleFileNameW(nullptr, path, MAX_PATH);
    std::wstring directory(path, length);
    return directory.substr(0, directory.find_last_of(L"\\/"));
}

std::wstring TempPath(const wchar_t* name) {
    return ExecutableDirectory() + L"\\" + name;
}

std::string ReadAll(const std::wstring& path) {
    std::ifstream in(path.c_str(), std::ios::binary);
    std::ostringstream content;
    content << in.rdbuf();
    return content.str();
}

std::wstring SamplePath() {
    return L"Z:" LV_SOURCE_DIR L"/tools/lvsim/samples/survey.lv";
}

// lvsim on the other end of the cable; its stderr goes to a file for the test to read.
class Simulator {
public:
    explicit Simulator(const std::wstring& arguments) : log_(TempPath(L"lvsim.log")) {
        SECURITY_ATTRIBUTES inherit{sizeof inherit, nullptr, TRUE};
        UniqueFileHandle logFile(::CreateFileW(log_.c_str(), GENERIC_WRITE, FILE_SHARE_READ,
                                               &inherit, CREATE_ALWAYS, 0, nullptr));
        STARTUPINFOW startup{};
        startup.cb = sizeof startup;
        startup.dwFlags = STARTF_USESTDHANDLES;
        startup.hStdError = logFile.get();
        startup.hStdOutput = logFile.get();
        std::wstring command = L"\"" + ExecutableDirectory() +
                               L"\\..\\..\\bin\\lvsim.exe\" --port " + kSimulatorPort +
                               L" --verbose " + arguments;
        PROCESS_INFORMATION process{};
        started_ = ::CreateProcessW(nullptr, command.data(), nullptr, nullptr, TRUE, 0, nullptr,
                                    nullptr, &startup, &process) != FALSE;
        if (started_) {
            process_.reset(process.hProcess);
            UniqueHandle thread(process.hThread);
        }
    }
    ~Simulator() {
        if (process_ && ::WaitForSingleObject(process_.get(), 0) == WAIT_TIMEOUT)
            ::TerminateProcess(process_.get(), 99);
    }
    bool Started() const { return started_; }
    // Exit code, or -1 when it did not end within the time.
    int Wait(DWORD milliseconds) {
        if (::WaitForSingleObject(process_.get(), milliseconds) != WAIT_OBJECT_0)
            return -1;
        DWORD code = 0;
        ::GetExitCodeProcess(process_.get(), &code);
        return static_cast<int>(code);
    }
    std::string Log() const { return ReadAll(log_); }

private:
    std::wstring log_;
    UniqueHandle process_;
    bool started_ = false;
};

class RecordingCallback final : public TParserCallBack {
public:
    void ShowMessage(uint32_t code, const wchar_t* text) override {
        codes.push_back(code);
        texts.push_back(text);
    }
    void SetProgress(uint32_t, uint32_t current) override { lastProgress = current; }
    bool IsCancelled() override {
        return cancelAtProgress != 0 && lastProgress >= cancelAtProgress;
    }

    std::vector<uint32_t> codes;
    std::vector<std::wstring> texts;
    uint32_t lastProgress = 0;
    uint32_t cancelAtProgress = 0;
};

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

int Count(const std::string& text, const std::string& word) {
    int count = 0;
    for (size_t at = text.find(word); at != std::string::npos; at = text.find(word, at + 1))
        ++count;
    return count;
}

TEST(SerialDriver, ReceivesTheSimulatorsFileByteForByte) {
    const std::wstring output = TempPath(L"received.lv");
    TAZCommParams params = LineParams(kDriverPort, output);
    RecordingCallback callback;
    TAZComm driver(&callback, &params);
    ASSERT_TRUE(driver.IsPortOpen());
    EXPECT_EQ(params.DeviceControlBlock.XonLim, 1024);
    EXPECT_FALSE(params.DeviceControlBlock.fOutX);  // selector 1: no software flow control
    EXPECT_EQ(params.Timeouts.ReadIntervalTimeout, 50u);

    Simulator simulator(L"--file \"" + SamplePath() + L"\"");
    ASSERT_TRUE(simulator.Started());
    EXPECT_EQ(driver.ReceiveLines(), 0u);
    EXPECT_EQ(simulator.Wait(20000), 0) << simulator.Log();
    EXPECT_TRUE(callback.codes.empty());
    EXPECT_EQ(ReadAll(output), ReadAll(SamplePath()));
    EXPECT_EQ(callback.lastProgress, 40u);  // 12 lines accepted: 12 × 100 / 30
}

TEST(SerialDriver, WrongCheckCharacterIsRefusedAndTheResendAccepted) {
    const std::wstring output = TempPath(L"received-bad-check.lv");
    TAZCommParams params = LineParams(kDriverPort, output);
    RecordingCallback callback;
    TAZComm driver(&callback, &params);
    ASSERT_TRUE(driver.IsPortOpen());

    Simulator simulator(L"--bad-check 4 --file \"" + SamplePath() + L"\"");
    EXPECT_EQ(driver.ReceiveLines(), 0u);
    ASSERT_EQ(simulator.Wait(20000), 0);
    const std::string log = simulator.Log();
    EXPECT_EQ(Count(log, "answer NAK"), 1) << log;
    EXPECT_EQ(Count(log, "answer ACK"), 12) << log;
    EXPECT_EQ(ReadAll(output), ReadAll(SamplePath()));
}

TEST(SerialDriver, MissingPortGivesTheCodeFiftyMessage) {
    RecordingCallback callback;
    TAZCommParams params = LineParams(kMissingPort, TempPath(L"never.lv"));
    TAZComm driver(&callback, &params);
    EXPECT_FALSE(driver.IsPortOpen());
    ASSERT_EQ(callback.codes.size(), 1u);
    EXPECT_EQ(callback.codes[0], 50u);
    EXPECT_EQ(callback.texts[0], L"Can not open COM port. Port is already open by another program");
    EXPECT_EQ(driver.ReceiveLines(), 1u);
    EXPECT_EQ(driver.Receive(), 1u);
}

TEST(SerialDriver, CancelMidTransferReportsAndClosesThePort) {
    const std::wstring output = TempPath(L"received-cancelled.lv");
    TAZCommParams params = LineParams(kDriverPort, output);
    RecordingCallback callback;
    callback.cancelAtProgress = 10;  // after the third line
    TAZComm driver(&callback, &params);
    ASSERT_TRUE(driver.IsPortOpen());

    Simulator simulator(L"--lines 200 --answer-timeout 300 --max-resends 2");
    EXPECT_EQ(driver.ReceiveLines(), 1u);
    EXPECT_FALSE(driver.IsPortOpen());
    ASSERT_EQ(callback.codes.size(), 1u);
    EXPECT_EQ(callback.codes[0], 4u);
    EXPECT_EQ(callback.texts[0], L"The communication's process is interrupted by the user");
    // Closed means free: the port opens again at once.
    UniqueFileHandle reopened(::CreateFileW(kDriverPort, GENERIC_READ | GENERIC_WRITE, 0, nullptr,
                                            OPEN_EXISTING, 0, nullptr));
    EXPECT_TRUE(reopened) << ::GetLastError();
    reopened.reset();
    EXPECT_NE(simulator.Wait(20000), 0);
    EXPECT_EQ(Count(ReadAll(output), "\r\n"), 3);
}

TEST(SerialDriverSetup, DeviceControlFlagsAndStringTableTexts) {
    DCB dcb{};
    ApplyDeviceControlFields(MakeDeviceControlFields(0), dcb);
    DWORD flags = 0;
    static_assert(offsetof(DCB, BaudRate) + sizeof(DWORD) == 8);
    std::memcpy(&flags, reinterpret_cast<const uint8_t*>(&dcb) + 8, sizeof flags);
    EXPECT_EQ(flags, 0x1393u);
    ApplyDeviceControlFields(MakeDeviceControlFields(1), dcb);
    std::memcpy(&flags, reinterpret_cast<const uint8_t*>(&dcb) + 8, sizeof flags);
    EXPECT_EQ(flags, 0x1093u);
    EXPECT_EQ(dcb.DCBlength, 28u);
    EXPECT_EQ(dcb.EvtChar, static_cast<char>(0xFE));

    const StringTableDriverTexts texts;
    EXPECT_EQ(texts.Text(DriverText::WaitExpired), L"The waiting time of the data has expired.");
    EXPECT_EQ(texts.Text(DriverText::BlockImportFailed),
              L"AZ doesn't respond or error in importing block");
    EXPECT_EQ(texts.Text(DriverText::InputFileBccMismatch),
              L"Incorrect input file: BCC in block %d mismatch with computed %d!=%d");
    EXPECT_EQ(texts.Text(DriverText::YModemFileInfo), L"Y-Modem File Info: %s (size=%s)");
}

}  // namespace
