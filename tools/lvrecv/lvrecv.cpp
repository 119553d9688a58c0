// lvrecv: receives an instrument's file over a COM port with the extension's serial driver.
#include <windows.h>

#include <atomic>
#include <cstdio>
#include <cwchar>
#include <optional>
#include <string>

#include "download/az_comm.h"
#include "download/portable/serial_protocol.h"

namespace {

const char kUsage[] =
    "Usage: lvrecv --port COMn --out FILE [options]\n"
    "Receives a file from a digital level as the extension does, printing the driver's\n"
    "messages (\"lvrecv: [code N] text\"; errors on the error stream) and progress.\n"
    "\n"
    "  --port COMn                    serial port (required)\n"
    "  --out FILE                     where the received data go (required)\n"
    "  --baud N                       baud rate (default 9600)\n"
    "  --parity none|odd|even         parity (default even); 7 data bits, 1 stop bit\n"
    "  --protocol line|raw|bcc|ymodem receive procedure (default line)\n"
    "  --quiet                        no progress lines\n"
    "  --cancel-after N               cancel as a user would, once N progress steps above\n"
    "                                 zero were reported (the driver sees it at its next check)\n"
    "  --help                         this text\n";
// After the options: the cap, named from the driver's own constant.
const char kUsageEnd[] =
    "A receive ends as failed once the instrument sent more than %s MiB (far more than any\n"
    "instrument holds), so that one that never sends its end cannot fill the disk; a cancel is\n"
    "seen at the next line or block.\n"
    "Exit code: 0 when the file is complete; 1 when the receive failed or was cancelled (Ctrl+C,\n"
    "--cancel-after, the size cap); 3 when the port cannot be opened; 2 on bad usage.\n";

void PrintUsage(FILE* stream) {
    std::fputs(kUsage, stream);
    std::fprintf(stream, kUsageEnd, std::to_string(kMaxReceiveBytes >> kMebibyteShift).c_str());
}

// The exit codes the usage text names.
constexpr int kExitSuccess = 0;
constexpr int kExitFailed = 1;
constexpr int kExitBadUsage = 2;
constexpr int kExitPortNotOpened = 3;

// The longest port name taken (the record's capacity less the device prefix).
constexpr size_t kLongestPortName = 10;

std::atomic<bool> g_cancelled{false};
// Progress steps above zero after which the receive is cancelled; 0 = never.
uint32_t g_cancelAfterSteps = 0;

BOOL WINAPI OnConsoleControl(DWORD event) {
    if (event == CTRL_C_EVENT || event == CTRL_BREAK_EVENT || event == CTRL_CLOSE_EVENT) {
        // The driver sees it at its next check, reports and closes the port.
        g_cancelled = true;
        return TRUE;
    }
    return FALSE;
}

void PrintLine(FILE* stream, const wchar_t* prefix, const wchar_t* text) {
    std::wstring line = std::wstring(prefix) + text + L"\n";
    const int bytes = ::WideCharToMultiByte(CP_UTF8, 0, line.c_str(), static_cast<int>(line.size()),
                                            nullptr, 0, nullptr, nullptr);
    std::string utf8(bytes, '\0');
    ::WideCharToMultiByte(CP_UTF8, 0, line.c_str(), static_cast<int>(line.size()), utf8.data(),
                          bytes, nullptr, nullptr);
    std::fwrite(utf8.data(), 1, utf8.size(), stream);
    std::fflush(stream);
}

class ConsoleCallback final : public TParserCallBack {
public:
    explicit ConsoleCallback(bool quiet) : quiet_(quiet) {}
    void ShowMessage(MessageCode code, const wchar_t* text) override {
        // Scripts read the code as the dialog receives it.
        const std::wstring prefix = L"lvrecv: [code " + std::to_wstring(PostedCodeOf(code)) + L"] ";
        PrintLine(code == MessageCode::Information ? stdout : stderr, prefix.c_str(), text);
    }
    void SetProgress(uint32_t total, uint32_t current) override {
        if (current > 0 && g_cancelAfterSteps != 0 && ++steps_ >= g_cancelAfterSteps)
            g_cancelled = true;
        if (quiet_ || total == 0)
            return;
        const std::wstring text = std::to_wstring(current) + L" / " + std::to_wstring(total);
        PrintLine(stdout, L"lvrecv: progress ", text.c_str());
    }
    bool IsCancelled() override { return g_cancelled; }

private:
    bool quiet_;
    uint32_t steps_ = 0;
};

}  // namespace

int wmain(int argc, wchar_t** argv) {
    std::wstring port;
    std::wstring out;
    std::wstring protocol = L"line";
    uint32_t baud = 9600;
    BYTE parity = EVENPARITY;
    bool quiet = false;
    for (int i = 1; i < argc; ++i) {
        const std::wstring option = argv[i];
        const bool hasValue = i + 1 < argc;
        if (option == L"--help" || option == L"-h") {
            PrintUsage(stdout);
            return kExitSuccess;
        } else if (option == L"--quiet") {
            quiet = true;
        } else if (option == L"--port" && hasValue) {
            port = argv[++i];
        } else if (option == L"--out" && hasValue) {
            out = argv[++i];
        } else if (option == L"--baud" && hasValue) {
            baud = static_cast<uint32_t>(std::wcstoul(argv[++i], nullptr, 10));
        } else if (option == L"--parity" && hasValue) {
            const std::wstring name = argv[++i];
            parity = name == L"none" ? NOPARITY : name == L"odd" ? ODDPARITY : EVENPARITY;
        } else if (option == L"--protocol" && hasValue) {
            protocol = argv[++i];
        } else if (option == L"--cancel-after" && hasValue) {
            g_cancelAfterSteps = static_cast<uint32_t>(std::wcstoul(argv[++i], nullptr, 10));
        } else {
            std::fprintf(stderr, "lvrecv: bad option %ls\n", option.c_str());
            PrintUsage(stderr);
            return kExitBadUsage;
        }
    }
    std::optional<ReceiveProcedure> procedure;
    if (protocol == L"bcc")
        procedure = ReceiveProcedure::BccBlocks;
    else if (protocol == L"ymodem")
        procedure = ReceiveProcedure::YModem;
    else if (protocol == L"raw")
        procedure = ReceiveProcedure::RawStream;
    else if (protocol == L"line")
        procedure = ReceiveProcedure::BccBlocks;  // the download thread's: no software flow control
    if (!procedure || port.empty() || out.empty() || baud == 0 || port.size() > kLongestPortName) {
        PrintUsage(stderr);
        return kExitBadUsage;
    }

    TAZCommParams params;
    params.DeviceControlBlock.BaudRate = baud;
    params.DeviceControlBlock.ByteSize = kReceiveDataBits;
    params.DeviceControlBlock.Parity = parity;
    params.DeviceControlBlock.StopBits = ONESTOPBIT;
    // The driver passes the name to CreateFileW as it stands; only the device path form reaches
    // ports above COM9, and it works for every port.
    const std::wstring device = port.rfind(L"\\\\.\\", 0) == 0 ? port : L"\\\\.\\" + port;
    wcsncpy(params.PortName, device.c_str(), kPortNameCapacity);
    params.Protocol = *procedure;
    params.OutputPath = out;

    ::SetConsoleCtrlHandler(OnConsoleControl, TRUE);
    ConsoleCallback callback(quiet);
    TAZComm driver(&callback, &params);
    if (!driver.IsPortOpen())
        return kExitPortNotOpened;
    const TransferResult result = protocol == L"line" ? driver.ReceiveLines() : driver.Receive();
    if (result == TransferResult::Complete) {
        PrintLine(stdout, L"lvrecv: file complete: ", out.c_str());
        return kExitSuccess;
    }
    if (g_cancelled)
        PrintLine(stderr, L"lvrecv: ", L"stopped");
    return kExitFailed;
}
