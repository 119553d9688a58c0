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
    switch (reason) {
        case DLL_PROCESS_ATTACH:
            g_module = instance;
            ::DisableThreadLibraryCalls(instance);
            CModuleApp::InitInstance(instance);
            break;
        case DLL_PROCESS_DETACH:
            // A non-null reserved pointer means the process is ending, not FreeLibrary.
            CModuleApp::ExitInstance(reserved != nullptr);
            break;
        default:
            break;
    }
    return TRUE;
}

STDAPI DllGetClassObject(REFCLSID classId, REFIID iid, void** object) {
    return GetClassObject(classId, iid, object);
}

STDAPI DllCanUnloadNow() {
    return ModuleLockCount() == 0 ? S_OK : S_FALSE;
}

STDAPI DllRegisterServer() {
    return RegisterServer(g_module);
}

STDAPI DllUnregisterServer() {
    return UnregisterServer(g_module);
}
