// The Win32 side of the driver: COM port, clock, output file and string-table texts.
#include "download/win32_serial_port.h"

#include <ctime>

#include "res/resource.h"
#include "support/module_instance.h"
#include "support/text_lookup.h"

void ApplyDeviceControlFields(const DeviceControlFields& fields, DCB& dcb) noexcept {
    dcb.DCBlength = fields.Length;
    dcb.fBinary = (fields.Flags & kDcbBinary) != 0;
    dcb.fParity = (fields.Flags & kDcbParityCheck) != 0;
    dcb.fOutxCtsFlow = FALSE;
    dcb.fOutxDsrFlow = FALSE;
    dcb.fDtrControl = (fields.Flags & kDcbDtrEnabled) ? DTR_CONTROL_ENABLE : DTR_CONTROL_DISABLE;
    dcb.fDsrSensitivity = FALSE;
    dcb.fTXContinueOnXoff = (fields.Flags & kDcbTxContinueOnXoff) != 0;
    dcb.fOutX = (fields.Flags & kDcbXonXoffOut) != 0;
    dcb.fInX = (fields.Flags & kDcbXonXoffIn) != 0;
    dcb.fErrorChar = FALSE;
    dcb.fNull = FALSE;
    dcb.fRtsControl = (fields.Flags & kDcbRtsEnabled) ? RTS_CONTROL_ENABLE : RTS_CONTROL_DISABLE;
    dcb.fAbortOnError = FALSE;
    dcb.wReserved = fields.Reserved;
    dcb.XonLim = fields.XonLimit;
    dcb.XoffLim = fields.XoffLimit;
    dcb.XonChar = static_cast<char>(fields.XonChar);
    dcb.XoffChar = static_cast<char>(fields.XoffChar);
    dcb.ErrorChar = static_cast<char>(fields.ErrorChar);
    dcb.EofChar = static_cast<char>(fields.EofChar);
    dcb.EvtChar = static_cast<char>(fields.EventChar);
    dcb.wReserved1 = fields.Reserved1;
}

COMMTIMEOUTS ToCommTimeouts(const PortTimeouts& timeouts) noexcept {
    COMMTIMEOUTS result{};
    result.ReadIntervalTimeout = timeouts.ReadInterval;
    result.ReadTotalTimeoutMultiplier = timeouts.ReadTotalMultiplier;
    result.ReadTotalTimeoutConstant = timeouts.ReadTotalConstant;
    result.WriteTotalTimeoutMultiplier = timeouts.WriteTotalMultiplier;
    result.WriteTotalTimeoutConstant = timeouts.WriteTotalConstant;
    return result;
}

PortOpenFailure ClassifyPortOpenFailure(DWORD error, bool opened, bool listed) noexcept {
    // A handle that opened belongs to a device that is there, whatever its set-up refused.
    if (opened)
        return PortOpenFailure::Other;
    switch (error) {
        case ERROR_ACCESS_DENIED:
        case ERROR_SHARING_VIOLATION:
            return PortOpenFailure::InUse;
        case ERROR_FILE_NOT_FOUND:
        case ERROR_PATH_NOT_FOUND:
            return PortOpenFailure::NotPresent;
        default:
            return listed ? PortOpenFailure::Other : PortOpenFailure::NotPresent;
    }
}

Win32SerialPort::~Win32SerialPort() {
    Close();
}

DWORD Win32SerialPort::Open(const wchar_t* portName, const DCB& dcb,
                            const COMMTIMEOUTS& timeouts) noexcept {
    // "COM10" and above open only through the device namespace; "\\.\COM1" works for every
    // port, so the station's plain name is given that prefix unless it already has one.
    wchar_t device[MAX_PATH];
    const bool prefixed = wcsncmp(portName, L"\\\\.\\", 4) == 0;
    if (swprintf(device, ARRAYSIZE(device), prefixed ? L"%ls" : L"\\\\.\\%ls", portName) < 0) {
        return ERROR_INVALID_NAME;
    }
    handle_.reset(
        ::CreateFileW(device, GENERIC_READ | GENERIC_WRITE, 0, nullptr, OPEN_EXISTING, 0, nullptr));
    if (!handle_)
        return ::GetLastError();
    savedDcb_.DCBlength = sizeof savedDcb_;
    // A port whose state cannot be read is still configured; Close then puts back zeros, which
    // SetCommState refuses harmlessly.
    (void)::GetCommState(handle_.get(), &savedDcb_);
    DCB applied = dcb;
    if (!::SetCommState(handle_.get(), &applied))
        return ::GetLastError();
    (void)::GetCommTimeouts(handle_.get(), &savedTimeouts_);
    COMMTIMEOUTS appliedTimeouts = timeouts;
    if (!::SetCommTimeouts(handle_.get(), &appliedTimeouts))
        return ::GetLastError();
    readTotalConstant_ = timeouts.ReadTotalTimeoutConstant;
    writeTotalConstant_ = timeouts.WriteTotalTimeoutConstant;
    return ERROR_SUCCESS;
}

bool Win32SerialPort::SetTimeouts(const COMMTIMEOUTS& timeouts) noexcept {
    if (!handle_)
        return false;
    COMMTIMEOUTS applied = timeouts;
    if (!::SetCommTimeouts(handle_.get(), &applied))
        return false;
    readTotalConstant_ = timeouts.ReadTotalTimeoutConstant;
    writeTotalConstant_ = timeouts.WriteTotalTimeoutConstant;
    return true;
}

size_t Win32SerialPort::Read(uint8_t* buffer, size_t count) {
    if (!handle_ || count == 0)
        return 0;
    const ULONGLONG start = ::GetTickCount64();
    DWORD got = 0;
    const BOOL ok = ::ReadFile(handle_.get(), buffer, static_cast<DWORD>(count), &got, nullptr);
    if (!ok || got == 0) {
        // A failed read, or a peer that hung up, answers at once; the protocol's pacing assumes
        // the port waited its total time-out, so wait the rest of it instead of spinning.
        const ULONGLONG spent = ::GetTickCount64() - start;
        if (spent < readTotalConstant_)
            ::Sleep(static_cast<DWORD>(readTotalConstant_ - spent));
        return 0;
    }
    return got;
}

size_t Win32SerialPort::Write(const uint8_t* bytes, size_t count) {
    if (!handle_)
        return 0;
    const ULONGLONG start = ::GetTickCount64();
    DWORD written = 0;
    const BOOL ok = ::WriteFile(handle_.get(), bytes, static_cast<DWORD>(count), &written, nullptr);
    if (!ok || written == 0) {
        // A port whose cable is gone refuses at once, and the sender tries again until its own
        // give-up: wait the rest of the write time-out, as a working port would have, instead of
        // spinning a core for those seconds.
        const ULONGLONG spent = ::GetTickCount64() - start;
        if (spent < writeTotalConstant_)
            ::Sleep(static_cast<DWORD>(writeTotalConstant_ - spent));
        return 0;
    }
    return written;
}

void Win32SerialPort::Purge(bool transmit, bool receive) {
    if (!handle_)
        return;
    DWORD flags = 0;
    if (transmit)
        flags |= PURGE_TXCLEAR;
    if (receive)
        flags |= PURGE_RXCLEAR;
    (void)::PurgeComm(handle_.get(), flags);  // nothing to do when the queue cannot be cleared
}

void Win32SerialPort::Break() {
    if (handle_)
        (void)::EscapeCommFunction(handle_.get(), SETBREAK);  // best effort before closing
}

void Win32SerialPort::Close() {
    if (!handle_)
        return;
    // Restoring is best effort: the handle is closed whatever the port answers.
    (void)::SetCommState(handle_.get(), &savedDcb_);
    (void)::SetCommTimeouts(handle_.get(), &savedTimeouts_);
    handle_.reset();
}

int64_t Win32ProtocolClock::WallSeconds() {
    return static_cast<int64_t>(_time64(nullptr));
}

uint32_t Win32ProtocolClock::TickMilliseconds() {
    return ::GetTickCount();
}

// The protocol takes the system's success for a written file.
static_assert(kFileWritten == ERROR_SUCCESS);

uint32_t Win32ReceiveFile::Create() noexcept {
    // The data object holds its download's file open for reading from its creation on, so that
    // nobody can delete or swap it: the file is shared with readers, never with other writers,
    // and an existing file (that one) is emptied rather than replaced.
    handle_.reset(::CreateFileW(path_.c_str(), GENERIC_READ | GENERIC_WRITE, FILE_SHARE_READ,
                                nullptr, CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr));
    return handle_ ? ERROR_SUCCESS : ::GetLastError();
}

uint32_t Win32ReceiveFile::Write(const uint8_t* bytes, size_t count) noexcept {
    if (count == 0)
        return ERROR_SUCCESS;
    if (!handle_)
        return ERROR_INVALID_HANDLE;
    DWORD written = 0;
    if (!::WriteFile(handle_.get(), bytes, static_cast<DWORD>(count), &written, nullptr)) {
        const DWORD error = ::GetLastError();
        return error != ERROR_SUCCESS ? error : ERROR_WRITE_FAULT;
    }
    // A write to a disk that has room for only part of the data stores that part and succeeds.
    return written == count ? ERROR_SUCCESS : ERROR_DISK_FULL;
}

uint64_t Win32ReceiveFile::Position() noexcept {
    LARGE_INTEGER position{};
    if (!handle_ || !::SetFilePointerEx(handle_.get(), LARGE_INTEGER{}, &position, FILE_CURRENT))
        return 0;
    return static_cast<uint64_t>(position.QuadPart);
}

uint32_t Win32ReceiveFile::Close() noexcept {
    if (!handle_)
        return ERROR_SUCCESS;
    // Data the system still holds in its cache can fail to reach the disk (a network folder, a
    // removable drive): the file counts as complete only once it has.
    DWORD error = ERROR_SUCCESS;
    if (!::FlushFileBuffers(handle_.get()))
        error = ::GetLastError();
    handle_.reset();
    return error;
}

WideString StringTableDriverTexts::Text(DriverText text) const {
    switch (text) {
        case DriverText::PortNotOpened:
            return LoadUiText(IDS_SERIAL_PORT_NOT_OPENED);
        case DriverText::WaitExpired:
            return LoadUiText(IDS_SERIAL_WAIT_EXPIRED);
        case DriverText::InterruptedByUser:
            return LoadUiText(IDS_SERIAL_INTERRUPTED_BY_USER);
        case DriverText::BlockImportFailed:
            return LoadUiText(IDS_SERIAL_BLOCK_IMPORT_FAILED);
        case DriverText::InputFileBccMismatch:
            return LoadUiText(IDS_SERIAL_INPUT_FILE_BCC_MISMATCH);
        case DriverText::SizeLimitReached:
            return LoadUiText(IDS_SERIAL_SIZE_LIMIT_REACHED);
        case DriverText::YModemFileInfo:
            return LoadUiText(IDS_SERIAL_YMODEM_FILE_INFO);
    }
    return {};
}

WideString StringTableDriverTexts::SystemErrorText(uint32_t code) const {
    return SystemMessageText(code);
}

PortProblemTexts StringTableDriverTexts::PortProblems() const {
    return {LoadUiText(IDS_SERIAL_PORT_NOT_PRESENT), LoadUiText(IDS_SERIAL_PORT_NOT_PRESENT_NONE),
            LoadUiText(IDS_SERIAL_PORT_NOT_OPENED)};
}
