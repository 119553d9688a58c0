// The station file: stations as UTF-8 text that an administrator reads and edits, one
// "[name]" section per station and one "Key = value" line per field, read whole and checked
// before anyone writes a station.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "stations/portable/station.h"
#include "stations/portable/station_fields.h"

// A file's bytes are read whole into memory: anything larger is refused unread.
inline constexpr size_t kMaximumStationFileSize = 1024 * 1024;
inline constexpr size_t kMaximumStationsInFile = 1000;

enum class StationFileProblem {
    kTooLarge,
    kUtf16,  // a UTF-16 byte-order mark: the file must be saved as UTF-8
    kInvalidUtf8,
    kControlCharacter,
    kNoStations,
    kTooManyStations,
    kBadLine,     // neither a section, a "Key = value" line, a comment nor blank
    kBadSection,  // "[" without a closing "]"
    kValueOutsideSection,
    kEmptySection,  // a section with no values: most likely a file cut short
    kDuplicateSection,
    kUnknownKey,
    kDuplicateKey,
    kBadText,  // a quoted text that is not closed, or an unknown escape
    kNotANumber,
    kNumberTooLarge,  // beyond 32 bits
    kRefusedValue,    // outside what the field may hold
};

struct StationFileError {
    StationFileProblem problem;
    size_t line = 0;    // 1-based; 0 for the file as a whole
    WideString field;   // the registry value name; for a key that is none, the key as written
    WideString reason;  // English, for a person
};

// "line 12, BaudRate: 28800 is not one of ..."; "the file is ..." when the file as a whole is
// meant.
WideString DescribeStationFileError(const StationFileError& error);

// A port the computer does not list: accepted, since COM numbers differ between computers.
struct StationFileWarning {
    size_t line = 0;
    WideString station;
    WideString port;
};

struct StationFileRules {
    // The known model texts; the first is the default of a station that names none.
    std::vector<WideString> modelTexts;
    // The computer's serial ports; a station on another port gets a warning.
    std::vector<WideString> ports;
};

struct StationFileEntry {
    Station station;
    size_t line = 0;  // of its "[name]"
};

struct StationFileContents {
    std::vector<StationFileEntry> stations;  // in file order, every one checked
    std::vector<StationFileWarning> warnings;
    std::optional<StationFileError> error;  // set: the file is refused and stations is empty
};

// Reads and checks the whole file. Keys missing from a section take the store's defaults (Port
// COM1, BaudRate 9600, StopBits 0, Parity 2, DataBits 7, Model the first model text, Protocol 1,
// Flow 0, CheckSum 1, empty Manufacturer and Software).
StationFileContents ReadStationFile(const uint8_t* bytes, size_t size,
                                    const StationFileRules& rules);

// One station as a station key holds it; the values the key lacks are left out of the file.
struct StationFileSection {
    Station station;
    std::vector<StationField> missing;
};

// The file of these stations: a comment that says what it is, then one section each, every value
// it has in the store's order, numbers in decimal. CR LF line ends, no byte-order mark.
std::string WriteStationFile(const std::vector<StationFileSection>& sections);
