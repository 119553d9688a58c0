// Filling the "%s" places of a user-visible text.
#include "support/portable/text_format.h"

WideString FormatText(WideStringView format, std::span<const WideStringView> arguments) {
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
