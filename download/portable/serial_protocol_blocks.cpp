// SerialProtocol: the block procedures (raw stream, BCC blocks, Y-Modem) and block reception.
#include "download/portable/serial_protocol.h"

#include <algorithm>
#include <cstring>

using namespace serial_bytes;

namespace {
constexpr uint32_t kEnqRepollMilliseconds = 4000;
constexpr int kBccTries = 5;
constexpr int kYModemNakLimit = 10;
constexpr int kFinalAcks = 10;
}  // namespace

size_t SerialProtocol::ReadBurst(int firstByte) {
    receiveBuffer_.fill(0);
    receiveCount_ = 0;
    if (firstByte >= 0)
        receiveBuffer_[receiveCount_++] = static_cast<uint8_t>(firstByte);
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
    const WideString mebibytes = DecimalText(static_cast<long long>(receiveCap_ >> 20));
    Report(kMessageError, FormatDriverText(texts_.Text(DriverText::SizeLimitReached), {mebibytes}));
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
uint8_t SerialProtocol::ReceiveBlock(int firstByte) {
    ReadBurst(firstByte);
    // The block procedures look at a cancel on every block, good or bad, before the block is
    // written or answered: an instrument that never stops sending good blocks is still stopped
    // by the user. The raw stream answers nothing, so a burst it has read is kept, and its own
    // loop sees the cancel before the next one.
    const bool answered = selector_ == 1 || selector_ == 2;
    if (answered && (stopRequest_ || callback_.IsCancelled())) {
        receiveEnded_ = true;
        Report(kMessageError, texts_.Text(DriverText::InterruptedByUser));
        ClosePort();
        return kNak;
    }
    const uint8_t* data = receiveBuffer_.data();
    size_t dataSize = receiveCount_;
    if (selector_ == 2) {
        data += 3;
        dataSize = kBlockDataSize;
    } else if ((selector_ == 1 || selector_ == 3) && receiveCount_ == kBlockCapacity) {
        data += 1;
        dataSize = kBlockDataSize;
    }
    uint8_t result = ValidateBlock(receiveBuffer_.data(), receiveCount_, crcTable_, receivedCheck_);

    // Every accepted block counts towards the cap, also one that writes nothing (a Y-Modem block
    // past the announced size, a BCC block repeated): an instrument that repeats forever ends too.
    if (selector_ == 2) {
        if (result == kAck && AcceptWithinCap(kBlockDataSize)) {
            const uint32_t left = fileSize_ > bytesWritten_ ? fileSize_ - bytesWritten_ : 0;
            (void)WriteOutput(data, std::min<uint32_t>(left, kBlockDataSize));
            bytesWritten_ += kBlockDataSize;
        }
    } else if (selector_ == 1) {
        if (result != kNak && result != kEot && AcceptWithinCap(dataSize)) {
            // A block sent again because our reply was lost carries the same digit.
            const uint32_t digit = receiveBuffer_[129];
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

uint32_t SerialProtocol::Receive() {
    if (!portOpen_)
        return 1;
    port_.Purge(true, true);
    if (!CreateOutputFile())
        return 1;
    receiveEnded_ = false;
    acceptedBytes_ = 0;
    uint32_t result = 1;
    switch (selector_) {
        case 1:
            result = ReceiveBccBlocks();
            break;
        case 2:
            result = ReceiveYModem();
            break;
        default:
            result = ReceiveRawStream();
            break;
    }
    // A receive that ended well but left an incomplete file has failed.
    if (!CloseOutputFile())
        result = 1;
    return result;
}

uint32_t SerialProtocol::ReceiveRawStream() {
    callback_.SetProgress(100, 0);
    int64_t lastProgress = clock_.WallSeconds();
    uint32_t counter = 0;
    for (;;) {
        if (!CheckTimeoutAndCancel(lastProgress) || stopRequest_)
            return 1;
        uint8_t first = 0;
        if (port_.Read(&first, 1) == 0)
            continue;
        counter = std::min(counter + 1, 10u);
        callback_.SetProgress(100, counter * 10);
        const uint8_t result = ReceiveBlock(first);
        if (ReceiveEnded())
            return 1;
        lastProgress = clock_.WallSeconds();
        if (result == kEot)
            return 0;
    }
}

uint32_t SerialProtocol::ReceiveBccBlocks() {
    lastBlockDigit_ = 9;
    callback_.SetProgress(100, 0);
    const int64_t start = clock_.WallSeconds();

    SendByteWithLineEnd(kEnq);
    uint32_t enqSent = clock_.TickMilliseconds();
    uint8_t result = ReceiveBlock(-1);
    while (result == kNak) {
        if (ReceiveEnded() || !CheckTimeoutAndCancel(start) || stopRequest_)
            return 1;
        if (clock_.TickMilliseconds() - enqSent > kEnqRepollMilliseconds) {
            port_.Purge(true, true);
            SendByteWithLineEnd(kEnq);
            enqSent = clock_.TickMilliseconds();
        }
        result = ReceiveBlock(-1);
    }
    if (ReceiveEnded())
        return 1;

    uint8_t reply = kAck;
    uint32_t counter = 1;
    while (reply != kEot) {
        callback_.SetProgress(100, counter * 5);
        counter = std::min(counter + 1, 20u);
        for (int tries = 1;; ++tries) {
            SendByteWithLineEnd(reply);
            reply = MapBccReply(ReceiveBlock(-1));
            if (ReceiveEnded())
                return 1;
            if (reply != kNak)
                break;
            if (tries == kBccTries) {
                Report(kMessageError, texts_.Text(DriverText::BlockImportFailed));
                return 1;
            }
        }
    }
    for (int i = 0; i < kFinalAcks; ++i)
        SendByteWithLineEnd(kAck);
    return 0;
}

uint32_t SerialProtocol::ReceiveYModem() {
    BuildCrcTable(crcTable_);
    const int64_t start = clock_.WallSeconds();
    bytesWritten_ = 0;
    if (!CheckTimeoutAndCancel(start))
        return 1;

    // The header block is only read here, not written: the data blocks that follow are.
    for (;;) {
        const uint8_t request = kCrcRequest;
        SendBytes(&request, 1);
        const size_t count = ReadBurst(-1);
        if (count > 0 &&
            ValidateBlock(receiveBuffer_.data(), count, crcTable_, receivedCheck_) != kNak)
            break;
        if (count > 0) {
            const uint8_t nak = kNak;
            SendBytes(&nak, 1);
        }
        if (!CheckTimeoutAndCancel(start) || stopRequest_)
            return 1;
    }
    const YModemHeaderInfo header = ParseYModemHeader(receiveBuffer_.data());
    fileSize_ = header.Size;
    yModemFileName_.assign(header.Name);
    expectedBlockCount_ = fileSize_ / kBlockCapacity + 1;
    WideString sizeText = WidenBytes(header.SizeText.data(), header.SizeText.size());
    sizeText += WIDE_TEXT(" byte");
    Report(kMessageInformation,
           FormatDriverText(texts_.Text(DriverText::YModemFileInfo),
                            {WidenBytes(header.Name.data(), header.Name.size()), sizeText}));
    // A file announced larger than the cap could never be received: its header is not accepted.
    if (header.Size > receiveCap_) {
        EndAtSizeLimit();
        return 1;
    }

    const uint8_t acceptHeader[] = {kAck, kCrcRequest};
    SendBytes(acceptHeader, sizeof acceptHeader);

    int naksInARow = 0;
    for (;;) {
        const uint8_t result = ReceiveBlock(-1);
        if (ReceiveEnded())
            return 1;
        if (result == kNak) {
            SendBytes(&result, 1);
            if (++naksInARow >= kYModemNakLimit) {
                Report(kMessageError, texts_.Text(DriverText::BlockImportFailed));
                return 1;
            }
            continue;
        }
        naksInARow = 0;
        const uint64_t written = file_.Position();
        const uint64_t lastByte = fileSize_ > 0 ? fileSize_ - 1 : 0;
        callback_.SetProgress(fileSize_, static_cast<uint32_t>(std::min(lastByte, written)));
        const uint8_t ack = kAck;
        SendBytes(&ack, 1);
        if (result == kEot)
            break;
    }
    const uint8_t cancel[] = {kCan, kCan};
    SendBytes(cancel, sizeof cancel);
    return 0;
}
