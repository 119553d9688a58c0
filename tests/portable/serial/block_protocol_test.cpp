// The block receive procedures through the port interface: raw stream, BCC blocks, Y-Modem.
#include <gtest/gtest.h>

#include <utility>

#include "tests/portable/serial/scripted_instruments.h"

namespace {

const WideString kWaitExpired = WIDE_TEXT("The waiting time of the data has expired.");
const WideString kImportFailed = WIDE_TEXT("AZ doesn't respond or error in importing block");
const WideString kInterrupted = WIDE_TEXT("The communication's process is interrupted by the user");

TEST(RawStream, WritesEveryBurstUntilEot) {
    ProtocolRun run(ReceiveProcedure::RawStreamWithoutFlowControl);
    run.port.Deliver("first burst ");
    run.port.Deliver("second");
    run.port.onSilence = [sent = false](FakePort& port) mutable {
        if (!std::exchange(sent, true))
            port.Queue(ToBytes("end\x04x"));
    };
    EXPECT_EQ(run.protocol.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.Text(), "first burst secondend\x04x");
    EXPECT_TRUE(run.port.writes.empty());
    EXPECT_EQ(run.callback.progress.front(), std::make_pair(100u, 0u));
    EXPECT_EQ(run.callback.progress.back(), std::make_pair(100u, 20u));
}

TEST(RawStream, WithoutEotTimesOut) {
    ProtocolRun run(ReceiveProcedure::RawStream);
    run.port.Deliver("no end");
    EXPECT_EQ(run.protocol.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.file.Text(), "no end");
    EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, kWaitExpired));
    EXPECT_FALSE(run.file.open);
}

TEST(BccBlocks, AreWrittenAfterTheEnqAndTheEndIsAcknowledgedTenTimes) {
    BccRun run;
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.Text(), BlocksText(3));
    EXPECT_EQ(run.port.writes.front(), kEnqLine);
    ASSERT_GE(run.port.writes.size(), 10u);
    EXPECT_EQ(std::vector(run.port.writes.end() - 10, run.port.writes.end()),
              std::vector<Bytes>(10, kAckLine));
}

TEST(BccBlocks, BadBccIsAnsweredWithNakUntilTheFifthBadBlockInARowEndsTheReceive) {
    const struct {
        int badAttempts;  // of block 1
        TransferResult result;
        long naks;
        int blocksWritten;
        std::vector<RecordedMessage> messages;
    } cases[] = {
        {2, TransferResult::Complete, 2, 3, {}},
        {5, TransferResult::Failed, 4, 1, OnlyMessage(MessageCode::Error, kImportFailed)},
    };
    for (const auto& test : cases) {
        BccRun run;
        run.damage = [&](int index, int attempt, BccBlock& block) {
            if (index == 1 && attempt < test.badAttempts)
                block[20] ^= 0x40;
        };
        EXPECT_EQ(run.Receive(), test.result) << test.badAttempts;
        EXPECT_EQ(run.port.WritesOf(kNakLine), test.naks) << test.badAttempts;
        EXPECT_EQ(run.file.Text(), BlocksText(test.blocksWritten)) << test.badAttempts;
        EXPECT_EQ(run.callback.messages, test.messages) << test.badAttempts;
    }
}

TEST(BccBlocks, BlockSentAgainWithTheSameDigitIsWrittenOnce) {
    BccRun run;
    run.missedAck = 1;
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.port.WritesOf(kAckLine), 3 + 1 + 10) << "block 1 is acknowledged twice";
    EXPECT_EQ(run.file.Text(), BlocksText(3));
}

TEST(BccBlocks, SilentInstrumentIsPolledAgainEveryFourSecondsUntilTheTimeOut) {
    ProtocolRun run(ReceiveProcedure::BccBlocks);
    const int64_t start = run.clock.WallSeconds();
    EXPECT_EQ(run.protocol.Receive(), TransferResult::Failed);
    EXPECT_GT(run.clock.WallSeconds() - start, 60);
    EXPECT_GE(run.port.WritesOf(kEnqLine), 14);
    EXPECT_LE(run.port.WritesOf(kEnqLine), 16);
    EXPECT_EQ(run.callback.messages.back().text, kWaitExpired);
}

TEST(BccBlocks, CancelSeenOnABadBlockClosesThePort) {
    BccRun run;
    run.damage = [](int index, int, BccBlock& block) {
        if (index == 1)
            block[5] ^= 1;
    };
    int asked = 0;
    run.callback.cancelWhen = [&] { return ++asked > 1; };
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, kInterrupted));
    EXPECT_EQ(run.port.closes, 1);
    EXPECT_FALSE(run.protocol.IsPortOpen());
}

TEST(YModem, ReceivesTheAnnouncedSizeAndReportsTheHeader) {
    Bytes sent;
    for (int i = 0; i < 300; ++i)
        sent.push_back(static_cast<uint8_t>(i * 7));
    YModemRun run(sent);
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.content, sent);
    EXPECT_EQ(run.protocol.FileSize(), 300u);
    EXPECT_EQ(run.protocol.YModemFileName(), "survey.lv");
    EXPECT_EQ(run.protocol.ExpectedBlockCount(), 3u);
    EXPECT_EQ(run.callback.messages,
              OnlyMessage(MessageCode::Information,
                          WIDE_TEXT("Y-Modem File Info: survey.lv (size=300 byte)")));
    EXPECT_EQ(run.port.writes.back(), (Bytes{0x18, 0x18}));
    EXPECT_EQ(run.callback.progress.back(), std::make_pair(300u, 299u));
}

TEST(YModem, BlockOfHundredThirtyOneBytesPassesWithoutCrc) {
    YModemRun run(Bytes(200, 'L'));
    run.damage = [](size_t block, Bytes& bytes) {
        if (block == 2)
            bytes.resize(131);
    };
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.content, run.sent);
}

TEST(YModem, TenNaksInARowFail) {
    YModemRun run(Bytes(500, 'L'));
    run.damage = [](size_t block, Bytes& bytes) {
        if (block == 2)
            bytes[60] ^= 1;
    };
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.port.WritesOf(Bytes{0x15}), 10);
    EXPECT_EQ(run.callback.messages.back().text, kImportFailed);
    EXPECT_EQ(run.file.content.size(), 128u);
}

TEST(YModem, SendingAHeaderWaitsForTheReceiverAndResendsUntilAck) {
    ProtocolRun run(ReceiveProcedure::YModem);
    const YModemBlock header = BuildYModemHeaderBlock("a.lv", 10, 5, MakeCrcTable());
    int sends = 0;
    run.port.Queue(Bytes{0x43});
    run.port.onWrite = [&](const Bytes& written, FakePort& port) {
        EXPECT_EQ(written, Bytes(header.begin(), header.end()));
        port.Deliver(Bytes{++sends < 3 ? uint8_t{0x15} : uint8_t{0x06}});
    };
    EXPECT_EQ(run.protocol.SendYModemHeader(header), TransferResult::Complete);
    EXPECT_EQ(sends, 3);
}

// Each block procedure on a disk that fills up part-way through the second block: the receive
// fails at that write, with the system's text, and the block that did not fit is not answered
// as received (no ACK after it).
TEST(BlockProcedures, ARefusedWriteFailsTheReceiveAtThatBlock) {
    const WideString diskFull = WIDE_TEXT("System error 112");
    {
        SCOPED_TRACE("raw stream");
        ProtocolRun run(ReceiveProcedure::RawStream);
        run.file.capacity = 20;
        run.port.Deliver("first burst ");
        run.port.onSilence = [sent = false](FakePort& port) mutable {
            if (!std::exchange(sent, true))
                port.Queue(ToBytes("second burst\x04"));
        };
        EXPECT_EQ(run.protocol.Receive(), TransferResult::Failed);
        EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, diskFull));
        EXPECT_EQ(run.protocol.FileError(), MemoryFile::kDiskFull);
        EXPECT_FALSE(run.file.open);
    }
    {
        SCOPED_TRACE("BCC blocks");
        BccRun run;
        run.file.capacity = 128 + 10;
        EXPECT_EQ(run.Receive(), TransferResult::Failed);
        EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, diskFull));
        // ENQ, then the ACK of block 0; block 1 is left unanswered.
        EXPECT_EQ(run.port.writes, (std::vector<Bytes>{kEnqLine, kAckLine}));
        EXPECT_FALSE(run.file.open);
    }
    {
        SCOPED_TRACE("Y-Modem");
        YModemRun run(Bytes(400, 'L'));
        run.file.capacity = 128 + 10;
        EXPECT_EQ(run.Receive(), TransferResult::Failed);
        EXPECT_EQ(run.callback.messages.back(), (RecordedMessage{MessageCode::Error, diskFull}));
        // 'C', the header's ACK 'C', the first block's ACK: nothing after the second block.
        EXPECT_EQ(run.port.writes,
                  (std::vector<Bytes>{Bytes{0x43}, Bytes{0x06, 0x43}, Bytes{0x06}}));
        EXPECT_FALSE(run.file.open);
    }
}

TEST(BlockProcedures, AFileThatFailsToCloseFailsAnOtherwiseGoodReceive) {
    BccRun run;
    run.file.closeError = 1784;
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.file.Text(), BlocksText(3));
    EXPECT_EQ(run.callback.messages,
              OnlyMessage(MessageCode::Error, WIDE_TEXT("System error 1784")));
}

}  // namespace
