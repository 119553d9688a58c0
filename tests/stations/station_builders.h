// Stations for tests that run over a scratch store: records with a name and a model from the
// string table, stations added to the store, and station keys written as another program would.
#pragma once

#include <windows.h>

#include <gtest/gtest.h>

#include <string>

#include "res/resource.h"
#include "stations/station_store.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"

// The defaults with this name and the current text of the model.
inline Station Named(const std::wstring& name, UINT modelId = IDS_MODEL_LV10) {
    Station station = DefaultStation();
    station.Name = name;
    station.Model = LoadUiText(modelId);
    return station;
}

inline void AddStationOfModel(const std::wstring& name, UINT modelId = IDS_MODEL_LV10) {
    ASSERT_EQ(S_OK, AddStation(Named(name, modelId)));
}

// The station subkey of this name, created when it is missing.
inline UniqueRegKey StationKey(const std::wstring& subkey) {
    UniqueRegKey key;
    EXPECT_EQ(ERROR_SUCCESS,
              ::RegCreateKeyExW(HKEY_CURRENT_USER, (StationsKeyPath() + L"\\" + subkey).c_str(), 0,
                                nullptr, 0, KEY_ALL_ACCESS, nullptr, key.put(), nullptr));
    return key;
}
