// The namespace's folder: its interfaces and its class identifier.
#include "server/lv_shell_folder.h"

HRESULT CLVShellFolder::QueryInterface(REFIID iid, void** object) {
    static const QITAB table[] = {
        QITABENT(CLVShellFolder, IShellFolder),
        QITABENT(CLVShellFolder, IPersistFolder2),
        QITABENTMULTI(CLVShellFolder, IPersistFolder, IPersistFolder2),
        QITABENTMULTI(CLVShellFolder, IPersist, IPersistFolder2),
        {},
    };
    return QISearch(this, table, iid, object);
}

HRESULT CLVShellFolder::GetClassID(CLSID* id) {
    if (!id)
        return E_POINTER;
    *id = CLSID_LVShellFolder;
    return S_OK;
}
