// Receiving a generated file from lvsim through the real serial path at several baud rates: the
// time from the acknowledged header to the last answer against what the cable allows.
#include <windows.h>

#include <cstdio>
#include <cwchar>
#include <string>
#include <vector>

#include "download/az_comm.h"
#include "support/unique_resource.h"

namespace {

// Notes when each line was answered: the driver reports progress right after each ACK.
class TimingCallback final : public TParserCallBack {
public:
    void ShowMessage(MessageCode code, const wchar_t* text) override {
        std::fprintf(stderr, "driver message %u: %ls\n", PostedCodeOf(code), text);
    }
    void SetProgress(uint32_t, uint32_t current) override {
        if (current == 0)
            return;  // the start, before any line
        LARGE_INTEGER now;
        ::QueryPerformanceCounter(&now);
        if (answers++ == 0)
            headerAnswered = now;
        lastAnswered = now;
    }
    bool IsCancelled() override { return false; }

    unsigned answers = 0;
    LARGE_INTEGER headerAnswered{};
    LARGE_INTEGER lastAnswered{};
};

double Seconds(const FILETIME& time) {
    ULARGE_INTEGER value;
    value.LowPart = time.dwLowDateTime;
    value.HighPart = time.dwHighDateTime;
    return static_cast<double>(value.QuadPart) / 1e7;
}

double ProcessCpuSeconds() {
    FILETIME created, exited, kernel, user;
    ::GetProcessTimes(::GetCurrentProcess(), &created, &exited, &kernel, &user);
    return Seconds(kernel) + Seconds(user);
}

std::wstring ExecutableDirectory() {
    wchar_t path[MAX_PATH];
    const DWORD length = ::GetModuleFileNameW(nullptr, path, MAX_PATH);
    std::wstring directory(path, length);
    return directory.substr(0, directory.find_last_of(L"\\/"));
}

struct Options {
    std::wstring driverPort = L"COM22";
    std::wstring simulatorPort = L"COM23";
    unsigned lines = 1000;
    unsigned lineLength = 60;  // CR LF included
    unsigned turnaroundMs = 10;
    std::vector<unsigned> rates = {9600, 19200, 38400};
    bool wholeWrites = false;
};

// One transfer at one rate; false when the receive failed.
bool RunAt(const Options& options, unsigned baud) {
    const std::wstring output = ExecutableDirectory() + L"\\bench-received.lv";
    TAZCommParams params;
    params.DeviceControlBlock.BaudRate = baud;
    params.DeviceControlBlock.ByteSize = kReceiveDataBits;
    params.DeviceControlBlock.Parity = EVENPARITY;
    params.DeviceControlBlock.StopBits = ONESTOPBIT;
    const std::wstring device = L"\\\\.\\" + options.driverPort;
    wcsncpy(params.PortName, device.c_str(), kPortNameCapacity);
    params.OutputPath = output;
    TimingCallback callback;
    TAZComm driver(&callback, &params);
    if (!driver.IsPortOpen())
        return false;

    std::wstring command = L"\"" + ExecutableDirectory() + L"\\lvsim.exe\" --port " +
                           options.simulatorPort + L" --baud " + std::to_wstring(baud) +
                           L" --parity even --lines " + std::to_wstring(options.lines) +
                           L" --line-length " + std::to_wstring(options.lineLength) +
                           L" --turnaround " + std::to_wstring(options.turnaroundMs) +
                           (options.wholeWrites ? L" --whole-writes" : L"");
    STARTUPINFOW startup{};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION process{};
    LARGE_INTEGER frequency;
    ::QueryPerformanceFrequency(&frequency);
    if (!::CreateProcessW(nullptr, command.data(), nullptr, nullptr, FALSE, 0, nullptr, nullptr,
                          &startup, &process))
        return false;
    UniqueHandle simulator(process.hProcess);
    UniqueHandle thread(process.hThread);
    const double cpuBefore = ProcessCpuSeconds();
    const TransferResult result = driver.ReceiveLines();
    const double cpu = ProcessCpuSeconds() - cpuBefore;
    ::WaitForSingleObject(simulator.get(), 30000);

    WIN32_FILE_ATTRIBUTE_DATA attributes{};
    ::GetFileAttributesExW(output.c_str(), GetFileExInfoStandard, &attributes);
    // After the header: every data line and the end line, each answered by a 6-byte ACK line
    // after which the instrument pauses for its turn-around before the next.
    const unsigned headerBytes = 8;
    const unsigned timedLines = options.lines + 1;
    const double received = static_cast<double>(attributes.nFileSizeLow) - headerBytes;
    const double answered = timedLines * 6.0;
    const double wall =
        static_cast<double>(callback.lastAnswered.QuadPart - callback.headerAnswered.QuadPart) /
        frequency.QuadPart;
    const double limit =
        (received + answered) * 10.0 / baud + timedLines * options.turnaroundMs / 1000.0;
    const bool complete = result == TransferResult::Complete;
    std::printf("%6u  %-8s  %8.0f  %7.0f  %8.2f  %8.2f  %6.3f  %6.3f (%.2f%% of wall)\n", baud,
                complete ? "complete" : "FAILED", received, answered, wall, limit, wall / limit,
                cpu, 100.0 * cpu / wall);
    return complete;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    Options options;
    for (int i = 1; i < argc; ++i) {
        const std::wstring option = argv[i];
        const bool hasValue = i + 1 < argc;
        if (option == L"--whole-writes") {
            options.wholeWrites = true;
        } else if (option == L"--driver-port" && hasValue) {
            options.driverPort = argv[++i];
        } else if (option == L"--sim-port" && hasValue) {
            options.simulatorPort = argv[++i];
        } else if (option == L"--lines" && hasValue) {
            options.lines = static_cast<unsigned>(std::wcstoul(argv[++i], nullptr, 10));
        } else if (option == L"--baud" && hasValue) {
            options.rates = {static_cast<unsigned>(std::wcstoul(argv[++i], nullptr, 10))};
        } else {
            std::fprintf(stderr,
                         "usage: bench_serial_receive [--lines N] [--baud B] [--whole-writes] "
                         "[--driver-port COMn] [--sim-port COMn]\n");
            return 2;
        }
    }
    std::printf("serial receive, line protocol, 7E1, %u lines of %u characters, lvsim %s, "
                "turn-around %u ms\n",
                options.lines, options.lineLength,
                options.wholeWrites ? "writing whole lines" : "pacing every byte",
                options.turnaroundMs);
    std::printf("timed from the header's ACK to the last ACK; limit = bytes both ways x 10 bits "
                "/ baud + turn-around a line\n");
    std::printf("%6s  %-8s  %8s  %7s  %8s  %8s  %6s  %s\n", "baud", "result", "received",
                "answered", "time (s)", "limit (s)", "ratio", "driver CPU (s)");
    bool allComplete = true;
    for (const unsigned baud : options.rates)
        allComplete = RunAt(options, baud) && allComplete;
    return allComplete ? 0 : 1;
}
