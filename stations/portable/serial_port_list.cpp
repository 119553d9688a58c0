// The serial-port list from the serial-port key's values.
#include "stations/portable/serial_port_list.h"

bool AppendSerialPort(const SerialCommValue& value, std::vector<WideString>& ports) {
    if (value.name.size() >= kSerialCommNameCapacity ||
        value.data.size() > kSerialCommDataCapacity || value.type != RegistryValueType::kText) {
        return false;
    }
    ports.push_back(TextInValueData(value.data));
    return true;
}

std::vector<WideString> BuildSerialPortList(std::span<const SerialCommValue> values) {
    std::vector<WideString> ports;
    for (const SerialCommValue& value : values) {
        if (!AppendSerialPort(value, ports))
            break;
    }
    return ports;
}
