// Naming rules of stations.
#include "stations/portable/station_names.h"

#include <string>

namespace {

WideString DecimalText(unsigned value) {
    WideString digits;
    do {
        digits.insert(digits.begin(), static_cast<WideChar>(WIDE_TEXT('0') + value % 10));
        value /= 10;
    } while (value != 0);
    return digits;
}

}  // namespace

WideString MakeUniqueName(const WideString& base, const NameTakenPredicate& isTaken) {
    if (!isTaken(base))
        return base;
    // Unbounded on purpose: there is always a free number, and the store is small.
    for (unsigned number = 2;; ++number) {
        WideString candidate = base + WIDE_TEXT(" (") + DecimalText(number) + WIDE_TEXT(")");
        if (!isTaken(candidate))
            return candidate;
    }
}

WideString MakePastedName(const WideString& name, const WideString& copyPrefix,
                          const NameTakenPredicate& isTaken) {
    WideString candidate = name;
    if (copyPrefix.empty())
        return candidate;  // nothing to put in front: the loop could not end
    while (isTaken(candidate))
        candidate.insert(0, copyPrefix);
    return candidate;
}

bool IsValidStationName(WideStringView name) noexcept {
    return !name.empty() && name.find_first_of(WIDE_TEXT("\\/\"*")) == WideStringView::npos;
}

StationNameProblem CheckStationName(WideStringView name) noexcept {
    if (name.empty())
        return StationNameProblem::kEmpty;
    if (name.size() > kMaximumStationNameLength)
        return StationNameProblem::kTooLong;
    if (!IsValidStationName(name))
        return StationNameProblem::kForbiddenCharacter;
    return StationNameProblem::kNone;
}

bool IsListableStationName(WideStringView name) noexcept {
    return !name.empty() && name.size() <= kMaximumStationNameLength &&
           name.find(WIDE_TEXT('\\')) == WideStringView::npos;
}
