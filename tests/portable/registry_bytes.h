// Registry text values as the bytes a key holds, for the portable readers' tests.
#pragma once

#include <cstdint>
#include <vector>

#include "support/portable/byte_io.h"

// The text in UTF-16 with its terminating zero, as a program that writes REG_SZ properly stores it.
inline std::vector<uint8_t> Terminated(WideStringView text) {
    std::vector<uint8_t> bytes;
    AppendWideZ(bytes, text);
    return bytes;
}

// The same without its terminator, as a careless writer leaves it.
inline std::vector<uint8_t> Units(WideStringView text) {
    std::vector<uint8_t> bytes = Terminated(text);
    bytes.resize(bytes.size() - 2);
    return bytes;
}
