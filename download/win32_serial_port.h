// The Win32 side of the driver: the COM port, the clock, the output file and the texts.
#pragma once

#include <windows.h>

#include <string>

#include "download/portable/driver_text.h"
#include "download/portable/port_open_problem.h"
#include "download/portable/port_setup.h"
#include "download/portable/protocol_io.h"
#include "support/unique_resource.h"

// Writes the driver's fields into a DCB, keeping the caller's BaudRate, ByteSize, Parity and
// StopBits.
void ApplyDeviceControlFields(const DeviceControlFields& fields, DCB& dcb) noexcept;
COMMTIMEOUTS ToCommTimeouts(const PortTimeouts& timeouts) noexcept;

// The case of a failed Open: its error, whether the handle was opened (configuration failed)
// and whether the computer's port list holds the port.
[[nodiscard]] PortOpenFailure ClassifyPortOpenFailure(DWORD error, bool opened,
                                                      bool listed) noexcept;

// A COM port opened with CreateFileW and configured with SetCommState/SetCommTimeouts; the
// settings found are saved and put back by Close.
class Win32SerialPort final : public SerialPort {
public:
    Win32SerialPort() = default;
    ~Win32SerialPort() override;

    // Opens and configures; on a configuration failure returns the Win32 error (the handle stays
    // open but unusable, as callers treat the port as not open). ERROR_SUCCESS when ready.
    [[nodiscard]] DWORD Open(const wchar_t* portName, const DCB& dcb,
                             const COMMTIMEOUTS& timeouts) noexcept;
    [[nodiscard]] bool IsValid() const noexcept { return static_cast<bool>(handle_); }

    // Replaces the time-outs of an open port; false when the port refuses them (it then keeps
    // those it had).
    [[nodiscard]] bool SetTimeouts(const COMMTIMEOUTS& timeouts) noexcept;

    size_t Read(uint8_t* buffer, size_t count) override;
    size_t Write(const uint8_t* bytes, size_t count) override;
    void Purge(bool transmit, bool receive) override;
    void Break() override;
    void Close() override;

private:
    UniqueFileHandle handle_;
    DCB savedDcb_{};
    COMMTIMEOUTS savedTimeouts_{};
    DWORD readTotalConstant_ = 100;
    DWORD writeTotalConstant_ = 100;
};

// _time64 for the 60-second wait, GetTickCount for the short ones.
class Win32ProtocolClock final : public ProtocolClock {
public:
    int64_t WallSeconds() override;
    uint32_t TickMilliseconds() override;
};

// The output file: created (emptied) for read and write at each receive. Its errors are the
// system's codes, so a full disk is reported in the system's own words.
class Win32ReceiveFile final : public ReceiveFile {
public:
    explicit Win32ReceiveFile(std::wstring path) : path_(std::move(path)) {}
    [[nodiscard]] uint32_t Create() noexcept override;
    [[nodiscard]] uint32_t Write(const uint8_t* bytes, size_t count) noexcept override;
    uint64_t Position() noexcept override;
    [[nodiscard]] uint32_t Close() noexcept override;

private:
    std::wstring path_;
    UniqueFileHandle handle_;
};

// The driver's texts from the module's string table.
class StringTableDriverTexts final : public DriverTextSource {
public:
    WideString Text(DriverText text) const override;
    WideString SystemErrorText(uint32_t code) const override;
    // The texts of a port that did not open.
    PortProblemTexts PortProblems() const;
};
