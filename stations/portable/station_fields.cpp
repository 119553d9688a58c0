// The station fields' table and the one rule for the values a station may hold.
#include "stations/portable/station_fields.h"

#include <algorithm>
#include <array>

#include "stations/portable/station_file_text.h"
#include "stations/portable/station_names.h"
#include "support/portable/text_format.h"

namespace {

constexpr std::array<StationFieldInfo, kStationFieldCount> kFields = {{
    {StationField::kName, WIDE_TEXT("Name"), &Station::Name, nullptr},
    {StationField::kPort, WIDE_TEXT("Port"), &Station::Port, nullptr},
    {StationField::kBaudRate, WIDE_TEXT("BaudRate"), nullptr, &Station::BaudRate},
    {StationField::kStopBits, WIDE_TEXT("StopBits"), nullptr, &Station::StopBits},
    {StationField::kParity, WIDE_TEXT("Parity"), nullptr, &Station::Parity},
    {StationField::kDataBits, WIDE_TEXT("DataBits"), nullptr, &Station::DataBits},
    {StationField::kManufacturer, WIDE_TEXT("Manufacturer"), &Station::Manufacturer, nullptr},
    {StationField::kModel, WIDE_TEXT("Model"), &Station::Model, nullptr},
    {StationField::kSoftware, WIDE_TEXT("Software"), &Station::Software, nullptr},
    {StationField::kProtocol, WIDE_TEXT("Protocol"), nullptr, &Station::Protocol},
    {StationField::kFlow, WIDE_TEXT("Flow"), nullptr, &Station::Flow},
    {StationField::kCheckSum, WIDE_TEXT("CheckSum"), nullptr, &Station::CheckSum},
}};

constexpr uint32_t kBaudRates[] = {300,  600,   1200,  2400,  4800,  9600,
                                   14400, 19200, 38400, 57600, 115200};
// The first six, which the sheet always lists.
constexpr size_t kSheetBaudRateCount = 6;

// The formats of every refusal. Each is the English key of its translation: changing one's words
// means changing its translation's too.
constexpr WideStringView kBaudRateFormat = WIDE_TEXT("%s is not one of the baud rates %s");
constexpr WideStringView kParityFormat =
    WIDE_TEXT("%s is not allowed here: 0 (none), 1 (odd) or 2 (even)");
constexpr WideStringView kStopBitsFormat =
    WIDE_TEXT("%s is not allowed here: 0 (one stop bit), 1 (one and a half) or 2 (two)");
constexpr WideStringView kDataBitsFormat = WIDE_TEXT("%s is not allowed here: from 5 to 8");
constexpr WideStringView kProtocolFormat = WIDE_TEXT("%s is not allowed here: from 0 to 3");
constexpr WideStringView kFlowFormat = WIDE_TEXT("%s is not allowed here: from 0 to 2");
constexpr WideStringView kCheckSumFormat = WIDE_TEXT("%s is not allowed here: 0 (off) or 1 (on)");
constexpr WideStringView kTooLongFormat = WIDE_TEXT("longer than %s characters");
constexpr WideStringView kNulFormat = WIDE_TEXT("holds a NUL character");
constexpr WideStringView kNoNameFormat = WIDE_TEXT("a station needs a name");
constexpr WideStringView kNameCharactersFormat = WIDE_TEXT("a name may not hold \\ / \" or *");
constexpr WideStringView kModelFormat = WIDE_TEXT("\"%s\" is not a model; the models are %s");

constexpr WideStringView kFormats[] = {
    kBaudRateFormat, kParityFormat,  kStopBitsFormat, kDataBitsFormat,      kProtocolFormat,
    kFlowFormat,     kCheckSumFormat, kTooLongFormat,  kNulFormat,           kNoNameFormat,
    kNameCharactersFormat, kModelFormat};

struct NumberRange {
    uint32_t lowest;
    uint32_t highest;
    WideStringView format;
};

std::optional<NumberRange> RangeOf(StationField field) {
    switch (field) {
        case StationField::kParity:
            return NumberRange{0, 2, kParityFormat};
        case StationField::kStopBits:
            return NumberRange{0, 2, kStopBitsFormat};
        case StationField::kDataBits:
            return NumberRange{5, 8, kDataBitsFormat};
        case StationField::kProtocol:
            return NumberRange{0, 3, kProtocolFormat};
        case StationField::kFlow:
            return NumberRange{0, 2, kFlowFormat};
        case StationField::kCheckSum:
            return NumberRange{0, 1, kCheckSumFormat};
        default:
            return std::nullopt;
    }
}

RefusalReason Reason(WideStringView format, std::vector<WideString> arguments = {}) {
    return {WideString(format), std::move(arguments)};
}

char AsciiLower(WideChar c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : static_cast<char>(c);
}

bool EqualIgnoringAsciiCase(WideStringView a, WideStringView b) {
    return a.size() == b.size() &&
           std::equal(a.begin(), a.end(), b.begin(), [](WideChar x, WideChar y) {
               return x == y || (x < 0x80 && y < 0x80 && AsciiLower(x) == AsciiLower(y));
           });
}

}  // namespace

std::span<const StationFieldInfo> StationFields() noexcept {
    return kFields;
}

const StationFieldInfo& StationFieldOf(StationField field) noexcept {
    return kFields[static_cast<size_t>(field)];
}

std::optional<StationField> StationFieldNamed(WideStringView valueName) noexcept {
    for (const StationFieldInfo& info : kFields) {
        if (EqualIgnoringAsciiCase(valueName, info.valueName))
            return info.field;
    }
    return std::nullopt;
}

std::span<const uint32_t> StationBaudRates() noexcept {
    return kBaudRates;
}

std::span<const uint32_t> SheetBaudRates() noexcept {
    return std::span<const uint32_t>(kBaudRates).first(kSheetBaudRateCount);
}

WideString RefusalReason::Text() const {
    const std::vector<WideStringView> views(arguments.begin(), arguments.end());
    return FormatText(format, views);
}

std::optional<RefusalReason> RefusedNumberReason(StationField field, uint32_t value) {
    if (field == StationField::kBaudRate) {
        if (std::find(std::begin(kBaudRates), std::end(kBaudRates), value) != std::end(kBaudRates))
            return std::nullopt;
        WideString rates;
        for (uint32_t rate : kBaudRates)
            rates += (rates.empty() ? WideString() : AsciiWide(", ")) + DecimalWide(rate);
        return Reason(kBaudRateFormat, {DecimalWide(value), rates});
    }
    const std::optional<NumberRange> range = RangeOf(field);
    if (!range || (value >= range->lowest && value <= range->highest))
        return std::nullopt;
    return Reason(range->format, {DecimalWide(value)});
}

std::optional<RefusalReason> RefusedTextReason(StationField field, WideStringView text,
                                               std::span<const WideString> modelTexts) {
    if (text.size() > kMaximumStationTextLength)
        return Reason(kTooLongFormat, {DecimalWide(kMaximumStationTextLength)});
    if (text.find(WideChar(0)) != WideStringView::npos)
        return Reason(kNulFormat);
    if (field == StationField::kName && !IsValidStationName(text))
        return Reason(text.empty() ? kNoNameFormat : kNameCharactersFormat);
    if (field == StationField::kModel &&
        std::find(modelTexts.begin(), modelTexts.end(), text) == modelTexts.end()) {
        WideString known;
        for (const WideString& model : modelTexts)
            known +=
                (known.empty() ? AsciiWide("\"") : AsciiWide(", \"")) + model + AsciiWide("\"");
        return Reason(kModelFormat, {WideString(text), known});
    }
    return std::nullopt;
}

std::optional<WideString> RefusedNumber(StationField field, uint32_t value) {
    const std::optional<RefusalReason> reason = RefusedNumberReason(field, value);
    return reason ? std::optional(reason->Text()) : std::nullopt;
}

std::optional<WideString> RefusedText(StationField field, WideStringView text,
                                      std::span<const WideString> modelTexts) {
    const std::optional<RefusalReason> reason = RefusedTextReason(field, text, modelTexts);
    return reason ? std::optional(reason->Text()) : std::nullopt;
}

std::span<const WideStringView> RefusalFormats() noexcept {
    return kFormats;
}

std::optional<StationFieldRefusal> RefusedStation(const Station& station,
                                                  std::span<const WideString> modelTexts) {
    for (const StationFieldInfo& info : kFields) {
        std::optional<RefusalReason> reason =
            info.number ? RefusedNumberReason(info.field, station.*info.number)
                        : RefusedTextReason(info.field, station.*info.text, modelTexts);
        if (reason)
            return StationFieldRefusal{info.field, std::move(*reason)};
    }
    return std::nullopt;
}
