// SerialProtocol: the driver's receive procedures and sending side over the port interface.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <string>

#include "download/portable/block_format.h"
#include "download/portable/driver_text.h"
#include "download/portable/parser_callback.h"
#include "download/portable/protocol_io.h"

// The most data one receive takes before it ends with a failure. The largest memories of the
// instruments hold a few MiB of records; 64 MiB is far above any of them and still a harmless
// temporary file. Without a cap an instrument (or a loop in its firmware) that never sends the
// end would fill the disk. Even at 115200 baud the cap is hours of blocks away.
constexpr uint64_t kMaxReceiveBytes = uint64_t{64} << 20;

// Runs on one thread; only RequestStop may be called from others. Results: 0 success, 1 failure.
class SerialProtocol {
public:
    SerialProtocol(SerialPort& port, ProtocolClock& clock, ReceiveFile& file,
                   TParserCallBack& callback, const DriverTextSource& texts,
                   uint32_t protocolSelector) noexcept;

    // Set by the owner once the port is open and configured; cleared when the port is closed.
    void SetPortOpen(bool open) noexcept {
        portOpen_ = open;
        fileOpened_ = open;
    }
    bool IsPortOpen() const noexcept { return portOpen_; }
    bool IsFileOpened() const noexcept { return fileOpened_; }
    void RequestStop() noexcept { stopRequest_ = true; }
    // The most data one receive takes: kMaxReceiveBytes, unless a test needs a nearer cap.
    void SetReceiveCap(uint64_t bytes) noexcept { receiveCap_ = bytes; }
    uint32_t FileSize() const noexcept { return fileSize_; }
    const std::string& YModemFileName() const noexcept { return yModemFileName_; }
    // The system's code of the write that ended the last receive; 0 when every write succeeded.
    uint32_t FileError() const noexcept { return fileError_; }
    uint32_t ExpectedBlockCount() const noexcept { return expectedBlockCount_; }

    // The line protocol: header "A,01,Z", checked lines each answered ACK or NAK, end "Z,&,".
    uint32_t ReceiveLines();
    // The procedure of the selector: 0 and 3 raw stream, 1 BCC blocks, 2 Y-Modem.
    uint32_t Receive();
    // Sends a Y-Modem header block once the receiver has sent anything, until acknowledged.
    uint32_t SendYModemHeader(const YModemBlock& block);
    // Checks an input file of BCC blocks (see CheckBccBlocks); false only on a BCC mismatch.
    [[nodiscard]] bool CheckInputFile(const uint8_t* bytes, size_t size);

    // Break, restore and close the port; the protocol is unusable afterwards.
    void ClosePort() noexcept;

private:
    // Sends all bytes; gives up when a write moves nothing after 3 s from the start of the send.
    void SendBytes(const uint8_t* bytes, size_t count);
    void SendByteWithLineEnd(uint8_t value);
    void Report(uint32_t code, const WideString& text);
    // The 60-second wait and the user's cancel (which closes the port); false ends the receive.
    bool CheckTimeoutAndCancel(int64_t lastProgress);
    // Reads one burst into the receive buffer (after firstByte when >= 0), validates and writes
    // its data as the selector says; returns the validation result. A cancel seen on the burst,
    // the size cap or a refused write end the receive (ReceiveEnded) with nothing written.
    uint8_t ReceiveBlock(int firstByte);
    [[nodiscard]] bool ReceiveEnded() const noexcept { return receiveEnded_ || fileError_ != 0; }
    // Counts data accepted by this receive; false, with the message, once it would pass the cap.
    [[nodiscard]] bool AcceptWithinCap(size_t count);
    void EndAtSizeLimit();
    // Reads one burst without writing; returns the count.
    size_t ReadBurst(int firstByte);
    bool CancelSeen();
    // Writes to the output file; the first refused write is reported with the system's text and
    // fails every later one, so that the receive ends before it acknowledges the data.
    [[nodiscard]] bool WriteOutput(const uint8_t* bytes, size_t count);
    // Opens the output file for a new receive and forgets an earlier write failure.
    [[nodiscard]] bool CreateOutputFile();
    // Closes the output file; false when the file is not complete (a write or the close failed).
    [[nodiscard]] bool CloseOutputFile();
    void FailOutput(uint32_t error);

    uint32_t ReceiveRawStream();
    uint32_t ReceiveBccBlocks();
    uint32_t ReceiveYModem();

    SerialPort& port_;
    ProtocolClock& clock_;
    ReceiveFile& file_;
    TParserCallBack& callback_;
    const DriverTextSource& texts_;
    const uint32_t selector_;

    std::atomic<bool> stopRequest_{false};
    bool portOpen_ = false;
    uint16_t receivedCheck_ = 0;
    uint32_t expectedBlockCount_ = 0;
    size_t receiveCount_ = 0;
    uint32_t fileSize_ = 0;
    uint32_t bytesWritten_ = 0;
    bool fileOpened_ = false;
    uint32_t fileError_ = 0;
    bool receiveEnded_ = false;
    uint64_t acceptedBytes_ = 0;
    uint64_t receiveCap_ = kMaxReceiveBytes;
    uint32_t lastBlockDigit_ = 9;
    std::array<uint8_t, kBlockCapacity + 1> receiveBuffer_{};
    CrcTable crcTable_{};
    std::string yModemFileName_;
};
