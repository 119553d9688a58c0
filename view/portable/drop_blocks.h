// Bounded readers of the blocks a drag source hands over on a drop: the file list (CF_HDROP), the
// "Shell IDList Array" and the file group descriptors. Any program can be the source, so every
// offset, count and text in them is untrusted and nothing is read outside [block, block + size).
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

#include "support/portable/wide_text.h"

// The layouts as the source writes them: little-endian, fields at their Win32 offsets (none needs
// padding). The readers take offsets from these declarations and read byte by byte.

// DROPFILES, the header of a CF_HDROP block; the path list follows at filesOffset.
struct DropFilesHeader {
    uint32_t filesOffset;  // pFiles: start of the path list, from the start of the block
    int32_t pointX;        // pt.x: where the drop happened; not needed here
    int32_t pointY;        // pt.y
    uint32_t nonClient;    // fNC: the point is in non-client coordinates; not needed here
    uint32_t wide;         // fWide: non-zero for UTF-16 paths, zero for 8-bit ANSI paths
};

// CIDA, the start of a "Shell IDList Array"; childCount more offsets follow parentOffset.
struct IdListArrayHeader {
    uint32_t childCount;    // cidl: the number of children, one offset each after the parent's
    uint32_t parentOffset;  // aoffset[0]: the parent folder's item-ID list, from the block's start
};

// The fields of a FILEDESCRIPTOR before its name, the same in both forms.
struct FileDescriptorFixedPart {
    uint32_t flags;              // dwFlags: which of the fields below the source filled in
    uint8_t classId[16];         // clsid
    int32_t sizeWidth;           // sizel.cx
    int32_t sizeHeight;          // sizel.cy
    int32_t pointX;              // pointl.x
    int32_t pointY;              // pointl.y
    uint32_t attributes;         // dwFileAttributes: read whatever flags says
    uint32_t creationTime[2];    // ftCreationTime, low half first
    uint32_t lastAccessTime[2];  // ftLastAccessTime
    uint32_t lastWriteTime[2];   // ftLastWriteTime
    uint32_t fileSizeHigh;       // nFileSizeHigh
    uint32_t fileSizeLow;        // nFileSizeLow
};

inline constexpr size_t kFileDescriptorNameLength = 260;  // cFileName's characters (MAX_PATH)
inline constexpr size_t kFileGroupRecordsOffset = 4;      // the records follow the uint32 cItems

// FILEDESCRIPTORW, one record of "FileGroupDescriptorW".
struct FileDescriptorWide {
    FileDescriptorFixedPart fixed;
    uint16_t name[kFileDescriptorNameLength];  // cFileName: UTF-16, NUL-terminated unless full
};

// FILEDESCRIPTORA, one record of "FileGroupDescriptor".
struct FileDescriptorAnsi {
    FileDescriptorFixedPart fixed;
    uint8_t name[kFileDescriptorNameLength];  // cFileName: 8-bit ANSI, NUL-terminated unless full
};

static_assert(sizeof(DropFilesHeader) == 20 && offsetof(DropFilesHeader, wide) == 16);
static_assert(sizeof(IdListArrayHeader) == 8);
static_assert(offsetof(FileDescriptorFixedPart, attributes) == 36);
static_assert(sizeof(FileDescriptorFixedPart) == 72);
static_assert(offsetof(FileDescriptorWide, name) == 72 && sizeof(FileDescriptorWide) == 592);
static_assert(offsetof(FileDescriptorAnsi, name) == 72 && sizeof(FileDescriptorAnsi) == 332);

// Turns an ANSI text's bytes into UTF-16. The readers default to Latin-1 (each byte is the code
// point of the same value), which needs no code page; the Win32 side passes a conversion through
// the system's ANSI code page where it matters.
using AnsiToWide = WideString (*)(std::string_view bytes);
WideString WidenLatin1(std::string_view bytes);

// The paths of a CF_HDROP block, in order and whole (the caller applies its own length limit).
// A header that does not fit, or a list offset past the block or inside the header, gives none.
// The list ends at its empty string or at the block's end; a path whose terminator does not lie
// inside the block is dropped, not cut.
std::vector<WideString> ReadDropFilePaths(const uint8_t* block, size_t blockSize,
                                          AnsiToWide widen = WidenLatin1);

// One child of a "Shell IDList Array": its 0-based position among the children (its list is at
// aoffset[index + 1]) and its whole item-ID list, terminator included.
struct IdListArrayChild {
    uint32_t index = 0;
    std::vector<uint8_t> list;

    bool operator==(const IdListArrayChild&) const = default;
};

struct IdListArray {
    std::vector<uint8_t> parent;  // terminator included; empty only when the block is unusable
    std::vector<IdListArrayChild> children;  // the well-formed ones, in order

    bool operator==(const IdListArray&) const = default;
};

// A list is taken only when it lies wholly inside the block and each of its items has a cb of at
// least 2. A malformed parent (or a block too short for the parent's offset) gives an empty
// result; a malformed child is left out. Only the children whose offsets fit in the block count.
IdListArray ReadIdListArray(const uint8_t* block, size_t blockSize);

// One record of a file group descriptor.
struct FileGroupEntry {
    uint32_t index = 0;       // position in the group: the lindex of its "FileContents"
    uint32_t attributes = 0;  // dwFileAttributes as written: the caller skips directories
    WideString name;          // cFileName up to its terminator, at most 260 characters

    bool operator==(const FileGroupEntry&) const = default;
};

// "FileGroupDescriptorW" when wide, else "FileGroupDescriptor" (its names through widen). Only the
// records that lie wholly inside the block are read, however many cItems announces.
std::vector<FileGroupEntry> ReadFileGroupDescriptors(const uint8_t* block, size_t blockSize,
                                                     bool wide, AnsiToWide widen = WidenLatin1);
