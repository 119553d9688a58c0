// The module object: start-up when the library is loaded and clean-up when it is unloaded.
#pragma once

#include <windows.h>

class CModuleApp {
public:
    // Registers the window messages, loads the view's display settings and builds the shared
    // icon lists. Runs once, when the library is attached to the process.
    static void InitInstance(HMODULE module) noexcept;

    // Saves the display settings. When the library is freed (not at process exit) it also
    // destroys the icon lists and the cached class factories.
    static void ExitInstance(bool processTerminating) noexcept;
};
