// SerialProtocol: the driver's receive procedures and sending side over the port interface.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <optional>
#include <string>

#include "download/portable/block_format.h"
#include "download/portable/driver_text.h"
#include "download/portable/parser_callback.h"
#include "download/portable/protocol_io.h"
#include "download/portable/protocol_vocabulary.h"

// The most data one receive takes before it ends with a failure. The largest memories of the
// instruments hold a few MiB of records; 64 MiB is far above any of them and still a harmless
// temporary file. Without a cap an instrument (or a loop in its firmware) that never sends the
// end would fill the disk. Even at 115200 baud the cap is hours of blocks away.
constexpr uint32_t kMebibyteShift = 20;
constexpr uint64_t kMaxReceiveBytes = uint64_t{64} << kMebibyteShift;

// The buffers: a line or a block with room for a terminating zero after it.
constexpr size_t kLineBufferSize = kLineCapacity + 1;
constexpr size_t kReceiveBufferSize = kBlockCapacity + 1;

// Runs on one thread; only RequestStop may be called from others. Whatever reports to the
// callback may throw std::bad_alloc (its texts); the download thread's base catches it, so only
// the helpers that neither report nor touch the port are noexcept.
class SerialProtocol {
public:
    SerialProtocol(SerialPort& port, ProtocolClock& clock, ReceiveFile& file,
                   TParserCallBack& callback, const DriverTextSource& texts,
                   ReceiveProcedure procedure) noexcept;

    // Set by the owner once the port is open and configured; cleared when the port is closed.
    void SetPortOpen(bool open) noexcept {
        portOpen_ = open;
        fileOpened_ = open;
    }
    [[nodiscard]] bool IsPortOpen() const noexcept { return portOpen_; }
    [[nodiscard]] bool IsFileOpened() const noexcept { return fileOpened_; }
    void RequestStop() noexcept { stopRequest_ = true; }
    // The most data one receive takes: kMaxReceiveBytes, unless a test needs a nearer cap.
    void SetReceiveCap(uint64_t bytes) noexcept { receiveCap_ = bytes; }
    uint32_t FileSize() const noexcept { return fileSize_; }
    const std::string& YModemFileName() const noexcept { return yModemFileName_; }
    // The system's code of the write that ended the last receive; kFileWritten when every write
    // succeeded.
    [[nodiscard]] uint32_t FileError() const noexcept { return fileError_; }
    uint32_t ExpectedBlockCount() const noexcept { return expectedBlockCount_; }

    // The line protocol: header "A,01,Z", checked lines each answered ACK or NAK, end "Z,&,".
    [[nodiscard]] TransferResult ReceiveLines();
    // The procedure the driver was made for.
    [[nodiscard]] TransferResult Receive();
    // Sends a Y-Modem header block once the receiver has sent anything, until acknowledged.
    [[nodiscard]] TransferResult SendYModemHeader(const YModemBlock& block);
    // Checks an input file of BCC blocks (see CheckBccBlocks); false only on a BCC mismatch.
    [[nodiscard]] bool CheckInputFile(const uint8_t* bytes, size_t size);

    // Break, restore and close the port; the protocol is unusable afterwards.
    void ClosePort() noexcept;

private:
    // The BCC block protocol's last block digit before its first block: the number 9, which no
    // digit character ('0' to '9') equals, so that the first block is always written.
    static constexpr uint32_t kNoBlockDigit = 9;

    // Sends all bytes; gives up when a write moves nothing after 3 s from the start of the send.
    void SendBytes(const uint8_t* bytes, size_t count);
    void SendByteWithLineEnd(uint8_t value);
    void Report(MessageCode code, const WideString& text);
    // The 60-second wait and the user's cancel (which closes the port); false ends the receive.
    [[nodiscard]] bool CheckTimeoutAndCancel(int64_t lastProgress);
    // Reads one burst into the receive buffer (after firstByte when there is one), validates and
    // writes its data as the procedure says; returns the validation result (a reply byte). A
    // cancel seen on the burst, the size cap or a refused write end the receive (ReceiveEnded)
    // with nothing written.
    [[nodiscard]] uint8_t ReceiveBlock(std::optional<uint8_t> firstByte);
    [[nodiscard]] bool ReceiveEnded() const noexcept {
        return receiveEnded_ || fileError_ != kFileWritten;
    }
    // Counts data accepted by this receive; false, with the message, once it would pass the cap.
    [[nodiscard]] bool AcceptWithinCap(size_t count);
    void EndAtSizeLimit();
    // Reads one burst without writing; returns the count.
    size_t ReadBurst(std::optional<uint8_t> firstByte);
    // The user's cancel: reported, the port closed.
    [[nodiscard]] bool CancelSeen();
    // Whether the procedure answers each block (a cancel then ends it before the answer).
    [[nodiscard]] bool AnswersBlocks() const noexcept;
    // Writes to the output file; the first refused write is reported with the system's text and
    // fails every later one, so that the receive ends before it acknowledges the data.
    [[nodiscard]] bool WriteOutput(const uint8_t* bytes, size_t count);
    // Opens the output file for a new receive and forgets an earlier write failure.
    [[nodiscard]] bool CreateOutputFile();
    // Closes the output file; false when the file is not complete (a write or the close failed).
    [[nodiscard]] bool CloseOutputFile();
    void FailOutput(uint32_t error);

    [[nodiscard]] TransferResult ReceiveRawStream();
    [[nodiscard]] TransferResult ReceiveBccBlocks();
    [[nodiscard]] TransferResult ReceiveYModem();

    SerialPort& port_;
    ProtocolClock& clock_;
    ReceiveFile& file_;
    TParserCallBack& callback_;
    const DriverTextSource& texts_;
    const ReceiveProcedure procedure_;

    std::atomic<bool> stopRequest_{false};
    bool portOpen_ = false;
    uint16_t receivedCheck_ = 0;
    uint32_t expectedBlockCount_ = 0;
    size_t receiveCount_ = 0;
    uint32_t fileSize_ = 0;
    uint32_t bytesWritten_ = 0;
    bool fileOpened_ = false;
    uint32_t fileError_ = kFileWritten;
    bool receiveEnded_ = false;
    uint64_t acceptedBytes_ = 0;
    uint64_t receiveCap_ = kMaxReceiveBytes;
    uint32_t lastBlockDigit_ = kNoBlockDigit;
    std::array<uint8_t, kReceiveBufferSize> receiveBuffer_{};
    CrcTable crcTable_{};
    std::string yModemFileName_;
};
