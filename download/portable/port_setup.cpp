// The port settings the driver applies.
#include "download/portable/port_setup.h"

DeviceControlFields MakeDeviceControlFields(ReceiveProcedure procedure) noexcept {
    DeviceControlFields fields;
    if (procedure == ReceiveProcedure::RawStream)
        fields.Flags |= kDcbXonXoffOut | kDcbXonXoffIn;
    else
        fields.Flags &= ~(kDcbXonXoffOut | kDcbXonXoffIn);
    return fields;
}

PortTimeouts MakePortTimeouts() noexcept {
    return PortTimeouts{};
}

PortTimeouts MakeLineTimeouts(uint32_t baudRate, uint32_t bitsPerCharacter) noexcept {
    constexpr uint64_t kIntervalCharacters = 2;
    constexpr uint64_t kMillisecondsPerSecond = 1000;
    constexpr uint32_t kShortestInterval = 1;  // a 0 interval would mean none at all
    constexpr uint32_t kNoMultiplier = 0;
    constexpr uint32_t kSilentReadMilliseconds = 100;
    PortTimeouts timeouts;
    if (baudRate == 0)
        return timeouts;  // no rate to pace by: the port refuses such a setting anyway
    // Two character times, rounded up to whole milliseconds and never 0.
    const uint64_t intervalBits = kIntervalCharacters * bitsPerCharacter * kMillisecondsPerSecond;
    timeouts.ReadInterval = static_cast<uint32_t>((intervalBits + baudRate - 1) / baudRate);
    if (timeouts.ReadInterval < kShortestInterval)
        timeouts.ReadInterval = kShortestInterval;
    timeouts.ReadTotalMultiplier = kNoMultiplier;
    timeouts.ReadTotalConstant = kSilentReadMilliseconds;
    return timeouts;
}
