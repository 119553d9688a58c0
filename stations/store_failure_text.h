// The text that tells a user the station store refused a change: the stations left unchanged
// and the system's words for why.
#pragma once

#include <windows.h>

#include <span>
#include <string>

// The string-table text textId with the bounded list of names (StationNamesForMessage) in place
// of its first %s and the system's description of result in place of its second.
std::wstring StationsNotChangedText(UINT textId, std::span<const std::wstring> names,
                                    HRESULT result);
