// The port settings the driver applies.
#include "download/portable/port_setup.h"

DeviceControlFields MakeDeviceControlFields(uint32_t protocolSelector) noexcept {
    DeviceControlFields fields;
    if (protocolSelector == 0)
        fields.Flags |= kDcbXonXoffOut | kDcbXonXoffIn;
    else
        fields.Flags &= ~(kDcbXonXoffOut | kDcbXonXoffIn);
    return fields;
}

PortTimeouts MakePortTimeouts() noexcept {
    return PortTimeouts{};
}

PortTimeouts MakeLineTimeouts(uint32_t baudRate, uint32_t bitsPerCharacter) noexcept {
    PortTimeouts timeouts;
    if (baudRate == 0)
        return timeouts;  // no rate to pace by: the port refuses such a setting anyway
    // Two character times, rounded up to whole milliseconds and never 0 (0 means no interval).
    const uint64_t twoCharacters = 2ull * bitsPerCharacter * 1000;
    timeouts.ReadInterval = static_cast<uint32_t>((twoCharacters + baudRate - 1) / baudRate);
    if (timeouts.ReadInterval == 0)
        timeouts.ReadInterval = 1;
    timeouts.ReadTotalMultiplier = 0;
    timeouts.ReadTotalConstant = 100;
    return timeouts;
}
