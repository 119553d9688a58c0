// Feeds arbitrary items to the item-ID reader. The bytes are cut into items by their cb as the
// shell would hand them over (each item lies wholly inside what the shell allocated); the reader
// must never look past an item's cb.
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "namespace/portable/item_id_layout.h"
#include "support/portable/byte_io.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::vector<uint8_t> list;
    size_t offset = 0;
    while (size - offset >= 2) {
        const size_t cb = ReadU16(data + offset);
        if (cb < 2 || cb > size - offset)
            break;
        // Each item in an exact-size allocation of its own first.
        std::vector<uint8_t> item(data + offset, data + offset + cb);
        const uint32_t kind = ItemKind(item.data());
        const WideString name = ItemName(item.data());
        if (IsWellFormedItem(item.data()) && (kind < PT_ROOT || kind > PT_FILE))
            abort();
        // A name is only ever read with its terminator inside cb.
        if (!name.empty() && kItemNameOffset + 2 * (name.size() + 1) > cb)
            abort();
        list.insert(list.end(), item.begin(), item.end());
        offset += cb;
    }
    list.push_back(0);
    list.push_back(0);

    const size_t needed = BuildListPath(list.data(), nullptr, 0);
    for (size_t capacity : {size_t{1}, size_t{7}, kMaximumPath, needed}) {
        std::vector<WideChar> buffer(capacity);
        BuildListPath(list.data(), buffer.data(), capacity);
        if (BoundedLength(buffer.data(), capacity) >= capacity)
            abort();
    }
    return 0;
}
