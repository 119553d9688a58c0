// What Windows refuses in a file or folder name.
#include "support/portable/windows_file_names.h"

namespace {

WideChar AsciiUpper(WideChar character) noexcept {
    return character >= WIDE_TEXT('a') && character <= WIDE_TEXT('z')
               ? static_cast<WideChar>(character - WIDE_TEXT('a') + WIDE_TEXT('A'))
               : character;
}

// Devices whose names stand alone; COM and LPT take a digit.
const WideChar* const kDevices[] = {WIDE_TEXT("CON"), WIDE_TEXT("PRN"),    WIDE_TEXT("AUX"),
                                    WIDE_TEXT("NUL"), WIDE_TEXT("CONIN$"), WIDE_TEXT("CONOUT$")};

// A digit that ends a COM or LPT device's name: 0-9 and the superscripts 1, 2, 3.
bool IsDevicePortDigit(WideChar character) noexcept {
    constexpr WideChar kSuperscriptOne = 0x00B9;
    constexpr WideChar kSuperscriptTwo = 0x00B2;
    constexpr WideChar kSuperscriptThree = 0x00B3;
    return (character >= WIDE_TEXT('0') && character <= WIDE_TEXT('9')) ||
           character == kSuperscriptOne || character == kSuperscriptTwo ||
           character == kSuperscriptThree;
}

}  // namespace

bool IsForbiddenInFileName(WideChar character) noexcept {
    if (character < 0x20)
        return true;
    return WideStringView(WIDE_TEXT("<>:\"/\\|?*")).find(character) != WideStringView::npos;
}

WideString DeviceInFileName(WideStringView name) {
    WideStringView base = name.substr(0, name.find(WIDE_TEXT('.')));
    while (!base.empty() && base.back() == WIDE_TEXT(' '))
        base.remove_suffix(1);
    WideString upper;
    for (const WideChar character : base)
        upper.push_back(AsciiUpper(character));
    for (const WideChar* device : kDevices) {
        if (upper == device)
            return upper;
    }
    if (upper.size() == 4 &&
        (upper.starts_with(WIDE_TEXT("COM")) || upper.starts_with(WIDE_TEXT("LPT"))) &&
        IsDevicePortDigit(upper[3])) {
        return upper;
    }
    return WideString();
}
