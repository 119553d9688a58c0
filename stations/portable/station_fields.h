// The twelve fields of a station by their registry value names, and the values each may take.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "stations/portable/station.h"

// In the order in which the store writes a station's values.
enum class StationField : uint8_t {
    kName,
    kPort,
    kBaudRate,
    kStopBits,
    kParity,
    kDataBits,
    kManufacturer,
    kModel,
    kSoftware,
    kProtocol,
    kFlow,
    kCheckSum,
};

inline constexpr size_t kStationFieldCount = 12;

// The store reads every text with a buffer of 520 bytes, terminator included: a longer text would
// be written but could never be read back (a longer name is a station nobody finds).
inline constexpr size_t kMaximumStationTextLength = 259;

struct StationFieldInfo {
    StationField field;
    const WideChar* valueName;  // the registry value's name, e.g. "BaudRate"
    WideString Station::*text;  // set for the five texts
    uint32_t Station::*number;  // set for the seven numbers (REG_DWORD)
};

// All twelve, in the store's write order.
std::span<const StationFieldInfo> StationFields() noexcept;

const StationFieldInfo& StationFieldOf(StationField field) noexcept;

// The field whose value name this is, compared without regard to ASCII letter case, as the
// registry compares value names.
std::optional<StationField> StationFieldNamed(WideStringView valueName) noexcept;

// The standard baud rates from 300 to 115200, which a station may hold, in ascending order.
std::span<const uint32_t> StationBaudRates() noexcept;

// The rates the station sheet always lists (300 to 9600); it adds a station's own standard rate.
std::span<const uint32_t> SheetBaudRates() noexcept;

// Why a value is refused, in words a program can translate: an English format of a fixed set
// (the key of its translation), "%s" standing for each argument in turn.
struct RefusalReason {
    WideString format;
    std::vector<WideString> arguments;

    // The format with its arguments filled in.
    [[nodiscard]] WideString Text() const;
};

// Why a number is refused, or nullopt when the field may hold it: a baud rate of
// StationBaudRates, the three parities, and for the fields the sheet does not show the codes their
// consumers know: stop bits 0 to 2 (one, one and a half, two), data bits 5 to 8, protocol
// selectors 0 to 3, flow selectors 0 to 2, block checksums 0 or 1.
std::optional<RefusalReason> RefusedNumberReason(StationField field, uint32_t value);

// Why a text is refused, or nullopt. Every text is at most kMaximumStationTextLength units and
// holds no NUL (the store's texts end at the first one). A name follows IsValidStationName; a
// model is one of modelTexts (exact comparison). Ports are any text: whether this computer has
// the port is a warning for the caller, since COM numbers differ between computers.
std::optional<RefusalReason> RefusedTextReason(StationField field, WideStringView text,
                                               std::span<const WideString> modelTexts);

// The same reasons in English, for the tools and the station file's messages.
std::optional<WideString> RefusedNumber(StationField field, uint32_t value);
std::optional<WideString> RefusedText(StationField field, WideStringView text,
                                      std::span<const WideString> modelTexts);

// Every format a reason may have, for the translations' completeness.
std::span<const WideStringView> RefusalFormats() noexcept;

struct StationFieldRefusal {
    StationField field;
    RefusalReason reason;
};

// The one check of a whole station, field by field in the store's order, that the sheet, adding
// from the command line and the station file share: the first field refused, or nullopt.
std::optional<StationFieldRefusal> RefusedStation(const Station& station,
                                                  std::span<const WideString> modelTexts);
