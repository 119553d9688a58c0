// The module object: start-up on first use, tear-down when DllCanUnloadNow lets the library go.
#pragma once

#include <windows.h>

class CModuleApp {
public:
    // One module lock, taken by EnsureStarted under the start-up lock and dropped when this goes
    // out of scope. While it lives DllCanUnloadNow answers S_FALSE, so what start-up made stays
    // in place until the caller has locks of its own (a class factory's, an object's).
    class [[nodiscard]] StartedScope {
    public:
        StartedScope(const StartedScope&) = delete;
        StartedScope& operator=(const StartedScope&) = delete;
        ~StartedScope();

    private:
        friend class CModuleApp;
        StartedScope() noexcept = default;
    };

    // Registers the window messages, loads the view's display settings and builds the shared
    // icon lists, on the first call from any thread and again on the first call after a
    // tear-down. The exports call it before they do anything (DllGetClassObject,
    // DllRegisterServer): none of this work may run in DllMain, under the loader lock.
    static StartedScope EnsureStarted(HMODULE module) noexcept;

    // DllCanUnloadNow: S_FALSE while any object, client reference to a class factory or server
    // lock is alive. Otherwise destroys the shared icon lists and the cached class factories,
    // so that nothing is left for DllMain to do at unload, and answers S_OK; a library that is
    // then not freed starts up again on the next EnsureStarted. The display settings need no
    // saving here: the view saves them when they change.
    [[nodiscard]] static HRESULT CanUnloadNow() noexcept;
};
