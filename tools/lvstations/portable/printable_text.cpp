// Escapes for the characters a terminal would act on.
#include "tools/lvstations/portable/printable_text.h"

namespace {

constexpr char kHexDigits[] = "0123456789ABCDEF";

bool IsControl(uint16_t unit) noexcept {
    return unit < 0x20 || (unit >= 0x7F && unit <= 0x9F);
}

// Characters that are no controls but change how the line reads: line and paragraph separators,
// and the marks, embeddings, overrides and isolates of bidirectional text.
bool IsLayoutCharacter(uint16_t unit) noexcept {
    return unit == 0x200E || unit == 0x200F || (unit >= 0x2028 && unit <= 0x202E) ||
           (unit >= 0x2066 && unit <= 0x2069);
}

bool IsHighSurrogate(uint16_t unit) noexcept {
    return unit >= 0xD800 && unit <= 0xDBFF;
}

bool IsLowSurrogate(uint16_t unit) noexcept {
    return unit >= 0xDC00 && unit <= 0xDFFF;
}

void AppendEscape(WideString& out, char kind, uint16_t unit, int digits) {
    out += static_cast<WideChar>('\\');
    out += static_cast<WideChar>(kind);
    for (int shift = (digits - 1) * 4; shift >= 0; shift -= 4)
        out += static_cast<WideChar>(kHexDigits[(unit >> shift) & 0xF]);
}

}  // namespace

WideString PrintableText(WideStringView text) {
    WideString out;
    out.reserve(text.size());
    for (size_t index = 0; index < text.size(); ++index) {
        const auto unit = static_cast<uint16_t>(text[index]);
        if (unit == '\\') {
            out += WIDE_TEXT("\\\\");
        } else if (IsControl(unit)) {
            AppendEscape(out, 'x', unit, 2);
        } else if (IsLayoutCharacter(unit)) {
            AppendEscape(out, 'u', unit, 4);
        } else if (IsHighSurrogate(unit) && index + 1 < text.size() &&
                   IsLowSurrogate(static_cast<uint16_t>(text[index + 1]))) {
            out += text[index];
            out += text[++index];
        } else if (IsHighSurrogate(unit) || IsLowSurrogate(unit)) {
            AppendEscape(out, 'u', unit, 4);
        } else {
            out += text[index];
        }
    }
    return out;
}
