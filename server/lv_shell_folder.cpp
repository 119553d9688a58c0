// The namespace's folder: its interfaces, its class identifier and the objects it creates.
#include "server/lv_shell_folder.h"

#include "download/dialog_station_downloader.h"
#include "namespace/lv_enum_id_list.h"
#include "namespace/lv_extract_icon.h"
#include "namespace/lv_query_info.h"
#include "support/error_handling.h"
#include "view/lv_context_menu.h"
#include "view/lv_data_object.h"
#include "view/lv_drop_target.h"
#include "view/lv_shell_view.h"

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

HRESULT CLVShellFolder::EnumObjects(HWND, SHCONTF flags, IEnumIDList** enumerator) {
    if (!enumerator)
        return E_POINTER;
    *enumerator = nullptr;
    try {
        auto list = MakeComObject<CLVEnumIDList>();
        wchar_t folderPath[kMaximumPath] = {};
        // A folder whose path does not fit lists nothing: the cut path would be an ancestor's,
        // whose items are not this folder's. The enumerator is released here when filling fails.
        if (GetFolderPath(folderPath, ARRAYSIZE(folderPath), false))
            RETURN_IF_FAILED(list->Fill(folderPath, flags));
        return list->QueryInterface(IID_PPV_ARGS(enumerator));
    }
    CATCH_RETURN()
}

HRESULT CLVShellFolder::BindToObject(PCUIDLIST_RELATIVE list, IBindCtx*, REFIID iid,
                                     void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (!manager_.IsWellFormedList(list))
        return E_INVALIDARG;
    // Files are leaves: only the root and stations are folders.
    if (manager_.IsFile(list))
        return E_INVALIDARG;
    try {
        auto folder = MakeComObject<CLVShellFolder>();
        RETURN_IF_FAILED(folder->SetUp(this, list));
        return folder->QueryInterface(iid, object);
    }
    CATCH_RETURN()
}

HRESULT CLVShellFolder::CreateViewObject(HWND, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    try {
        if (iid == IID_IShellView) {
            auto view = MakeComObject<CLVShellView>();
            RETURN_IF_FAILED(view->SetUp(static_cast<IShellFolder*>(this), OwnIdentifier()));
            return view->QueryInterface(iid, object);
        }
        if (iid == IID_IContextMenu)
            return MakeComObject<CLVContextMenu>()->QueryInterface(iid, object);
        return E_NOINTERFACE;
    }
    CATCH_RETURN()
}

HRESULT CLVShellFolder::GetUIObjectOf(HWND, UINT count, PCUITEMID_CHILD_ARRAY items, REFIID iid,
                                      UINT*, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (count != 1)
        return E_FAIL;
    if (!items || !manager_.IsWellFormedList(items[0]))
        return E_INVALIDARG;
    try {
        if (iid == IID_IExtractIconW)
            return CreateItemObject<CLVExtractIcon>(items[0], iid, object);
        if (iid == IID_IQueryInfo)
            return CreateItemObject<CLVQueryInfo>(items[0], iid, object);
        if (iid == IID_IDataObject)
            return CreateDataObject(items[0], iid, object);
        if (iid == IID_IDropTarget)
            return CreateItemObject<CLVDropTarget>(items[0], iid, object);
        // An item context menu among them: the view carries the item commands.
        return E_NOINTERFACE;
    }
    CATCH_RETURN()
}

HRESULT CLVShellFolder::CreateDataObject(PCUITEMID_CHILD item, REFIID iid,
                                         void** object) noexcept {
    try {
        UniqueRelativePidl fullList;
        RETURN_IF_FAILED(CreateFullList(item, fullList));
        auto dataObject = MakeComObject<CLVDataObject>(MakeDialogStationDownloader());
        RETURN_IF_FAILED(dataObject->SetItem(fullList.get()));
        RETURN_IF_FAILED(dataObject->SetFolderLocation(Location()));
        return dataObject->QueryInterface(iid, object);
    }
    CATCH_RETURN()
}

template <typename ItemObject>
HRESULT CLVShellFolder::CreateItemObject(PCUITEMID_CHILD item, REFIID iid,
                                         void** object) noexcept {
    try {
        UniqueRelativePidl fullList;
        RETURN_IF_FAILED(CreateFullList(item, fullList));
        auto itemObject = MakeComObject<ItemObject>();
        RETURN_IF_FAILED(itemObject->SetItem(fullList.get()));
        return itemObject->QueryInterface(iid, object);
    }
    CATCH_RETURN()
}
