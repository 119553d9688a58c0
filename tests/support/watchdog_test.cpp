// A case that hangs on a box nobody answers, for run_watchdog_test: the watchdog must name the
// case and the box's text, and end the program with its own exit code. Run alone, it passes.
#include <windows.h>

#include <gtest/gtest.h>

TEST(Watchdog, ABoxNobodyAnswers) {
    if (::GetEnvironmentVariableW(L"LV_WATCHDOG_HANG", nullptr, 0) == 0)
        GTEST_SKIP() << "hangs only when run_watchdog_test asks it to";
    ::MessageBoxW(nullptr, L"Nobody answers this box.", L"Watchdog test", MB_OK);
    ADD_FAILURE() << "the box was answered";
}
