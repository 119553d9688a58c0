// An open station key as the portable reader's source of values, and the registry's codes for
// what a read came to.
#pragma once

#include <windows.h>

#include <vector>

#include "stations/portable/station_values.h"

// Reads values of one open key, each into a buffer of the reader's size. It keeps the registry's
// own code of its last read, the one passed on when that read was refused.
class RegistryStationValues final : public StationValueSource {
public:
    explicit RegistryStationValues(HKEY key) noexcept : key_(key) {}

    [[nodiscard]] ValueReadStatus ReadValue(const wchar_t* name, size_t capacity,
                                            RegistryValueType& type,
                                            std::vector<uint8_t>& data) override;

    // The code of what the reads came to: the registry's own for a refusal, the system's nearest
    // (ERROR_FILE_NOT_FOUND, ERROR_MORE_DATA, ERROR_UNSUPPORTED_TYPE) for an answer about the
    // data, ERROR_SUCCESS for kRead.
    [[nodiscard]] LONG CodeOf(ValueReadStatus status) const noexcept;

private:
    HKEY key_;
    LONG lastError_ = ERROR_SUCCESS;
};
