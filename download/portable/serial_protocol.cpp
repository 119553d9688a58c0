// SerialProtocol: shared checks, sending, the line protocol and the input-file check.
#include "download/portable/serial_protocol.h"

#include <algorithm>
#include <cstring>

using namespace serial_bytes;

namespace {
constexpr int64_t kWaitLimitSeconds = 60;
constexpr uint32_t kSendGiveUpMilliseconds = 3000;
constexpr uint32_t kMaxRefusedHeaderLines = 60;
constexpr uint32_t kProgressLines = 30;
constexpr uint32_t kNoProgress = 0;
constexpr uint8_t kAckLine[] = {kAck, ',', 'R', ',', kCr, kLf};
constexpr uint8_t kNakLine[] = {kNak, ',', '!', ',', kCr, kLf};
constexpr char kHeaderLine[] = "A,01,Z";
constexpr char kEndLine[] = "Z,&,";

bool StartsWith(const uint8_t* line, size_t length, const char* prefix) noexcept {
    const size_t prefixLength = std::strlen(prefix);
    return length >= prefixLength && std::memcmp(line, prefix, prefixLength) == 0;
}

// Zero-terminated comparison: a line repeated by the instrument is recognised up to its end.
bool SameText(const uint8_t* left, const uint8_t* right, size_t capacity) noexcept {
    for (size_t i = 0; i < capacity; ++i) {
        if (left[i] != right[i])
            return false;
        if (left[i] == kNul)
            return true;
    }
    return true;
}
}  // namespace

SerialProtocol::SerialProtocol(SerialPort& port, ProtocolClock& clock, ReceiveFile& file,
                               TParserCallBack& callback, const DriverTextSource& texts,
                               ReceiveProcedure procedure) noexcept
    : port_(port),
      clock_(clock),
      file_(file),
      callback_(callback),
      texts_(texts),
      procedure_(procedure) {}

void SerialProtocol::ClosePort() noexcept {
    if (!portOpen_)
        return;
    port_.Break();  // the line is left in the break state on purpose
    port_.Close();
    portOpen_ = false;
}

void SerialProtocol::Report(MessageCode code, const WideString& text) {
    callback_.ShowMessage(code, text.c_str());
}

bool SerialProtocol::CancelSeen() {
    if (!callback_.IsCancelled())
        return false;
    Report(MessageCode::Error, texts_.Text(DriverText::InterruptedByUser));
    ClosePort();
    return true;
}

bool SerialProtocol::CheckTimeoutAndCancel(int64_t lastProgress) {
    if (clock_.WallSeconds() - lastProgress > kWaitLimitSeconds) {
        Report(MessageCode::Error, texts_.Text(DriverText::WaitExpired));
        return false;
    }
    return !CancelSeen();
}

void SerialProtocol::FailOutput(uint32_t error) {
    if (fileError_ != kFileWritten)
        return;  // the first failure is the one the user needs to see
    fileError_ = error;
    Report(MessageCode::Error, texts_.SystemErrorText(error));
}

bool SerialProtocol::CreateOutputFile() {
    fileError_ = kFileWritten;
    const uint32_t error = file_.Create();
    if (error != kFileWritten)
        FailOutput(error);
    return error == kFileWritten;
}

bool SerialProtocol::WriteOutput(const uint8_t* bytes, size_t count) {
    if (fileError_ != kFileWritten)
        return false;
    const uint32_t error = file_.Write(bytes, count);
    if (error != kFileWritten)
        FailOutput(error);
    return error == kFileWritten;
}

bool SerialProtocol::CloseOutputFile() {
    const uint32_t error = file_.Close();
    if (error != kFileWritten)
        FailOutput(error);
    return fileError_ == kFileWritten;
}

void SerialProtocol::SendBytes(const uint8_t* bytes, size_t count) {
    if (!portOpen_)
        return;
    const uint32_t start = clock_.TickMilliseconds();
    size_t sent = 0;
    while (sent < count) {
        const size_t moved = port_.Write(bytes + sent, count - sent);
        sent += moved;
        if (moved == 0 && clock_.TickMilliseconds() - start > kSendGiveUpMilliseconds)
            return;  // nobody examines a failed reply: the peer's time-out handles it
    }
}

void SerialProtocol::SendByteWithLineEnd(uint8_t value) {
    const uint8_t reply[] = {value, kCr, kLf};
    SendBytes(reply, sizeof reply);
}

TransferResult SerialProtocol::ReceiveLines() {
    if (!portOpen_)
        return TransferResult::Failed;
    if (!CreateOutputFile())
        return TransferResult::Failed;
    port_.Purge(true, true);
    int64_t lastProgress = clock_.WallSeconds();
    callback_.SetProgress(kProgressScale, kNoProgress);
    // One more byte than a line holds, for the terminator after a full 128-byte line.
    std::array<uint8_t, kLineBufferSize> previous{};
    std::array<uint8_t, kLineBufferSize> line{};
    std::array<uint8_t, kLineCapacity> overflow{};
    bool started = false;
    bool finished = false;
    uint32_t acceptedLines = 0;
    uint32_t refusedHeaderLines = 0;
    acceptedBytes_ = 0;

    for (;;) {
        // Whatever followed the last line's CR LF is stale: the instrument waits for our reply.
        if (portOpen_)
            port_.Purge(false, true);
        size_t length = 0;
        size_t lineEnd = 0;
        while (lineEnd == 0) {
            if (!CheckTimeoutAndCancel(lastProgress) || stopRequest_ ||
                refusedHeaderLines > kMaxRefusedHeaderLines) {
                (void)file_.Close();  // the receive has failed: a close error adds nothing
                return TransferResult::Failed;
            }
            if (length < kLineCapacity) {
                length += port_.Read(line.data() + length, kLineCapacity - length);
            } else {
                // A full line without CR LF is never accepted; keep draining at the port's pace
                // (an empty read would return at once and spin) until the time-out ends it.
                (void)port_.Read(overflow.data(), overflow.size());
            }
            for (size_t i = 0; i + 1 < length; ++i) {
                if (line[i] == kCr && line[i + 1] == kLf) {
                    lineEnd = i + 2;
                    break;
                }
            }
        }
        line[lineEnd] = kNul;

        if (!started) {
            if (!StartsWith(line.data(), lineEnd, kHeaderLine)) {
                SendBytes(kNakLine, sizeof kNakLine);
                ++refusedHeaderLines;
                continue;
            }
            started = true;
            refusedHeaderLines = 0;
        } else if (StartsWith(line.data(), lineEnd, kEndLine)) {
            finished = true;
        } else if (!PassesLineCheck(line.data(), line.size())) {
            SendBytes(kNakLine, sizeof kNakLine);  // the instrument sends the line again
            continue;
        }
        // Every accepted line counts towards the cap, a repeated one too.
        if (!AcceptWithinCap(lineEnd)) {
            (void)file_.Close();  // the cap's message is the one the user sees
            return TransferResult::Failed;
        }
        // A line repeated because our ACK was lost is acknowledged again but written once. The
        // line goes into the file before the instrument hears that it arrived: a line the disk
        // refused is never acknowledged, and the receive ends with the instrument still holding it.
        // Only the line itself is written: bytes that came after its CR LF in the same read
        // belong to no accepted line and go the way of those the purge drops.
        if (!SameText(line.data(), previous.data(), line.size())) {
            if (!WriteOutput(line.data(), lineEnd)) {
                (void)file_.Close();  // the write's error is the one the user sees
                return TransferResult::Failed;
            }
            std::memcpy(previous.data(), line.data(), lineEnd + 1);
        }
        // The end line is acknowledged only once the whole file is safely closed.
        if (finished && !CloseOutputFile())
            return TransferResult::Failed;
        SendBytes(kAckLine, sizeof kAckLine);
        lastProgress = clock_.WallSeconds();
        acceptedLines = std::min(acceptedLines + 1, kProgressLines);
        callback_.SetProgress(kProgressScale, acceptedLines * kProgressScale / kProgressLines);
        if (finished)
            return TransferResult::Complete;
    }
}

TransferResult SerialProtocol::SendYModemHeader(const YModemBlock& block) {
    if (!portOpen_)
        return TransferResult::Failed;
    const int64_t start = clock_.WallSeconds();
    bool receiverSpoke = false;
    for (;;) {
        if (!CheckTimeoutAndCancel(start) || stopRequest_)
            return TransferResult::Failed;
        if (!receiverSpoke) {
            receiverSpoke = ReadBurst(std::nullopt) > 0;
            continue;
        }
        SendBytes(block.data(), block.size());
        if (ReadBurst(std::nullopt) > 0 && MapBccReply(receiveBuffer_[kBlockKindOffset]) == kAck)
            return TransferResult::Complete;
    }
}

bool SerialProtocol::CheckInputFile(const uint8_t* bytes, size_t size) {
    const BccFileCheck check = CheckBccBlocks(bytes, size);
    switch (check.Result) {
        case BccFileCheck::Outcome::Valid:
            return true;
        case BccFileCheck::Outcome::WrongBlock:
            fileOpened_ = false;  // not a block file: noted, but not an error of the check
            return true;
        case BccFileCheck::Outcome::BccMismatch:
            Report(MessageCode::Error,
                   FormatText(texts_.Text(DriverText::InputFileBccMismatch),
                              {DecimalText(check.Block), DecimalText(check.ValueInBlock),
                               DecimalText(check.Computed)}));
            return false;
    }
    return false;
}
