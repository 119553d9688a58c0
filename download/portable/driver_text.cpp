// Formatting of the driver's texts.
#include "download/portable/driver_text.h"

#include <string>

WideString DecimalText(long long value) {
    const std::string digits = std::to_string(value);
    return WidenBytes(digits.data(), digits.size());
}

WideString WidenBytes(const char* bytes, size_t count) {
    WideString text;
    text.reserve(count);
    for (size_t i = 0; i < count; ++i)
        text.push_back(static_cast<WideChar>(static_cast<unsigned char>(bytes[i])));
    return text;
}
