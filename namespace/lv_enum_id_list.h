// The namespace's item enumerator: the stations of the store, or a station's one file.
#pragma once

#include <windows.h>
#include <shlobj.h>
#include <shlwapi.h>

#include <mutex>

#include "namespace/enum_id_list_impl.h"
#include "support/com_object.h"

class CLVEnumIDList final : public ComObject<CEnumIDListImpl> {
public:
    CLVEnumIDList() noexcept = default;

    IFACEMETHODIMP QueryInterface(REFIID iid, void** object) override {
        static const QITAB table[] = {QITABENT(CLVEnumIDList, IEnumIDList), {}};
        return QISearch(this, table, iid, object);
    }

    // The shell may call one enumerator from several threads: the position moves under a lock.
    IFACEMETHODIMP Next(ULONG count, PITEMID_CHILD* items, ULONG* fetched) override;
    IFACEMETHODIMP Skip(ULONG count) override;
    IFACEMETHODIMP Reset() override;

    // Empties the list and fills it for the folder path (without prefix) and the SHCONTF flags:
    // the root lists the stations, a station folder its one file. Fails only for a path of
    // separators only or when memory runs out.
    [[nodiscard]] HRESULT Fill(const wchar_t* folderPath, SHCONTF flags) noexcept;

private:
    [[nodiscard]] HRESULT AddStations(const std::wstring& rootName) noexcept;

    std::mutex lock_;
};
