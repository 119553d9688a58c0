// Follows station names on their way to the store: an item-ID list's names joined into a path
// bounded by the path limit, with the station read back as the path's second component, and the
// names of a pasted station-list block, through the rules that make new and pasted names.
// Input: items cut by their cb, a 16-bit end of list, then the clipboard block.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "namespace/portable/item_id_layout.h"
#include "stations/portable/station_list_format.h"
#include "stations/portable/station_names.h"
#include "support/portable/byte_io.h"

namespace {

constexpr size_t kMaximumTakenNames = 16;

// A made name is never taken and keeps the name it came from; a valid one stays valid and comes
// back whole from a path. Each candidate is new, so n taken names cost at most n + 1 questions.
void CheckNaming(const WideString& name, const std::vector<WideString>& taken) {
    size_t questions = 0;
    const NameTakenPredicate isTaken = [&](const WideString& candidate) {
        if (++questions > taken.size() + 1)
            abort();
        return std::find(taken.begin(), taken.end(), candidate) != taken.end();
    };
    const WideString unique = MakeUniqueName(name, isTaken);
    questions = 0;
    const WideString pasted = MakePastedName(name, WIDE_TEXT("Copy of "), isTaken);
    if (unique != name && unique.compare(0, name.size() + 2, name + WIDE_TEXT(" (")) != 0)
        abort();
    if (pasted.size() < name.size() || pasted.substr(pasted.size() - name.size()) != name)
        abort();
    for (const WideString& made : {unique, pasted}) {
        if (std::find(taken.begin(), taken.end(), made) != taken.end())
            abort();
        if (IsValidStationName(name) &&
            (!IsValidStationName(made) ||
             StationNameFromPath(kRootItemName + (WIDE_TEXT("\\") + made)) != made))
            abort();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::vector<uint8_t> list;
    std::vector<WideString> names;
    size_t offset = 0;
    while (size - offset >= 2) {
        const size_t cb = ReadU16(data + offset);
        if (cb < 2 || cb > size - offset)
            break;
        std::vector<uint8_t> item(data + offset, data + offset + cb);
        names.push_back(ItemName(item.data()));
        list.insert(list.end(), item.begin(), item.end());
        offset += cb;
    }
    list.insert(list.end(), {0, 0});
    list.shrink_to_fit();  // exact size: a walk past the end of the list is an overflow for ASan

    // The bounded path is the start of the whole one and leaves room for its terminator.
    WideChar path[kMaximumPath];
    BuildListPath(list.data(), path, kMaximumPath);
    const size_t length = BoundedLength(path, kMaximumPath);
    std::vector<WideChar> whole(BuildListPath(list.data(), nullptr, 0));
    BuildListPath(list.data(), whole.data(), whole.size());
    const WideStringView wholePath(whole.data(), BoundedLength(whole.data(), whole.size()));
    if (length >= kMaximumPath || wholePath.substr(0, length) != WideStringView(path, length))
        abort();
    // The station the store is asked for lies inside one item's name.
    const WideString station = StationNameFromPath(WideStringView(path, length));
    std::vector<WideString> taken;
    if (!station.empty()) {
        if (std::none_of(names.begin(), names.end(),
                         [&](const WideString& name) { return name.find(station) != name.npos; }))
            abort();
        taken.push_back(station);
    }

    const size_t blockStart = size - offset >= 2 ? offset + 2 : size;
    const std::vector<uint8_t> block(data + blockStart, data + size);
    for (const Station& pasted : ParseStationRecords(block.data(), block.size()))
        taken.push_back(pasted.Name);
    taken.resize(std::min(taken.size(), kMaximumTakenNames));
    for (const WideString& name : taken)
        CheckNaming(name, taken);
    return 0;
}
