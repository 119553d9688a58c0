// The texts that tell a user the station store refused a change: the system's words for the
// store's HRESULT, and a message naming the stations left unchanged.
#pragma once

#include <windows.h>

#include <span>
#include <string>

// The system's description of a store failure; its hexadecimal form when the system has none.
std::wstring StoreFailureText(HRESULT result);

// The string-table text textId with the bounded list of names (StationNamesForMessage) in place
// of its first %s and the system's description of result in place of its second.
std::wstring StationsNotChangedText(UINT textId, std::span<const std::wstring> names,
                                    HRESULT result);
