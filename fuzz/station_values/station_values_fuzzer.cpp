// Reads a station from a key another program wrote: any values, of any type and length, some
// refused, and any serial-port list. The reads must follow the store's order and stop where the
// first one fails; no field may change unless its value was read, and every text must come from
// inside its value's bytes.
// Input: records of [selector][type][16-bit length][bytes]. The selector's low nibble names the
// value (0-11 the station's, 12 a serial port of the list, 13-15 a stranger), its high bits
// a refusal of the read.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "stations/portable/serial_port_list.h"
#include "stations/portable/station_values.h"
#include "support/portable/byte_io.h"
#include "tests/portable/station_value_table.h"

namespace {

const WideChar* const kValueNames[] = {
    WIDE_TEXT("Name"),     WIDE_TEXT("Port"),     WIDE_TEXT("BaudRate"),     WIDE_TEXT("StopBits"),
    WIDE_TEXT("Parity"),   WIDE_TEXT("DataBits"), WIDE_TEXT("Manufacturer"), WIDE_TEXT("Model"),
    WIDE_TEXT("Software"), WIDE_TEXT("Protocol"), WIDE_TEXT("Flow"),         WIDE_TEXT("CheckSum")};
constexpr size_t kPortSelector = 12;

// Written out here rather than taken from the reader: the order the store has always read in.
const WideChar* const kReadOrder[] = {
    WIDE_TEXT("Name"),    WIDE_TEXT("Port"),     WIDE_TEXT("StopBits"), WIDE_TEXT("BaudRate"),
    WIDE_TEXT("Parity"),  WIDE_TEXT("Parity"),   WIDE_TEXT("DataBits"), WIDE_TEXT("Manufacturer"),
    WIDE_TEXT("Model"),   WIDE_TEXT("Software"), WIDE_TEXT("Protocol"), WIDE_TEXT("Flow"),
    WIDE_TEXT("CheckSum")};
constexpr size_t kReadCount = sizeof(kReadOrder) / sizeof(kReadOrder[0]);

const WideString kModels[] = {WIDE_TEXT("Quorvel LV-10"), WIDE_TEXT("Quorvel LV-20"),
                              WIDE_TEXT("Quorvel LV-30")};

struct StoredValue {
    RegistryValueType type = RegistryValueType::kNone;
    std::vector<uint8_t> data;
    bool refused = false;
};

// A record no read can produce by chance, so that a field that was not read is seen.
Station Prior() {
    Station station;
    station.Name = WIDE_TEXT("prior\x01name");
    station.Port = WIDE_TEXT("prior\x01port");
    station.Manufacturer = WIDE_TEXT("prior\x01maker");
    station.Model = WIDE_TEXT("prior\x01model");
    station.Software = WIDE_TEXT("prior\x01software");
    station.BaudRate = 0xB0B0B0B1;
    station.StopBits = 0xB0B0B0B2;
    station.Parity = 0xB0B0B0B3;
    station.DataBits = 0xB0B0B0B4;
    station.Protocol = 0xB0B0B0B5;
    station.Flow = 0xB0B0B0B6;
    station.CheckSum = 0xB0B0B0B7;
    return station;
}

bool WasAsked(const std::vector<WideString>& asked, WideStringView name) {
    return std::find(asked.begin(), asked.end(), name) != asked.end();
}

// A text field is the prior one when its value was not read, else a text from inside its bytes:
// at most 260 units, no NUL.
void CheckText(const WideString& now, const WideString& prior, bool asked) {
    if (!asked && now != prior)
        abort();
    if (now != prior && (now.size() > 260 || now.find(WideChar(0)) != WideString::npos))
        abort();
}

// A number changes only by being read, and then to its value's four bytes.
void CheckNumber(uint32_t now, uint32_t prior, bool asked, const StoredValue* stored) {
    if (now == prior)
        return;
    if (!asked || !stored || stored->refused || stored->type != RegistryValueType::kNumber ||
        stored->data.size() != 4 || ReadU32(stored->data.data()) != now)
        abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    StationValueTable key;
    StoredValue stored[std::size(kValueNames)];
    bool present[std::size(kValueNames)] = {};
    std::vector<WideString> ports;
    size_t offset = 0;
    while (size - offset >= 4) {
        const uint8_t selector = data[offset];
        const auto type = static_cast<RegistryValueType>(data[offset + 1]);
        const size_t length = std::min<size_t>(ReadU16(data + offset + 2), size - offset - 4);
        const uint8_t* bytes = data + offset + 4;
        offset += 4 + length;
        const size_t which = selector & 0x0F;
        if (which == kPortSelector) {
            // As the list has them: at most the enumeration's 128 bytes.
            ports.push_back(TextInValueData({bytes, std::min(length, kSerialCommDataCapacity)}));
            continue;
        }
        const WideChar* name =
            which < std::size(kValueNames) ? kValueNames[which] : WIDE_TEXT("Stranger");
        key.Set(name, type, std::vector<uint8_t>(bytes, bytes + length));
        const bool refused = (selector & 0x80) != 0;
        if (refused)
            key.Refuse(name,
                       (selector & 0x40) ? ValueReadStatus::kFailed : ValueReadStatus::kMissing);
        if (which < std::size(kValueNames)) {
            stored[which] = {type, std::vector<uint8_t>(bytes, bytes + length), refused};
            present[which] = true;
        }
    }

    size_t portListsAsked = 0;
    const StationReadRules rules{[&] {
                                     ++portListsAsked;
                                     return ports;
                                 },
                                 kModels[0], kModels[1], kModels[2]};
    const Station prior = Prior();
    Station station = prior;
    const ValueReadStatus status = ReadStationValues(station, key, rules);

    // The reads made are the store's order up to where it stopped: the end, or a read that
    // failed other than Protocol's and Flow's.
    const std::vector<WideString>& asked = key.Asked();
    if (asked.empty() || asked.size() > kReadCount)
        abort();
    for (size_t index = 0; index < asked.size(); ++index)
        if (asked[index] != kReadOrder[index])
            abort();
    // A read that stopped early failed; CheckSum, the last, may fail too.
    if (status == ValueReadStatus::kRead && asked.size() != kReadCount)
        abort();
    if (status != ValueReadStatus::kRead &&
        (asked.back() == WIDE_TEXT("Protocol") || asked.back() == WIDE_TEXT("Flow")))
        abort();
    // The port list is asked for once, as soon as the port is read; not when the read stops there.
    if (portListsAsked != (asked.size() > 2 ? 1u : 0u))
        abort();

    auto storedOf = [&](size_t which) { return present[which] ? &stored[which] : nullptr; };
    CheckText(station.Name, prior.Name, WasAsked(asked, WIDE_TEXT("Name")));
    CheckText(station.Manufacturer, prior.Manufacturer, WasAsked(asked, WIDE_TEXT("Manufacturer")));
    CheckText(station.Software, prior.Software, WasAsked(asked, WIDE_TEXT("Software")));
    CheckText(station.Port, prior.Port, WasAsked(asked, WIDE_TEXT("Port")));
    if (station.Port != prior.Port && !ports.empty() &&
        std::find(ports.begin(), ports.end(), station.Port) == ports.end())
        abort();
    if (station.Model != prior.Model &&
        std::find(std::begin(kModels), std::end(kModels), station.Model) == std::end(kModels))
        abort();
    if (station.Model != prior.Model && !WasAsked(asked, WIDE_TEXT("Model")))
        abort();
    CheckNumber(station.BaudRate, prior.BaudRate, WasAsked(asked, WIDE_TEXT("BaudRate")),
                storedOf(2));
    CheckNumber(station.StopBits, prior.StopBits, WasAsked(asked, WIDE_TEXT("StopBits")),
                storedOf(3));
    CheckNumber(station.Parity, prior.Parity, WasAsked(asked, WIDE_TEXT("Parity")), storedOf(4));
    CheckNumber(station.DataBits, prior.DataBits, WasAsked(asked, WIDE_TEXT("DataBits")),
                storedOf(5));
    CheckNumber(station.Protocol, prior.Protocol, WasAsked(asked, WIDE_TEXT("Protocol")),
                storedOf(9));
    CheckNumber(station.Flow, prior.Flow, WasAsked(asked, WIDE_TEXT("Flow")), storedOf(10));
    CheckNumber(station.CheckSum, prior.CheckSum, WasAsked(asked, WIDE_TEXT("CheckSum")),
                storedOf(11));
    return 0;
}
