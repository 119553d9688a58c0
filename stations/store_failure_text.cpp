// The store's failures in the user's words: the system's text and the bounded list of names.
#include "stations/store_failure_text.h"

#include <cwchar>

#include "res/resource.h"
#include "stations/portable/station_name_list.h"
#include "support/module_instance.h"
#include "support/text_lookup.h"

std::wstring StoreFailureText(HRESULT result) {
    std::wstring text = SystemMessageText(static_cast<DWORD>(result));
    // Some systems keep the registry's texts under the bare Win32 code only.
    if (text.empty() && HRESULT_FACILITY(result) == FACILITY_WIN32)
        text = SystemMessageText(HRESULT_CODE(result));
    if (text.empty()) {
        wchar_t number[16] = {};
        swprintf(number, ARRAYSIZE(number), L"0x%08X", static_cast<unsigned>(result));
        text = number;
    }
    return text;
}

std::wstring StationsNotChangedText(UINT textId, std::span<const std::wstring> names,
                                    HRESULT result) {
    const std::wstring list = StationNamesForMessage(names, LoadUiText(IDS_MORE_STATIONS));
    return FillTextArguments(LoadUiText(textId), {list, StoreFailureText(result)});
}
