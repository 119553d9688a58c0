// Item identifier bytes and display paths.
#include "namespace/portable/item_id_layout.h"

#include <cstring>

#include "support/portable/byte_io.h"

uint16_t ItemSize(const uint8_t* item) noexcept {
    return ReadU16(item);
}

uint32_t ItemKind(const uint8_t* item) noexcept {
    if (ItemSize(item) < kItemKindOffset + 4)
        return 0;
    return ReadU32(item + kItemKindOffset);
}

WideString ItemName(const uint8_t* item) {
    const size_t size = ItemSize(item);
    WideString name;
    size_t consumed = 0;
    if (size <= kItemNameOffset ||
        !ReadWideZ(item + kItemNameOffset, size - kItemNameOffset, name, consumed)) {
        return {};
    }
    return name;
}

bool IsWellFormedItem(const uint8_t* item) noexcept {
    const size_t size = ItemSize(item);
    if (size < kMinimumItemSize)
        return false;
    const uint32_t kind = ItemKind(item);
    if (kind != PT_ROOT && kind != PT_STATION && kind != PT_FILE)
        return false;
    for (size_t offset = kItemNameOffset; offset + 1 < size; offset += 2) {
        if (ReadU16(item + offset) == 0)
            return true;
    }
    return false;
}

void WriteItem(uint8_t* destination, uint32_t kind, const void* data, size_t dataBytes) noexcept {
    const size_t size = dataBytes + kItemSizeOverhead;
    memset(destination, 0, ItemAllocationSize(dataBytes));
    WriteU16(destination, static_cast<uint16_t>(size));
    WriteU32(destination + kItemKindOffset, kind);
    if (dataBytes)
        memcpy(destination + kItemNameOffset, data, dataBytes);
    WriteU16(destination + size, 0);
}

std::vector<uint8_t> ItemNameBytes(WideStringView name) {
    std::vector<uint8_t> bytes;
    bytes.reserve(2 * (name.size() + 1));
    AppendWideZ(bytes, name);
    return bytes;
}

std::vector<WideString> SplitPathComponents(WideStringView path) {
    std::vector<WideString> components;
    size_t start = 0;
    while (start <= path.size()) {
        size_t end = path.find(WIDE_TEXT('\\'), start);
        if (end == WideStringView::npos)
            end = path.size();
        if (end > start)
            components.emplace_back(path.substr(start, end - start));
        start = end + 1;
    }
    return components;
}

namespace {

// Appends as much of the text as fits, keeping room for the terminator.
void AppendBounded(WideChar* buffer, size_t capacity, WideStringView text) {
    size_t length = BoundedLength(buffer, capacity);
    for (WideChar unit : text) {
        if (length + 1 >= capacity)
            break;
        buffer[length++] = unit;
    }
    if (length < capacity)
        buffer[length] = 0;
}

}  // namespace

size_t BuildListPath(const uint8_t* list, WideChar* buffer, size_t capacity) {
    if (!list)
        return 0;
    size_t count = 0;
    if (!buffer) {
        for (const uint8_t* item = list; ItemSize(item) != 0; item += ItemSize(item)) {
            count += ItemName(item).size() + 1;
        }
        return count + 1;
    }
    if (capacity == 0)
        return 0;
    buffer[0] = 0;
    for (const uint8_t* item = list; ItemSize(item) != 0 && count < capacity;
         item += ItemSize(item)) {
        const WideString name = ItemName(item);
        AppendBounded(buffer, capacity, name);
        AppendBounded(buffer, capacity, WIDE_TEXT("\\"));
        count += name.size() + 1;
    }
    const size_t length = BoundedLength(buffer, capacity);
    if (length > 0 && buffer[length - 1] == WIDE_TEXT('\\')) {
        buffer[length - 1] = 0;
        --count;
    }
    return count;
}

int32_t ScaleComparison(int32_t order, int32_t sign) noexcept {
    if (sign == 0)
        return order;
    return static_cast<int32_t>(static_cast<uint32_t>(order) * static_cast<uint32_t>(sign));
}

WideString StationNameFromPath(WideStringView path) {
    const std::vector<WideString> components = SplitPathComponents(path);
    return components.size() > 1 ? components[1] : WideString();
}
