// The four entry points of the COM server.
#include <windows.h>
#include <objbase.h>

STDAPI DllGetClassObject(REFCLSID, REFIID, void** object) {
    if (object)
        *object = nullptr;
    return CLASS_E_CLASSNOTAVAILABLE;  // the class table arrives with the shell folder
}

STDAPI DllCanUnloadNow() {
    return S_OK;
}

STDAPI DllRegisterServer() {
    return E_NOTIMPL;
}

STDAPI DllUnregisterServer() {
    return E_NOTIMPL;
}
