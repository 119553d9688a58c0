// CThread: one operating-system thread running an object's Run, in its creator's UI language.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstdint>

#include "support/unique_resource.h"

class CThread {
public:
    enum State : uint32_t { kCreated = 0, kRunning = 1, kFinished = 3 };
    // The exit code of a worker whose OnStart, Run or OnEnd threw (E_FAIL's bits).
    static constexpr DWORD kThreadFailed = 0x80004005;

    // Remembers the creating thread's UI language for the worker.
    CThread() noexcept;
    CThread(const CThread&) = delete;
    CThread& operator=(const CThread&) = delete;
    // Closes the thread handle; does not stop the thread (call StopAndWait first).
    virtual ~CThread();

    // Starts the worker unless it is running; returns the thread's handle, null when it could not
    // be created.
    HANDLE Start();
    // The state; a running thread whose exit code is no longer STILL_ACTIVE becomes finished.
    [[nodiscard]] uint32_t GetStatus() noexcept;
    // The wait result for the thread's handle, or 0xFFFFFFFF when not running.
    [[nodiscard]] DWORD Wait(DWORD milliseconds) noexcept;
    // Stop (which a derived class may override), then Wait.
    [[nodiscard]] DWORD StopAndWait(DWORD milliseconds);
    [[nodiscard]] DWORD GetExitCode() const noexcept;

    // Runs first on the worker thread.
    virtual void OnStart();
    // Runs last on the worker thread, after the state became finished, also when Run threw.
    virtual void OnEnd();
    // Asks the work to end; the work reads the request through IsStopRequested.
    virtual void Stop();
    // The work; its result becomes the thread's exit code.
    virtual DWORD Run();

protected:
    // The worker's handle (null before the first start), for a derived destructor that must not
    // free what the worker still uses.
    HANDLE ThreadHandle() const noexcept { return thread_.get(); }
    bool IsStopRequested() const noexcept { return stopRequested_.load(std::memory_order_relaxed); }

private:
    static DWORD WINAPI ThreadProcedure(void* parameter);

    UniqueHandle thread_;
    // Written by the UI thread, polled by the worker: a lone flag, no ordering needed.
    std::atomic<bool> stopRequested_{false};
    std::atomic<uint32_t> state_{kCreated};
    LANGID language_;
};
