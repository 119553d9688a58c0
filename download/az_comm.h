// TAZComm, the serial driver that receives an instrument's data over a COM port into a file.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <string>

#include "download/portable/parser_callback.h"

class SerialProtocol;
class Win32SerialPort;
class Win32ReceiveFile;

// Protocol selectors of the connection record.
constexpr uint32_t kProtocolRawStream = 0;
constexpr uint32_t kProtocolBccBlocks = 1;
constexpr uint32_t kProtocolYModem = 2;
constexpr uint32_t kProtocolRawStreamAlt = 3;

// The connection record, filled by the caller and read by the driver. The caller sets
// DeviceControlBlock.BaudRate, ByteSize (7), Parity (0 none, 1 odd, 2 even) and StopBits (0);
// the driver fills the rest of the block and the time-outs.
struct TAZCommParams {
    DCB DeviceControlBlock{};
    COMMTIMEOUTS Timeouts{};
    wchar_t PortName[15]{};  // e.g. L"COM1", passed to CreateFileW as it stands
    uint32_t Protocol = kProtocolBccBlocks;
    std::wstring OutputPath;
};

// Owns the port from construction to destruction. Not copyable; all receives run on one thread,
// only Stop() may be called from another.
class TAZComm {
public:
    // Configures and opens the port. On failure reports code 50 (after the system text, code 4,
    // where there is one) and leaves the object unusable: every receive then returns 1.
    // Neither pointer is owned; both must outlive the driver.
    TAZComm(TParserCallBack* callback, TAZCommParams* params);
    ~TAZComm();
    TAZComm(const TAZComm&) = delete;
    TAZComm& operator=(const TAZComm&) = delete;

    bool IsPortOpen() const noexcept;

    // The line protocol ("A,01,Z" … "Z,&,"): 0 when the file is complete, 1 otherwise.
    [[nodiscard]] uint32_t ReceiveLines();
    // The procedure chosen by the record's Protocol selector: 0 success, 1 failure or stop.
    [[nodiscard]] uint32_t Receive();

    // Outside stop switch, read by every receive loop at its next check. Safe from any thread.
    void Stop() noexcept;
    // The size announced by a Y-Modem header block; 0 otherwise.
    uint32_t FileSize() const noexcept;

    // Sending side. Sends a Y-Modem header block for the file at path (name, size, creation
    // time) once the receiver has sent anything, until it is acknowledged: 0 success, 1 failure.
    [[nodiscard]] uint32_t SendYModemHeader(const std::wstring& path);
    // Checks that the record's OutputPath holds BCC blocks numbered 0, 1, 2 … ended by EOT:
    // false only on a BCC mismatch or an unreadable file (both reported, code 4).
    [[nodiscard]] bool CheckInputFile();
    // The system's code of the output-file write that failed the last receive (already reported,
    // code 4); 0 when none did.
    uint32_t FileError() const noexcept;
    // Set at opening; cleared by CheckInputFile on a wrong block kind or digit.
    bool IsFileOpened() const noexcept;

private:
    [[nodiscard]] bool OpenPort();

    TParserCallBack* callback_;
    TAZCommParams* params_;
    std::unique_ptr<Win32SerialPort> port_;
    std::unique_ptr<Win32ReceiveFile> file_;
    std::unique_ptr<SerialProtocol> protocol_;
};
