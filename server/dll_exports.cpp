// The entry points of the COM server: DllMain and the four exports.
#include <windows.h>
#include <objbase.h>

#include "server/class_table.h"
#include "server/module_app.h"
#include "server/registration.h"
#include "support/module_lock.h"

namespace {
HMODULE g_module = nullptr;
}

BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID reserved) {
    // Only what is safe under the loader lock: the start-up work waits for the first export.
    switch (reason) {
        case DLL_PROCESS_ATTACH:
            g_module = instance;
            ::DisableThreadLibraryCalls(instance);
            break;
        case DLL_PROCESS_DETACH:
            // A non-null reserved pointer means the process is ending, not FreeLibrary: the
            // process takes memory and handles with it, and other modules may be gone already.
            if (!reserved)
                CModuleApp::ExitInstance();
            break;
        default:
            break;
    }
    return TRUE;
}

STDAPI DllGetClassObject(REFCLSID classId, REFIID iid, void** object) {
    CModuleApp::EnsureStarted(g_module);
    return GetClassObject(classId, iid, object);
}

STDAPI DllCanUnloadNow() {
    return ModuleLockCount() == 0 ? S_OK : S_FALSE;
}

STDAPI DllRegisterServer() {
    CModuleApp::EnsureStarted(g_module);
    return RegisterServer(g_module);
}

STDAPI DllUnregisterServer() {
    return UnregisterServer(g_module);
}
