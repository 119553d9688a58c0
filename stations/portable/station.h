// One configured instrument connection, as a plain value.
#pragma once

#include <cstdint>

#include "support/portable/wide_text.h"

struct Station {
    WideString Name;
    WideString Port = WIDE_TEXT("COM1");
    WideString Manufacturer;
    WideString Model;  // set to the first model's current text by DefaultStation()
    WideString Software;
    uint32_t BaudRate = 9600;
    uint32_t StopBits = 0;  // 0 = one stop bit, in the serial driver's code scale
    uint32_t Parity = 2;    // 0 none, 1 odd, 2 even
    uint32_t Protocol = 1;
    uint32_t DataBits = 7;
    uint32_t Flow = 0;
    uint32_t CheckSum = 1;

    bool operator==(const Station&) const = default;
};
