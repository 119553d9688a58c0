// The port settings the driver applies: device-control fields and time-outs as plain values.
#pragma once

#include <cstdint>

#include "download/portable/protocol_vocabulary.h"

// DCB flag bits as the driver sets them.
constexpr uint32_t kDcbBinary = 0x0001;
constexpr uint32_t kDcbParityCheck = 0x0002;
constexpr uint32_t kDcbDtrEnabled = 0x0010;
constexpr uint32_t kDcbTxContinueOnXoff = 0x0080;
constexpr uint32_t kDcbXonXoffOut = 0x0100;
constexpr uint32_t kDcbXonXoffIn = 0x0200;
constexpr uint32_t kDcbRtsEnabled = 0x1000;
constexpr uint32_t kDcbBaseFlags = 0x1393;

// The fields of the device control block that the driver fills; the caller's BaudRate,
// ByteSize, Parity and StopBits are kept as they are.
struct DeviceControlFields {
    uint32_t Length = 28;
    uint32_t Flags = kDcbBaseFlags;
    uint16_t Reserved = 0;
    uint16_t XonLimit = 1024;
    uint16_t XoffLimit = 1536;
    uint8_t XonChar = 0x11;
    uint8_t XoffChar = 0x13;
    uint8_t ErrorChar = 0x00;
    uint8_t EofChar = 0xFF;
    uint8_t EventChar = 0xFE;
    uint16_t Reserved1 = 0;
};

// Software flow control only for ReceiveProcedure::RawStream: with every other procedure XON and
// XOFF are data bytes (they occur inside BCC and Y-Modem blocks).
[[nodiscard]] DeviceControlFields MakeDeviceControlFields(ReceiveProcedure procedure) noexcept;

// Milliseconds. The block procedures' time-outs: a read returns after 50 ms of silence between
// bytes or after 100 ms plus 1 ms per byte asked for. A burst (a block) is framed by that silence,
// so this interval is those procedures' whole pacing; there is no other wait.
struct PortTimeouts {
    uint32_t ReadInterval = 50;
    uint32_t ReadTotalMultiplier = 1;
    uint32_t ReadTotalConstant = 100;
    uint32_t WriteTotalMultiplier = 1;
    uint32_t WriteTotalConstant = 100;
};

[[nodiscard]] PortTimeouts MakePortTimeouts() noexcept;

// The line protocol's time-outs at a baud rate and framing: a read returns once the bytes stop
// for about two character times, or after 100 ms when nothing comes. A line is framed by its
// CR LF, not by silence, so the 50 ms interval of the block procedures would only add its length
// to every line (up to three quarters of a transfer at 38400 baud); this is a deliberate
// difference from those time-outs. The read time-outs' other documented mode for this
// ("return as soon as any byte is there": interval and multiplier MAXDWORD) is not honoured by
// Wine's serial layer, and a short interval does the same job on both.
[[nodiscard]] PortTimeouts MakeLineTimeouts(uint32_t baudRate, uint32_t bitsPerCharacter) noexcept;
