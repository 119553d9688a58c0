// The shell-folder framework's template: the operations that create objects of its parameter
// classes (enumerator, bound folder, view and menu, per-item objects).
#pragma once

#include <windows.h>
#include <shlobj.h>

#include "namespace/quorvel_shell_folder_base.h"
#include "support/com_object.h"
#include "support/error_handling.h"

template <typename Folder, typename View, typename EnumIDList, typename ContextMenu,
          typename ExtractIcon, typename QueryInfo, typename DataObject, typename DropTarget>
class CQuorvelShellFolderImpl : public CQuorvelShellFolderBase {
public:
    IFACEMETHODIMP EnumObjects(HWND, SHCONTF flags, IEnumIDList** enumerator) override {
        if (!enumerator)
            return E_POINTER;
        *enumerator = nullptr;
        try {
            auto list = MakeComObject<EnumIDList>();
            wchar_t folderPath[kMaximumPath] = {};
            // A folder whose path does not fit lists nothing: the cut path would be an
            // ancestor's, whose items are not this folder's. The enumerator is released here
            // when filling fails.
            if (GetFolderPath(folderPath, ARRAYSIZE(folderPath), false))
                RETURN_HR_IF(E_OUTOFMEMORY, FAILED(list->Fill(folderPath, flags)));
            return list->QueryInterface(IID_PPV_ARGS(enumerator));
        }
        CATCH_RETURN()
    }

    IFACEMETHODIMP BindToObject(PCUIDLIST_RELATIVE list, IBindCtx*, REFIID iid,
                                void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        if (!manager_.IsWellFormedList(list))
            return E_INVALIDARG;
        // Files are leaves: only the root and stations are folders.
        if (manager_.IsFile(list))
            return E_INVALIDARG;
        try {
            auto folder = MakeComObject<Folder>();
            RETURN_IF_FAILED(folder->SetUp(this, list));
            return folder->QueryInterface(iid, object);
        }
        CATCH_RETURN()
    }

    IFACEMETHODIMP CreateViewObject(HWND, REFIID iid, void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        try {
            if (iid == IID_IShellView) {
                auto view = MakeComObject<View>();
                RETURN_IF_FAILED(view->SetUp(static_cast<IShellFolder*>(this), OwnIdentifier()));
                return view->QueryInterface(iid, object);
            }
            if (iid == IID_IContextMenu)
                return MakeComObject<ContextMenu>()->QueryInterface(iid, object);
            return E_NOINTERFACE;
        }
        CATCH_RETURN()
    }

    IFACEMETHODIMP GetUIObjectOf(HWND, UINT count, PCUITEMID_CHILD_ARRAY items, REFIID iid, UINT*,
                                 void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        if (count != 1)
            return E_FAIL;
        if (!items || !manager_.IsWellFormedList(items[0]))
            return E_INVALIDARG;
        try {
            if (iid == IID_IExtractIconW)
                return CreateItemObject<ExtractIcon>(items[0], iid, object);
            if (iid == IID_IQueryInfo)
                return CreateItemObject<QueryInfo>(items[0], iid, object);
            if (iid == IID_IDataObject)
                return CreateDataObject(items[0], iid, object);
            if (iid == IID_IDropTarget)
                return CreateItemObject<DropTarget>(items[0], iid, object);
            // An item context menu among them: the view carries the item commands.
            return E_NOINTERFACE;
        }
        CATCH_RETURN()
    }

private:
    // A data object also learns where the folder is, to name the items' parent to the shell.
    HRESULT CreateDataObject(PCUITEMID_CHILD item, REFIID iid, void** object) {
        UniqueRelativePidl fullList;
        RETURN_IF_FAILED(CreateFullList(item, fullList));
        auto dataObject = MakeComObject<DataObject>();
        RETURN_IF_FAILED(dataObject->SetItem(fullList.get()));
        RETURN_IF_FAILED(dataObject->SetFolderLocation(this->Location()));
        return dataObject->QueryInterface(iid, object);
    }

    // The object keeps its own copy of the item's full list; ours is freed on return.
    template <typename ItemObject>
    HRESULT CreateItemObject(PCUITEMID_CHILD item, REFIID iid, void** object) {
        UniqueRelativePidl fullList;
        RETURN_IF_FAILED(CreateFullList(item, fullList));
        auto itemObject = MakeComObject<ItemObject>();
        RETURN_IF_FAILED(itemObject->SetItem(fullList.get()));
        return itemObject->QueryInterface(iid, object);
    }
};
