// Bounded readers of CF_HDROP, "Shell IDList Array" and file group descriptor blocks.
#include "view/portable/drop_blocks.h"

#include <algorithm>
#include <cstring>

#include "support/portable/byte_io.h"

namespace {

// Bytes of the item-ID list at offset, terminator included; 0 when an item's cb is 1, or the list
// or its terminator leaves the block. walked grows by the bytes stepped over, whatever the result.
size_t IdListLength(const uint8_t* block, size_t blockSize, size_t offset, size_t& walked) {
    size_t position = offset;
    while (position <= blockSize && blockSize - position >= 2) {
        const size_t cb = ReadU16(block + position);
        if (cb == 0) {
            walked += position + 2 - offset;
            return position + 2 - offset;
        }
        if (cb < 2 || cb > blockSize - position)
            break;
        position += cb;
    }
    walked += position - offset;
    return 0;
}

std::vector<uint8_t> IdListAt(const uint8_t* block, size_t blockSize, size_t offset,
                              size_t& walked) {
    const size_t length = IdListLength(block, blockSize, offset, walked);
    if (length == 0)
        return {};
    return std::vector<uint8_t>(block + offset, block + offset + length);
}

}  // namespace

WideString WidenLatin1(std::string_view bytes) {
    WideString text;
    text.reserve(bytes.size());
    for (char byte : bytes)
        text.push_back(static_cast<WideChar>(static_cast<uint8_t>(byte)));
    return text;
}

std::vector<WideString> ReadDropFilePaths(const uint8_t* block, size_t blockSize,
                                          AnsiToWide widen) {
    std::vector<WideString> paths;
    if (!block || blockSize < sizeof(DropFilesHeader))
        return paths;
    size_t offset = ReadU32(block + offsetof(DropFilesHeader, filesOffset));
    const bool wide = ReadU32(block + offsetof(DropFilesHeader, wide)) != 0;
    if (offset < sizeof(DropFilesHeader))
        return paths;
    if (!widen)
        widen = WidenLatin1;
    while (offset < blockSize) {
        WideString path;
        size_t consumed = 0;
        if (wide) {
            if (!ReadWideZ(block + offset, blockSize - offset, path, consumed))
                break;
        } else {
            const void* end = std::memchr(block + offset, 0, blockSize - offset);
            if (!end)
                break;
            consumed = static_cast<const uint8_t*>(end) - (block + offset) + 1;
            path = widen(
                std::string_view(reinterpret_cast<const char*>(block + offset), consumed - 1));
        }
        if (consumed == (wide ? 2u : 1u))
            break;  // the empty string that ends the list
        paths.push_back(std::move(path));
        offset += consumed;
    }
    return paths;
}

IdListArray ReadIdListArray(const uint8_t* block, size_t blockSize) {
    IdListArray array;
    if (!block || blockSize < sizeof(IdListArrayHeader))
        return array;
    size_t walked = 0;
    array.parent = IdListAt(block, blockSize,
                            ReadU32(block + offsetof(IdListArrayHeader, parentOffset)), walked);
    if (array.parent.empty())
        return array;
    // Only the offsets that lie inside the block are read, whatever cidl claims.
    const size_t fittingChildren = (blockSize - sizeof(IdListArrayHeader)) / 4;
    const size_t childCount =
        std::min<size_t>(ReadU32(block + offsetof(IdListArrayHeader, childCount)), fittingChildren);
    // The lists of a real array lie side by side, so together they are no longer than the block.
    // Offsets that all point at one long list would make every child a copy of it: reading
    // stops once the lists walked add up to four blocks, which keeps time and memory linear.
    const size_t budget = 4 * blockSize;
    for (size_t index = 0; index < childCount && walked <= budget; ++index) {
        const size_t offset = ReadU32(block + sizeof(IdListArrayHeader) + 4 * index);
        std::vector<uint8_t> list = IdListAt(block, blockSize, offset, walked);
        if (!list.empty())
            array.children.push_back({static_cast<uint32_t>(index), std::move(list)});
    }
    return array;
}

std::vector<FileGroupEntry> ReadFileGroupDescriptors(const uint8_t* block, size_t blockSize,
                                                     bool wide, AnsiToWide widen) {
    std::vector<FileGroupEntry> entries;
    if (!block || blockSize < kFileGroupRecordsOffset)
        return entries;
    const size_t recordSize = wide ? sizeof(FileDescriptorWide) : sizeof(FileDescriptorAnsi);
    const size_t nameOffset =
        wide ? offsetof(FileDescriptorWide, name) : offsetof(FileDescriptorAnsi, name);
    const size_t count =
        std::min<size_t>(ReadU32(block), (blockSize - kFileGroupRecordsOffset) / recordSize);
    entries.reserve(count);
    if (!widen)
        widen = WidenLatin1;
    for (size_t index = 0; index < count; ++index) {
        const uint8_t* record = block + kFileGroupRecordsOffset + index * recordSize;
        FileGroupEntry entry;
        entry.index = static_cast<uint32_t>(index);
        entry.attributes = ReadU32(record + offsetof(FileDescriptorFixedPart, attributes));
        const uint8_t* name = record + nameOffset;
        if (wide) {
            for (size_t i = 0; i < kFileDescriptorNameLength && ReadU16(name + 2 * i) != 0; ++i)
                entry.name.push_back(static_cast<WideChar>(ReadU16(name + 2 * i)));
        } else {
            const void* end = std::memchr(name, 0, kFileDescriptorNameLength);
            const size_t length =
                end ? static_cast<const uint8_t*>(end) - name : kFileDescriptorNameLength;
            entry.name = widen(std::string_view(reinterpret_cast<const char*>(name), length));
        }
        entries.push_back(std::move(entry));
    }
    return entries;
}
