// TAZComm, the serial driver that receives an instrument's data over a COM port into a file.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <string>

#include "download/portable/parser_callback.h"
#include "download/portable/protocol_io.h"
#include "download/portable/protocol_vocabulary.h"

class SerialProtocol;
class Win32SerialPort;
class Win32ReceiveFile;

// The longest port name the connection record holds, e.g. L"\\.\COM1234".
constexpr size_t kPortNameCapacity = 14;
// The framing of every receive: seven data bits (the caller sets the parity and one stop bit).
constexpr BYTE kReceiveDataBits = 7;

// The connection record, filled by the caller and read by the driver. The caller sets
// DeviceControlBlock.BaudRate, ByteSize (kReceiveDataBits), Parity (NOPARITY, ODDPARITY or
// EVENPARITY) and StopBits (ONESTOPBIT); the driver fills the rest of the block and the time-outs.
struct TAZCommParams {
    DCB DeviceControlBlock{};
    COMMTIMEOUTS Timeouts{};
    wchar_t PortName[kPortNameCapacity + 1]{};  // passed to CreateFileW as it stands
    // The protocol selector, 32 bits as in the record; StoredSelectorOf gives its number.
    ReceiveProcedure Protocol = ReceiveProcedure::BccBlocks;
    std::wstring OutputPath;
};
static_assert(sizeof(ReceiveProcedure) == sizeof(uint32_t));

// Owns the port from construction to destruction. Not copyable; all receives run on one thread,
// only Stop() may be called from another.
class TAZComm {
public:
    // Configures and opens the port. On failure reports MessageCode::PortNotOpened once, with a
    // text that says whether the port is not on the computer now (naming the ports that are),
    // in use by another program, or refused for another reason (the system's text), and leaves
    // the object unusable: every receive then fails.
    // Neither pointer is owned; both must outlive the driver.
    TAZComm(TParserCallBack* callback, TAZCommParams* params);
    ~TAZComm();
    TAZComm(const TAZComm&) = delete;
    TAZComm& operator=(const TAZComm&) = delete;

    [[nodiscard]] bool IsPortOpen() const noexcept;

    // The line protocol ("A,01,Z" … "Z,&,"): Complete when the file is complete.
    [[nodiscard]] TransferResult ReceiveLines();
    // The procedure chosen by the record's Protocol: Complete, or Failed on a failure or stop.
    [[nodiscard]] TransferResult Receive();

    // Outside stop switch, read by every receive loop at its next check. Safe from any thread.
    void Stop() noexcept;
    // The size announced by a Y-Modem header block; 0 otherwise.
    [[nodiscard]] uint32_t FileSize() const noexcept;

    // Sending side. Sends a Y-Modem header block for the file at path (name, size, creation
    // time) once the receiver has sent anything, until it is acknowledged.
    [[nodiscard]] TransferResult SendYModemHeader(const std::wstring& path);
    // Checks that the record's OutputPath holds BCC blocks numbered 0, 1, 2 … ended by EOT:
    // false only on a BCC mismatch or an unreadable file (both reported, MessageCode::Error).
    [[nodiscard]] bool CheckInputFile();
    // The system's code of the output-file write that failed the last receive (already reported,
    // MessageCode::Error); kFileWritten when none did.
    [[nodiscard]] uint32_t FileError() const noexcept;
    // Set at opening; cleared by CheckInputFile on a wrong block kind or digit.
    [[nodiscard]] bool IsFileOpened() const noexcept;

private:
    [[nodiscard]] bool OpenPort();

    TParserCallBack* callback_;
    TAZCommParams* params_;
    std::unique_ptr<Win32SerialPort> port_;
    std::unique_ptr<Win32ReceiveFile> file_;
    std::unique_ptr<SerialProtocol> protocol_;
};
