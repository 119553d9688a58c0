// SerialProtocol: the block procedures (raw stream, BCC blocks, Y-Modem) and block reception.
#include "download/portable/serial_protocol.h"

#include <algorithm>
#include <cstring>

using namespace serial_bytes;

namespace {

// The BCC procedure polls with ENQ again after this long without a first block, answers a block
// this many times before it gives up on it, and acknowledges the end this often.
constexpr uint32_t kEnqRepollMilliseconds = 4000;
constexpr int kBccTries = 5;
constexpr int kFinalAcks = 10;
// Y-Modem gives up after this many refused blocks in a row.
constexpr int kYModemNakLimit = 10;
constexpr uint32_t kNoProgress = 0;
// The progress the raw stream and the BCC blocks show: steps of a tenth and of a twentieth.
constexpr uint32_t kRawStreamSteps = 10;
constexpr uint32_t kBccBlockSteps = 20;

}  // namespace

size_t SerialProtocol::ReadBurst(std::optional<uint8_t> firstByte) {
    receiveBuffer_.fill(kNul);
    receiveCount_ = 0;
    if (firstByte)
        receiveBuffer_[receiveCount_++] = *firstByte;
    // A burst ends when a read brings nothing: the port's 50 ms interval time-out.
    while (receiveCount_ < kBlockCapacity) {
        const size_t got =
            port_.Read(receiveBuffer_.data() + receiveCount_, kBlockCapacity - receiveCount_);
        if (got == 0)
            break;
        receiveCount_ += got;
    }
    return receiveCount_;
}

void SerialProtocol::EndAtSizeLimit() {
    receiveEnded_ = true;
    const WideString mebibytes = DecimalText(static_cast<long long>(receiveCap_ >> kMebibyteShift));
    Report(MessageCode::Error, FormatText(texts_.Text(DriverText::SizeLimitReached), {mebibytes}));
}

bool SerialProtocol::AcceptWithinCap(size_t count) {
    if (acceptedBytes_ + count > receiveCap_) {
        EndAtSizeLimit();
        return false;
    }
    acceptedBytes_ += count;
    return true;
}

// The procedures see a cancel, the cap or a refused write through ReceiveEnded right after this
// returns, before they answer the block: what ended the receive is neither written nor answered.
bool SerialProtocol::AnswersBlocks() const noexcept {
    return procedure_ == ReceiveProcedure::BccBlocks || procedure_ == ReceiveProcedure::YModem;
}

uint8_t SerialProtocol::ReceiveBlock(std::optional<uint8_t> firstByte) {
    (void)ReadBurst(firstByte);  // the count is kept in receiveCount_
    // The block procedures look at a cancel on every block, good or bad, before the block is
    // written or answered: an instrument that never stops sending good blocks is still stopped
    // by the user. The raw stream answers nothing, so a burst it has read is kept, and its own
    // loop sees the cancel before the next one.
    if (AnswersBlocks() && (stopRequest_ || callback_.IsCancelled())) {
        receiveEnded_ = true;
        Report(MessageCode::Error, texts_.Text(DriverText::InterruptedByUser));
        ClosePort();
        return kNak;
    }
    const uint8_t* data = receiveBuffer_.data();
    size_t dataSize = receiveCount_;
    if (procedure_ == ReceiveProcedure::YModem) {
        data += kYModemDataOffset;
        dataSize = kBlockDataSize;
    } else if ((procedure_ == ReceiveProcedure::BccBlocks ||
                procedure_ == ReceiveProcedure::RawStreamWithoutFlowControl) &&
               receiveCount_ == kBlockCapacity) {
        data += kBccDataOffset;
        dataSize = kBlockDataSize;
    }
    uint8_t result = ValidateBlock(receiveBuffer_.data(), receiveCount_, crcTable_, receivedCheck_);

    // Every accepted block counts towards the cap, also one that writes nothing (a Y-Modem block
    // past the announced size, a BCC block repeated): an instrument that repeats forever ends too.
    if (procedure_ == ReceiveProcedure::YModem) {
        if (result == kAck && AcceptWithinCap(kBlockDataSize)) {
            const uint32_t left = fileSize_ > bytesWritten_ ? fileSize_ - bytesWritten_ : 0;
            (void)WriteOutput(data, std::min<uint32_t>(left, kBlockDataSize));
            bytesWritten_ += kBlockDataSize;
        }
    } else if (procedure_ == ReceiveProcedure::BccBlocks) {
        if (result != kNak && result != kEot && AcceptWithinCap(dataSize)) {
            // A block sent again because our reply was lost carries the same digit.
            const uint32_t digit = receiveBuffer_[kBccDigitOffset];
            if (digit != lastBlockDigit_)
                (void)WriteOutput(data, dataSize);
            lastBlockDigit_ = digit;
        }
    } else if (AcceptWithinCap(dataSize)) {
        (void)WriteOutput(data, dataSize);
        if (std::memchr(data, kEot, dataSize) != nullptr)
            result = kEot;
    }
    return result;
}

TransferResult SerialProtocol::Receive() {
    if (!portOpen_)
        return TransferResult::Failed;
    port_.Purge(true, true);
    if (!CreateOutputFile())
        return TransferResult::Failed;
    receiveEnded_ = false;
    acceptedBytes_ = 0;
    TransferResult result = TransferResult::Failed;
    switch (procedure_) {
        case ReceiveProcedure::BccBlocks:
            result = ReceiveBccBlocks();
            break;
        case ReceiveProcedure::YModem:
            result = ReceiveYModem();
            break;
        case ReceiveProcedure::RawStream:
        case ReceiveProcedure::RawStreamWithoutFlowControl:
            result = ReceiveRawStream();
            break;
    }
    // A receive that ended well but left an incomplete file has failed.
    if (!CloseOutputFile())
        result = TransferResult::Failed;
    return result;
}

TransferResult SerialProtocol::ReceiveRawStream() {
    callback_.SetProgress(kProgressScale, kNoProgress);
    int64_t lastProgress = clock_.WallSeconds();
    uint32_t counter = 0;
    for (;;) {
        if (!CheckTimeoutAndCancel(lastProgress) || stopRequest_)
            return TransferResult::Failed;
        uint8_t first = kNul;
        if (port_.Read(&first, sizeof first) == 0)
            continue;
        counter = std::min(counter + 1, kRawStreamSteps);
        callback_.SetProgress(kProgressScale, counter * kProgressScale / kRawStreamSteps);
        const uint8_t result = ReceiveBlock(first);
        if (ReceiveEnded())
            return TransferResult::Failed;
        lastProgress = clock_.WallSeconds();
        if (result == kEot)
            return TransferResult::Complete;
    }
}

TransferResult SerialProtocol::ReceiveBccBlocks() {
    lastBlockDigit_ = kNoBlockDigit;
    callback_.SetProgress(kProgressScale, kNoProgress);
    const int64_t start = clock_.WallSeconds();

    SendByteWithLineEnd(kEnq);
    uint32_t enqSent = clock_.TickMilliseconds();
    uint8_t result = ReceiveBlock(std::nullopt);
    while (result == kNak) {
        if (ReceiveEnded() || !CheckTimeoutAndCancel(start) || stopRequest_)
            return TransferResult::Failed;
        if (clock_.TickMilliseconds() - enqSent > kEnqRepollMilliseconds) {
            port_.Purge(true, true);
            SendByteWithLineEnd(kEnq);
            enqSent = clock_.TickMilliseconds();
        }
        result = ReceiveBlock(std::nullopt);
    }
    if (ReceiveEnded())
        return TransferResult::Failed;

    uint8_t reply = kAck;
    uint32_t counter = 1;  // the first block shows as one step done
    while (reply != kEot) {
        callback_.SetProgress(kProgressScale, counter * kProgressScale / kBccBlockSteps);
        counter = std::min(counter + 1, kBccBlockSteps);
        for (int tries = 1;; ++tries) {
            SendByteWithLineEnd(reply);
            reply = MapBccReply(ReceiveBlock(std::nullopt));
            if (ReceiveEnded())
                return TransferResult::Failed;
            if (reply != kNak)
                break;
            if (tries == kBccTries) {
                Report(MessageCode::Error, texts_.Text(DriverText::BlockImportFailed));
                return TransferResult::Failed;
            }
        }
    }
    for (int i = 0; i < kFinalAcks; ++i)
        SendByteWithLineEnd(kAck);
    return TransferResult::Complete;
}

TransferResult SerialProtocol::ReceiveYModem() {
    BuildCrcTable(crcTable_);
    const int64_t start = clock_.WallSeconds();
    bytesWritten_ = 0;
    if (!CheckTimeoutAndCancel(start))
        return TransferResult::Failed;

    // The header block is only read here, not written: the data blocks that follow are.
    for (;;) {
        const uint8_t request = kCrcRequest;
        SendBytes(&request, sizeof request);
        const size_t count = ReadBurst(std::nullopt);
        if (count > 0 &&
            ValidateBlock(receiveBuffer_.data(), count, crcTable_, receivedCheck_) != kNak)
            break;
        if (count > 0) {
            const uint8_t nak = kNak;
            SendBytes(&nak, sizeof nak);
        }
        if (!CheckTimeoutAndCancel(start) || stopRequest_)
            return TransferResult::Failed;
    }
    const YModemHeaderInfo header = ParseYModemHeader(receiveBuffer_.data());
    fileSize_ = header.Size;
    yModemFileName_.assign(header.Name);
    expectedBlockCount_ = fileSize_ / kBlockCapacity + 1;
    WideString sizeText = WidenBytes(header.SizeText.data(), header.SizeText.size());
    sizeText += WIDE_TEXT(" byte");
    Report(MessageCode::Information,
           FormatText(texts_.Text(DriverText::YModemFileInfo),
                      {WidenBytes(header.Name.data(), header.Name.size()), sizeText}));
    // A file announced larger than the cap could never be received: its header is not accepted.
    if (header.Size > receiveCap_) {
        EndAtSizeLimit();
        return TransferResult::Failed;
    }

    const uint8_t acceptHeader[] = {kAck, kCrcRequest};
    SendBytes(acceptHeader, sizeof acceptHeader);

    int naksInARow = 0;
    for (;;) {
        const uint8_t result = ReceiveBlock(std::nullopt);
        if (ReceiveEnded())
            return TransferResult::Failed;
        if (result == kNak) {
            SendBytes(&result, sizeof result);
            if (++naksInARow >= kYModemNakLimit) {
                Report(MessageCode::Error, texts_.Text(DriverText::BlockImportFailed));
                return TransferResult::Failed;
            }
            continue;
        }
        naksInARow = 0;
        const uint64_t written = file_.Position();
        const uint64_t lastByte = fileSize_ > 0 ? fileSize_ - 1 : 0;
        callback_.SetProgress(fileSize_, static_cast<uint32_t>(std::min(lastByte, written)));
        const uint8_t ack = kAck;
        SendBytes(&ack, sizeof ack);
        if (result == kEot)
            break;
    }
    const uint8_t cancel[] = {kCan, kCan};
    SendBytes(cancel, sizeof cancel);
    return TransferResult::Complete;
}
