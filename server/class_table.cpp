// The class table: class identifiers, registry scripts and creation functions.
#include "server/class_table.h"

#include <atomic>

#include "download/dialog_station_downloader.h"
#include "namespace/lv_enum_id_list.h"
#include "namespace/lv_extract_icon.h"
#include "namespace/lv_query_info.h"
#include "res/registry/ids_registry.h"
#include "server/lv_shell_folder.h"
#include "view/lv_data_object.h"
#include "view/lv_drop_target.h"
#include "view/lv_shell_view.h"

namespace {

constexpr CLSID kDataObjectClassId = {
    0x4F9A7D26, 0xE3B1, 0x4C58, {0x8D, 0x0F, 0x72, 0xA5, 0xB1, 0xE6, 0xC3, 0x90}};
constexpr CLSID kShellViewClassId = {
    0xA2C54E87, 0x6B19, 0x4D3A, {0x9F, 0x72, 0x18, 0xE6, 0xC0, 0xB5, 0xA9, 0x4D}};
constexpr CLSID kDropTargetClassId = {
    0x61F7B2C9, 0x8D3E, 0x4A14, {0xA5, 0xC0, 0xE9, 0x27, 0x4B, 0x6D, 0x8F, 0x13}};
constexpr CLSID kDropTargetOnListViewClassId = {
    0xD46E8A3B, 0x1C92, 0x4A5F, {0x87, 0xE6, 0x0B, 0x3D, 0x9F, 0x52, 0xC1, 0xA8}};

constexpr CLSID kEnumIdListClassId = {
    0x3B8C1F92, 0xA6D5, 0x4E07, {0x9C, 0x4B, 0xD2, 0x1F, 0x7A, 0x8E, 0x30, 0x65}};
constexpr CLSID kExtractIconClassId = {
    0x9E2B6D14, 0x7C3A, 0x4F85, {0xB1, 0xD9, 0x36, 0xA8, 0xE0, 0x5C, 0x7F, 0x21}};
constexpr CLSID kQueryInfoClassId = {
    0x5A91C3E7, 0x2F04, 0x4B6D, {0x8E, 0x13, 0xA7, 0xC2, 0xD9, 0x0F, 0x4B, 0x58}};

constexpr ClassTableEntry kClassTable[] = {
    {&CLSID_LVShellFolder, IDR_LVSHELLFOLDER, &CreateComInstance<CLVShellFolder>},
    {&kDataObjectClassId, IDR_LVDATAOBJECT,
     &CreateComInstanceWith<CLVDataObject, &MakeDialogStationDownloader>},
    {&kEnumIdListClassId, IDR_LVENUMIDLIST, &CreateComInstance<CLVEnumIDList>},
    {&kExtractIconClassId, IDR_LVEXTRACTICON, &CreateComInstance<CLVExtractIcon>},
    {&kQueryInfoClassId, IDR_AZQUERYINFO, &CreateComInstance<CLVQueryInfo>},
    {&kShellViewClassId, IDR_LVSHELLVIEW, &CreateComInstance<CLVShellView>},
    {&kDropTargetClassId, IDR_LVDROPTARGET, &CreateComInstance<CLVDropTarget>},
    {&kDropTargetOnListViewClassId, IDR_LVDROPTARGETONLISTVIEW,
     &CreateComInstance<CLVDropTargetOnListView>},
};

constexpr size_t kClassCount = sizeof kClassTable / sizeof kClassTable[0];

// One factory per class, published with a compare-exchange: DllGetClassObject may be called on
// any thread, and a thread that loses the race releases its own factory.
std::atomic<ClassFactory*> g_factories[kClassCount];

}  // namespace

std::span<const ClassTableEntry> ClassTable() noexcept {
    return kClassTable;
}

HRESULT GetClassObject(REFCLSID classId, REFIID iid, void** object) noexcept {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    for (size_t index = 0; index < kClassCount; ++index) {
        const ClassTableEntry& entry = kClassTable[index];
        if (!::IsEqualCLSID(*entry.classId, classId))
            continue;
        if (!entry.create)
            return CLASS_E_CLASSNOTAVAILABLE;
        ClassFactory* factory = g_factories[index].load(std::memory_order_acquire);
        if (!factory) {
            auto* created = new (std::nothrow) ClassFactory(entry.create);
            RETURN_IF_NULL_ALLOC(created);
            if (g_factories[index].compare_exchange_strong(factory, created,
                                                           std::memory_order_acq_rel)) {
                factory = created;
            } else {
                created->Release();  // another thread published its factory first
            }
        }
        return factory->QueryInterface(iid, object);
    }
    return CLASS_E_CLASSNOTAVAILABLE;
}

void ReleaseClassFactories() noexcept {
    for (std::atomic<ClassFactory*>& slot : g_factories) {
        if (ClassFactory* factory = slot.exchange(nullptr))
            factory->Release();
    }
}
