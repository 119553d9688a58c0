// The serial-port list built from the values of the system's serial-port key, with the buffer
// limits of its enumeration: the values are another program's, of any name, type and length.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "stations/portable/registry_data.h"

// Enumeration buffers: value names of up to 63 characters (the buffer holds the terminator) and
// port names of up to 128 bytes.
inline constexpr size_t kSerialCommNameCapacity = 64;
inline constexpr size_t kSerialCommDataCapacity = 128;

// One value of the key as it is stored (name and data whole, not yet cut to the buffers).
struct SerialCommValue {
    WideStringView name;
    RegistryValueType type = RegistryValueType::kNone;
    std::span<const uint8_t> data;
};

// Appends the port this value names and answers true, or answers false where the list ends: a
// value whose name or data would not fit the enumeration's buffers (the registry refuses to
// enumerate it) or that is not REG_SZ. The port is the data's text up to its first NUL or last
// whole unit. No sorting and no removal of duplicates: the system's order and entries as they are.
[[nodiscard]] bool AppendSerialPort(const SerialCommValue& value, std::vector<WideString>& ports);

// The ports of the values in order, up to the first that ends the list.
std::vector<WideString> BuildSerialPortList(std::span<const SerialCommValue> values);
