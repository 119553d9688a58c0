// The namespace's item enumerator: filling from the station store, and the locked moves.
#include "namespace/lv_enum_id_list.h"

#include <string>
#include <vector>

#include "stations/station_models.h"
#include "stations/station_store.h"
#include "support/error_handling.h"

HRESULT CLVEnumIDList::Next(ULONG count, PITEMID_CHILD* items, ULONG* fetched) {
    std::lock_guard<std::mutex> guard(lock_);
    return CEnumIDListImpl::Next(count, items, fetched);
}

HRESULT CLVEnumIDList::Skip(ULONG count) {
    std::lock_guard<std::mutex> guard(lock_);
    return CEnumIDListImpl::Skip(count);
}

HRESULT CLVEnumIDList::Reset() {
    std::lock_guard<std::mutex> guard(lock_);
    return CEnumIDListImpl::Reset();
}

HRESULT CLVEnumIDList::Fill(const wchar_t* folderPath, SHCONTF flags) noexcept {
    try {
        std::lock_guard<std::mutex> guard(lock_);
        DeleteList();
        const std::wstring path =
            folderPath && *folderPath ? std::wstring(folderPath) : std::wstring(kRootItemName);
        const std::vector<std::wstring> components = SplitPathComponents(path);
        RETURN_HR_IF(E_INVALIDARG, components.empty());

        if ((flags & SHCONTF_FOLDERS) && components.size() < 2)
            return AddStations(components[0]);

        if ((flags & SHCONTF_NONFOLDERS) && components.size() >= 2) {
            // A station that is gone still shows a file: its download then finds no station.
            Station station;
            station.Name = components[1];
            const std::wstring fileName = FindStation(station) == S_OK
                                              ? StationFileName(station.Model)
                                              : StationFileName(std::wstring());
            const std::vector<uint8_t> name = ItemNameBytes(fileName);
            UniqueChildPidl item =
                manager_.CreateItem(PT_FILE, name.data(), static_cast<UINT>(name.size()));
            // An item that cannot be made is left out; only a node that cannot be added fails.
            if (item)
                RETURN_IF_FAILED(AddToEnumList(std::move(item)));
        }
        return S_OK;
    }
    CATCH_RETURN()
}

HRESULT CLVEnumIDList::AddStations(const std::wstring& rootName) noexcept {
    try {
        // A store that cannot be read lists no station, silently. The store leaves out names a path
        // would not carry as themselves (empty, with a backslash): "Site\North" would be listed
        // as "Site", and the folder would act on the real "Site". FindStation skips them alike.
        for (const std::wstring& name : ListStationNames()) {
            const std::wstring itemPath = rootName + L"\\" + name;
            UniqueChildPidl item = manager_.CreateItemPidl(itemPath.c_str());
            if (item)
                RETURN_IF_FAILED(AddToEnumList(std::move(item)));
        }
        return S_OK;
    }
    CATCH_RETURN()
}
