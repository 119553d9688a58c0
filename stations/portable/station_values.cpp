// One station's values read in the store's order, each read bounded by its buffer.
#include "stations/portable/station_values.h"

#include "stations/portable/model_rules.h"

namespace {

[[nodiscard]] ValueReadStatus ReadText(StationValueSource& source, const WideChar* name,
                                       WideString& field) {
    RegistryValueType type = RegistryValueType::kNone;
    std::vector<uint8_t> data;
    const ValueReadStatus status = source.ReadValue(name, kStationTextValueBytes, type, data);
    if (status != ValueReadStatus::kRead)
        return status;
    return DecodeTextValue(type, data, kStationTextValueBytes, field);
}

[[nodiscard]] ValueReadStatus ReadNumber(StationValueSource& source, const WideChar* name,
                                         uint32_t& field) {
    RegistryValueType type = RegistryValueType::kNone;
    std::vector<uint8_t> data;
    const ValueReadStatus status = source.ReadValue(name, kNumberValueBytes, type, data);
    if (status != ValueReadStatus::kRead)
        return status;
    return DecodeNumberValue(type, data, field);
}

}  // namespace

ValueReadStatus ReadStationValues(Station& station, StationValueSource& source,
                                  const StationReadRules& rules) {
    ValueReadStatus status = ReadText(source, WIDE_TEXT("Name"), station.Name);
    if (status != ValueReadStatus::kRead)
        return status;

    status = ReadText(source, WIDE_TEXT("Port"), station.Port);
    if (status != ValueReadStatus::kRead)
        return status;
    // A port the computer no longer has becomes its only one: a USB adapter that came back
    // under another number. With several present, any one of them is a guess (another
    // instrument, or a wait on the wrong device), and with none there is nothing to take: the
    // stored port stays, and opening it names the ports present.
    const std::vector<WideString> ports =
        rules.listSerialPorts ? rules.listSerialPorts() : std::vector<WideString>();
    if (ports.size() == 1 && ports.front() != station.Port)
        station.Port = ports.front();

    // Parity twice: the store has always read it so, and the second read is harmless.
    const struct {
        const WideChar* name;
        uint32_t Station::*field;
    } numbers[] = {
        {WIDE_TEXT("StopBits"), &Station::StopBits}, {WIDE_TEXT("BaudRate"), &Station::BaudRate},
        {WIDE_TEXT("Parity"), &Station::Parity},     {WIDE_TEXT("Parity"), &Station::Parity},
        {WIDE_TEXT("DataBits"), &Station::DataBits},
    };
    for (const auto& number : numbers) {
        status = ReadNumber(source, number.name, station.*number.field);
        if (status != ValueReadStatus::kRead)
            return status;
    }

    status = ReadText(source, WIDE_TEXT("Manufacturer"), station.Manufacturer);
    if (status != ValueReadStatus::kRead)
        return status;

    status = ReadText(source, WIDE_TEXT("Model"), station.Model);
    if (status != ValueReadStatus::kRead)
        return status;
    // Any unknown or empty model silently becomes the first.
    if (ClassifyModel(station.Model, rules.lv20Model, rules.lv30Model) == ModelKind::kBuiltInDriver)
        station.Model = rules.firstModel;

    status = ReadText(source, WIDE_TEXT("Software"), station.Software);
    if (status != ValueReadStatus::kRead)
        return status;

    // Protocol and Flow came later than the other values; keys written before them still load.
    (void)ReadNumber(source, WIDE_TEXT("Protocol"), station.Protocol);
    (void)ReadNumber(source, WIDE_TEXT("Flow"), station.Flow);
    return ReadNumber(source, WIDE_TEXT("CheckSum"), station.CheckSum);
}
