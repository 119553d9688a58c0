// Receiving a generated file from lvsim through the real serial path: wall time against wire time.
#include <windows.h>

#include <cstdio>
#include <cwchar>
#include <string>

#include "download/az_comm.h"
#include "support/unique_resource.h"

namespace {

class QuietCallback final : public TParserCallBack {
public:
    void ShowMessage(uint32_t code, const wchar_t* text) override {
        std::fprintf(stderr, "driver message %u: %ls\n", code, text);
    }
    void SetProgress(uint32_t, uint32_t) override {}
    bool IsCancelled() override { return false; }
};

double Seconds(const FILETIME& time) {
    ULARGE_INTEGER value;
    value.LowPart = time.dwLowDateTime;
    value.HighPart = time.dwHighDateTime;
    return static_cast<double>(value.QuadPart) / 1e7;
}

std::wstring ExecutableDirectory() {
    wchar_t path[MAX_PATH];
    const DWORD length = ::GetModuleFileNameW(nullptr, path, MAX_PATH);
    std::wstring directory(path, length);
    return directory.substr(0, directory.find_last_of(L"\\/"));
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    std::wstring driverPort = L"COM22";
    std::wstring simulatorPort = L"COM23";
    unsigned lines = 1000;
    unsigned lineLength = 60;
    for (int i = 1; i + 1 < argc; i += 2) {
        const std::wstring option = argv[i];
        if (option == L"--driver-port")
            driverPort = argv[i + 1];
        else if (option == L"--sim-port")
            simulatorPort = argv[i + 1];
        else if (option == L"--lines")
            lines = static_cast<unsigned>(std::wcstoul(argv[i + 1], nullptr, 10));
    }
    const std::wstring output = ExecutableDirectory() + L"\\bench-received.lv";

    TAZCommParams params;
    params.DeviceControlBlock.BaudRate = 9600;
    params.DeviceControlBlock.ByteSize = 7;
    params.DeviceControlBlock.Parity = 2;
    params.DeviceControlBlock.StopBits = 0;
    const std::wstring device = L"\\\\.\\" + driverPort;
    wcsncpy(params.PortName, device.c_str(), 14);
    params.OutputPath = output;
    QuietCallback callback;
    TAZComm driver(&callback, &params);
    if (!driver.IsPortOpen())
        return 1;

    std::wstring command = L"\"" + ExecutableDirectory() + L"\\lvsim.exe\" --port " +
                           simulatorPort + L" --baud 9600 --parity even --lines " +
                           std::to_wstring(lines) + L" --line-length " +
                           std::to_wstring(lineLength);
    STARTUPINFOW startup{};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION process{};
    LARGE_INTEGER frequency, start, end;
    ::QueryPerformanceFrequency(&frequency);
    FILETIME created, exited, kernelBefore, userBefore, kernelAfter, userAfter;
    ::GetProcessTimes(::GetCurrentProcess(), &created, &exited, &kernelBefore, &userBefore);
    ::QueryPerformanceCounter(&start);
    if (!::CreateProcessW(nullptr, command.data(), nullptr, nullptr, FALSE, 0, nullptr, nullptr,
                          &startup, &process))
        return 1;
    UniqueHandle simulator(process.hProcess);
    UniqueHandle thread(process.hThread);
    const uint32_t result = driver.ReceiveLines();
    ::QueryPerformanceCounter(&end);
    ::GetProcessTimes(::GetCurrentProcess(), &created, &exited, &kernelAfter, &userAfter);
    ::WaitForSingleObject(simulator.get(), 30000);

    WIN32_FILE_ATTRIBUTE_DATA attributes{};
    ::GetFileAttributesExW(output.c_str(), GetFileExInfoStandard, &attributes);
    const double received = attributes.nFileSizeLow;
    const unsigned acceptedLines = lines + 2;     // header and end line
    const double answered = acceptedLines * 6.0;  // one ACK line each
    const double wall = static_cast<double>(end.QuadPart - start.QuadPart) / frequency.QuadPart;
    const double wire = (received + answered) * 10.0 / 9600.0;
    const double cpu =
        Seconds(kernelAfter) - Seconds(kernelBefore) + Seconds(userAfter) - Seconds(userBefore);
    std::printf("serial receive, line protocol, 9600 baud 7E1, %u lines of %u characters\n", lines,
                lineLength);
    std::printf("result                 %u (%s)\n", result, result == 0 ? "complete" : "FAILED");
    std::printf("bytes                  %.0f received, %.0f answered\n", received, answered);
    std::printf("wall time              %.3f s\n", wall);
    std::printf("wire-time limit        %.3f s\n", wire);
    std::printf("wall / wire            %.2f\n", wall / wire);
    std::printf("per line beyond wire   %.1f ms (port read interval 50 ms)\n",
                (wall - wire) * 1000.0 / acceptedLines);
    std::printf("driver CPU time        %.3f s (%.1f%% of wall)\n", cpu, 100.0 * cpu / wall);
    return result == 0 ? 0 : 1;
}
