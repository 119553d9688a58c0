// The Windows test programs' main: GoogleTest's, plus a watchdog. A test case that does not end
// within its time (a modal box nobody answers, a wait that never returns) is named on the output
// with the windows this process shows, and the program ends; otherwise CTest's much longer
// time-out ends it without a word about where it stood.
#include <windows.h>

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <string>

namespace {

// The longest single case (a serial transfer at 1200 baud with its waits) takes about 70 s.
constexpr DWORD kDefaultCaseSeconds = 240;
constexpr int kHungExitCode = 124;  // what timeout(1) answers, so the log reads alike
constexpr int kTextCharacters = 256;

DWORD CaseSeconds() {
    // LV_TEST_CASE_SECONDS lets a slow machine or a debugging session give each case longer.
    wchar_t text[16] = {};
    const DWORD length = ::GetEnvironmentVariableW(L"LV_TEST_CASE_SECONDS", text, ARRAYSIZE(text));
    if (length == 0 || length >= ARRAYSIZE(text))
        return kDefaultCaseSeconds;
    const unsigned long seconds = std::wcstoul(text, nullptr, 10);
    return seconds == 0 ? kDefaultCaseSeconds : static_cast<DWORD>(seconds);
}

std::string Narrow(const wchar_t* text) {
    const int size = ::WideCharToMultiByte(CP_UTF8, 0, text, -1, nullptr, 0, nullptr, nullptr);
    if (size <= 1)
        return {};
    std::string narrow(static_cast<size_t>(size), '\0');
    ::WideCharToMultiByte(CP_UTF8, 0, text, -1, narrow.data(), size, nullptr, nullptr);
    narrow.resize(static_cast<size_t>(size) - 1);
    return narrow;
}

// Prints a window's class and text; with nesting, the texts of its children (a message box's
// text is a child's).
void PrintWindow(HWND window, int depth) {
    wchar_t className[kTextCharacters] = {};
    wchar_t text[kTextCharacters] = {};
    ::GetClassNameW(window, className, ARRAYSIZE(className));
    // WM_GETTEXT, not GetWindowText: a window of another thread of this process may be the stuck
    // one, and its text is what says why. The time bound keeps a frozen thread from freezing us.
    DWORD_PTR copied = 0;
    ::SendMessageTimeoutW(window, WM_GETTEXT, ARRAYSIZE(text), reinterpret_cast<LPARAM>(text),
                          SMTO_ABORTIFHUNG, 500, &copied);
    std::fprintf(stderr, "%*s- %s \"%s\"%s\n", depth * 2 + 2, "", Narrow(className).c_str(),
                 Narrow(text).c_str(), ::IsWindowVisible(window) ? "" : " (hidden)");
}

BOOL CALLBACK PrintChild(HWND window, LPARAM) {
    if (::GetParent(window) != nullptr)
        PrintWindow(window, 1);
    return TRUE;
}

BOOL CALLBACK PrintOwnWindow(HWND window, LPARAM) {
    DWORD process = 0;
    ::GetWindowThreadProcessId(window, &process);
    if (process == ::GetCurrentProcessId() && ::IsWindowVisible(window)) {
        PrintWindow(window, 0);
        ::EnumChildWindows(window, &PrintChild, 0);
    }
    return TRUE;
}

class Watchdog final : public testing::EmptyTestEventListener {
public:
    Watchdog() : seconds_(CaseSeconds()), started_(::CreateEventW(nullptr, FALSE, FALSE, nullptr)),
                 ended_(::CreateEventW(nullptr, FALSE, FALSE, nullptr)) {}

    void OnTestStart(const testing::TestInfo& info) override {
        name_ = std::string(info.test_suite_name()) + "." + info.name();
        if (!thread_)
            thread_ = ::CreateThread(nullptr, 0, &Watchdog::Watch, this, 0, nullptr);
        ::SetEvent(started_);
    }

    void OnTestEnd(const testing::TestInfo&) override { ::SetEvent(ended_); }

private:
    static DWORD WINAPI Watch(void* parameter) {
        auto* self = static_cast<Watchdog*>(parameter);
        for (;;) {
            ::WaitForSingleObject(self->started_, INFINITE);
            if (::WaitForSingleObject(self->ended_, self->seconds_ * 1000) == WAIT_OBJECT_0)
                continue;
            std::fflush(stdout);
            std::fprintf(stderr, "[  HUNG    ] %s did not end within %lu s; its windows:\n",
                         self->name_.c_str(), self->seconds_);
            ::EnumWindows(&PrintOwnWindow, 0);
            std::fflush(stderr);
            // No clean shutdown: the stuck thread may hold what a clean one would wait for.
            ::TerminateProcess(::GetCurrentProcess(), kHungExitCode);
        }
    }

    const DWORD seconds_;
    // The watchdog lives as long as the process, as does its thread: no handle is closed.
    const HANDLE started_;
    const HANDLE ended_;
    HANDLE thread_ = nullptr;
    std::string name_;  // written before started_ is set, read after it
};

}  // namespace

int main(int argc, char** argv) {
    testing::InitGoogleTest(&argc, argv);
    // GoogleTest owns its listeners and deletes them at exit.
    testing::UnitTest::GetInstance()->listeners().Append(new Watchdog);
    return RUN_ALL_TESTS();
}
