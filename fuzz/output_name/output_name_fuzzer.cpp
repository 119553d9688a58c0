// Expands lvcopy's name patterns with any station name, file name, date and time. A name that
// comes out must be one Windows creates as a file: not empty, at most 255 characters, none that
// a name cannot hold, no trailing dot or space, no device; a refusal must say why.
// Input: six 32-bit numbers (year, month, day, hour, minute, second), then UTF-16LE units: the
// pattern, the station's name and the file's name, separated by the unit 0xFFFF.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <memory>

#include "support/portable/byte_io.h"
#include "tools/common/portable/output_name.h"

namespace {

constexpr size_t kNumberBytes = 6 * 4;
constexpr WideChar kSeparator = static_cast<WideChar>(0xFFFF);

bool HoldsForbidden(WideStringView name) {
    for (const WideChar character : name)
        if (character < 0x20 ||
            WideStringView(WIDE_TEXT("<>:\"/\\|?*")).find(character) != WideStringView::npos)
            return true;
    return false;
}

WideChar Upper(WideChar character) {
    return character >= 'a' && character <= 'z' ? static_cast<WideChar>(character - 'a' + 'A')
                                                : character;
}

// Written from the rule, not taken from the code under test: the part before the first dot, less
// trailing spaces, in any case, is CON, PRN, AUX, NUL, CONIN$, CONOUT$, or COM or LPT followed by
// one digit 0-9 or a superscript 1, 2 or 3.
bool NamesDevice(WideStringView name) {
    WideString base(name.substr(0, name.find(WIDE_TEXT('.'))));
    while (!base.empty() && base.back() == WIDE_TEXT(' '))
        base.pop_back();
    for (WideChar& character : base)
        character = Upper(character);
    for (const WideChar* device : {WIDE_TEXT("CON"), WIDE_TEXT("PRN"), WIDE_TEXT("AUX"),
                                   WIDE_TEXT("NUL"), WIDE_TEXT("CONIN$"), WIDE_TEXT("CONOUT$")})
        if (base == device)
            return true;
    if (base.size() != 4 ||
        (base.compare(0, 3, WIDE_TEXT("COM")) != 0 && base.compare(0, 3, WIDE_TEXT("LPT")) != 0))
        return false;
    const WideChar last = base[3];
    return (last >= '0' && last <= '9') || last == 0x00B9 || last == 0x00B2 || last == 0x00B3;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < kNumberBytes)
        return 0;
    OutputNameParts parts;
    int* const numbers[] = {&parts.year, &parts.month,  &parts.day,
                            &parts.hour, &parts.minute, &parts.second};
    for (size_t index = 0; index < 6; ++index)
        *numbers[index] = static_cast<int>(ReadU32(data + 4 * index));
    WideString texts[3];
    size_t which = 0;
    for (size_t offset = kNumberBytes; offset + 1 < size && which < 3; offset += 2) {
        const auto unit = static_cast<WideChar>(ReadU16(data + offset));
        if (unit == kSeparator)
            ++which;
        else
            texts[which].push_back(unit);
    }
    // The pattern as its own exact-size copy: a read past its end is an overflow for ASan.
    const std::unique_ptr<WideChar[]> pattern(new WideChar[texts[0].size()]);
    std::copy(texts[0].begin(), texts[0].end(), pattern.get());
    parts.station = texts[1];
    parts.fileName = texts[2];

    WideString name = WIDE_TEXT("stale");
    WideString error = WIDE_TEXT("stale");
    const bool expanded =
        ExpandOutputName(WideStringView(pattern.get(), texts[0].size()), parts, name, error);
    if (!expanded) {
        if (error.empty() || error == WIDE_TEXT("stale"))
            abort();
        return 0;
    }
    if (!error.empty() || name.empty() || name.size() > 255 || HoldsForbidden(name) ||
        name.back() == WIDE_TEXT('.') || name.back() == WIDE_TEXT(' ') || NamesDevice(name))
        abort();
    // The same name passes the check lvcopy makes of a name given whole.
    WideString refusal;
    if (!DeviceInFileName(name).empty() || !IsCreatableFileName(name, 0, refusal))
        abort();
    return 0;
}
