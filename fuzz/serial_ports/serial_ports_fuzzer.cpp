// Builds the serial-port list from values another program left in the system's serial-port key:
// any names, types and lengths, texts without terminators. The list holds, in order, one port
// for each value up to the first that would not fit the enumeration's buffers or is not REG_SZ,
// each port the text inside its value's bytes.
// Input: records of [name length][name, UTF-16LE][type][data length][data].
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <vector>

#include "stations/portable/serial_port_list.h"
#include "support/portable/byte_io.h"

namespace {

struct StoredValue {
    WideString name;
    RegistryValueType type;
    std::unique_ptr<uint8_t[]> data;  // exactly dataSize bytes: a read past them is an overflow
    size_t dataSize;
};

bool EndsTheList(const SerialCommValue& value) {
    return value.name.size() > 63 || value.data.size() > 128 ||
           value.type != RegistryValueType::kText;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::vector<StoredValue> stored;
    size_t offset = 0;
    while (offset < size) {
        const size_t nameLength = std::min<size_t>(data[offset], (size - offset - 1) / 2);
        offset += 1;
        WideString name;
        for (size_t unit = 0; unit < nameLength; ++unit, offset += 2)
            name.push_back(static_cast<WideChar>(ReadU16(data + offset)));
        if (size - offset < 2)
            break;
        const auto type = static_cast<RegistryValueType>(data[offset]);
        const size_t dataSize = std::min<size_t>(data[offset + 1], size - offset - 2);
        offset += 2;
        auto bytes = std::make_unique<uint8_t[]>(dataSize);
        std::copy(data + offset, data + offset + dataSize, bytes.get());
        offset += dataSize;
        stored.push_back({std::move(name), type, std::move(bytes), dataSize});
    }
    std::vector<SerialCommValue> values;
    for (const StoredValue& value : stored)
        values.push_back({value.name, value.type, {value.data.get(), value.dataSize}});

    const std::vector<WideString> ports = BuildSerialPortList(values);
    if (ports.size() > values.size())
        abort();
    for (size_t index = 0; index < ports.size(); ++index) {
        const SerialCommValue& value = values[index];
        const WideString& port = ports[index];
        if (EndsTheList(value) || port.size() > value.data.size() / 2 ||
            port.find(WideChar(0)) != WideString::npos)
            abort();
        // The port's units are the value's first ones, followed by a NUL or the end of data.
        for (size_t unit = 0; unit < port.size(); ++unit)
            if (static_cast<uint16_t>(port[unit]) != ReadU16(value.data.data() + 2 * unit))
                abort();
        if (2 * port.size() + 1 < value.data.size() &&
            ReadU16(value.data.data() + 2 * port.size()) != 0)
            abort();
    }
    if (ports.size() < values.size() && !EndsTheList(values[ports.size()]))
        abort();
    return 0;
}
