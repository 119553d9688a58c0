// The message for a port that did not open.
#include "download/portable/port_open_problem.h"

#include <algorithm>

#include "support/portable/text_format.h"

namespace {

constexpr WideStringView kDevicePrefix = WIDE_TEXT("\\\\.\\");

[[nodiscard]] WideChar AsciiUpper(WideChar unit) noexcept {
    return unit >= WIDE_TEXT('a') && unit <= WIDE_TEXT('z')
               ? static_cast<WideChar>(unit - WIDE_TEXT('a') + WIDE_TEXT('A'))
               : unit;
}

[[nodiscard]] bool SameDeviceName(WideStringView left, WideStringView right) noexcept {
    return std::equal(left.begin(), left.end(), right.begin(), right.end(),
                      [](WideChar a, WideChar b) { return AsciiUpper(a) == AsciiUpper(b); });
}

}  // namespace

WideStringView PortDisplayName(WideStringView port) noexcept {
    return port.substr(0, kDevicePrefix.size()) == kDevicePrefix
               ? port.substr(kDevicePrefix.size())
               : port;
}

bool IsPortListed(WideStringView port, const std::vector<WideString>& present) {
    const WideStringView name = PortDisplayName(port);
    return std::any_of(present.begin(), present.end(), [name](const WideString& listed) {
        return SameDeviceName(PortDisplayName(listed), name);
    });
}

WideString PortOpenProblemText(const PortOpenProblem& problem, const PortProblemTexts& texts) {
    switch (problem.failure) {
        case PortOpenFailure::NotPresent: {
            const WideStringView port = PortDisplayName(problem.port);
            if (problem.present.empty())
                return FormatText(texts.noPortsPresent, {port});
            WideString list;
            for (const WideString& present : problem.present) {
                if (!list.empty())
                    list.append(WIDE_TEXT(", "));
                list.append(present);
            }
            return FormatText(texts.notPresent, {port, list});
        }
        case PortOpenFailure::InUse:
            break;
        case PortOpenFailure::Other:
            if (!problem.systemText.empty())
                return problem.systemText;
            break;
    }
    return texts.inUse;
}
