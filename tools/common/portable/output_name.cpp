// The name lvcopy gives a downloaded file.
#include "tools/common/portable/output_name.h"

#include "support/portable/windows_file_names.h"

namespace {

constexpr size_t kMaximumName = 255;  // characters of one path component on NTFS and FAT

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

// The pattern with its fields filled in; false with a reason for a pattern that cannot be read.
bool ExpandFields(WideStringView pattern, const OutputNameParts& parts, WideString& name,
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
    return true;
}

WideString Number(size_t value) {
    return Digits(static_cast<int>(value), 1);
}

// What keeps a name from being a file's, and the reason in words.
enum class NameProblem { kNone, kNoName, kCharacter, kTrailingDotOrSpace, kDevice, kTooLong };

NameProblem FindNameProblem(WideStringView name, size_t folderLength, WideString& error) {
    error.clear();
    if (name.empty() || name == WIDE_TEXT(".") || name == WIDE_TEXT("..")) {
        error = WIDE_TEXT("the pattern names no file");
        return NameProblem::kNoName;
    }
    for (const WideChar character : name) {
        if (IsForbiddenInFileName(character)) {
            error = WIDE_TEXT("a file name cannot hold the character \"") +
                    WideString(1, character) + WIDE_TEXT("\"");
            return NameProblem::kCharacter;
        }
    }
    // Windows drops them, so the file would not get the name asked for.
    if (name.back() == WIDE_TEXT('.') || name.back() == WIDE_TEXT(' ')) {
        error = WIDE_TEXT("a file name cannot end in a dot or a space");
        return NameProblem::kTrailingDotOrSpace;
    }
    const WideString device = DeviceInFileName(name);
    if (!device.empty()) {
        error = WIDE_TEXT("\"") + WideString(name) + WIDE_TEXT("\" is the device ") + device +
                WIDE_TEXT(" in Windows, not a file");
        return NameProblem::kDevice;
    }
    if (name.size() > kMaximumName) {
        error = WIDE_TEXT("the name is longer than 255 characters");
        return NameProblem::kTooLong;
    }
    const size_t pathLength = folderLength + 1 + name.size();
    if (pathLength > kMaximumOutputPath) {
        error = WIDE_TEXT("the name is too long for the folder: the path would have ") +
                Number(pathLength) + WIDE_TEXT(" characters, Windows takes ") +
                Number(kMaximumOutputPath);
        return NameProblem::kTooLong;
    }
    return NameProblem::kNone;
}

}  // namespace

bool IsCreatableFileName(WideStringView name, size_t folderLength, WideString& error) {
    return FindNameProblem(name, folderLength, error) == NameProblem::kNone;
}

bool ExpandOutputName(WideStringView pattern, const OutputNameParts& parts, WideString& name,
                      WideString& error) {
    if (!ExpandFields(pattern, parts, name, error))
        return false;
    // No folder yet: only the name itself is checked here.
    const NameProblem problem = FindNameProblem(name, 0, error);
    if (problem != NameProblem::kDevice)
        return problem == NameProblem::kNone;
    const WideString device = DeviceInFileName(name);
    // A device that the pattern names whatever the station is the pattern's; one that only this
    // station's name makes can be avoided by writing something beside {station}.
    OutputNameParts neutral = parts;
    neutral.station = WIDE_TEXT("x");
    WideString neutralName, neutralError;
    if (ExpandFields(pattern, neutral, neutralName, neutralError) &&
        DeviceInFileName(neutralName).empty()) {
        error = WIDE_TEXT("the station's name \"") + parts.station + WIDE_TEXT("\" makes \"") +
                name + WIDE_TEXT("\", which Windows takes for the device ") + device +
                WIDE_TEXT(", not a file; put something beside {station}, as in ") +
                WIDE_TEXT("\"_{station}{ext}\" or \"{station} {date}{ext}\"");
    } else {
        error = WIDE_TEXT("the pattern names the device ") + device +
                WIDE_TEXT(" in Windows, not a file");
    }
    return false;
}
