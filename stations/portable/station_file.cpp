// Reading and writing the station file; every line is checked before any station is handed on.
#include "stations/portable/station_file.h"

#include <algorithm>
#include <array>
#include <map>
#include <string_view>

#include "stations/portable/station_file_text.h"

namespace {

using Failure = std::optional<StationFileError>;

StationFileError Problem(StationFileProblem problem, size_t line, WideString field,
                         WideString reason) {
    return {problem, line, std::move(field), std::move(reason)};
}

WideString FieldName(StationField field) {
    return StationFieldOf(field).valueName;
}

WideString KnownKeys() {
    WideString keys;
    for (const StationFieldInfo& info : StationFields()) {
        if (info.field != StationField::kName)
            keys += (keys.empty() ? WideString() : AsciiWide(", ")) + info.valueName;
    }
    return keys;
}

// Decimal digits only: no sign, no blanks inside, no other base.
Failure ParseNumber(size_t line, StationField field, WideStringView text, uint32_t& value) {
    if (text.empty() ||
        !std::all_of(text.begin(), text.end(), [](WideChar c) { return c >= '0' && c <= '9'; })) {
        return Problem(StationFileProblem::kNotANumber, line, FieldName(field),
                       AsciiWide("\"") + WideString(text) +
                           AsciiWide("\" is not a number (decimal digits only)"));
    }
    uint64_t number = 0;
    for (WideChar digit : text) {
        number = number * 10 + static_cast<uint64_t>(digit - '0');
        if (number > UINT32_MAX) {
            return Problem(StationFileProblem::kNumberTooLarge, line, FieldName(field),
                           WideString(text) + AsciiWide(" does not fit in 32 bits"));
        }
    }
    value = static_cast<uint32_t>(number);
    return std::nullopt;
}

class StationFileReader {
public:
    explicit StationFileReader(const StationFileRules& rules) : rules_(rules) {}

    Failure ReadLine(size_t line, WideStringView text) {
        text = TrimBlanks(text);
        if (text.empty() || text.front() == ';' || text.front() == '#')
            return std::nullopt;
        if (text.front() == '[')
            return OpenSection(line, text);
        return ReadValue(line, text);
    }

    Failure Finish() {
        if (Failure failure = CloseSection())
            return failure;
        if (contents_.stations.empty()) {
            return Problem(StationFileProblem::kNoStations, 0, WideString(),
                           AsciiWide("holds no [station] section"));
        }
        return std::nullopt;
    }

    StationFileContents& Contents() { return contents_; }

private:
    struct Section {
        StationFileEntry entry;
        std::array<bool, kStationFieldCount> seen{};
        size_t values = 0;
        size_t portLine = 0;
    };

    Failure OpenSection(size_t line, WideStringView text) {
        if (text.size() < 2 || text.back() != ']') {
            return Problem(StationFileProblem::kBadSection, line, FieldName(StationField::kName),
                           AsciiWide("a section's name must end with ]"));
        }
        if (Failure failure = CloseSection())
            return failure;
        WideString name;
        if (std::optional<WideString> reason =
                DecodeFileText(TrimBlanks(text.substr(1, text.size() - 2)), name)) {
            return Problem(StationFileProblem::kBadText, line, FieldName(StationField::kName),
                           *reason);
        }
        if (contents_.stations.size() == kMaximumStationsInFile) {
            return Problem(StationFileProblem::kTooManyStations, line, WideString(),
                           AsciiWide("more than ") + DecimalWide(kMaximumStationsInFile) +
                               AsciiWide(" stations in one file"));
        }
        if (std::optional<WideString> reason =
                RefusedText(StationField::kName, name, rules_.modelTexts)) {
            return Problem(StationFileProblem::kRefusedValue, line, FieldName(StationField::kName),
                           *reason);
        }
        const auto [earlier, added] = sectionLines_.emplace(name, line);
        if (!added) {
            return Problem(
                StationFileProblem::kDuplicateSection, line, FieldName(StationField::kName),
                AsciiWide("\"") + name + AsciiWide("\" is already the station of line ") +
                    DecimalWide(earlier->second));
        }
        Section section;
        section.entry.station.Name = std::move(name);
        if (!rules_.modelTexts.empty())
            section.entry.station.Model = rules_.modelTexts.front();
        section.entry.line = line;
        section.portLine = line;
        open_ = std::move(section);
        return std::nullopt;
    }

    Failure CloseSection() {
        if (!open_)
            return std::nullopt;
        Section section = std::move(*open_);
        open_.reset();
        if (section.values == 0) {
            return Problem(StationFileProblem::kEmptySection, section.entry.line,
                           FieldName(StationField::kName),
                           AsciiWide("the station \"") + section.entry.station.Name +
                               AsciiWide("\" has no values (is the file cut short?)"));
        }
        const Station& station = section.entry.station;
        if (std::find(rules_.ports.begin(), rules_.ports.end(), station.Port) == rules_.ports.end())
            contents_.warnings.push_back({section.portLine, station.Name, station.Port});
        contents_.stations.push_back(std::move(section.entry));
        return std::nullopt;
    }

    Failure ReadValue(size_t line, WideStringView text) {
        const size_t equals = text.find('=');
        if (equals == WideStringView::npos) {
            return Problem(StationFileProblem::kBadLine, line, WideString(),
                           AsciiWide("expected [station name], Key = value, or a comment "
                                     "starting with ; or #"));
        }
        const WideStringView key = TrimBlanks(text.substr(0, equals));
        const WideStringView written = TrimBlanks(text.substr(equals + 1));
        if (!open_) {
            return Problem(StationFileProblem::kValueOutsideSection, line, WideString(key),
                           AsciiWide("a value before the first [station] section"));
        }
        const std::optional<StationField> field = StationFieldNamed(key);
        if (!field || *field == StationField::kName) {
            return Problem(
                StationFileProblem::kUnknownKey, line, WideString(key),
                field ? AsciiWide("a station's name is its [section] name")
                      : AsciiWide("not a value of a station; the keys are ") + KnownKeys());
        }
        Section& section = *open_;
        const size_t index = static_cast<size_t>(*field);
        if (section.seen[index]) {
            return Problem(StationFileProblem::kDuplicateKey, line, FieldName(*field),
                           AsciiWide("given twice for the station \"") +
                               section.entry.station.Name + AsciiWide("\""));
        }
        section.seen[index] = true;
        ++section.values;
        const StationFieldInfo& info = StationFieldOf(*field);
        Station& station = section.entry.station;
        if (info.number)
            return ReadNumber(line, *field, written, station.*info.number);
        WideString value;
        if (std::optional<WideString> reason = DecodeFileText(written, value))
            return Problem(StationFileProblem::kBadText, line, FieldName(*field), *reason);
        if (std::optional<WideString> reason = RefusedText(*field, value, rules_.modelTexts))
            return Problem(StationFileProblem::kRefusedValue, line, FieldName(*field), *reason);
        if (*field == StationField::kPort)
            section.portLine = line;
        station.*info.text = std::move(value);
        return std::nullopt;
    }

    Failure ReadNumber(size_t line, StationField field, WideStringView written, uint32_t& target) {
        uint32_t value = 0;
        if (Failure failure = ParseNumber(line, field, written, value))
            return failure;
        if (std::optional<WideString> reason = RefusedNumber(field, value))
            return Problem(StationFileProblem::kRefusedValue, line, FieldName(field), *reason);
        target = value;
        return std::nullopt;
    }

    const StationFileRules& rules_;
    StationFileContents contents_;
    std::optional<Section> open_;
    std::map<WideString, size_t> sectionLines_;
};

Failure CheckEncodingMarks(const uint8_t* bytes, size_t size) {
    if (size > kMaximumStationFileSize) {
        return Problem(StationFileProblem::kTooLarge, 0, WideString(),
                       AsciiWide("is larger than ") + DecimalWide(kMaximumStationFileSize) +
                           AsciiWide(" bytes"));
    }
    if (size >= 2 &&
        ((bytes[0] == 0xFF && bytes[1] == 0xFE) || (bytes[0] == 0xFE && bytes[1] == 0xFF))) {
        return Problem(StationFileProblem::kUtf16, 0, WideString(),
                       AsciiWide("is UTF-16 text; save it as UTF-8"));
    }
    return std::nullopt;
}

Failure ReadLines(const uint8_t* bytes, size_t size, StationFileReader& reader) {
    const std::string_view all(reinterpret_cast<const char*>(bytes), size);
    size_t start = all.substr(0, 3) == "\xEF\xBB\xBF" ? 3 : 0;
    WideString text;
    for (size_t line = 1; start < all.size(); ++line) {
        const size_t end = std::min(all.find('\n', start), all.size());
        std::string_view bytesOfLine = all.substr(start, end - start);
        if (!bytesOfLine.empty() && bytesOfLine.back() == '\r')
            bytesOfLine.remove_suffix(1);
        start = end + 1;
        size_t column = 0;
        switch (DecodeUtf8Line(bytesOfLine, text, column)) {
            case LineDecoding::kDecoded:
                break;
            case LineDecoding::kInvalidUtf8:
                return Problem(StationFileProblem::kInvalidUtf8, line, WideString(),
                               AsciiWide("not UTF-8 text (byte ") + DecimalWide(column) +
                                   AsciiWide(" of the line)"));
            case LineDecoding::kControlCharacter:
                return Problem(
                    StationFileProblem::kControlCharacter, line, WideString(),
                    AsciiWide("a control character (byte ") + DecimalWide(column) +
                        AsciiWide(" of the line); write it as \\uHHHH in double quotes"));
        }
        if (Failure failure = reader.ReadLine(line, text))
            return failure;
    }
    return reader.Finish();
}

void AppendLine(std::string& out, std::string_view text) {
    out += text;
    out += "\r\n";
}

}  // namespace

WideString DescribeStationFileError(const StationFileError& error) {
    if (error.line == 0)
        return AsciiWide("the file ") + error.reason;
    WideString where = AsciiWide("line ") + DecimalWide(error.line);
    if (!error.field.empty())
        where += AsciiWide(", ") + error.field;
    return where + AsciiWide(": ") + error.reason;
}

StationFileContents ReadStationFile(const uint8_t* bytes, size_t size,
                                    const StationFileRules& rules) {
    StationFileReader reader(rules);
    Failure failure = CheckEncodingMarks(bytes, size);
    if (!failure)
        failure = ReadLines(bytes, size, reader);
    StationFileContents contents = std::move(reader.Contents());
    if (failure) {
        contents.stations.clear();
        contents.warnings.clear();
        contents.error = std::move(failure);
    }
    return contents;
}

std::string WriteStationFile(const std::vector<StationFileSection>& sections) {
    std::string out;
    AppendLine(out, "; Stations of Quorvel Digital Levels, written by \"lvstations export\".");
    AppendLine(out,
               "; One [section] per station, named after it, then its values by their registry "
               "names.");
    AppendLine(out,
               "; Lines starting with ; or # are comments. On another computer: "
               "lvstations import FILE");
    for (const StationFileSection& section : sections) {
        AppendLine(out, "");
        AppendLine(out, "[" + EncodeFileText(section.station.Name) + "]");
        for (const StationFieldInfo& info : StationFields()) {
            if (info.field == StationField::kName ||
                std::find(section.missing.begin(), section.missing.end(), info.field) !=
                    section.missing.end()) {
                continue;
            }
            std::string line;
            AppendUtf8(line, info.valueName);
            line += " =";
            const std::string value = info.number ? std::to_string(section.station.*info.number)
                                                  : EncodeFileText(section.station.*info.text);
            if (!value.empty())
                line += " " + value;
            AppendLine(out, line);
        }
    }
    return out;
}
