// CThread: start, state tracking and waiting around one worker thread.
#include "download/thread.h"

#include "support/text_lookup.h"

namespace {
constexpr DWORD kNotApplicable = 0xFFFFFFFF;
}  // namespace

CThread::CThread() noexcept : language_(UiLanguage()) {}

CThread::~CThread() = default;

HANDLE CThread::Start() {
    const uint32_t state = state_.load();
    if (state == kRunning)
        return thread_.get();
    thread_.reset();
    state_ = kRunning;  // before the worker can finish and set its own state
    thread_.reset(::CreateThread(nullptr, 0, &CThread::ThreadProcedure, this, 0, nullptr));
    if (!thread_)
        state_ = state;
    return thread_.get();
}

uint32_t CThread::GetStatus() noexcept {
    if (state_.load() == kRunning) {
        DWORD exitCode = STILL_ACTIVE;
        if (::GetExitCodeThread(thread_.get(), &exitCode) && exitCode != STILL_ACTIVE)
            state_ = kFinished;
    }
    return state_.load();
}

DWORD CThread::Wait(DWORD milliseconds) noexcept {
    if (state_.load() != kRunning)
        return kNotApplicable;
    return ::WaitForSingleObject(thread_.get(), milliseconds);
}

DWORD CThread::StopAndWait(DWORD milliseconds) {
    Stop();
    return Wait(milliseconds);
}

DWORD CThread::GetExitCode() const noexcept {
    DWORD exitCode = 0;
    if (!::GetExitCodeThread(thread_.get(), &exitCode))
        return 0;
    return exitCode;
}

void CThread::OnStart() {}

void CThread::OnEnd() {}

void CThread::Stop() {
    stopRequested_ = true;
}

DWORD CThread::Run() {
    return kNotApplicable;
}

DWORD WINAPI CThread::ThreadProcedure(void* parameter) {
    auto* thread = static_cast<CThread*>(parameter);
    // Texts loaded on the worker come in the language of the window that started it.
    (void)SelectThreadUiLanguage(thread->language_);  // a failure leaves the system's language
    // An exception leaving a thread procedure ends the whole process, the shell with it: the
    // work fails instead, and OnEnd still runs so that whoever waits for the worker hears of it.
    DWORD result = kThreadFailed;
    try {
        thread->OnStart();
        result = thread->Run();
    } catch (...) {
        result = kThreadFailed;
    }
    thread->state_ = kFinished;
    try {
        thread->OnEnd();
    } catch (...) {
        result = kThreadFailed;
    }
    return result;
}
