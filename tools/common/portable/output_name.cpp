// The name lvcopy gives a downloaded file.
#include "tools/common/portable/output_name.h"

namespace {

constexpr size_t kMaximumName = 255;  // characters of one path component on NTFS and FAT

bool IsForbiddenInFileName(WideChar character) noexcept {
    if (character < 0x20)
        return true;
    for (const WideChar forbidden : WideStringView(WIDE_TEXT("<>:\"/\\|?*")))
        if (character == forbidden)
            return true;
    return false;
}

WideString Digits(int value, size_t width) {
    WideString text;
    for (int rest = value < 0 ? 0 : value; rest > 0 || text.empty(); rest /= 10)
        text.insert(text.begin(), static_cast<WideChar>(WIDE_TEXT('0') + rest % 10));
    while (text.size() < width)
        text.insert(text.begin(), WIDE_TEXT('0'));
    return text;
}

WideString WithoutForbidden(WideStringView text) {
    WideString cleaned(text);
    for (WideChar& character : cleaned)
        if (IsForbiddenInFileName(character))
            character = WIDE_TEXT('_');
    return cleaned;
}

}  // namespace

bool ExpandOutputName(WideStringView pattern, const OutputNameParts& parts, WideString& name,
                      WideString& error) {
    name.clear();
    error.clear();
    const size_t dot = parts.fileName.rfind(WIDE_TEXT('.'));
    const WideStringView fileName(parts.fileName);
    const WideStringView stem = fileName.substr(0, dot);
    const WideStringView extension =
        dot == WideString::npos ? WideStringView() : fileName.substr(dot);
    for (size_t index = 0; index < pattern.size(); ++index) {
        const WideChar character = pattern[index];
        if ((character == WIDE_TEXT('{') || character == WIDE_TEXT('}')) &&
            index + 1 < pattern.size() && pattern[index + 1] == character) {
            name.push_back(character);
            ++index;
            continue;
        }
        if (character == WIDE_TEXT('}')) {
            error = WIDE_TEXT("a \"}\" without its \"{\"");
            return false;
        }
        if (character != WIDE_TEXT('{')) {
            if (IsForbiddenInFileName(character)) {
                error = WIDE_TEXT("the pattern holds a character a file name cannot: \"") +
                        WideString(1, character) + WIDE_TEXT("\"");
                return false;
            }
            name.push_back(character);
            continue;
        }
        const size_t close = pattern.find(WIDE_TEXT('}'), index);
        if (close == WideStringView::npos) {
            error = WIDE_TEXT("a \"{\" without its \"}\"");
            return false;
        }
        const WideStringView field = pattern.substr(index + 1, close - index - 1);
        if (field == WIDE_TEXT("station"))
            name += WithoutForbidden(parts.station);
        else if (field == WIDE_TEXT("date"))
            name += Digits(parts.year, 4) + WIDE_TEXT("-") + Digits(parts.month, 2) +
                    WIDE_TEXT("-") + Digits(parts.day, 2);
        else if (field == WIDE_TEXT("time"))
            name += Digits(parts.hour, 2) + Digits(parts.minute, 2) + Digits(parts.second, 2);
        else if (field == WIDE_TEXT("name"))
            name += WithoutForbidden(stem);
        else if (field == WIDE_TEXT("ext"))
            name += WithoutForbidden(extension);
        else {
            error = WIDE_TEXT("unknown field {") + WideString(field) +
                    WIDE_TEXT("}: use {station}, {date}, {time}, {name} or {ext}");
            return false;
        }
        index = close;
    }
    if (name.empty() || name == WIDE_TEXT(".") || name == WIDE_TEXT("..")) {
        error = WIDE_TEXT("the pattern names no file");
        return false;
    }
    if (name.back() == WIDE_TEXT('.') || name.back() == WIDE_TEXT(' ')) {
        error = WIDE_TEXT("a file name cannot end in a dot or a space");
        return false;
    }
    if (name.size() > kMaximumName) {
        error = WIDE_TEXT("the name is longer than 255 characters");
        return false;
    }
    return true;
}
