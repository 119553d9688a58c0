// Scripted instruments of the block procedures: a BCC-block sender and a Y-Modem sender that
// answer the driver's replies through the fake port, each able to send good blocks forever.
#pragma once

#include <algorithm>
#include <climits>
#include <functional>
#include <string>
#include <utility>

#include "tests/portable/serial/fake_serial.h"

const Bytes kEnqLine = {0x05, 0x0D, 0x0A};
const Bytes kAckLine = {0x06, 0x0D, 0x0A};
const Bytes kNakLine = {0x15, 0x0D, 0x0A};

// More blocks than any receive takes: the instrument never comes to its end.
constexpr int kEndless = INT_MAX;

inline std::string BlockText(int index) {
    // XON and XOFF are data here: without flow control they pass through the blocks.
    return "R," + std::to_string(index) + ",1.2345,\x11\x13,";
}

// A BCC-block receive against an instrument that sends block 0 on ENQ, the next on ACK, the same
// again on NAK, and EOT after the last. damage(index, attempt) may spoil what goes out; the
// instrument may miss our first ACK of block missedAck and send that block again.
struct BccRun : ProtocolRun {
    BccRun() : ProtocolRun(ReceiveProcedure::BccBlocks) {}

    int blocks = 3;  // kEndless: never the EOT
    int next = 0;
    int attempt = 0;
    int missedAck = -1;
    std::function<void(int index, int attempt, BccBlock& block)> damage;

    void Send() {
        if (next >= blocks)
            return port.Deliver(Bytes{0x04});
        const std::string text = BlockText(next);
        BccBlock block = BuildBccBlock(BytesOf(text), text.size(), next);
        if (damage)
            damage(next, attempt, block);
        ++attempt;
        port.Deliver(Bytes(block.begin(), block.end()));
    }
    TransferResult Receive() {
        port.onWrite = [this](const Bytes& written, FakePort&) {
            if (written == kAckLine && next == missedAck) {
                missedAck = -1;  // lost on the line: the instrument sends the block again
                Send();
            } else if (written == kAckLine && next < blocks) {
                ++next;
                attempt = 0;
                Send();
            } else if (written == kEnqLine || written == kNakLine) {
                Send();
            }
        };
        return protocol.Receive();
    }
    // Blocks the driver has acknowledged (its repeated ACK of a resent block not counted).
    int Acknowledged() const { return next; }
};

// What the first count blocks leave in the file: each block's text filled with spaces.
inline std::string BlocksText(int count) {
    std::string text;
    for (int i = 0; i < count; ++i)
        text += (BlockText(i) + std::string(128, ' ')).substr(0, 128);
    return text;
}

// A Y-Modem receive against a sender that sends its header on the first 'C', a data block on
// each ACK and EOT after the last. damage(block, bytes) may spoil what goes out (block 0 is the
// header).
struct YModemRun : ProtocolRun {
    explicit YModemRun(Bytes bytes)
        : ProtocolRun(ReceiveProcedure::YModem), sent(std::move(bytes)) {}

    Bytes sent;
    int64_t announcedSize = -1;  // what the header says; -1: the size of sent
    bool endless = false;        // the file's blocks over and over, never the EOT
    size_t nextBlock = 0;
    bool eotSent = false;
    std::function<void(size_t block, Bytes& bytes)> damage;
    const CrcTable table = MakeCrcTable();

    void Send() {
        if (nextBlock == 0) {
            const int64_t size =
                announcedSize >= 0 ? announcedSize : static_cast<int64_t>(sent.size());
            const YModemBlock header =
                BuildYModemHeaderBlock("survey.lv", static_cast<uint32_t>(size), 0, table);
            return port.Deliver(Bytes(header.begin(), header.end()));
        }
        const size_t fileBlocks = (sent.size() + 127) / 128;
        if (nextBlock > fileBlocks && !endless) {
            eotSent = true;
            return port.Deliver(Bytes{0x04});
        }
        const size_t offset = (nextBlock - 1) % fileBlocks * 128;
        Bytes data(sent.begin() + offset, sent.begin() + std::min(sent.size(), offset + 128));
        data.resize(128, 0x1A);
        const uint16_t crc = Crc16(table, data.data(), data.size());
        Bytes block(kYModemBlockSize);
        block[0] = 0x01;
        block[1] = static_cast<uint8_t>(nextBlock);
        block[2] = static_cast<uint8_t>(255 - nextBlock);
        std::copy(data.begin(), data.end(), block.begin() + 3);
        block[131] = static_cast<uint8_t>(crc >> 8);
        block[132] = static_cast<uint8_t>(crc);
        if (damage)
            damage(nextBlock, block);
        port.Deliver(block);
    }
    TransferResult Receive() {
        port.onWrite = [this](const Bytes& written, FakePort&) {
            if ((written == Bytes{0x43} && nextBlock == 0) || written == Bytes{0x15}) {
                Send();
            } else if (written == Bytes{0x06, 0x43} || (written == Bytes{0x06} && !eotSent)) {
                ++nextBlock;
                Send();
            }
        };
        return protocol.Receive();
    }
    // Data blocks the driver has acknowledged.
    int Acknowledged() const { return nextBlock > 0 ? static_cast<int>(nextBlock) - 1 : 0; }
};
