// HalvekLibraryClaim: the one download through the external library that a process runs at a
// time, and the route of the library's completion callback to the dialog that runs it.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <string>

#include "download/halvek_comm.h"

// The library's completion function takes nothing but a result code, so it cannot say which
// download it ends: with one download at a time it can only end the claim holder's. A claim
// outlives its dialog when the library never confirmed its end, so that a late completion can
// never be taken for another dialog's.
class HalvekLibraryClaim {
public:
    // Takes the process's one library download. An empty claim when it is taken: a library
    // dialog is open, or a library that never confirmed its cancel may still call back.
    [[nodiscard]] static HalvekLibraryClaim TryTake() noexcept;

    HalvekLibraryClaim() noexcept = default;  // empty
    HalvekLibraryClaim(HalvekLibraryClaim&& other) noexcept;
    HalvekLibraryClaim& operator=(HalvekLibraryClaim&& other) noexcept;
    HalvekLibraryClaim(const HalvekLibraryClaim&) = delete;
    HalvekLibraryClaim& operator=(const HalvekLibraryClaim&) = delete;
    // Lets the download go, unless Finish kept it for a library still running.
    ~HalvekLibraryClaim();

    explicit operator bool() const noexcept { return held_; }

    // The window that the library's completion is posted to; null stops the posts.
    void RouteCompletionTo(HWND window) noexcept;
    // True right before the transfer starts: from then on a completion is due; false when the
    // transfer did not start after all.
    void ExpectCompletion(bool expected) noexcept;
    // Whether the library reported its end since ExpectCompletion.
    [[nodiscard]] bool CompletionArrived() const noexcept;
    // The holder is done with the library. When a completion is due that has not arrived, the
    // library's own thread may still write to its object, the points buffer and the file: the
    // object and the buffer are kept, and the claim with them, until the completion arrives,
    // which then lets the download go and deletes the file that came too late (outputPath with
    // ".txt" added, as the library names it). Otherwise the object is deleted here, before the
    // buffer it may point to.
    void Finish(UniqueHalvekObject object, std::unique_ptr<uint8_t[]> points,
                const std::wstring& outputPath) noexcept;

    // The completion function handed to the library; any thread.
    static void CompletionCallback(int32_t result);

private:
    void Release() noexcept;

    bool held_ = false;
};
