// lvsim: a digital level on a COM port, for testing the receiver without an instrument.
#include <windows.h>

#include <cstdio>
#include <cwchar>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "support/module_instance.h"
#include "tools/lvsim/instrument_simulator.h"

namespace {

const char kUsage[] =
    "Usage: lvsim --port COMn [options]\n"
    "Plays a digital level on a serial port: sends a survey file with the line protocol\n"
    "(header \"A,01,Z\", data lines with check characters, end line \"Z,&,\"), waiting for each\n"
    "ACK or NAK line, at the wire speed of the configured baud rate and framing. The raw stream\n"
    "sends the same lines without waiting for answers, then EOT; BCC blocks and Y-Modem carry\n"
    "the data lines (BCC: one line a block, without check character; Y-Modem: the lines with\n"
    "check characters, as the file \"survey.lv\").\n"
    "\n"
    "  --port COMn            serial port to play on (required)\n"
    "  --baud N               baud rate (default 9600)\n"
    "  --parity none|odd|even parity (default even)\n"
    "  --data-bits N          data bits (default 7; 7E1 = 10 bits a character)\n"
    "  --protocol line|raw|bcc|ymodem  what to speak (default line)\n"
    "  --file PATH            survey file to send: one data line per text line, without check\n"
    "                         characters; lines \"A,01,Z\" and \"Z,&,\" in it are skipped\n"
    "  --lines N              send N generated lines instead of a file (default 20)\n"
    "  --line-length N        length of generated lines with CR LF (default 60)\n"
    "  --answer-timeout MS    resend a line with no ACK or NAK after MS (default 1000)\n"
    "  --max-resends N        give up after N resends of one line or block (default 20)\n"
    "  --start-delay MS       wait before the first byte, to let the receiver start (default 0)\n"
    "  --gap MS               raw stream: pause after each line (default 0)\n"
    "  --turnaround MS        pause after each answer before the next line or block\n"
    "                         (default 10)\n"
    "  --whole-writes         hand each line to the port at once, then wait its wire time\n"
    "                         (default: byte by byte at the baud rate, as a cable delivers)\n"
    "Faults:\n"
    "  --bad-check K          line (or block) K goes first with a wrong check character\n"
    "  --lose-ack K           the ACK of line K is ignored once, so line K is sent again\n"
    "  --noise N              N noise lines before the header\n"
    "  --silence S            say nothing for S seconds first\n"
    "  --long-line            after the header, a 128-byte line without CR LF, then nothing\n"
    "  --disconnect-after K   close the port after line or block K was acknowledged (raw\n"
    "                         stream: sent), before the end\n"
    "  --repeat               BCC blocks and Y-Modem: send the data again and again and never\n"
    "                         the end (Y-Modem: past the announced size), for as long as the\n"
    "                         receiver acknowledges\n"
    "  --verbose              report the opened port, every line or block and its answer on\n"
    "                         stderr\n"
    "  --help                 this text\n"
    "Exit code: 0 when the receiver acknowledged everything (raw stream: when everything was\n"
    "sent), 1 otherwise, 2 on bad usage.\n";

std::vector<std::string> ReadSurveyFile(const std::wstring& path, bool& ok) {
    std::vector<std::string> lines;
    std::ifstream in(path.c_str(), std::ios::binary);  // MinGW's ifstream takes wide paths
    ok = static_cast<bool>(in);
    std::string line;
    while (std::getline(in, line)) {
        while (!line.empty() && (line.back() == '\r' || line.back() == '\n'))
            line.pop_back();
        if (line.empty() || line.rfind("A,01,Z", 0) == 0 || line.rfind("Z,&,", 0) == 0)
            continue;
        // A line that already ends with its check character and comma keeps only its body.
        if (line.size() >= 3 && line.back() == ',' && line[line.size() - 3] == ',') {
            const std::string body = line.substr(0, line.size() - 2);
            if (WithCheckCharacter(body) == line + "\r\n")
                line = body;
        }
        lines.push_back(line.substr(0, 120));
    }
    return lines;
}

}  // namespace

// The exit codes the usage text names.
constexpr int kExitAcknowledged = 0;
constexpr int kExitNotCompleted = 1;
constexpr int kExitBadUsage = 2;

int wmain(int argc, wchar_t** argv) {
    std::wstring port;
    std::wstring file;
    std::wstring protocol = L"line";
    BYTE parity = EVENPARITY;
    uint32_t dataBits = 7;
    uint32_t lineCount = 20;
    uint32_t lineLength = 60;
    uint32_t startDelay = 0;
    SimulatorOptions options;
    for (int i = 1; i < argc; ++i) {
        const std::wstring option = argv[i];
        auto value = [&]() -> std::wstring {
            if (i + 1 >= argc) {
                std::fprintf(stderr, "lvsim: %ls needs a value\n", option.c_str());
                std::exit(kExitBadUsage);
            }
            return argv[++i];
        };
        auto number = [&]() {
            return static_cast<uint32_t>(std::wcstoul(value().c_str(), nullptr, 10));
        };
        if (option == L"--help" || option == L"-h") {
            std::fputs(kUsage, stdout);
            return kExitAcknowledged;
        } else if (option == L"--port") {
            port = value();
        } else if (option == L"--baud") {
            options.BaudRate = number();
        } else if (option == L"--parity") {
            const std::wstring name = value();
            parity = name == L"none" ? NOPARITY : name == L"odd" ? ODDPARITY : EVENPARITY;
        } else if (option == L"--data-bits") {
            dataBits = number();
        } else if (option == L"--protocol") {
            protocol = value();
        } else if (option == L"--file") {
            file = value();
        } else if (option == L"--lines") {
            lineCount = number();
        } else if (option == L"--line-length") {
            lineLength = number();
        } else if (option == L"--answer-timeout") {
            options.AnswerTimeoutMs = number();
        } else if (option == L"--max-resends") {
            options.MaxResends = number();
        } else if (option == L"--start-delay") {
            startDelay = number();
        } else if (option == L"--gap") {
            options.LineGapMs = number();
        } else if (option == L"--turnaround") {
            options.TurnaroundMs = number();
        } else if (option == L"--whole-writes") {
            options.WholeWrites = true;
        } else if (option == L"--bad-check") {
            options.BadCheckLine = number();
        } else if (option == L"--lose-ack") {
            options.LostAckLine = number();
        } else if (option == L"--noise") {
            options.NoiseLines = number();
        } else if (option == L"--silence") {
            options.SilenceSeconds = number();
        } else if (option == L"--long-line") {
            options.LongLineWithoutEnd = true;
        } else if (option == L"--disconnect-after") {
            options.DisconnectAfterLine = number();
        } else if (option == L"--repeat") {
            options.Endless = true;
        } else if (option == L"--verbose") {
            options.Verbose = true;
        } else {
            std::fprintf(stderr, "lvsim: unknown option %ls\n%s", option.c_str(), kUsage);
            return kExitBadUsage;
        }
    }
    if (port.empty() || options.BaudRate == 0 ||
        (protocol != L"line" && protocol != L"raw" && protocol != L"bcc" &&
         protocol != L"ymodem")) {
        std::fputs(kUsage, stderr);
        return kExitBadUsage;
    }
    constexpr uint32_t kStartBits = 1;
    constexpr uint32_t kParityBits = 1;
    constexpr uint32_t kStopBits = 1;
    options.BitsPerCharacter =
        kStartBits + dataBits + (parity != NOPARITY ? kParityBits : 0) + kStopBits;

    std::vector<std::string> lines;
    if (!file.empty()) {
        bool ok = false;
        lines = ReadSurveyFile(file, ok);
        if (!ok) {
            std::fprintf(stderr, "lvsim: cannot read %ls\n", file.c_str());
            return kExitBadUsage;
        }
    } else {
        lines = GenerateSurveyLines(lineCount, lineLength);
    }

    DCB dcb{};
    dcb.DCBlength = sizeof dcb;
    dcb.BaudRate = options.BaudRate;
    dcb.ByteSize = static_cast<BYTE>(dataBits);
    dcb.Parity = parity;
    dcb.StopBits = ONESTOPBIT;
    dcb.fBinary = TRUE;
    dcb.fDtrControl = DTR_CONTROL_ENABLE;
    dcb.fRtsControl = RTS_CONTROL_ENABLE;
    // An answer is seen as soon as its bytes stop (the turn-around is a pause of its own): a
    // coarse interval here would add its length to every line of the transfer.
    COMMTIMEOUTS timeouts{};
    timeouts.ReadIntervalTimeout = 1;
    timeouts.ReadTotalTimeoutConstant = 100;
    timeouts.WriteTotalTimeoutConstant = 1000;
    const std::wstring device = L"\\\\.\\" + port;
    Win32SerialPort serial;
    const DWORD error = serial.Open(device.c_str(), dcb, timeouts);
    if (error != ERROR_SUCCESS) {
        std::fprintf(stderr, "lvsim: cannot open %ls: %ls\n", port.c_str(),
                     SystemMessageText(error).c_str());
        return kExitNotCompleted;
    }
    // Answers left on the line by an earlier receiver are not meant for this transfer.
    serial.Purge(true, true);
    if (options.Verbose)
        std::fprintf(stderr, "lvsim: ready on %ls\n", port.c_str());
    if (startDelay)
        ::Sleep(startDelay);

    InstrumentSimulator simulator(serial, options);
    TransferResult result = TransferResult::Failed;
    if (protocol == L"line") {
        result = simulator.SendLines(lines);
    } else if (protocol == L"raw") {
        // What the instrument prints: the line protocol's lines, without its answers.
        std::vector<std::string> printed = {"A,01,Z\r\n"};
        for (const auto& line : lines)
            printed.push_back(WithCheckCharacter(line));
        printed.push_back("Z,&,\r\n");
        result = simulator.SendRawStream(printed);
    } else if (protocol == L"bcc") {
        result = simulator.SendBccBlocks(lines);
    } else {
        std::string content;
        for (const auto& line : lines)
            content += WithCheckCharacter(line);
        result = simulator.SendYModem("survey.lv", content);
    }
    std::fprintf(
        stderr, "lvsim: %s (%llu bytes sent, %llu received)\n",
        result == TransferResult::Complete ? "transfer acknowledged" : "transfer not completed",
        static_cast<unsigned long long>(simulator.BytesSent()),
        static_cast<unsigned long long>(simulator.BytesReceived()));
    return result == TransferResult::Complete ? kExitAcknowledged : kExitNotCompleted;
}
