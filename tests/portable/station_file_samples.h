// Shared by the station file's tests: the rules of a computer with COM1 and COM3, reading from an
// exact-size copy, the refusal's text, and the store's default station.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "stations/portable/station_file.h"

inline StationFileRules Rules(std::vector<WideString> ports = {WIDE_TEXT("COM1"),
                                                               WIDE_TEXT("COM3")}) {
    return {{WIDE_TEXT("Quorvel LV-10"), WIDE_TEXT("Quorvel LV-20"), WIDE_TEXT("Quorvel LV-30")},
            std::move(ports)};
}

// Read from an exact-size heap copy, so that AddressSanitizer sees any read past the end.
inline StationFileContents Read(const std::string& file, const StationFileRules& rules = Rules()) {
    const std::vector<uint8_t> bytes(file.begin(), file.end());
    return ReadStationFile(bytes.data(), bytes.size(), rules);
}

// The refusal as a person reads it, for a failure message.
inline std::string ErrorText(const StationFileContents& contents) {
    return contents.error ? testing::PrintToString(DescribeStationFileError(*contents.error)) : "";
}

inline Station Defaults(const WideString& name) {
    Station station;
    station.Name = name;
    station.Model = WIDE_TEXT("Quorvel LV-10");
    return station;
}
