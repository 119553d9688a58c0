// Copy soak: takes a station's file out of the namespace N times in one process through the
// shell's paste path, pressing Start in each download dialog as the user would, and prints the
// process's handle count and private bytes before and after, the temporary downloads left and
// the time per copy. A leak of one handle or one block per copy shows as growth over N.
#include <windows.h>
#include <psapi.h>

#include <algorithm>
#include <atomic>
#include <map>
#include <cstdint>
#include <cstdarg>
#include <chrono>
#include <cstdio>
#include <string>
#include <thread>
#include <vector>

#include "tools/common/console_output.h"
#include "tools/common/shell_copy.h"

namespace {

const wchar_t kUsage[] =
    L"Usage: bench_copy_soak STATION FOLDER [--copies N]\n"
    L"Copies STATION's file into FOLDER N times (default 100) in this one process, pressing\n"
    L"Start in each download dialog, and prints handles, private bytes, temporary files left\n"
    L"and the time per copy. Something must play the instrument on the station's port.\n";

constexpr int kStartButton = 218;

struct Usage {
    DWORD handles = 0;          // handle values that name an open handle
    SIZE_T privateBytes = 0;    // as the system reports them (0 when it does not)
    SIZE_T workingSet = 0;
    SIZE_T heapBytes = 0;       // blocks in use in all of the process's heaps
};

// Counts the handle values in use by asking about each: GetProcessHandleCount is not answered
// everywhere (Wine), this is.
DWORD CountHandles() {
    DWORD count = 0;
    for (uintptr_t value = 4; value < (1u << 20); value += 4) {
        DWORD flags = 0;
        if (::GetHandleInformation(reinterpret_cast<HANDLE>(value), &flags))
            ++count;
    }
    return count;
}

// Busy heap blocks by size, for telling which allocation grows with the copies.
std::map<SIZE_T, long> HeapBlockSizes() {
    std::map<SIZE_T, long> sizes;
    std::vector<HANDLE> heaps(::GetProcessHeaps(0, nullptr) + 16);
    heaps.resize(::GetProcessHeaps(static_cast<DWORD>(heaps.size()), heaps.data()));
    for (HANDLE heap : heaps) {
        if (!::HeapLock(heap))
            continue;
        PROCESS_HEAP_ENTRY entry{};
        while (::HeapWalk(heap, &entry)) {
            if (entry.wFlags & PROCESS_HEAP_ENTRY_BUSY)
                ++sizes[entry.cbData];
        }
        ::HeapUnlock(heap);
    }
    return sizes;
}

SIZE_T HeapBytesInUse() {
    SIZE_T total = 0;
    for (const auto& [size, count] : HeapBlockSizes())
        total += size * static_cast<SIZE_T>(count);
    return total;
}

Usage Measure() {
    Usage usage;
    usage.handles = CountHandles();
    PROCESS_MEMORY_COUNTERS_EX counters{};
    counters.cb = sizeof counters;
    if (::GetProcessMemoryInfo(::GetCurrentProcess(),
                               reinterpret_cast<PROCESS_MEMORY_COUNTERS*>(&counters),
                               sizeof counters)) {
        usage.privateBytes = counters.PrivateUsage;
        usage.workingSet = counters.WorkingSetSize;
    }
    usage.heapBytes = HeapBytesInUse();
    return usage;
}

double MiB(SIZE_T bytes) {
    return static_cast<double>(bytes) / 1048576.0;
}

// "QRV" files in the user's temporary folder: downloads that outlived their request.
int TemporaryDownloads() {
    wchar_t directory[MAX_PATH];
    if (::GetTempPathW(MAX_PATH, directory) == 0)
        return -1;
    WIN32_FIND_DATAW found;
    const HANDLE search =
        ::FindFirstFileW((std::wstring(directory) + L"QRV*").c_str(), &found);
    if (search == INVALID_HANDLE_VALUE)
        return 0;
    int count = 0;
    do {
        ++count;
    } while (::FindNextFileW(search, &found));
    ::FindClose(search);
    return count;
}

// Presses Start once in every download dialog this process shows, until told to stop.
class StartPresser {
public:
    StartPresser() : thread_([this] { Run(); }) {}
    ~StartPresser() {
        stop_ = true;
        thread_.join();
    }

private:
    void Run() {
        HWND pressed = nullptr;
        while (!stop_) {
            ::Sleep(50);
            HWND dialog = nullptr;
            ::EnumWindows(
                [](HWND window, LPARAM found) -> BOOL {
                    DWORD process = 0;
                    ::GetWindowThreadProcessId(window, &process);
                    const HWND start = ::GetDlgItem(window, kStartButton);
                    if (process != ::GetCurrentProcessId() || !start || !::IsWindowVisible(window))
                        return TRUE;
                    *reinterpret_cast<HWND*>(found) = window;
                    return FALSE;
                },
                reinterpret_cast<LPARAM>(&dialog));
            if (!dialog || dialog == pressed)
                continue;
            const HWND start = ::GetDlgItem(dialog, kStartButton);
            if (::IsWindowEnabled(start)) {
                ::SendMessageW(start, BM_CLICK, 0, 0);
                pressed = dialog;
            }
        }
    }

    std::atomic<bool> stop_{false};
    std::thread thread_;
};

void Print(const wchar_t* format, ...) {
    wchar_t line[512];
    va_list arguments;
    va_start(arguments, format);
    vswprintf(line, ARRAYSIZE(line), format, arguments);
    va_end(arguments);
    PrintUtf8(line);
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    if (argc < 3 || std::wstring(argv[1]) == L"--help") {
        PrintUtf8(kUsage);
        return 2;
    }
    const std::wstring station = argv[1];
    const std::wstring folder = argv[2];
    int copies = 100;
    if (argc == 5 && std::wstring(argv[3]) == L"--copies")
        copies = std::max(1, _wtoi(argv[4]));
    if (FAILED(::OleInitialize(nullptr))) {
        PrintUtf8(L"bench_copy_soak: OLE could not start\n");
        return 2;
    }

    const int leftBefore = TemporaryDownloads();
    const Usage before = Measure();
    Usage afterFirst;
    Usage halfway;
    std::map<SIZE_T, long> halfwayBlocks;
    std::vector<double> seconds;
    int failures = 0;
    unsigned long long bytes = 0;
    {
        StartPresser presser;
        for (int copy = 0; copy < copies; ++copy) {
            const auto start = std::chrono::steady_clock::now();
            CopyOptions options;
            options.overwrite = true;  // the same file, copied again and again
            const StationFileCopy result = CopyStationFile(station, folder, options);
            seconds.push_back(
                std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
            if (result.result != StationFileCopy::kCopied) {
                ++failures;
                Print(L"copy %d: %ls (0x%08lX)\n", copy + 1,
                      result.result == StationFileCopy::kCancelled ? L"cancelled"
                                                                   : result.failure.c_str(),
                      static_cast<unsigned long>(result.code));
            } else if (bytes == 0) {
                bytes = result.bytes;
            }
            if (copy == 0)
                afterFirst = Measure();
            if (copy == copies / 2 - 1) {
                halfway = Measure();
                halfwayBlocks = HeapBlockSizes();
            }
        }
    }
    const Usage after = Measure();
    std::map<SIZE_T, long> growth = HeapBlockSizes();
    for (const auto& [size, count] : halfwayBlocks)
        growth[size] -= count;
    const int leftAfter = TemporaryDownloads();
    ::OleUninitialize();

    std::vector<double> sorted = seconds;
    std::sort(sorted.begin(), sorted.end());
    double total = 0;
    for (double value : seconds)
        total += value;
    Print(L"copies: %d (%d failed), %llu bytes each\n", copies, failures, bytes);
    Print(L"handles: %lu before, %lu after the first copy, %lu after the last\n",
          before.handles, afterFirst.handles, after.handles);
    // A leak grows the same in both halves; a cache fills once and stays.
    const auto kib = [](const Usage& from, const Usage& to) {
        return (static_cast<double>(to.heapBytes) - static_cast<double>(from.heapBytes)) / 1024.0;
    };
    Print(L"heap bytes in use: %.2f MiB before, %.2f MiB after the first copy, %.2f MiB after "
          L"the last; %+.1f KiB over copies 2 to %d, %+.1f KiB over copies %d to %d\n",
          MiB(before.heapBytes), MiB(afterFirst.heapBytes), MiB(after.heapBytes),
          kib(afterFirst, halfway), copies / 2, kib(halfway, after), copies / 2 + 1, copies);
    if (after.privateBytes == 0) {
        PrintUtf8(L"private bytes: not reported by this system\n");  // Wine leaves them 0
    } else {
        Print(L"private bytes: %.1f MiB before, %.1f MiB after the first copy, %.1f MiB after "
              L"the last\n",
              MiB(before.privateBytes), MiB(afterFirst.privateBytes), MiB(after.privateBytes));
    }
    Print(L"working set: %.1f MiB before, %.1f MiB after the first copy, %.1f MiB after the last\n",
          MiB(before.workingSet), MiB(afterFirst.workingSet), MiB(after.workingSet));
    // Block sizes whose count grew over the second half by at least one per four copies.
    std::wstring growing;
    for (const auto& [size, count] : growth) {
        if (count * 4 >= copies - copies / 2) {
            wchar_t entry[64];
            swprintf(entry, ARRAYSIZE(entry), L" %zu bytes x%ld;", static_cast<size_t>(size), count);
            growing += entry;
        }
    }
    Print(L"heap blocks growing over the second half:%ls\n",
          growing.empty() ? L" none" : growing.c_str());
    Print(L"QRV files in the temporary folder: %d before, %d after\n", leftBefore, leftAfter);
    Print(L"time per copy: mean %.2f s, median %.2f s, min %.2f s, max %.2f s\n",
          total / copies, sorted[sorted.size() / 2], sorted.front(), sorted.back());
    return failures == 0 ? 0 : 1;
}
