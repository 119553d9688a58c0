// The driver's user-visible texts: looked up by whoever runs it, formatted here.
#pragma once

#include <cstdint>

#include "support/portable/text_format.h"
#include "support/portable/wide_text.h"

enum class DriverText {
    PortNotOpened,         // "Can not open COM port. Port is already open by another program"
    WaitExpired,           // "The waiting time of the data has expired."
    InterruptedByUser,     // "The communication's process is interrupted by the user"
    BlockImportFailed,     // "AZ doesn't respond or error in importing block"
    InputFileBccMismatch,  // format with three %d: block, value in the block, computed value
    SizeLimitReached,      // format with one %d: the cap in MiB
    YModemFileInfo,        // format with two %s: file name, size text
};

// Supplies the text of each message (the string table on Windows).
class DriverTextSource {
public:
    virtual ~DriverTextSource() = default;
    virtual WideString Text(DriverText text) const = 0;
    // The system's own text for one of its error codes (a failed write of the output file).
    virtual WideString SystemErrorText(uint32_t code) const = 0;
};

// Decimal text of a signed number, for the %d arguments.
WideString DecimalText(long long value);

// Widens 8-bit text byte by byte (names from the instrument are plain ASCII).
WideString WidenBytes(const char* bytes, size_t count);
