// The serial protocol's names: receive procedures, transfer results and message codes, and the
// only conversions between them and the numbers that are stored or posted outside the driver.
#pragma once

#include <cstdint>
#include <optional>

// The receive procedure that a connection record's protocol selector chooses. A station's stored
// Protocol value and the record carry it as a number (ProcedureOfStoredSelector); the driver
// and its callers use these names.
enum class ReceiveProcedure : uint32_t {
    // Whatever arrives, written as it comes until an EOT; the port handles XON/XOFF.
    RawStream,
    // 136-byte blocks with an XOR check, started by ENQ. The download thread's selector, also
    // for the line protocol: it keeps software flow control off.
    BccBlocks,
    // 133-byte Y-Modem blocks with CRC-16 after a header block with name and size.
    YModem,
    // The raw stream with XON and XOFF as data; a full 136-byte burst gives its 128 data bytes.
    RawStreamWithoutFlowControl,
};

// The stored selector's procedure; none for a value that names no procedure.
[[nodiscard]] std::optional<ReceiveProcedure> ProcedureOfStoredSelector(uint32_t stored) noexcept;
// The number stored for a procedure (a station's Protocol value, the connection record).
[[nodiscard]] uint32_t StoredSelectorOf(ReceiveProcedure procedure) noexcept;

// How a receive (or the sending of a Y-Modem header) ended. Every failure has already been
// reported through the callback, except a stop request, which ends it silently.
enum class TransferResult : uint32_t {
    Complete,  // the output file holds everything and is closed
    Failed,    // time-out, cancel, stop, refused lines or blocks, a refused write, the size cap
};

// The kind of a message the driver hands to its callback, which the download thread posts to the
// progress dialog as a number (PostedCodeOf, MessageCodeOfPosted).
enum class MessageCode : uint32_t {
    Information,    // information or a progress text
    Error,          // shown to the user in a box
    PortNotOpened,  // the port could not be opened or configured; the driver is unusable
};

// The number a message code travels as (a window message's first argument, lvrecv's output).
[[nodiscard]] uint32_t PostedCodeOf(MessageCode code) noexcept;
// The code a posted number names; none for a number that names none (all 64 bits count, so
// a window message's argument is taken as it came).
[[nodiscard]] std::optional<MessageCode> MessageCodeOfPosted(uint64_t posted) noexcept;
