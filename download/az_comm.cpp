// TAZComm: opens and configures the port, then runs the protocol over it.
#include "download/az_comm.h"

#include <vector>

#include "download/portable/port_setup.h"
#include "download/portable/serial_protocol.h"
#include "download/win32_serial_port.h"
#include "stations/serial_ports.h"
#include "support/module_instance.h"

namespace {
// One clock and one text source serve every driver: both are stateless.
Win32ProtocolClock g_clock;
const StringTableDriverTexts g_texts;
}  // namespace

TAZComm::TAZComm(TParserCallBack* callback, TAZCommParams* params)
    : callback_(callback),
      params_(params),
      port_(std::make_unique<Win32SerialPort>()),
      file_(std::make_unique<Win32ReceiveFile>(params->OutputPath)),
      protocol_(std::make_unique<SerialProtocol>(*port_, g_clock, *file_, *callback, g_texts,
                                                 params->Protocol)) {
    if (OpenPort())
        protocol_->SetPortOpen(true);
}

TAZComm::~TAZComm() {
    // Closing follows the handle, not the open flag: a port opened but not configured is closed
    // here too.
    if (port_->IsValid()) {
        port_->Break();
        port_->Close();
    }
}

bool TAZComm::OpenPort() {
    ApplyDeviceControlFields(MakeDeviceControlFields(params_->Protocol),
                             params_->DeviceControlBlock);
    params_->Timeouts = ToCommTimeouts(MakePortTimeouts());
    const DWORD error =
        port_->Open(params_->PortName, params_->DeviceControlBlock, params_->Timeouts);
    if (error == ERROR_SUCCESS)
        return true;
    // The computer's list is read now, not when the station was loaded: an adapter may have
    // been plugged in or out since.
    PortOpenProblem problem;
    problem.port = params_->PortName;
    problem.present = ListSerialPorts();
    problem.failure = ClassifyPortOpenFailure(error, port_->IsValid(),
                                              IsPortListed(problem.port, problem.present));
    problem.systemText = SystemResultText(HRESULT_FROM_WIN32(error));
    callback_->ShowMessage(MessageCode::PortNotOpened,
                           PortOpenProblemText(problem, g_texts.PortProblems()).c_str());
    return false;
}

bool TAZComm::IsPortOpen() const noexcept {
    return protocol_->IsPortOpen();
}

TransferResult TAZComm::ReceiveLines() {
    // The time-outs are set per procedure: lines are framed by CR LF, blocks by silence.
    const DCB& dcb = params_->DeviceControlBlock;
    constexpr uint32_t kStartBits = 1;
    constexpr uint32_t kParityBits = 1;
    // ONE5STOPBITS is counted as two: the interval only needs to be long enough.
    constexpr uint32_t kOneStopBit = 1;
    constexpr uint32_t kTwoStopBits = 2;
    const uint32_t bitsPerCharacter = kStartBits + dcb.ByteSize +
                                      (dcb.Parity != NOPARITY ? kParityBits : 0) +
                                      (dcb.StopBits == ONESTOPBIT ? kOneStopBit : kTwoStopBits);
    // A port that refuses them keeps the block time-outs: slower per line, still correct.
    (void)port_->SetTimeouts(ToCommTimeouts(MakeLineTimeouts(dcb.BaudRate, bitsPerCharacter)));
    return protocol_->ReceiveLines();
}

TransferResult TAZComm::Receive() {
    (void)port_->SetTimeouts(params_->Timeouts);  // as opened; refused only by a port gone bad
    return protocol_->Receive();
}

void TAZComm::Stop() noexcept {
    protocol_->RequestStop();
}

uint32_t TAZComm::FileSize() const noexcept {
    return protocol_->FileSize();
}

uint32_t TAZComm::FileError() const noexcept {
    return protocol_->FileError();
}

bool TAZComm::IsFileOpened() const noexcept {
    return protocol_->IsFileOpened();
}

TransferResult TAZComm::SendYModemHeader(const std::wstring& path) {
    WIN32_FILE_ATTRIBUTE_DATA attributes{};
    if (!::GetFileAttributesExW(path.c_str(), GetFileExInfoStandard, &attributes)) {
        callback_->ShowMessage(MessageCode::Error, SystemMessageText(::GetLastError()).c_str());
        return TransferResult::Failed;
    }
    // The name travels as multibyte text of the thread's code page.
    const wchar_t* name = path.c_str();
    for (const wchar_t* p = name; *p; ++p)
        if (*p == L'\\' || *p == L'/' || *p == L':')
            name = p + 1;
    char nameBytes[MAX_PATH * 2] = {};
    const int nameLength = ::WideCharToMultiByte(CP_THREAD_ACP, 0, name, -1, nameBytes,
                                                 sizeof nameBytes, nullptr, nullptr);
    ULARGE_INTEGER created;
    created.LowPart = attributes.ftCreationTime.dwLowDateTime;
    created.HighPart = attributes.ftCreationTime.dwHighDateTime;
    // FILETIME counts 100 ns from 1601; the header carries seconds from 1970.
    const uint64_t unixSeconds = created.QuadPart / 10000000ULL - 11644473600ULL;
    CrcTable table;
    BuildCrcTable(table);
    const YModemBlock block =
        BuildYModemHeaderBlock(std::string_view(nameBytes, nameLength > 0 ? nameLength - 1 : 0),
                               attributes.nFileSizeLow, static_cast<uint32_t>(unixSeconds), table);
    return protocol_->SendYModemHeader(block);
}

bool TAZComm::CheckInputFile() {
    UniqueFileHandle input(::CreateFileW(params_->OutputPath.c_str(), GENERIC_READ, FILE_SHARE_READ,
                                         nullptr, OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr));
    if (!input) {
        callback_->ShowMessage(MessageCode::Error, SystemMessageText(::GetLastError()).c_str());
        return false;
    }
    std::vector<uint8_t> bytes;
    uint8_t chunk[4096];
    DWORD got = 0;
    while (::ReadFile(input.get(), chunk, sizeof chunk, &got, nullptr) && got > 0)
        bytes.insert(bytes.end(), chunk, chunk + got);
    return protocol_->CheckInputFile(bytes.data(), bytes.size());
}
