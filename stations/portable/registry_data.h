// Registry values as bytes: their types, what a read of one came to, and the bounded decoding of
// the texts and numbers the store keeps in them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "support/portable/wide_text.h"

// A value's type as the registry reports it: any 32-bit number another program chose. The
// constants are the registry's own codes of the types the store meets.
enum class RegistryValueType : uint32_t {
    kNone = 0,        // REG_NONE
    kText = 1,        // REG_SZ
    kExpandText = 2,  // REG_EXPAND_SZ
    kBinary = 3,      // REG_BINARY
    kNumber = 4,      // REG_DWORD (little-endian)
};

// What became of reading one value.
enum class ValueReadStatus : uint8_t {
    kRead,       // there, of the expected type and size, and read whole
    kMissing,    // no value of that name
    kTooLong,    // larger than the buffer the reader offered
    kWrongType,  // not of the type the field is kept as, or a number that is not 4 bytes long
    kFailed,     // any other refusal by the registry (access denied, a key deleted meanwhile)
};

// A text value of at most maxBytes bytes, terminator included: REG_SZ or REG_EXPAND_SZ (taken as
// it is, unexpanded). The text ends at its first NUL or at the value's last whole unit, so one
// stored without its terminator or with an odd byte count is still read inside its bytes.
[[nodiscard]] ValueReadStatus DecodeTextValue(RegistryValueType type, std::span<const uint8_t> data,
                                              size_t maxBytes, WideString& text);

// The UTF-16LE units up to the first NUL or the last whole unit of data.
WideString TextInValueData(std::span<const uint8_t> data);

// Whether a unit other than NUL follows the first NUL among data's whole units: "Site", NUL,
// "North" reads as "Site", and a listing that took it so would show another station's name.
[[nodiscard]] bool HasTextAfterItsEnd(std::span<const uint8_t> data) noexcept;

// A REG_DWORD of exactly four bytes; nothing is written to value unless it is kRead.
[[nodiscard]] ValueReadStatus DecodeNumberValue(RegistryValueType type,
                                                std::span<const uint8_t> data,
                                                uint32_t& value) noexcept;

inline constexpr size_t kNumberValueBytes = 4;
