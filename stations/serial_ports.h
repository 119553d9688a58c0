// The serial ports this computer offers, as the system lists them.
#pragma once

#include <string>
#include <vector>

// Port names of HKEY_LOCAL_MACHINE\HARDWARE\DEVICEMAP\SERIALCOMM in enumeration order, up to
// the first value that is not text; empty when the key cannot be read.
std::vector<std::wstring> ListSerialPorts();
