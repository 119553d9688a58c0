// The serial-port list of the local machine, read through the portable list rules.
#include "stations/serial_ports.h"

#include <windows.h>

#include <algorithm>

#include "stations/portable/serial_port_list.h"
#include "support/unique_resource.h"

std::vector<std::wstring> ListSerialPorts() {
    std::vector<std::wstring> ports;
    UniqueRegKey key;
    if (::RegOpenKeyExW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DEVICEMAP\\SERIALCOMM", 0, KEY_READ,
                        key.put()) != ERROR_SUCCESS) {
        return ports;
    }
    for (DWORD index = 0;; ++index) {
        // Both buffers are reset for each value. A name or data that does not fit is an
        // enumeration error, which ends the list as the rules do.
        wchar_t valueName[kSerialCommNameCapacity] = {};
        BYTE data[kSerialCommDataCapacity] = {};
        DWORD nameLength = ARRAYSIZE(valueName);
        DWORD dataBytes = sizeof(data);
        DWORD type = REG_NONE;
        if (::RegEnumValueW(key.get(), index, valueName, &nameLength, nullptr, &type, data,
                            &dataBytes) != ERROR_SUCCESS) {
            break;
        }
        const SerialCommValue value{
            WideStringView(valueName, std::min<size_t>(nameLength, ARRAYSIZE(valueName))),
            static_cast<RegistryValueType>(type),
            std::span<const uint8_t>(data, std::min<size_t>(dataBytes, sizeof(data)))};
        if (!AppendSerialPort(value, ports))
            break;
    }
    return ports;
}
