// Feeds arbitrary clipboard blocks to the station list parser; re-serialising what it read must
// give a block that parses back to the same stations.
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "stations/portable/station_list_format.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // An exact-size copy: any read past the block's end is a heap overflow for ASan.
    std::vector<uint8_t> block(data, data + size);
    const std::vector<Station> stations = ParseStationRecords(block.data(), block.size());
    const std::vector<uint8_t> again = SerializeStationRecords(stations);
    if (ParseStationRecords(again.data(), again.size()) != stations)
        abort();
    return 0;
}
