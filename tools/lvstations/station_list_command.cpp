// "lvstations list" over one walk of the store.
#include "tools/lvstations/station_list_command.h"

#include <string>
#include <vector>

#include "res/resource.h"
#include "stations/station_store.h"
#include "support/text_lookup.h"
#include "tools/lvstations/portable/printable_text.h"

namespace {

std::wstring ParityName(uint32_t parity) {
    return LoadUiText(parity == 0   ? IDS_PARITY_NONE
                      : parity == 1 ? IDS_PARITY_ODD
                                    : IDS_PARITY_EVEN);
}

}  // namespace

int ListStationsCommand(const PrintLine& print) {
    const std::vector<Station> stations = ListStations();
    if (stations.empty())
        print(L"No stations.");
    const std::wstring parities[] = {PrintableText(ParityName(0)), PrintableText(ParityName(1)),
                                     PrintableText(ParityName(2))};
    for (const Station& station : stations) {
        print(PrintableText(station.Name));
        print(L"    " + PrintableText(station.Port) + L", " + std::to_wstring(station.BaudRate) +
              L" baud, " + std::to_wstring(station.DataBits) + L" data bits, parity " +
              parities[station.Parity < 2 ? station.Parity : 2] + L", " +
              PrintableText(station.Model));
    }
    return 0;
}
