// Flat station records: Name, Port, BaudRate, StopBits, Parity, DataBits, Manufacturer, Model,
// Software, Protocol, Flow, CheckSum. The number order differs from the record's declared order;
// other programs read this layout, so it stays as it is.
#include "stations/portable/station_list_format.h"

#include "support/portable/byte_io.h"

namespace {

class RecordReader {
public:
    RecordReader(const uint8_t* bytes, size_t size) : bytes_(bytes), size_(size) {}

    bool Text(WideString& text) {
        size_t consumed = 0;
        if (!ReadWideZ(bytes_ + offset_, size_ - offset_, text, consumed))
            return false;
        offset_ += consumed;
        return true;
    }

    bool Number(uint32_t& value) {
        if (size_ - offset_ < 4)
            return false;
        value = ReadU32(bytes_ + offset_);
        offset_ += 4;
        return true;
    }

private:
    const uint8_t* bytes_;
    size_t size_;
    size_t offset_ = 0;
};

bool DecodeFlatRecord(const uint8_t* bytes, size_t size, Station& station) {
    RecordReader reader(bytes, size);
    return reader.Text(station.Name) && reader.Text(station.Port) &&
           reader.Number(station.BaudRate) && reader.Number(station.StopBits) &&
           reader.Number(station.Parity) && reader.Number(station.DataBits) &&
           reader.Text(station.Manufacturer) && reader.Text(station.Model) &&
           reader.Text(station.Software) && reader.Number(station.Protocol) &&
           reader.Number(station.Flow) && reader.Number(station.CheckSum);
}

}  // namespace

size_t FlatStationRecordSize(const Station& station) noexcept {
    const size_t characters = station.Name.size() + station.Port.size() +
                              station.Manufacturer.size() + station.Model.size() +
                              station.Software.size();
    return 2 * (characters + 5) + 28;
}

std::vector<uint8_t> SerializeStationRecords(const std::vector<Station>& stations) {
    size_t total = 4;
    for (const Station& station : stations)
        total += 4 + FlatStationRecordSize(station);

    std::vector<uint8_t> block;
    block.reserve(total);
    AppendU32(block, static_cast<uint32_t>(stations.size()));
    for (const Station& station : stations) {
        AppendU32(block, static_cast<uint32_t>(FlatStationRecordSize(station)));
        AppendWideZ(block, station.Name);
        AppendWideZ(block, station.Port);
        AppendU32(block, station.BaudRate);
        AppendU32(block, station.StopBits);
        AppendU32(block, station.Parity);
        AppendU32(block, station.DataBits);
        AppendWideZ(block, station.Manufacturer);
        AppendWideZ(block, station.Model);
        AppendWideZ(block, station.Software);
        AppendU32(block, station.Protocol);
        AppendU32(block, station.Flow);
        AppendU32(block, station.CheckSum);
    }
    return block;
}

std::vector<Station> ParseStationRecords(const uint8_t* block, size_t blockSize) {
    std::vector<Station> stations;
    if (!block || blockSize < 4)
        return stations;
    const int32_t count = static_cast<int32_t>(ReadU32(block));
    size_t offset = 4;
    for (int32_t index = 0; index < count; ++index) {
        if (blockSize - offset < 4)
            break;
        const size_t recordSize = ReadU32(block + offset);
        offset += 4;
        if (recordSize > blockSize - offset)
            break;
        Station station;
        if (!DecodeFlatRecord(block + offset, recordSize, station))
            break;
        stations.push_back(std::move(station));
        offset += recordSize;
    }
    return stations;
}
