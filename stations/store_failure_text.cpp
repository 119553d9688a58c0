// The store's failures in the user's words: the system's text and the bounded list of names.
#include "stations/store_failure_text.h"

#include "res/resource.h"
#include "stations/portable/station_name_list.h"
#include "support/module_instance.h"
#include "support/text_lookup.h"

std::wstring StationsNotChangedText(UINT textId, std::span<const std::wstring> names,
                                    HRESULT result) {
    const std::wstring list = StationNamesForMessage(names, LoadUiText(IDS_MORE_STATIONS));
    return FillTextArguments(LoadUiText(textId), {list, SystemResultText(result)});
}
