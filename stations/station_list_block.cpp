// The clipboard block of the station list over the portable record format.
#include "stations/station_list_block.h"

#include <cstring>

#include "stations/portable/station_list_format.h"
#include "support/unique_resource.h"

HGLOBAL SerializeStationList(const std::vector<Station>& stations) {
    try {
        const std::vector<uint8_t> bytes = SerializeStationRecords(stations);
        UniqueHGlobal block(
            ::GlobalAlloc(GMEM_MOVEABLE | GMEM_ZEROINIT | GMEM_SHARE, bytes.size()));
        if (!block)
            return nullptr;
        {
            GlobalLockGuard lock(block.get());
            if (!lock.data())
                return nullptr;
            memcpy(lock.data(), bytes.data(), bytes.size());
        }
        return block.release();
    } catch (...) {
        return nullptr;  // out of memory: the caller sees no block
    }
}

HRESULT ParseStationList(HGLOBAL block, std::vector<Station>& stations) noexcept {
    GlobalLockGuard lock(block);
    try {
        stations = ParseStationRecords(static_cast<const uint8_t*>(lock.data()), lock.size());
    } catch (...) {
        // Out of memory while decoding: keep the result contract and report an empty list.
        stations.clear();
    }
    return S_OK;
}
