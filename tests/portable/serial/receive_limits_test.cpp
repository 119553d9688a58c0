// Receive procedures against an instrument that never stops sending good data: the user's cancel
// and the size cap end them, and nothing past that point is written or acknowledged.
#include <gtest/gtest.h>

#include <algorithm>

#include "tests/portable/serial/scripted_instruments.h"

namespace {

const WideString kInterrupted = WIDE_TEXT("The communication's process is interrupted by the user");
// The cap as the driver names it: the product's, and the nearer one these tests give it (the
// product's takes half a million scripted blocks).
WideString SizeLimitText(int mebibytes) {
    return WIDE_TEXT("The instrument sent more than ") + DecimalText(mebibytes) +
           WIDE_TEXT(" MiB, more than any instrument holds. The transfer was stopped.");
}
constexpr uint64_t kTestCap = uint64_t{1} << 20;
constexpr int kBlocksToCap = static_cast<int>(kTestCap / kBlockDataSize);

enum class Procedure { BccBlocks, YModem };

const char* NameOf(Procedure procedure) {
    return procedure == Procedure::BccBlocks ? "BCC blocks" : "Y-Modem";
}

// The Y-Modem sender's file: 40 blocks, each byte telling its place.
Bytes YModemFile() {
    Bytes file(40 * kBlockDataSize);
    for (size_t i = 0; i < file.size(); ++i)
        file[i] = static_cast<uint8_t>(i * 13 + i / 256);
    return file;
}

// What one receive against an endless instrument left.
struct Outcome {
    TransferResult result = TransferResult::Complete;
    int acknowledged = 0;
    std::vector<RecordedMessage> messages;
    Bytes file;
    bool portOpen = true;
    int closes = 0;
};

// One procedure against its instrument sending good blocks forever, with the test's cap; with
// cancelAfter >= 0 the user cancels as soon as the driver has acknowledged that many blocks.
Outcome RunEndless(Procedure procedure, int cancelAfter) {
    Outcome outcome;
    auto receive = [&](auto& run) {
        run.protocol.SetReceiveCap(kTestCap);
        if (cancelAfter >= 0)
            run.callback.cancelWhen = [&run, cancelAfter] {
                return run.Acknowledged() >= cancelAfter;
            };
        outcome.result = run.Receive();
        outcome.acknowledged = run.Acknowledged();
        outcome.messages = run.callback.messages;
        outcome.file = std::move(run.file.content);
        outcome.portOpen = run.protocol.IsPortOpen();
        outcome.closes = run.port.closes;
    };
    if (procedure == Procedure::BccBlocks) {
        BccRun run;
        run.blocks = kEndless;
        receive(run);
    } else {
        YModemRun run(YModemFile());
        run.endless = true;
        receive(run);
    }
    return outcome;
}

// What the first count acknowledged blocks leave in the file: Y-Modem writes no more than the
// header announced, however many blocks follow.
Bytes FileAfter(Procedure procedure, int count) {
    if (procedure == Procedure::BccBlocks)
        return ToBytes(BlocksText(count));
    const Bytes file = YModemFile();
    return Bytes(file.begin(),
                 file.begin() + std::min(file.size(), static_cast<size_t>(count) * kBlockDataSize));
}

TEST(EndlessInstrument, ACancelAfterBlockKEndsTheReceiveAtBlockKPlusOne) {
    // 45: the Y-Modem sender is past the 40 blocks it announced and keeps going.
    for (const Procedure procedure : {Procedure::BccBlocks, Procedure::YModem}) {
        for (const int k : {0, 1, 5, 45}) {
            SCOPED_TRACE(std::string(NameOf(procedure)) + ", cancel after block " +
                         std::to_string(k));
            const Outcome outcome = RunEndless(procedure, k);
            EXPECT_EQ(outcome.result, TransferResult::Failed);
            // Block k + 1 arrived and was neither acknowledged nor written.
            EXPECT_EQ(outcome.acknowledged, k);
            EXPECT_EQ(outcome.file, FileAfter(procedure, k));
            ASSERT_FALSE(outcome.messages.empty());
            EXPECT_EQ(outcome.messages.back(), (RecordedMessage{MessageCode::Error, kInterrupted}));
            EXPECT_EQ(std::count(outcome.messages.begin(), outcome.messages.end(),
                                 RecordedMessage{MessageCode::Error, kInterrupted}),
                      1);
            EXPECT_FALSE(outcome.portOpen);
            EXPECT_EQ(outcome.closes, 1);
        }
    }
}

TEST(EndlessInstrument, TheSizeCapEndsTheReceiveWithItsMessage) {
    for (const Procedure procedure : {Procedure::BccBlocks, Procedure::YModem}) {
        SCOPED_TRACE(NameOf(procedure));
        const Outcome outcome = RunEndless(procedure, -1);
        EXPECT_EQ(outcome.result, TransferResult::Failed);
        // Every block up to the cap is taken; the one that would pass it is not acknowledged.
        EXPECT_EQ(outcome.acknowledged, kBlocksToCap);
        ASSERT_FALSE(outcome.messages.empty());
        EXPECT_EQ(outcome.messages.back(), (RecordedMessage{MessageCode::Error, SizeLimitText(1)}));
        EXPECT_EQ(outcome.file, FileAfter(procedure, kBlocksToCap));
    }
}

TEST(EndlessInstrument, TheRawStreamAndTheLineProtocolEndAtTheCapToo) {
    {
        SCOPED_TRACE("raw stream: bursts without EOT");
        // All of each burst is data (without flow control a 136-byte burst would give 128).
        ProtocolRun run(ReceiveProcedure::RawStream);
        run.protocol.SetReceiveCap(kTestCap);
        run.port.onSilence = [](FakePort& port) { port.Queue(Bytes(136, 'R')); };
        EXPECT_EQ(run.protocol.Receive(), TransferResult::Failed);
        EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, SizeLimitText(1)));
        // Every burst up to the cap, none past it.
        EXPECT_EQ(run.file.content.size(), kTestCap / 136 * 136);
    }
    {
        SCOPED_TRACE("line protocol: checked lines without the end line");
        ProtocolRun run(ReceiveProcedure::BccBlocks);
        run.protocol.SetReceiveCap(kTestCap);
        const Bytes ack = {0x06, ',', 'R', ',', 0x0D, 0x0A};
        int sent = 0;
        auto next = [&] {
            std::string body = "B," + std::to_string(sent++) + ",";
            body.resize(95, '7');
            body += ',';
            return body + static_cast<char>(LineCheckCharacter(BytesOf(body), body.size())) +
                   ",\r\n";
        };
        run.port.onWrite = [&](const Bytes& written, FakePort& port) {
            if (written == ack)
                port.Deliver(next());
        };
        run.port.Deliver("A,01,Z\r\n");
        EXPECT_EQ(run.protocol.ReceiveLines(), TransferResult::Failed);
        EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, SizeLimitText(1)));
        // The header and 100-byte lines up to the cap, each acknowledged; the next one not.
        const size_t lines = (kTestCap - 8) / 100;
        EXPECT_EQ(run.file.content.size(), 8 + lines * 100);
        EXPECT_EQ(run.port.WritesOf(ack), static_cast<long>(lines + 1));
    }
}

// With the product's own cap.
TEST(YModem, AHeaderAnnouncingMoreThanTheCapIsRefusedAtOnce) {
    const struct {
        uint64_t announced;
        TransferResult result;
        bool headerAcknowledged;
    } cases[] = {
        {kMaxReceiveBytes + 1, TransferResult::Failed, false},
        {kMaxReceiveBytes, TransferResult::Complete,
         true},  // at the cap: taken (the sender here then sends its EOT)
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(test.announced);
        YModemRun run(Bytes(300, 'L'));
        run.announcedSize = static_cast<int64_t>(test.announced);
        EXPECT_EQ(run.Receive(), test.result);
        EXPECT_EQ(run.port.WritesOf(Bytes{0x06, 0x43}), test.headerAcknowledged ? 1 : 0);
        const bool capMessage =
            !run.callback.messages.empty() &&
            run.callback.messages.back() == RecordedMessage{MessageCode::Error, SizeLimitText(64)};
        EXPECT_EQ(capMessage, !test.headerAcknowledged);
    }
}

}  // namespace
