// An open station key as the portable reader's source of values.
#include "stations/registry_station_values.h"

#include <algorithm>

ValueReadStatus RegistryStationValues::ReadValue(const wchar_t* name, size_t capacity,
                                                 RegistryValueType& type,
                                                 std::vector<uint8_t>& data) {
    // Never a null buffer: given none, the registry answers with the value's size instead.
    data.assign(std::max<size_t>(capacity, 1), 0);
    DWORD valueType = REG_NONE;
    DWORD size = static_cast<DWORD>(capacity);  // the reader's own small constants
    lastError_ = ::RegQueryValueExW(key_, name, nullptr, &valueType, data.data(), &size);
    if (lastError_ != ERROR_SUCCESS) {
        data.clear();
        switch (lastError_) {
            case ERROR_FILE_NOT_FOUND:
                return ValueReadStatus::kMissing;
            case ERROR_MORE_DATA:
                return ValueReadStatus::kTooLong;
            default:
                return ValueReadStatus::kFailed;
        }
    }
    data.resize(std::min<size_t>(size, capacity));
    type = static_cast<RegistryValueType>(valueType);
    return ValueReadStatus::kRead;
}

LONG RegistryStationValues::CodeOf(ValueReadStatus status) const noexcept {
    switch (status) {
        case ValueReadStatus::kRead:
            return ERROR_SUCCESS;
        case ValueReadStatus::kMissing:
            return ERROR_FILE_NOT_FOUND;
        case ValueReadStatus::kTooLong:
            return ERROR_MORE_DATA;
        case ValueReadStatus::kWrongType:
            return ERROR_UNSUPPORTED_TYPE;
        case ValueReadStatus::kFailed:
            break;
    }
    // The read that failed is always the last one made.
    return lastError_ != ERROR_SUCCESS ? lastError_ : ERROR_GEN_FAILURE;
}
