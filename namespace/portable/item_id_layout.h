// Byte layout of the namespace's item identifiers, and the path rules built on them.
//
// One item: cb (2 bytes), kind (4), reserved (8), the UTF-16LE name with its NUL, then 5 slack
// bytes. cb is always 19 + name bytes: a bare shell item header (3) plus the record's fixed part
// (16), which ends 5 bytes after the fields do. Readers step by cb, so the slack travels along.
// A list is a run of items ended by a 16-bit zero.
//
// Items handed back by the shell are not trusted: a name is read only inside its item's cb. An
// item whose cb cannot hold a name, or whose name has no terminator inside cb, reads as an item
// with an empty name, and IsWellFormedItem() rejects it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "support/portable/wide_text.h"

enum tagPIDLTYPE : uint32_t {
    PT_ROOT = 1,     // the namespace root
    PT_STATION = 2,  // one configured station; a folder
    PT_FILE = 3,     // the file received from a station; a leaf
};

#pragma pack(push, 1)
struct tagPIDLDATA {
    uint32_t type;        // a tagPIDLTYPE value
    uint8_t reserved[8];  // never read; the creator writes zeros
    uint16_t name[1];     // UTF-16LE, NUL-terminated, followed by the slack
};
#pragma pack(pop)

constexpr size_t kItemKindOffset = 2;
constexpr size_t kItemNameOffset = 14;
constexpr size_t kItemSizeOverhead = 19;  // cb = 19 + name bytes
constexpr size_t kListTerminatorSize = 2;
constexpr size_t kMinimumItemSize = kItemSizeOverhead + 2;  // an empty name still has its NUL
constexpr size_t kMaximumPath = 260;

inline constexpr WideChar kRootItemName[] = WIDE_TEXT("Quorvel Digital Level");
inline constexpr WideChar kParsingPrefix[] = WIDE_TEXT("::{7D3F2A61-4B8E-4c19-9A27-5E0C81B6D4F3}");

uint16_t ItemSize(const uint8_t* item) noexcept;

// The kind of an item, or 0 when its cb is too small to hold one.
uint32_t ItemKind(const uint8_t* item) noexcept;

// The item's name, read only inside cb; empty when no terminator lies inside cb.
WideString ItemName(const uint8_t* item);

// cb large enough, a known kind and a name terminated inside cb.
bool IsWellFormedItem(const uint8_t* item) noexcept;

// Bytes to allocate for an item with the given data bytes: the item and a list terminator.
constexpr size_t ItemAllocationSize(size_t dataBytes) noexcept {
    return dataBytes + kItemSizeOverhead + kListTerminatorSize;
}

// Writes cb, the kind, zeroed reserved bytes, the data at offset 14 and the list terminator at
// offset cb into a buffer of ItemAllocationSize(dataBytes) bytes.
void WriteItem(uint8_t* destination, uint32_t kind, const void* data, size_t dataBytes) noexcept;

// The name bytes of an item: the text's UTF-16LE units and the NUL.
std::vector<uint8_t> ItemNameBytes(WideStringView name);

// The non-empty components of a path split at "\".
std::vector<WideString> SplitPathComponents(WideStringView path);

// The station's name in a namespace path: its second non-empty component, after the root's
// name; empty when the path names no station.
WideString StationNameFromPath(WideStringView path);

// The display path of a list: its names joined by "\". Without a buffer, the capacity a caller
// needs; with one, the text (appends bounded by the capacity) and its counted length.
size_t BuildListPath(const uint8_t* list, WideChar* buffer, size_t capacity);

// The folder's item comparison scaled by the shell's column argument: the order itself for 0,
// else order × sign. The argument carries SHCIDS bits (0x80000000, 0x10000000), so the product
// is taken modulo 2^32 as the processor's multiplication gives it: the same result for every
// product that fits, and defined arithmetic for every other.
int32_t ScaleComparison(int32_t order, int32_t sign) noexcept;
