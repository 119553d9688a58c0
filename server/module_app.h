// The module object: start-up on first use and clean-up when the library is freed.
#pragma once

#include <windows.h>

class CModuleApp {
public:
    // Registers the window messages, loads the view's display settings and builds the shared
    // icon lists, once per load of the library, on the first call from any thread. The exports
    // call it before they do anything (DllGetClassObject, DllRegisterServer): none of this work
    // may run in DllMain, under the loader lock.
    static void EnsureStarted(HMODULE module) noexcept;

    // When the library is freed (not at process exit, when other modules may already be gone
    // and nothing is worth saving half-way): saves the display settings if the module was
    // started, destroys the icon lists and the cached class factories.
    static void ExitInstance() noexcept;
};
