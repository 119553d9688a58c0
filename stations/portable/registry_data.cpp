// Bounded decoding of registry value bytes.
#include "stations/portable/registry_data.h"

#include "support/portable/byte_io.h"

WideString TextInValueData(std::span<const uint8_t> data) {
    WideString text;
    for (size_t offset = 0; offset + 1 < data.size(); offset += 2) {
        const uint16_t unit = ReadU16(data.data() + offset);
        if (unit == 0)
            break;
        text.push_back(static_cast<WideChar>(unit));
    }
    return text;
}

bool HasTextAfterItsEnd(std::span<const uint8_t> data) noexcept {
    bool ended = false;
    for (size_t offset = 0; offset + 1 < data.size(); offset += 2) {
        const uint16_t unit = ReadU16(data.data() + offset);
        if (unit == 0)
            ended = true;
        else if (ended)
            return true;
    }
    return false;
}

ValueReadStatus DecodeTextValue(RegistryValueType type, std::span<const uint8_t> data,
                                size_t maxBytes, WideString& text) {
    if (data.size() > maxBytes)
        return ValueReadStatus::kTooLong;
    if (type != RegistryValueType::kText && type != RegistryValueType::kExpandText)
        return ValueReadStatus::kWrongType;
    text = TextInValueData(data);
    return ValueReadStatus::kRead;
}

ValueReadStatus DecodeNumberValue(RegistryValueType type, std::span<const uint8_t> data,
                                  uint32_t& value) noexcept {
    if (type != RegistryValueType::kNumber || data.size() != kNumberValueBytes)
        return ValueReadStatus::kWrongType;
    value = ReadU32(data.data());
    return ValueReadStatus::kRead;
}
