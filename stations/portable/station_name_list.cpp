// The bounded list of station names for a message, and the filling of its text.
#include "stations/portable/station_name_list.h"

#include <string>

#include "stations/portable/pasted_stations.h"

namespace {

WideString DecimalNumber(size_t value) {
    WideString text;
    do {
        text.insert(text.begin(), static_cast<WideChar>(WIDE_TEXT('0') + value % 10));
        value /= 10;
    } while (value != 0);
    return text;
}

}  // namespace

WideString StationNamesForMessage(std::span<const WideString> names, WideStringView moreFormat) {
    WideString text;
    const size_t listed =
        names.size() < kMaximumNamesInMessage ? names.size() : kMaximumNamesInMessage;
    for (size_t index = 0; index < listed; ++index) {
        if (index != 0)
            text += WIDE_TEXT("\r\n");
        text += WIDE_TEXT("'") + NameForMessage(names[index]) + WIDE_TEXT("'");
    }
    if (names.size() > listed) {
        const WideString count = DecimalNumber(names.size() - listed);
        text += WIDE_TEXT("\r\n") + FillTextArguments(moreFormat, {count});
    }
    return text;
}

WideString FillTextArguments(WideStringView format,
                             std::initializer_list<WideStringView> arguments) {
    WideString text;
    auto next = arguments.begin();
    for (size_t at = 0; at < format.size(); ++at) {
        if (format[at] == WIDE_TEXT('%') && at + 1 < format.size() &&
            format[at + 1] == WIDE_TEXT('s')) {
            if (next != arguments.end())
                text += *next++;
            ++at;
            continue;
        }
        text += format[at];
    }
    return text;
}
