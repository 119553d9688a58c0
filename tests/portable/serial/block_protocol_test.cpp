// The block receive procedures through the port interface: raw stream, BCC blocks, Y-Modem.
#include <gtest/gtest.h>

#include <cstring>

#include "download/portable/block_format.h"
#include "download/portable/serial_protocol.h"
#include "tests/portable/serial/fake_serial.h"

namespace {

const Bytes kEnqLine = {0x05, 0x0D, 0x0A};
const Bytes kAckLine = {0x06, 0x0D, 0x0A};
const Bytes kNakLine = {0x15, 0x0D, 0x0A};

Bytes AsBytes(const BccBlock& block) {
    return Bytes(block.begin(), block.end());
}

std::string BlockText(int index) {
    // XON and XOFF are data here: without flow control they pass through the blocks.
    return "R," + std::to_string(index) + ",1.2345,\x11\x13,";
}

Bytes Padded(const std::string& text) {
    Bytes data(text.begin(), text.end());
    data.resize(128, ' ');
    return data;
}

struct BlockProtocolTest : ::testing::Test {
    ProtocolRig rig;
    std::unique_ptr<SerialProtocol> protocol;
    void Start(uint32_t selector) {
        protocol = std::make_unique<SerialProtocol>(rig.port, rig.clock, rig.file, rig.callback,
                                                    rig.texts, selector);
        protocol->SetPortOpen(true);
    }
};

TEST_F(BlockProtocolTest, RawStreamWritesEveryBurstUntilEot) {
    Start(3);
    rig.port.Deliver(ToBytes("first burst "));
    rig.port.Deliver(ToBytes("second"));
    rig.port.onSilence = [sent = false](FakePort& port) mutable {
        if (!sent)
            port.Queue(Bytes{'e', 'n', 'd', 0x04, 'x'});
        sent = true;
    };
    EXPECT_EQ(protocol->Receive(), 0u);
    EXPECT_EQ(rig.file.content, (Bytes{'f', 'i', 'r', 's', 't', ' ', 'b', 'u', 'r', 's',  't', ' ',
                                       's', 'e', 'c', 'o', 'n', 'd', 'e', 'n', 'd', 0x04, 'x'}));
    EXPECT_TRUE(rig.port.written.empty());
    EXPECT_EQ(rig.callback.progress.front(), std::make_pair(100u, 0u));
    EXPECT_EQ(rig.callback.progress.back(), std::make_pair(100u, 20u));
}

TEST_F(BlockProtocolTest, RawStreamWithoutEotTimesOut) {
    Start(0);
    rig.port.Deliver(ToBytes("no end"));
    EXPECT_EQ(protocol->Receive(), 1u);
    EXPECT_EQ(rig.file.Text(), "no end");
    EXPECT_EQ(rig.callback.messages,
              OnlyMessage(4, WIDE_TEXT("The waiting time of the data has expired.")));
    EXPECT_FALSE(rig.file.open);
}

// An instrument sending BCC blocks: block 0 on ENQ, the next on ACK, the same again on NAK,
// EOT after the last. damage(index, attempt) may spoil what goes out.
struct BccInstrument {
    int blocks = 3;
    int next = 0;
    int attempt = 0;
    std::function<void(int index, int attempt, BccBlock& block)> damage;

    void Send(FakePort& port) {
        if (next >= blocks) {
            port.Deliver(Bytes{0x04});
            return;
        }
        const std::string text = BlockText(next);
        BccBlock block =
            BuildBccBlock(reinterpret_cast<const uint8_t*>(text.data()), text.size(), next);
        if (damage)
            damage(next, attempt, block);
        ++attempt;
        port.Deliver(AsBytes(block));
    }
    void Attach(FakePort& port) {
        port.onWrite = [this](const Bytes& written, FakePort& p) {
            if (written == kEnqLine) {
                Send(p);
            } else if (written == kAckLine && next <= blocks) {
                ++next;
                attempt = 0;
                if (next <= blocks)
                    Send(p);
            } else if (written == kNakLine) {
                Send(p);
            }
        };
    }
};

TEST_F(BlockProtocolTest, BccBlocksAreWrittenAndTheEndAcknowledgedTenTimes) {
    Start(1);
    BccInstrument instrument;
    instrument.Attach(rig.port);
    EXPECT_EQ(protocol->Receive(), 0u);
    Bytes expected;
    for (int i = 0; i < 3; ++i) {
        const Bytes data = Padded(BlockText(i));
        expected.insert(expected.end(), data.begin(), data.end());
    }
    EXPECT_EQ(rig.file.content, expected);
    ASSERT_GE(rig.port.writes.size(), 10u);
    for (size_t i = rig.port.writes.size() - 10; i < rig.port.writes.size(); ++i)
        EXPECT_EQ(rig.port.writes[i], kAckLine);
    EXPECT_EQ(rig.port.writes.front(), kEnqLine);
}

TEST_F(BlockProtocolTest, BadBccIsAnsweredWithNakAndTheResentBlockWrittenOnce) {
    Start(1);
    BccInstrument instrument;
    instrument.damage = [](int index, int attempt, BccBlock& block) {
        if (index == 1 && attempt < 2)
            block[20] ^= 0x40;
    };
    instrument.Attach(rig.port);
    EXPECT_EQ(protocol->Receive(), 0u);
    EXPECT_EQ(rig.file.content.size(), 3 * 128u);
    EXPECT_EQ(std::count(rig.port.writes.begin(), rig.port.writes.end(), kNakLine), 2);
}

TEST_F(BlockProtocolTest, BlockRepeatedWithTheSameDigitIsWrittenOnce) {
    Start(1);
    BccInstrument instrument;
    instrument.Attach(rig.port);
    auto inner = rig.port.onWrite;
    // The instrument misses our first ACK of block 1 and sends block 1 again.
    rig.port.onWrite = [&, inner, missed = false](const Bytes& written, FakePort& port) mutable {
        if (written == kAckLine && instrument.next == 1 && !missed) {
            missed = true;
            instrument.Send(port);
            return;
        }
        inner(written, port);
    };
    EXPECT_EQ(protocol->Receive(), 0u);
    EXPECT_EQ(rig.file.content.size(), 3 * 128u);
}

TEST_F(BlockProtocolTest, FiveNaksInARowEndTheBlockProtocol) {
    Start(1);
    BccInstrument instrument;
    instrument.damage = [](int index, int, BccBlock& block) {
        if (index == 2)
            block[5] ^= 1;
    };
    instrument.Attach(rig.port);
    EXPECT_EQ(protocol->Receive(), 1u);
    EXPECT_EQ(std::count(rig.port.writes.begin(), rig.port.writes.end(), kNakLine), 4);
    EXPECT_EQ(rig.callback.messages,
              OnlyMessage(4, WIDE_TEXT("AZ doesn't respond or error in importing block")));
    EXPECT_EQ(rig.file.content.size(), 2 * 128u);
}

TEST_F(BlockProtocolTest, SilentInstrumentIsPolledAgainEveryFourSecondsUntilTheTimeOut) {
    Start(1);
    const int64_t start = rig.clock.WallSeconds();
    EXPECT_EQ(protocol->Receive(), 1u);
    EXPECT_GT(rig.clock.WallSeconds() - start, 60);
    const auto enqs = std::count(rig.port.writes.begin(), rig.port.writes.end(), kEnqLine);
    EXPECT_GE(enqs, 14);
    EXPECT_LE(enqs, 16);
    EXPECT_EQ(rig.callback.messages.back().text,
              WIDE_TEXT("The waiting time of the data has expired."));
}

TEST_F(BlockProtocolTest, CancelAfterANakClosesThePort) {
    Start(1);
    BccInstrument instrument;
    instrument.damage = [](int index, int, BccBlock& block) {
        if (index == 1)
            block[5] ^= 1;
    };
    instrument.Attach(rig.port);
    int asked = 0;
    rig.callback.cancelWhen = [&] { return ++asked > 1; };
    EXPECT_EQ(protocol->Receive(), 1u);
    EXPECT_EQ(rig.callback.messages,
              OnlyMessage(4, WIDE_TEXT("The communication's process is interrupted by the user")));
    EXPECT_EQ(rig.port.closes, 1);
    EXPECT_FALSE(protocol->IsPortOpen());
}

// A Y-Modem sender: header on the first 'C', data blocks on each ACK, EOT after the last.
struct YModemSender {
    Bytes file;
    std::string name = "survey.lv";
    size_t nextBlock = 0;  // 0 = header
    bool eotSent = false;
    std::function<void(size_t block, Bytes& bytes)> damage;
    CrcTable table;

    YModemSender() { BuildCrcTable(table); }
    size_t DataBlocks() const { return (file.size() + 127) / 128; }
    void SendCurrent(FakePort& port) {
        if (nextBlock == 0) {
            const YModemBlock header =
                BuildYModemHeaderBlock(name, static_cast<uint32_t>(file.size()), 0, table);
            port.Deliver(Bytes(header.begin(), header.end()));
            return;
        }
        if (nextBlock > DataBlocks()) {
            port.Deliver(Bytes{0x04});
            eotSent = true;
            return;
        }
        Bytes block = {0x01, static_cast<uint8_t>(nextBlock),
                       static_cast<uint8_t>(255 - nextBlock)};
        const size_t offset = (nextBlock - 1) * 128;
        Bytes data(file.begin() + offset, file.begin() + std::min(file.size(), offset + 128));
        data.resize(128, 0x1A);
        block.insert(block.end(), data.begin(), data.end());
        const uint16_t crc = Crc16(table, data.data(), data.size());
        block.push_back(static_cast<uint8_t>(crc >> 8));
        block.push_back(static_cast<uint8_t>(crc));
        if (damage)
            damage(nextBlock, block);
        port.Deliver(block);
    }
    void Attach(FakePort& port) {
        port.onWrite = [this](const Bytes& written, FakePort& p) {
            if (written == Bytes{0x43} && nextBlock == 0) {
                SendCurrent(p);
            } else if (written == Bytes{0x06, 0x43} || (written == Bytes{0x06} && !eotSent)) {
                ++nextBlock;
                SendCurrent(p);
            } else if (written == Bytes{0x15}) {
                SendCurrent(p);
            }
        };
    }
};

TEST_F(BlockProtocolTest, YModemReceivesTheAnnouncedSizeAndReportsTheHeader) {
    Start(2);
    YModemSender sender;
    for (int i = 0; i < 300; ++i)
        sender.file.push_back(static_cast<uint8_t>(i * 7));
    sender.Attach(rig.port);

    EXPECT_EQ(protocol->Receive(), 0u);
    EXPECT_EQ(rig.file.content, sender.file);
    EXPECT_EQ(protocol->FileSize(), 300u);
    EXPECT_EQ(protocol->YModemFileName(), "survey.lv");
    EXPECT_EQ(protocol->ExpectedBlockCount(), 3u);
    EXPECT_EQ(rig.callback.messages,
              OnlyMessage(1, WIDE_TEXT("Y-Modem File Info: survey.lv (size=300 byte)")));
    EXPECT_EQ(rig.port.writes.back(), (Bytes{0x18, 0x18}));
    EXPECT_EQ(rig.callback.progress.back(), std::make_pair(300u, 299u));
}

TEST_F(BlockProtocolTest, YModemBlockOfHundredThirtyOneBytesPassesWithoutCrc) {
    Start(2);
    YModemSender sender;
    sender.file = Bytes(200, 'L');
    sender.damage = [](size_t block, Bytes& bytes) {
        if (block == 2)
            bytes.resize(131);
    };
    sender.Attach(rig.port);
    EXPECT_EQ(protocol->Receive(), 0u);
    EXPECT_EQ(rig.file.content, sender.file);
}

TEST_F(BlockProtocolTest, YModemTenNaksInARowFail) {
    Start(2);
    YModemSender sender;
    sender.file = Bytes(500, 'L');
    sender.damage = [](size_t block, Bytes& bytes) {
        if (block == 2)
            bytes[60] ^= 1;
    };
    sender.Attach(rig.port);
    EXPECT_EQ(protocol->Receive(), 1u);
    EXPECT_EQ(std::count(rig.port.writes.begin(), rig.port.writes.end(), Bytes{0x15}), 10);
    EXPECT_EQ(rig.callback.messages.back().text,
              WIDE_TEXT("AZ doesn't respond or error in importing block"));
    EXPECT_EQ(rig.file.content.size(), 128u);
}

TEST_F(BlockProtocolTest, SendingAYModemHeaderWaitsForTheReceiverAndResendsUntilAck) {
    Start(2);
    CrcTable table;
    BuildCrcTable(table);
    const YModemBlock header = BuildYModemHeaderBlock("a.lv", 10, 5, table);
    int sends = 0;
    rig.port.Queue(Bytes{0x43});
    rig.port.onWrite = [&](const Bytes& written, FakePort& port) {
        EXPECT_EQ(written, Bytes(header.begin(), header.end()));
        port.Deliver(Bytes{++sends < 3 ? uint8_t{0x15} : uint8_t{0x06}});
    };
    EXPECT_EQ(protocol->SendYModemHeader(header), 0u);
    EXPECT_EQ(sends, 3);
}

TEST_F(BlockProtocolTest, InputFileBccMismatchIsReportedWithItsNumbers) {
    Start(1);
    const std::string text = "abc";
    BccBlock block = BuildBccBlock(reinterpret_cast<const uint8_t*>(text.data()), 3, 0);
    const uint8_t stored = ComputeBcc(block.data());
    block[1] = 'b';  // 'a' ^ 'b' = 3
    Bytes file(block.begin(), block.end());
    file.push_back(0x04);
    EXPECT_FALSE(protocol->CheckInputFile(file.data(), file.size()));
    ASSERT_EQ(rig.callback.messages.size(), 1u);
    const std::string expected = "Incorrect input file: BCC in block 0 mismatch with computed " +
                                 std::to_string(stored) + "!=" + std::to_string(stored ^ 3);
    EXPECT_EQ(rig.callback.messages[0].text, WidenBytes(expected.data(), expected.size()));
    EXPECT_TRUE(protocol->IsFileOpened());
    const Bytes notBlocks = ToBytes("plain text");
    EXPECT_TRUE(protocol->CheckInputFile(notBlocks.data(), notBlocks.size()));
    EXPECT_FALSE(protocol->IsFileOpened());
}

}  // namespace
