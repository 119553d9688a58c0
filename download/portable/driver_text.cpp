// Formatting of the driver's texts.
#include "download/portable/driver_text.h"

#include <string>

WideString FormatDriverText(WideStringView format,
                            std::initializer_list<WideStringView> arguments) {
    WideString result;
    result.reserve(format.size() + 32);
    auto next = arguments.begin();
    for (size_t i = 0; i < format.size(); ++i) {
        const WideChar unit = format[i];
        if (unit != WIDE_TEXT('%') || i + 1 == format.size()) {
            result.push_back(unit);
            continue;
        }
        const WideChar conversion = format[i + 1];
        if (conversion == WIDE_TEXT('%')) {
            result.push_back(WIDE_TEXT('%'));
            ++i;
        } else if (conversion == WIDE_TEXT('s') || conversion == WIDE_TEXT('d')) {
            if (next != arguments.end())
                result.append(*next++);
            ++i;
        } else {
            result.push_back(unit);
        }
    }
    return result;
}

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
