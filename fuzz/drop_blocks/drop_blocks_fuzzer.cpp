// Feeds arbitrary blocks to every reader of dropped data, as CF_HDROP, "Shell IDList Array" and
// both file group descriptor forms. Besides never reading past the block, what comes back must be
// what the block holds: paths and names without NULs that fit in it, and item-ID lists that are
// copies of well-formed lists found at the children's own offsets.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "support/portable/byte_io.h"
#include "view/portable/drop_blocks.h"

namespace {

void Check(bool condition) {
    if (!condition)
        abort();
}

bool HasNul(const WideString& text) {
    return text.find(WideChar{0}) != WideString::npos;
}

// Walks a returned list by its items' cb: it must end exactly at its terminator.
bool IsWellFormedList(const std::vector<uint8_t>& list) {
    size_t position = 0;
    while (list.size() - position >= 2) {
        const size_t cb = ReadU16(list.data() + position);
        if (cb == 0)
            return position + 2 == list.size();
        if (cb < 2)
            return false;
        position += cb;
        if (position > list.size())
            return false;
    }
    return false;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // An exact-size copy: any read past the block's end is a heap overflow for ASan.
    const std::vector<uint8_t> copy(data, data + size);
    const uint8_t* block = copy.data();

    size_t pathBytes = 0;
    for (const WideString& path : ReadDropFilePaths(block, size)) {
        Check(!path.empty() && !HasNul(path));
        pathBytes += path.size() + 1;  // at least one byte a character and terminator
    }
    Check(pathBytes == 0 || pathBytes + sizeof(DropFilesHeader) <= size);

    const IdListArray array = ReadIdListArray(block, size);
    Check(array.parent.empty() ? array.children.empty() : IsWellFormedList(array.parent));
    for (size_t i = 0; i < array.children.size(); ++i) {
        const IdListArrayChild& child = array.children[i];
        Check(i == 0 || child.index > array.children[i - 1].index);
        Check(size >= 8 + 4 * (size_t{child.index} + 1) && child.index < ReadU32(block));
        const size_t offset = ReadU32(block + 8 + 4 * size_t{child.index});
        Check(IsWellFormedList(child.list) && offset <= size && child.list.size() <= size - offset);
        Check(std::memcmp(child.list.data(), block + offset, child.list.size()) == 0);
    }

    for (bool wide : {true, false}) {
        const std::vector<FileGroupEntry> entries = ReadFileGroupDescriptors(block, size, wide);
        const size_t recordSize = wide ? sizeof(FileDescriptorWide) : sizeof(FileDescriptorAnsi);
        Check(entries.empty() || 4 + entries.size() * recordSize <= size);
        for (size_t i = 0; i < entries.size(); ++i) {
            Check(entries[i].index == i && entries[i].name.size() <= kFileDescriptorNameLength);
            Check(!HasNul(entries[i].name));
        }
    }
    return 0;
}
