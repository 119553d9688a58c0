// CThread: start, state, suspension, waiting, exit code and the worker's UI language.
#include "download/thread.h"

#include <gtest/gtest.h>

#include <stdexcept>

#include "support/text_lookup.h"
#include "support/unique_resource.h"

namespace {

constexpr LANGID kGerman = MAKELANGID(LANG_GERMAN, SUBLANG_GERMAN);

// Runs until released (or stopped), then returns a known code; or throws at once.
class GatedThread : public CThread {
public:
    explicit GatedThread(bool throws = false)
        : throws_(throws), gate_(::CreateEventW(nullptr, TRUE, FALSE, nullptr)) {}
    void Release() { ::SetEvent(gate_.get()); }
    DWORD Run() override {
        if (throws_)
            throw std::runtime_error("the work failed");
        language = UiLanguage();
        while (::WaitForSingleObject(gate_.get(), 10) == WAIT_TIMEOUT && !IsStopRequested()) {
        }
        ++runs;
        return IsStopRequested() ? 7 : 42;
    }
    void OnEnd() override { stateAtEnd = GetStatus(); }

    LANGID language = 0;
    int runs = 0;
    uint32_t stateAtEnd = 0;

private:
    const bool throws_;
    UniqueHandle gate_;
};

}  // namespace

TEST(Thread, StartOnRunningThreadReturnsItsHandleAndStartsNothing) {
    GatedThread thread;
    EXPECT_EQ(thread.GetStatus(), CThread::kCreated);
    const HANDLE first = thread.Start();
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(thread.GetStatus(), CThread::kRunning);
    EXPECT_EQ(thread.Start(), first);
    EXPECT_EQ(thread.Wait(10), static_cast<DWORD>(WAIT_TIMEOUT)) << "the running thread's handle";
    thread.Release();
    // Not thread.Wait: the worker may already count as finished when it is called.
    ASSERT_EQ(::WaitForSingleObject(first, INFINITE), WAIT_OBJECT_0);
    EXPECT_EQ(thread.GetStatus(), CThread::kFinished);
    EXPECT_EQ(thread.stateAtEnd, CThread::kFinished);
    EXPECT_EQ(thread.GetExitCode(), 42u);
    EXPECT_EQ(thread.runs, 1);
    // Not running any more: nothing to wait for.
    EXPECT_EQ(thread.Wait(0), 0xFFFFFFFFu);
}

TEST(Thread, FinishedThreadStartsAgainInTheCreatorsLanguageAndStopEndsTheWork) {
    const LANGID before = UiLanguage();
    ASSERT_TRUE(SelectThreadUiLanguage(kGerman));
    GatedThread thread;
    ASSERT_TRUE(SelectThreadUiLanguage(before));
    thread.Release();
    for (int start = 0; start < 2; ++start) {
        const HANDLE worker = thread.Start();
        ASSERT_NE(worker, nullptr);
        ASSERT_EQ(::WaitForSingleObject(worker, INFINITE), WAIT_OBJECT_0);
    }
    EXPECT_EQ(thread.runs, 2);
    EXPECT_EQ(thread.language, kGerman);

    GatedThread gated;
    ASSERT_NE(gated.Start(), nullptr);
    EXPECT_EQ(gated.StopAndWait(INFINITE), WAIT_OBJECT_0);
    EXPECT_EQ(gated.GetExitCode(), 7u);
}

TEST(Thread, WorkThatThrowsEndsTheThreadNotTheProcess) {
    GatedThread thread(true);
    ASSERT_NE(nullptr, thread.Start());
    for (int waited = 0; thread.GetExitCode() == STILL_ACTIVE && waited < 1000; ++waited)
        ::Sleep(10);
    EXPECT_EQ(CThread::kThreadFailed, thread.GetExitCode());
    EXPECT_EQ(CThread::kFinished, thread.stateAtEnd)
        << "whoever waits for the worker still hears of its end";
    EXPECT_EQ(CThread::kFinished, thread.GetStatus());
}
