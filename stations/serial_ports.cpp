// The serial-port list of the local machine.
#include "stations/serial_ports.h"

#include <windows.h>

#include "support/portable/wide_text.h"
#include "support/unique_resource.h"

std::vector<std::wstring> ListSerialPorts() {
    std::vector<std::wstring> ports;
    UniqueRegKey key;
    if (::RegOpenKeyExW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DEVICEMAP\\SERIALCOMM", 0, KEY_READ,
                        key.put()) != ERROR_SUCCESS) {
        return ports;
    }
    for (DWORD index = 0;; ++index) {
        wchar_t valueName[64] = {};
        wchar_t data[64] = {};  // 128 bytes
        DWORD nameLength = ARRAYSIZE(valueName);
        DWORD dataBytes = sizeof(data);
        DWORD type = 0;
        if (::RegEnumValueW(key.get(), index, valueName, &nameLength, nullptr, &type,
                            reinterpret_cast<BYTE*>(data), &dataBytes) != ERROR_SUCCESS ||
            type != REG_SZ) {
            break;
        }
        // The data need not end with its terminator: only what lies in the buffer is read.
        ports.emplace_back(data, BoundedLength(data, dataBytes / sizeof(wchar_t)));
    }
    return ports;
}
