// The station fields' table and the one rule for the values a station may hold.
#include "stations/portable/station_fields.h"

#include <algorithm>
#include <array>

#include "stations/portable/station_file_text.h"
#include "stations/portable/station_names.h"

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

struct NumberRange {
    uint32_t lowest;
    uint32_t highest;
    const char* what;
};

std::optional<NumberRange> RangeOf(StationField field) {
    switch (field) {
        case StationField::kParity:
            return NumberRange{0, 2, "0 (none), 1 (odd) or 2 (even)"};
        case StationField::kStopBits:
            return NumberRange{0, 2, "0 (one stop bit), 1 (one and a half) or 2 (two)"};
        case StationField::kDataBits:
            return NumberRange{5, 8, "from 5 to 8"};
        case StationField::kProtocol:
            return NumberRange{0, 3, "from 0 to 3"};
        case StationField::kFlow:
            return NumberRange{0, 2, "from 0 to 2"};
        case StationField::kCheckSum:
            return NumberRange{0, 1, "0 (off) or 1 (on)"};
        default:
            return std::nullopt;
    }
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

std::optional<WideString> RefusedNumber(StationField field, uint32_t value) {
    if (field == StationField::kBaudRate) {
        if (std::find(std::begin(kBaudRates), std::end(kBaudRates), value) != std::end(kBaudRates))
            return std::nullopt;
        WideString rates;
        for (uint32_t rate : kBaudRates)
            rates += (rates.empty() ? WideString() : AsciiWide(", ")) + DecimalWide(rate);
        return DecimalWide(value) + AsciiWide(" is not one of the baud rates ") + rates;
    }
    const std::optional<NumberRange> range = RangeOf(field);
    if (!range || (value >= range->lowest && value <= range->highest))
        return std::nullopt;
    return DecimalWide(value) + AsciiWide(" is not allowed here: ") + AsciiWide(range->what);
}

std::optional<WideString> RefusedText(StationField field, WideStringView text,
                                      std::span<const WideString> modelTexts) {
    if (text.size() > kMaximumStationTextLength) {
        return AsciiWide("longer than ") + DecimalWide(kMaximumStationTextLength) +
               AsciiWide(" characters");
    }
    if (text.find(WideChar(0)) != WideStringView::npos)
        return AsciiWide("holds a NUL character");
    if (field == StationField::kName && !IsValidStationName(text)) {
        return text.empty() ? AsciiWide("a station needs a name")
                            : AsciiWide("a name may not hold \\ / \" or *");
    }
    if (field == StationField::kModel &&
        std::find(modelTexts.begin(), modelTexts.end(), text) == modelTexts.end()) {
        WideString known;
        for (const WideString& model : modelTexts)
            known +=
                (known.empty() ? AsciiWide("\"") : AsciiWide(", \"")) + model + AsciiWide("\"");
        return AsciiWide("\"") + WideString(text) +
               AsciiWide("\" is not a model; the models are ") + known;
    }
    return std::nullopt;
}

std::optional<StationFieldRefusal> RefusedStation(const Station& station,
                                                  std::span<const WideString> modelTexts) {
    for (const StationFieldInfo& info : kFields) {
        std::optional<WideString> reason =
            info.number ? RefusedNumber(info.field, station.*info.number)
                        : RefusedText(info.field, station.*info.text, modelTexts);
        if (reason)
            return StationFieldRefusal{info.field, std::move(*reason)};
    }
    return std::nullopt;
}
