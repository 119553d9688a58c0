// The driver's outside world as the protocol sees it: the port, the clock and the output file.
#pragma once

#include <cstddef>
#include <cstdint>

// A configured COM port. Read follows the port's time-outs, which its owner sets per receive
// procedure (port_setup.h):
// - block procedures: Read returns what arrived once 50 ms pass without a byte or the total
//   time-out (100 ms + 1 ms a byte) ends; that silence is what ends a block;
// - line protocol: Read returns as soon as the bytes stop for about two character times, so a
//   line's CR LF is seen right after it arrives; the caller looks for CR LF, not for silence.
// In both, a silent line costs the caller about 100 ms per call and never a spin.
class SerialPort {
public:
    virtual ~SerialPort() = default;
    // Bytes read into buffer (0 on time-out or failure); count may be 0.
    virtual size_t Read(uint8_t* buffer, size_t count) = 0;
    // Bytes that left (0 when the write moved nothing).
    virtual size_t Write(const uint8_t* bytes, size_t count) = 0;
    virtual void Purge(bool transmit, bool receive) = 0;
    // Leaves the line in the break state.
    virtual void Break() = 0;
    // Restores the settings found at opening and closes the port; later calls do nothing.
    virtual void Close() = 0;
};

// Time as the protocol measures it: the wall clock in whole seconds for the 60-second wait,
// a millisecond tick for the short waits of sending and polling.
class ProtocolClock {
public:
    virtual ~ProtocolClock() = default;
    virtual int64_t WallSeconds() = 0;
    virtual uint32_t TickMilliseconds() = 0;
};

// What ReceiveFile answers when every byte is in the file (the system's code for success).
constexpr uint32_t kFileWritten = 0;

// The output file of one receive. Create empties an existing file. Write and Close answer the
// system's error code, kFileWritten when every byte is in the file: the driver must not
// acknowledge, nor report as complete, what the disk refused.
class ReceiveFile {
public:
    virtual ~ReceiveFile() = default;
    [[nodiscard]] virtual uint32_t Create() = 0;
    // A write that stores fewer bytes than asked without a code of its own counts as a full disk.
    [[nodiscard]] virtual uint32_t Write(const uint8_t* bytes, size_t count) = 0;
    // Bytes written so far.
    virtual uint64_t Position() = 0;
    // Flushes and closes; later calls answer kFileWritten.
    [[nodiscard]] virtual uint32_t Close() = 0;
};
