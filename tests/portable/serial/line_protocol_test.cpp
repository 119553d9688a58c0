// The line protocol through the port interface: acknowledgements, checks, repeats, time-outs.
#include <gtest/gtest.h>

#include "download/portable/block_format.h"
#include "download/portable/serial_protocol.h"
#include "tests/portable/serial/fake_serial.h"

namespace {

const Bytes kAckLine = {0x06, ',', 'R', ',', 0x0D, 0x0A};
const Bytes kNakLine = {0x15, ',', '!', ',', 0x0D, 0x0A};

std::string DataLine(const std::string& body) {
    const char check = static_cast<char>(
        LineCheckCharacter(reinterpret_cast<const uint8_t*>(body.data()), body.size()));
    return body + check + ",\r\n";
}

std::vector<std::string> Transfer(int dataLines) {
    std::vector<std::string> lines = {"A,01,Z\r\n"};
    for (int i = 1; i <= dataLines; ++i)
        lines.push_back(
            DataLine("B," + std::to_string(i) + ",1.2345" + std::to_string(i % 10) + ",45.210,"));
    lines.push_back("Z,&,\r\n");
    return lines;
}

std::string Joined(const std::vector<std::string>& lines) {
    std::string all;
    for (const auto& line : lines)
        all += line;
    return all;
}

int CountReplies(const Bytes& written, const Bytes& reply) {
    int count = 0;
    for (size_t i = 0; i + reply.size() <= written.size(); ++i)
        if (std::equal(reply.begin(), reply.end(), written.begin() + i))
            ++count;
    return count;
}

// An instrument that sends its lines one by one, the next on ACK, the same one again on NAK.
// sendAs may change what goes on the wire for (line index, attempt) and split it into chunks.
struct LineInstrument {
    std::vector<std::string> lines;
    size_t next = 0;
    int attempt = 0;
    std::function<std::vector<std::string>(size_t index, int attempt, const std::string& line)>
        sendAs;

    void Send(FakePort& port) {
        if (next >= lines.size())
            return;
        const std::vector<std::string> chunks =
            sendAs ? sendAs(next, attempt, lines[next]) : std::vector<std::string>{lines[next]};
        for (const auto& chunk : chunks)
            port.Deliver(chunk);
        ++attempt;
    }
    void Attach(FakePort& port) {
        port.onWrite = [this](const Bytes& written, FakePort& p) {
            if (written == kAckLine) {
                ++next;
                attempt = 0;
            }
            Send(p);
        };
        Send(port);
    }
};

struct LineProtocolTest : ::testing::Test {
    ProtocolRig rig;
    SerialProtocol protocol{rig.port, rig.clock, rig.file, rig.callback, rig.texts, 1};
    LineInstrument instrument;
    void SetUp() override { protocol.SetPortOpen(true); }
};

TEST_F(LineProtocolTest, ReceivesWholeTransferWritingEveryLineAndAcknowledgingEach) {
    instrument.lines = Transfer(3);
    instrument.Attach(rig.port);

    EXPECT_EQ(protocol.ReceiveLines(), 0u);
    EXPECT_EQ(rig.file.Text(), Joined(instrument.lines));
    EXPECT_EQ(rig.port.written.size(), 5 * kAckLine.size());
    EXPECT_EQ(CountReplies(rig.port.written, kAckLine), 5);
    EXPECT_FALSE(rig.file.open);
    EXPECT_TRUE(rig.callback.messages.empty());
    const std::vector<std::pair<uint32_t, uint32_t>> progress = {{100, 0},  {100, 3},  {100, 6},
                                                                 {100, 10}, {100, 13}, {100, 16}};
    EXPECT_EQ(rig.callback.progress, progress);
}

TEST_F(LineProtocolTest, LinesSplitAtEveryBoundaryAreJoined) {
    const std::vector<std::string> lines = Transfer(1);
    for (size_t split = 1; split < lines[1].size(); ++split) {
        ProtocolRig local;
        SerialProtocol receiver(local.port, local.clock, local.file, local.callback, local.texts,
                                1);
        receiver.SetPortOpen(true);
        LineInstrument splitter;
        splitter.lines = lines;
        splitter.sendAs = [split](size_t index, int, const std::string& line) {
            if (index != 1)
                return std::vector<std::string>{line};
            return std::vector<std::string>{line.substr(0, split), line.substr(split)};
        };
        splitter.Attach(local.port);
        ASSERT_EQ(receiver.ReceiveLines(), 0u) << "split at " << split;
        EXPECT_EQ(local.file.Text(), Joined(lines)) << "split at " << split;
    }
}

TEST_F(LineProtocolTest, ProgressStopsAtHundredFromTheThirtiethLine) {
    instrument.lines = Transfer(40);
    instrument.Attach(rig.port);
    ASSERT_EQ(protocol.ReceiveLines(), 0u);
    const auto& progress = rig.callback.progress;
    ASSERT_EQ(progress.size(), 43u);
    EXPECT_EQ(progress[29].second, 96u);
    EXPECT_EQ(progress[30].second, 100u);
    EXPECT_EQ(progress.back().second, 100u);
}

TEST_F(LineProtocolTest, AReplyThatMovesNoByteIsGivenUpAfterThreeSeconds) {
    rig.port.Deliver(Transfer(1).front());  // the header, then nothing more
    rig.port.refuseWrites = true;
    EXPECT_EQ(protocol.ReceiveLines(), 1u) << "the instrument never hears the ACK and goes silent";
    // Each refused write costs 100 ms: the reply stops at the first attempt past 3000 ms, and
    // the receive goes on to its own time-out instead of spinning on the dead line.
    EXPECT_EQ(31, rig.port.refusedWrites);
    EXPECT_TRUE(rig.port.written.empty());
}

TEST_F(LineProtocolTest, WrongCheckCharacterIsRefusedNotWrittenAndTheResendAccepted) {
    instrument.lines = Transfer(3);
    instrument.sendAs = [](size_t index, int attempt, const std::string& line) {
        std::string sent = line;
        if (index == 2 && attempt == 0)
            sent[sent.size() - 4] ^= 0x01;  // the check character
        return std::vector<std::string>{sent};
    };
    instrument.Attach(rig.port);

    EXPECT_EQ(protocol.ReceiveLines(), 0u);
    EXPECT_EQ(rig.file.Text(), Joined(instrument.lines));
    EXPECT_EQ(CountReplies(rig.port.written, kNakLine), 1);
    EXPECT_EQ(CountReplies(rig.port.written, kAckLine), 5);
}

TEST_F(LineProtocolTest, RefusedLinesDoNotPostponeTheTimeOut) {
    instrument.lines = Transfer(3);
    instrument.sendAs = [](size_t index, int, const std::string& line) {
        std::string sent = line;
        if (index == 2)
            sent[sent.size() - 4] ^= 0x01;
        return std::vector<std::string>{sent};
    };
    // The instrument answers each NAK only after a second of thinking.
    instrument.Attach(rig.port);
    auto inner = rig.port.onWrite;
    rig.port.onWrite = [&, inner](const Bytes& written, FakePort& port) {
        rig.clock.Advance(1000);
        inner(written, port);
    };
    const int64_t start = rig.clock.WallSeconds();

    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_GT(rig.clock.WallSeconds() - start, 60);
    EXPECT_LT(rig.clock.WallSeconds() - start, 70);
    EXPECT_EQ(rig.callback.messages,
              OnlyMessage(4, WIDE_TEXT("The waiting time of the data has expired.")));
    EXPECT_EQ(rig.file.Text(), instrument.lines[0] + instrument.lines[1]);
}

TEST_F(LineProtocolTest, RepeatedLineIsAcknowledgedTwiceButWrittenOnceUnlessNotAdjacent) {
    const std::string repeated = DataLine("B,7,1.11111,2.000,");
    instrument.lines = {"A,01,Z\r\n", repeated,  repeated, DataLine("B,8,1.2,3.0,"),
                        repeated,     "Z,&,\r\n"};
    instrument.Attach(rig.port);

    EXPECT_EQ(protocol.ReceiveLines(), 0u);
    EXPECT_EQ(CountReplies(rig.port.written, kAckLine), 6);
    EXPECT_EQ(rig.file.Text(),
              "A,01,Z\r\n" + repeated + DataLine("B,8,1.2,3.0,") + repeated + "Z,&,\r\n");
}

TEST_F(LineProtocolTest, EndLineIsWrittenWithoutTheLineCheck) {
    // The end line, with anything after "Z,&,", would fail the check.
    instrument.lines = {"A,01,Z\r\n", DataLine("B,1,0.5,"), "Z,&,~~garbage\r\n"};
    instrument.Attach(rig.port);
    EXPECT_EQ(protocol.ReceiveLines(), 0u);
    EXPECT_EQ(rig.file.Text(), Joined(instrument.lines));
}

TEST_F(LineProtocolTest, SixtyRefusalsBeforeTheHeaderAreTolerated) {
    instrument.lines.assign(60, "noise\r\n");
    const auto transfer = Transfer(1);
    instrument.lines.insert(instrument.lines.end(), transfer.begin(), transfer.end());
    instrument.Attach(rig.port);
    // Each refused line is answered with NAK: move on as if the noise were new lines.
    auto inner = rig.port.onWrite;
    rig.port.onWrite = [&, inner](const Bytes& written, FakePort& port) {
        if (written == kNakLine)
            inner(kAckLine, port);
        else
            inner(written, port);
    };
    EXPECT_EQ(protocol.ReceiveLines(), 0u);
    EXPECT_EQ(CountReplies(rig.port.written, kNakLine), 60);
    EXPECT_EQ(rig.file.Text(), Joined(transfer));
}

TEST_F(LineProtocolTest, TheSixtyFirstRefusalEndsTheReceiveSilently) {
    instrument.lines.assign(100, "noise before the header\r\n");
    instrument.Attach(rig.port);
    auto inner = rig.port.onWrite;
    rig.port.onWrite = [inner](const Bytes&, FakePort& port) { inner(kAckLine, port); };

    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_EQ(CountReplies(rig.port.written, kNakLine), 61);
    EXPECT_TRUE(rig.callback.messages.empty());
    EXPECT_TRUE(rig.file.content.empty());
    EXPECT_FALSE(rig.file.open);
}

TEST_F(LineProtocolTest, FullLineWithoutLineEndIsNeverAcceptedAndTimesOut) {
    instrument.lines = {"A,01,Z\r\n", std::string(128, 'X'), DataLine("B,1,2,")};
    instrument.Attach(rig.port);
    // Keep streaming after the 128 bytes: the surplus must not overrun the line.
    rig.port.onSilence = [](FakePort& port) { port.Queue(Bytes(200, 'Y')); };

    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_EQ(rig.file.Text(), "A,01,Z\r\n");
    EXPECT_EQ(rig.callback.messages,
              OnlyMessage(4, WIDE_TEXT("The waiting time of the data has expired.")));
}

TEST_F(LineProtocolTest, ClosedPortFailsAtOnceAndSilenceEndsAfterMoreThanSixtySeconds) {
    protocol.SetPortOpen(false);
    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_EQ(rig.file.creates, 0);
    EXPECT_EQ(rig.port.readCalls, 0);

    protocol.SetPortOpen(true);
    const int64_t start = rig.clock.WallSeconds();
    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_EQ(rig.clock.WallSeconds() - start, 61);
    ASSERT_EQ(rig.callback.messages.size(), 1u);
    EXPECT_EQ(rig.callback.messages[0].code, 4u);
    EXPECT_EQ(rig.port.closes, 0);
}

TEST_F(LineProtocolTest, CancelReportsClosesThePortAndLeavesTheDriverUnusable) {
    instrument.lines = Transfer(10);
    instrument.Attach(rig.port);
    rig.callback.cancelWhen = [&] { return rig.file.content.size() > 20; };

    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_EQ(rig.callback.messages,
              OnlyMessage(4, WIDE_TEXT("The communication's process is interrupted by the user")));
    EXPECT_EQ(rig.port.breaks, 1);
    EXPECT_EQ(rig.port.closes, 1);
    EXPECT_FALSE(protocol.IsPortOpen());
    EXPECT_EQ(rig.file.Text(), instrument.lines[0] + instrument.lines[1]);
    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_EQ(rig.file.creates, 1);
}

TEST_F(LineProtocolTest, StopRequestEndsWithoutAMessage) {
    instrument.lines = Transfer(10);
    instrument.Attach(rig.port);
    rig.callback.cancelWhen = [&] {
        if (rig.file.content.size() > 20)
            protocol.RequestStop();
        return false;
    };
    EXPECT_EQ(protocol.ReceiveLines(), 1u);
    EXPECT_TRUE(rig.callback.messages.empty());
    EXPECT_EQ(rig.port.closes, 0);
}

TEST_F(LineProtocolTest, BytesAfterALineAreDroppedByThePurge) {
    instrument.lines = Transfer(2);
    instrument.sendAs = [](size_t index, int, const std::string& line) {
        if (index == 1)
            return std::vector<std::string>{line, "stale"};
        return std::vector<std::string>{line};
    };
    // The stale bytes are already in the queue when the driver purges for the next line.
    instrument.Attach(rig.port);
    EXPECT_EQ(protocol.ReceiveLines(), 0u);
    EXPECT_EQ(rig.file.Text().find("stale"), std::string::npos);
}

}  // namespace
