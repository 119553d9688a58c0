// Little-endian reads and writes on byte buffers, bounds checked by the callers' spans.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "support/portable/wide_text.h"

inline uint16_t ReadU16(const uint8_t* bytes) noexcept {
    return static_cast<uint16_t>(bytes[0] | (bytes[1] << 8));
}

inline uint32_t ReadU32(const uint8_t* bytes) noexcept {
    return static_cast<uint32_t>(bytes[0]) | (static_cast<uint32_t>(bytes[1]) << 8) |
           (static_cast<uint32_t>(bytes[2]) << 16) | (static_cast<uint32_t>(bytes[3]) << 24);
}

inline void WriteU16(uint8_t* bytes, uint16_t value) noexcept {
    bytes[0] = static_cast<uint8_t>(value);
    bytes[1] = static_cast<uint8_t>(value >> 8);
}

inline void WriteU32(uint8_t* bytes, uint32_t value) noexcept {
    for (int i = 0; i < 4; ++i)
        bytes[i] = static_cast<uint8_t>(value >> (8 * i));
}

inline void AppendU32(std::vector<uint8_t>& out, uint32_t value) {
    uint8_t bytes[4];
    WriteU32(bytes, value);
    out.insert(out.end(), bytes, bytes + 4);
}

// Appends the text's UTF-16LE code units and a terminating zero unit.
inline void AppendWideZ(std::vector<uint8_t>& out, WideStringView text) {
    for (WideChar unit : text) {
        out.push_back(static_cast<uint8_t>(unit & 0xFF));
        out.push_back(static_cast<uint8_t>((static_cast<uint16_t>(unit) >> 8) & 0xFF));
    }
    out.push_back(0);
    out.push_back(0);
}

// Reads a zero-terminated UTF-16LE text that must end within [bytes, bytes + size).
// Returns false (and leaves consumed untouched) when no terminator lies inside the span.
[[nodiscard]] inline bool ReadWideZ(const uint8_t* bytes, size_t size, WideString& text,
                                    size_t& consumed) {
    for (size_t offset = 0; offset + 1 < size; offset += 2) {
        if (ReadU16(bytes + offset) == 0) {
            text.clear();
            text.reserve(offset / 2);
            for (size_t i = 0; i < offset; i += 2)
                text.push_back(static_cast<WideChar>(ReadU16(bytes + i)));
            consumed = offset + 2;
            return true;
        }
    }
    return false;
}
