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
