// HalvekLibraryClaim: the process-wide state of the one library download, under one lock that
// the dialog's thread and the library's thread share.
#include "download/halvek_library_claim.h"

#include <mutex>
#include <utility>

#include "support/module_lock.h"
#include "support/registered_messages.h"

namespace {

struct ClaimState {
    std::mutex lock;
    bool claimed = false;
    HWND window = nullptr;
    bool completionDue = false;
    bool completionArrived = false;
    // Kept for a library that has not confirmed its end (see Finish).
    bool waitingForLateCompletion = false;
    UniqueHalvekObject leftObject;
    std::unique_ptr<uint8_t[]> leftPoints;
    std::wstring lateFile;
};

// Never destroyed: deleting a library object from DllMain at unload would call into the
// library under the loader lock; a module lock keeps the module while a library may call back.
ClaimState& State() {
    static ClaimState* const state = new ClaimState;
    return *state;
}

}  // namespace

HalvekLibraryClaim HalvekLibraryClaim::TryTake() noexcept {
    ClaimState& state = State();
    UniqueHalvekObject leftObject;
    std::unique_ptr<uint8_t[]> leftPoints;
    HalvekLibraryClaim claim;
    {
        const std::lock_guard<std::mutex> guard(state.lock);
        if (state.claimed)
            return claim;
        state.claimed = true;
        state.window = nullptr;
        state.completionDue = false;
        state.completionArrived = false;
        // What a late completion released: the library has reported, its object can go now,
        // here on a thread of ours rather than inside the library's own callback.
        leftObject = std::move(state.leftObject);
        leftPoints = std::move(state.leftPoints);
    }
    leftObject.reset();  // before the buffer it may point to
    leftPoints.reset();
    claim.held_ = true;
    return claim;
}

HalvekLibraryClaim::HalvekLibraryClaim(HalvekLibraryClaim&& other) noexcept
    : held_(std::exchange(other.held_, false)) {}

HalvekLibraryClaim& HalvekLibraryClaim::operator=(HalvekLibraryClaim&& other) noexcept {
    if (this != &other) {
        Release();
        held_ = std::exchange(other.held_, false);
    }
    return *this;
}

HalvekLibraryClaim::~HalvekLibraryClaim() {
    Release();
}

void HalvekLibraryClaim::Release() noexcept {
    if (!held_)
        return;
    held_ = false;
    ClaimState& state = State();
    const std::lock_guard<std::mutex> guard(state.lock);
    state.claimed = false;
    state.window = nullptr;
    state.completionDue = false;
}

void HalvekLibraryClaim::RouteCompletionTo(HWND window) noexcept {
    if (!held_)
        return;
    ClaimState& state = State();
    const std::lock_guard<std::mutex> guard(state.lock);
    state.window = window;
}

void HalvekLibraryClaim::ExpectCompletion(bool expected) noexcept {
    if (!held_)
        return;
    ClaimState& state = State();
    const std::lock_guard<std::mutex> guard(state.lock);
    state.completionDue = expected;
    state.completionArrived = false;
}

bool HalvekLibraryClaim::CompletionArrived() const noexcept {
    if (!held_)
        return false;
    ClaimState& state = State();
    const std::lock_guard<std::mutex> guard(state.lock);
    return state.completionArrived;
}

void HalvekLibraryClaim::Finish(UniqueHalvekObject object, std::unique_ptr<uint8_t[]> points,
                                const std::wstring& outputPath) noexcept {
    if (held_) {
        ClaimState& state = State();
        const std::lock_guard<std::mutex> guard(state.lock);
        if (object && state.completionDue && !state.completionArrived) {
            // Not freed: the library's thread may still use them. The claim stays taken, and
            // the module loaded, until the library calls back.
            state.window = nullptr;
            state.waitingForLateCompletion = true;
            state.leftObject = std::move(object);
            state.leftPoints = std::move(points);
            try {
                state.lateFile = outputPath + L".txt";
            } catch (...) {
                state.lateFile.clear();  // out of memory: a late file then stays behind
            }
            LockModule();
            held_ = false;
            return;
        }
    }
    object.reset();  // before the buffer it may point to
    points.reset();
}

void HalvekLibraryClaim::CompletionCallback(int32_t result) {
    ClaimState& state = State();
    const std::lock_guard<std::mutex> guard(state.lock);
    // Nothing is waiting for a report that was not asked for.
    if (!state.completionDue || state.completionArrived)
        return;
    state.completionArrived = true;
    if (state.window) {
        // A dialog that has just closed waits for nothing: a failed post is of no concern.
        (void)::PostMessageW(state.window, g_registeredMessages.halvekDownloadMessage, 0,
                             static_cast<LPARAM>(result));
    }
    if (!state.waitingForLateCompletion)
        return;
    // The download it ended was given up: its file is nobody's, and goes before the next
    // download may start.
    if (!state.lateFile.empty())
        (void)::DeleteFileW(state.lateFile.c_str());  // often there is none
    state.lateFile.clear();
    state.waitingForLateCompletion = false;
    state.claimed = false;
    state.completionDue = false;
    UnlockModule();
}
