// The entry points of the COM server: DllMain and the four exports; and the Start menu's "Kept
// downloads", which rundll32 calls.
#include <windows.h>
#include <objbase.h>

#include "download/kept_downloads.h"
#include "server/class_table.h"
#include "server/module_app.h"
#include "server/registration.h"

namespace {
HMODULE g_module = nullptr;
}

BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID) {
    // Bookkeeping only, under the loader lock: no registry, window, image-list or COM call and
    // no waiting. Start-up waits for the first export; what it made is torn down when
    // DllCanUnloadNow answers S_OK, and the display settings are saved when they change, so the
    // detach has nothing left to do. A library freed without being asked first leaves the
    // icon lists and factories of its last start-up to the process.
    if (reason == DLL_PROCESS_ATTACH) {
        g_module = instance;
        ::DisableThreadLibraryCalls(instance);
    }
    return TRUE;
}

STDAPI DllGetClassObject(REFCLSID classId, REFIID iid, void** object) {
    // The scope holds the module until the factory, asked for the interface, holds it itself.
    const CModuleApp::StartedScope started = CModuleApp::EnsureStarted(g_module);
    return GetClassObject(classId, iid, object);
}

STDAPI DllCanUnloadNow() {
    return CModuleApp::CanUnloadNow();
}

STDAPI DllRegisterServer() {
    // Held for the whole registration: DllCanUnloadNow on another thread answers S_FALSE meanwhile.
    const CModuleApp::StartedScope started = CModuleApp::EnsureStarted(g_module);
    return RegisterServer(g_module);
}

STDAPI DllUnregisterServer() {
    return UnregisterServer(g_module);
}


// rundll32 "<folder>\LVShellExt.dll",OpenKeptDownloads: rundll32 takes the W form first.
// Opens the current user's folder of kept downloads; the command line is not read.
extern "C" void CALLBACK OpenKeptDownloadsW(HWND window, HINSTANCE, LPWSTR, int showCommand) {
    // The shell may hand the folder to extensions that need a single-threaded apartment.
    const HRESULT initialized =
        ::CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED | COINIT_DISABLE_OLE1DDE);
    // A failure has been shown to the user and logged where it happened; rundll32 has no use
    // for a result.
    (void)OpenKeptDownloadsFolder(window, showCommand);
    if (SUCCEEDED(initialized))
        ::CoUninitialize();
}
