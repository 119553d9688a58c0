// Strict UTF-8 decoding of the station file's lines and the quoting of its texts.
#include "stations/portable/station_file_text.h"

namespace {

bool IsBlank(WideChar c) {
    return c == ' ' || c == '\t';
}

bool IsHighSurrogate(uint32_t unit) {
    return unit >= 0xD800 && unit <= 0xDBFF;
}

bool IsLowSurrogate(uint32_t unit) {
    return unit >= 0xDC00 && unit <= 0xDFFF;
}

// Control characters other than the tab, and DEL: a line may not hold them as they stand.
bool IsForbiddenControl(uint32_t c) {
    return (c < 0x20 && c != '\t') || c == 0x7F;
}

void AppendHexUnit(std::string& out, uint32_t unit) {
    static const char kDigits[] = "0123456789ABCDEF";
    out += "\\u";
    for (int shift = 12; shift >= 0; shift -= 4)
        out += kDigits[(unit >> shift) & 0xF];
}

int HexValue(WideChar c) {
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    if (c >= 'a' && c <= 'f')
        return c - 'a' + 10;
    return -1;
}

// Whether unit i of the text is a surrogate without its partner.
bool IsLoneSurrogate(WideStringView text, size_t i) {
    const uint32_t unit = text[i];
    if (IsHighSurrogate(unit))
        return i + 1 >= text.size() || !IsLowSurrogate(text[i + 1]);
    if (IsLowSurrogate(unit))
        return i == 0 || !IsHighSurrogate(text[i - 1]);
    return false;
}

bool NeedsQuotes(WideStringView text) {
    if (text.empty())
        return false;
    if (IsBlank(text.front()) || IsBlank(text.back()) || text.front() == '"')
        return true;
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '\t' || IsForbiddenControl(text[i]) || IsLoneSurrogate(text, i))
            return true;
    }
    return false;
}

}  // namespace

WideString AsciiWide(std::string_view ascii) {
    return WideString(ascii.begin(), ascii.end());
}

WideString DecimalWide(uint64_t value) {
    WideString digits;
    do {
        digits.insert(digits.begin(), static_cast<WideChar>('0' + value % 10));
        value /= 10;
    } while (value != 0);
    return digits;
}

LineDecoding DecodeUtf8Line(std::string_view bytes, WideString& text, size_t& column) {
    text.clear();
    size_t i = 0;
    while (i < bytes.size()) {
        column = i + 1;
        const uint8_t lead = static_cast<uint8_t>(bytes[i]);
        if (lead < 0x80) {
            if (IsForbiddenControl(lead))
                return LineDecoding::kControlCharacter;
            text.push_back(static_cast<WideChar>(lead));
            ++i;
            continue;
        }
        // The sequence's length and the range of its second byte (which rules out overlong forms,
        // surrogates and code points above U+10FFFF); the other continuation bytes are 80-BF.
        size_t length = 0;
        uint8_t secondLow = 0x80, secondHigh = 0xBF;
        uint32_t codePoint = 0;
        if (lead >= 0xC2 && lead <= 0xDF) {
            length = 2;
            codePoint = lead & 0x1F;
        } else if (lead >= 0xE0 && lead <= 0xEF) {
            length = 3;
            codePoint = lead & 0x0F;
            if (lead == 0xE0)
                secondLow = 0xA0;
            if (lead == 0xED)
                secondHigh = 0x9F;
        } else if (lead >= 0xF0 && lead <= 0xF4) {
            length = 4;
            codePoint = lead & 0x07;
            if (lead == 0xF0)
                secondLow = 0x90;
            if (lead == 0xF4)
                secondHigh = 0x8F;
        } else {
            return LineDecoding::kInvalidUtf8;
        }
        for (size_t k = 1; k < length; ++k) {
            column = i + k + 1;
            if (i + k >= bytes.size())
                return LineDecoding::kInvalidUtf8;
            const uint8_t next = static_cast<uint8_t>(bytes[i + k]);
            const uint8_t low = k == 1 ? secondLow : 0x80;
            const uint8_t high = k == 1 ? secondHigh : 0xBF;
            if (next < low || next > high)
                return LineDecoding::kInvalidUtf8;
            codePoint = (codePoint << 6) | (next & 0x3F);
        }
        if (codePoint >= 0x10000) {
            codePoint -= 0x10000;
            text.push_back(static_cast<WideChar>(0xD800 + (codePoint >> 10)));
            text.push_back(static_cast<WideChar>(0xDC00 + (codePoint & 0x3FF)));
        } else {
            text.push_back(static_cast<WideChar>(codePoint));
        }
        i += length;
    }
    return LineDecoding::kDecoded;
}

WideStringView TrimBlanks(WideStringView text) noexcept {
    while (!text.empty() && IsBlank(text.front()))
        text.remove_prefix(1);
    while (!text.empty() && IsBlank(text.back()))
        text.remove_suffix(1);
    return text;
}

void AppendUtf8(std::string& out, WideStringView text) {
    for (size_t i = 0; i < text.size(); ++i) {
        uint32_t c = text[i];
        if (IsHighSurrogate(c) && i + 1 < text.size() && IsLowSurrogate(text[i + 1])) {
            c = 0x10000 + ((c - 0xD800) << 10) + (static_cast<uint32_t>(text[i + 1]) - 0xDC00);
            ++i;
        } else if (IsHighSurrogate(c) || IsLowSurrogate(c)) {
            c = 0xFFFD;
        }
        if (c < 0x80) {
            out += static_cast<char>(c);
        } else if (c < 0x800) {
            out += static_cast<char>(0xC0 | (c >> 6));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else if (c < 0x10000) {
            out += static_cast<char>(0xE0 | (c >> 12));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else {
            out += static_cast<char>(0xF0 | (c >> 18));
            out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        }
    }
}

std::string EncodeFileText(WideStringView text) {
    std::string out;
    if (!NeedsQuotes(text)) {
        AppendUtf8(out, text);
        return out;
    }
    out += '"';
    size_t plainStart = 0;
    for (size_t i = 0; i < text.size(); ++i) {
        const WideChar c = text[i];
        const bool escaped =
            c == '\\' || c == '"' || c == '\t' || IsForbiddenControl(c) || IsLoneSurrogate(text, i);
        if (!escaped)
            continue;
        AppendUtf8(out, text.substr(plainStart, i - plainStart));
        plainStart = i + 1;
        if (c == '\\' || c == '"') {
            out += '\\';
            out += static_cast<char>(c);
        } else if (c == '\t') {
            out += "\\t";
        } else {
            AppendHexUnit(out, c);
        }
    }
    AppendUtf8(out, text.substr(plainStart));
    out += '"';
    return out;
}

std::optional<WideString> DecodeFileText(WideStringView written, WideString& text) {
    text.clear();
    if (written.empty() || written.front() != '"') {
        text.assign(written);
        return std::nullopt;
    }
    for (size_t i = 1; i < written.size(); ++i) {
        const WideChar c = written[i];
        if (c == '"') {
            if (i + 1 != written.size())
                return AsciiWide("text follows the closing double quote");
            return std::nullopt;
        }
        if (c != '\\') {
            text.push_back(c);
            continue;
        }
        if (++i == written.size())
            break;
        const WideChar escape = written[i];
        if (escape == '\\' || escape == '"') {
            text.push_back(escape);
        } else if (escape == 't') {
            text.push_back('\t');
        } else if (escape == 'u') {
            uint32_t unit = 0;
            for (int k = 0; k < 4; ++k) {
                const int digit = ++i < written.size() ? HexValue(written[i]) : -1;
                if (digit < 0)
                    return AsciiWide("\\u must be followed by four hexadecimal digits");
                unit = unit * 16 + static_cast<uint32_t>(digit);
            }
            text.push_back(static_cast<WideChar>(unit));
        } else {
            return AsciiWide("unknown escape \\") + WideString(1, escape) +
                   AsciiWide(" (known: \\\\ \\\" \\t \\uHHHH)");
        }
    }
    return AsciiWide("the double quote is not closed");
}
