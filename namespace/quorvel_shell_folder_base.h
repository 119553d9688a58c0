// The shell folder's base: the IShellFolder and IPersistFolder operations that create no objects
// of other classes, the folder set-up and the folder path. The folder that creates the enumerator,
// the view and the item objects derives from it in server/, above the layers of those classes.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <wrl/client.h>

#include <string>

#include "namespace/pidl_manager.h"

class CQuorvelShellFolderBase : public IShellFolder, public IPersistFolder2 {
public:
    CQuorvelShellFolderBase() noexcept;
    CQuorvelShellFolderBase(const CQuorvelShellFolderBase&) = delete;
    CQuorvelShellFolderBase& operator=(const CQuorvelShellFolderBase&) = delete;

    // Declared once here so that a pointer to the base has one IUnknown to call.
    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override = 0;
    IFACEMETHODIMP_(ULONG) AddRef() override = 0;
    IFACEMETHODIMP_(ULONG) Release() override = 0;

    // IShellFolder
    IFACEMETHODIMP ParseDisplayName(HWND window, IBindCtx* bindContext, LPWSTR name, ULONG* eaten,
                                    PIDLIST_RELATIVE* list, ULONG* attributes) override;
    IFACEMETHODIMP BindToStorage(PCUIDLIST_RELATIVE list, IBindCtx* bindContext, REFIID iid,
                                 void** object) override;
    IFACEMETHODIMP CompareIDs(LPARAM column, PCUIDLIST_RELATIVE first,
                              PCUIDLIST_RELATIVE second) override;
    IFACEMETHODIMP GetAttributesOf(UINT count, PCUITEMID_CHILD_ARRAY items,
                                   SFGAOF* attributes) override;
    IFACEMETHODIMP GetDisplayNameOf(PCUITEMID_CHILD item, SHGDNF flags, STRRET* name) override;
    IFACEMETHODIMP SetNameOf(HWND window, PCUITEMID_CHILD item, LPCWSTR name, SHGDNF flags,
                             PITEMID_CHILD* newItem) override;

    // IPersistFolder: the folder always starts as the root; the shell's identifier of it is kept
    // only to name the folder to the shell (GetCurFolder, the parent of "Shell IDList Array").
    IFACEMETHODIMP Initialize(PCIDLIST_ABSOLUTE location) override;
    // IPersistFolder2: a copy of where the shell placed this folder; S_FALSE and null when the
    // folder was never given a place.
    IFACEMETHODIMP GetCurFolder(PIDLIST_ABSOLUTE* location) override;

    // Keeps the parent (one reference) and a copy of the identifier, or the root item when none is
    // given; then the parsing prefix (root only) and the own path.
    [[nodiscard]] HRESULT SetUp(CQuorvelShellFolderBase* parent,
                                PCUIDLIST_RELATIVE identifier) noexcept;

    // The parent's folder path and then this folder's part: with the prefix, a folder that has one
    // contributes "\" and the prefix instead of its path. False, with the buffer keeping what it
    // had, when the result would not fit in capacity characters.
    [[nodiscard]] bool GetFolderPath(wchar_t* buffer, size_t capacity,
                                     bool withPrefix) const noexcept;

    PCUIDLIST_RELATIVE OwnIdentifier() const noexcept { return ownIdentifier_.get(); }
    // The shell's identifier of this folder, from the desktop; null when it has none.
    PCIDLIST_ABSOLUTE Location() const noexcept { return location_.get(); }

protected:
    virtual ~CQuorvelShellFolderBase();

    // The item's internal full identifier: the folder's path as a list, then the item.
    [[nodiscard]] HRESULT CreateFullList(PCUITEMID_CHILD item,
                                         UniqueRelativePidl& fullList) const noexcept;

    CPidlMgr manager_;

private:
    UniqueRelativePidl ownIdentifier_;
    // The shell's identifier, made by the shell: the parent's and then this folder's item.
    UniqueAbsoluteIdList location_;
    Microsoft::WRL::ComPtr<CQuorvelShellFolderBase> parent_;
    Microsoft::WRL::ComPtr<IMalloc> allocator_;
    std::wstring parsingPrefix_;  // empty unless the folder is the root
    std::wstring ownPath_;
};
