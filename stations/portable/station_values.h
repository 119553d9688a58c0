// Reading one station's twelve values from its key, in the store's fixed order, over a source of
// raw values: the registry in the module, a table in tests and the fuzzer.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

#include "stations/portable/registry_data.h"
#include "stations/portable/station.h"

// Texts are read with a buffer of 520 bytes, terminator included: names of up to 259 units.
inline constexpr size_t kStationTextValueBytes = 520;

// One open station key, as far as reading goes.
class StationValueSource {
public:
    virtual ~StationValueSource() = default;

    // The value's type and at most capacity bytes of it. A value larger than capacity is kTooLong
    // and hands over no bytes, as the registry refuses a read into a buffer too small.
    [[nodiscard]] virtual ValueReadStatus ReadValue(const WideChar* name, size_t capacity,
                                                    RegistryValueType& type,
                                                    std::vector<uint8_t>& data) = 0;
};

// What a station's values are checked against while they are read.
struct StationReadRules {
    // The computer's serial ports, asked for once, after the port is read.
    std::function<std::vector<WideString>()> listSerialPorts;
    // The three model texts as the string table has them now.
    WideString firstModel;
    WideString lv20Model;
    WideString lv30Model;
};

// Reads Name, Port, StopBits, BaudRate, Parity (twice, as the store always has), DataBits,
// Manufacturer, Model, Software, Protocol, Flow and CheckSum, stopping at the first read that
// fails and returning its status; Protocol and Flow may fail (keys written before they existed),
// and CheckSum's status is the result. Fields not reached keep what the record held. A port the
// computer's list lacks becomes the list's port when it holds exactly one (none or several leave
// it); a model other than
// the second and third becomes the first.
[[nodiscard]] ValueReadStatus ReadStationValues(Station& station, StationValueSource& source,
                                                const StationReadRules& rules);
