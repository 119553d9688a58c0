// The line protocol through the port interface: acknowledgements, checks, repeats, time-outs.
#include <gtest/gtest.h>

#include "tests/portable/serial/fake_serial.h"

namespace {

const Bytes kAckLine = {0x06, ',', 'R', ',', 0x0D, 0x0A};
const Bytes kNakLine = {0x15, ',', '!', ',', 0x0D, 0x0A};
const WideString kWaitExpired = WIDE_TEXT("The waiting time of the data has expired.");

std::string DataLine(const std::string& body) {
    return body + static_cast<char>(LineCheckCharacter(BytesOf(body), body.size())) + ",\r\n";
}

std::string WithWrongCheck(std::string line) {
    line[line.size() - 4] ^= 0x01;  // the check character
    return line;
}

// The header, dataLines checked lines and the end line.
std::vector<std::string> Transfer(int dataLines) {
    std::vector<std::string> lines = {"A,01,Z\r\n"};
    for (int i = 1; i <= dataLines; ++i)
        lines.push_back(
            DataLine("B," + std::to_string(i) + ",1.2345" + std::to_string(i % 10) + ",45.210,"));
    lines.push_back("Z,&,\r\n");
    return lines;
}

// The first count lines, end to end.
std::string Joined(const std::vector<std::string>& lines, size_t count = SIZE_MAX) {
    std::string all;
    for (size_t i = 0; i < lines.size() && i < count; ++i)
        all += lines[i];
    return all;
}

// A line-protocol receive against an instrument that sends its lines one by one, the next on ACK
// (or on NAK too, when nakMovesOn), the same one again on NAK. sendAs may change what goes on the
// wire for (line index, attempt) and split it into chunks.
struct LineRun : ProtocolRun {
    explicit LineRun(std::vector<std::string> sent = {})
        : ProtocolRun(ReceiveProcedure::BccBlocks), lines(std::move(sent)) {}

    std::vector<std::string> lines;
    std::function<std::vector<std::string>(size_t index, int attempt, const std::string& line)>
        sendAs;
    bool nakMovesOn = false;
    size_t next = 0;
    int attempt = 0;

    void Send() {
        if (next >= lines.size())
            return;
        for (const auto& chunk :
             sendAs ? sendAs(next, attempt, lines[next]) : std::vector<std::string>{lines[next]})
            port.Deliver(chunk);
        ++attempt;
    }
    TransferResult Receive() {
        port.onWrite = [this](const Bytes& written, FakePort&) {
            if (written == kAckLine || (nakMovesOn && written == kNakLine)) {
                ++next;
                attempt = 0;
            }
            Send();
        };
        Send();
        return protocol.ReceiveLines();
    }
};

TEST(LineProtocol, ReceivesTheWholeTransferAcknowledgingEachLineWithProgressUpToHundred) {
    LineRun run(Transfer(40));
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.Text(), Joined(run.lines));
    EXPECT_EQ(run.port.writes, std::vector<Bytes>(42, kAckLine));
    EXPECT_FALSE(run.file.open);
    EXPECT_TRUE(run.callback.messages.empty());
    // 0 at the start, then 100 / 30 per accepted line up to the thirtieth.
    const auto& progress = run.callback.progress;
    ASSERT_EQ(progress.size(), 43u);
    const std::vector<std::pair<uint32_t, uint32_t>> start = {{100, 0}, {100, 3}, {100, 6}};
    EXPECT_EQ(std::vector(progress.begin(), progress.begin() + 3), start);
    EXPECT_EQ(progress[29].second, 96u);
    EXPECT_EQ(progress[30].second, 100u);
    EXPECT_EQ(progress.back().second, 100u);
}

TEST(LineProtocol, LinesSplitAtEveryBoundaryAreJoined) {
    const std::vector<std::string> lines = Transfer(1);
    for (size_t split = 1; split < lines[1].size(); ++split) {
        LineRun run(lines);
        run.sendAs = [split](size_t index, int, const std::string& line) {
            if (index != 1)
                return std::vector<std::string>{line};
            return std::vector<std::string>{line.substr(0, split), line.substr(split)};
        };
        ASSERT_EQ(run.Receive(), TransferResult::Complete) << "split at " << split;
        EXPECT_EQ(run.file.Text(), Joined(lines)) << "split at " << split;
    }
}

TEST(LineProtocol, AReplyThatMovesNoByteIsGivenUpAfterThreeSeconds) {
    LineRun run({Transfer(1).front()});  // the header, then nothing more
    run.port.refuseWrites = true;
    EXPECT_EQ(run.Receive(), TransferResult::Failed)
        << "the instrument never hears the ACK and goes silent";
    // Each refused write costs 100 ms: the reply stops at the first attempt past 3000 ms, and
    // the receive goes on to its own time-out instead of spinning on the dead line.
    EXPECT_EQ(31, run.port.refusedWrites);
    EXPECT_TRUE(run.port.writes.empty());
}

TEST(LineProtocol, WrongCheckCharacterIsRefusedNotWrittenAndTheResendAccepted) {
    LineRun run(Transfer(3));
    run.sendAs = [](size_t index, int attempt, const std::string& line) {
        return std::vector<std::string>{index == 2 && attempt == 0 ? WithWrongCheck(line) : line};
    };
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.Text(), Joined(run.lines));
    EXPECT_EQ(run.port.WritesOf(kNakLine), 1);
    EXPECT_EQ(run.port.WritesOf(kAckLine), 5);
}

TEST(LineProtocol, RefusedLinesDoNotPostponeTheTimeOut) {
    LineRun run(Transfer(3));
    run.sendAs = [](size_t index, int, const std::string& line) {
        return std::vector<std::string>{index == 2 ? WithWrongCheck(line) : line};
    };
    run.port.millisecondsPerWrite = 1000;  // the instrument thinks a second before each answer
    const int64_t start = run.clock.WallSeconds();
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_GT(run.clock.WallSeconds() - start, 60);
    EXPECT_LT(run.clock.WallSeconds() - start, 70);
    EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, kWaitExpired));
    EXPECT_EQ(run.file.Text(), Joined(run.lines, 2));
}

TEST(LineProtocol, RepeatedLineIsAcknowledgedTwiceButWrittenOnceUnlessNotAdjacent) {
    const std::string repeated = DataLine("B,7,1.11111,2.000,");
    const std::string other = DataLine("B,8,1.2,3.0,");
    LineRun run({"A,01,Z\r\n", repeated, repeated, other, repeated, "Z,&,\r\n"});
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.port.WritesOf(kAckLine), 6);
    EXPECT_EQ(run.file.Text(), "A,01,Z\r\n" + repeated + other + repeated + "Z,&,\r\n");
}

TEST(LineProtocol, EndLineIsWrittenWithoutTheLineCheck) {
    // The end line, with anything after "Z,&,", would fail the check.
    LineRun run({"A,01,Z\r\n", DataLine("B,1,0.5,"), "Z,&,~~garbage\r\n"});
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.Text(), Joined(run.lines));
}

TEST(LineProtocol, SixtyRefusalsBeforeTheHeaderAreToleratedAndTheSixtyFirstEndsSilently) {
    for (const int noise : {60, 61}) {
        const std::vector<std::string> transfer = Transfer(1);
        LineRun run(std::vector<std::string>(noise, "noise before the header\r\n"));
        run.lines.insert(run.lines.end(), transfer.begin(), transfer.end());
        run.nakMovesOn = true;  // each refused noise line is followed by the next line
        EXPECT_EQ(run.Receive(), noise == 60 ? TransferResult::Complete : TransferResult::Failed)
            << noise;
        EXPECT_EQ(run.port.WritesOf(kNakLine), noise);
        EXPECT_EQ(run.file.Text(), noise == 60 ? Joined(transfer) : "") << noise;
        EXPECT_TRUE(run.callback.messages.empty()) << noise;
        EXPECT_FALSE(run.file.open);
    }
}

TEST(LineProtocol, FullLineWithoutLineEndIsNeverAcceptedAndTimesOut) {
    LineRun run({"A,01,Z\r\n", std::string(128, 'X'), DataLine("B,1,2,")});
    // Keep streaming after the 128 bytes: the surplus must not overrun the line.
    run.port.onSilence = [](FakePort& port) { port.Queue(Bytes(200, 'Y')); };
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.file.Text(), "A,01,Z\r\n");
    EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, kWaitExpired));
}

TEST(LineProtocol, ClosedPortFailsAtOnceAndSilenceEndsAfterMoreThanSixtySeconds) {
    LineRun run;
    const int64_t start = run.clock.milliseconds;
    run.protocol.SetPortOpen(false);
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.protocol.Receive(), TransferResult::Failed) << "the block procedures too";
    EXPECT_EQ(run.file.creates, 0);
    EXPECT_EQ(run.clock.milliseconds, start) << "no read was tried";

    run.protocol.SetPortOpen(true);
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.clock.milliseconds / 1000 - start / 1000, 61);
    EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, kWaitExpired));
    EXPECT_EQ(run.port.closes, 0);
}

TEST(LineProtocol, CancelReportsClosesThePortAndLeavesTheDriverUnusable) {
    LineRun run(Transfer(10));
    run.callback.cancelWhen = [&] { return run.file.content.size() > 20; };
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.callback.messages,
              OnlyMessage(MessageCode::Error,
                          WIDE_TEXT("The communication's process is interrupted by the user")));
    EXPECT_EQ(run.port.breaks, 1);
    EXPECT_EQ(run.port.closes, 1);
    EXPECT_FALSE(run.protocol.IsPortOpen());
    EXPECT_EQ(run.file.Text(), Joined(run.lines, 2));
    EXPECT_EQ(run.protocol.ReceiveLines(), TransferResult::Failed);
    EXPECT_EQ(run.file.creates, 1);
}

TEST(LineProtocol, StopRequestEndsWithoutAMessage) {
    LineRun run(Transfer(10));
    run.callback.cancelWhen = [&] {
        if (run.file.content.size() > 20)
            run.protocol.RequestStop();
        return false;
    };
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_TRUE(run.callback.messages.empty());
    EXPECT_EQ(run.port.closes, 0);
}

// With the line time-outs a read may end anywhere: between CR and LF, or after bytes that
// followed the CR LF. A line is one line however its bytes were cut into reads, and what follows
// its CR LF in the same read is dropped as the purge drops what is still queued.
TEST(LineProtocol, LinesAreFramedByCrLfWhateverTheReadsCarry) {
    const std::vector<std::string> lines = Transfer(3);
    const struct {
        const char* what;
        std::function<std::vector<std::string>(const std::string&)> cut;
    } cases[] = {
        {"CR and LF in different reads",
         [](const std::string& line) {
             return std::vector<std::string>{line.substr(0, line.size() - 1), "\n"};
         }},
        {"every byte its own read",
         [](const std::string& line) {
             std::vector<std::string> bytes;
             for (const char byte : line)
                 bytes.push_back(std::string(1, byte));
             return bytes;
         }},
        {"the next line's first bytes in the read of the CR LF",
         [](const std::string& line) { return std::vector<std::string>{line + "B,9,"}; }},
    };
    for (const auto& test : cases) {
        SCOPED_TRACE(test.what);
        LineRun run(lines);
        run.sendAs = [&](size_t index, int, const std::string& line) {
            return index == 2 ? test.cut(line) : std::vector<std::string>{line};
        };
        EXPECT_EQ(run.Receive(), TransferResult::Complete);
        EXPECT_EQ(run.file.Text(), Joined(lines));
        EXPECT_EQ(run.port.writes, std::vector<Bytes>(lines.size(), kAckLine));
    }
}

TEST(LineProtocol, BytesAfterALineAreDroppedByThePurge) {
    LineRun run(Transfer(2));
    // The stale bytes are already in the queue when the driver purges for the next line.
    run.sendAs = [](size_t index, int, const std::string& line) {
        return index == 1 ? std::vector<std::string>{line, "stale"}
                          : std::vector<std::string>{line};
    };
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.file.Text().find("stale"), std::string::npos);
}

}  // namespace

// The disk refuses part of the file: the line that did not fit is never acknowledged, the
// system's text is shown once, and the receive fails there. Whether the disk runs out at the
// header, in the middle or at the end line, nothing after the refused line is asked for.
TEST(LineProtocol, ARefusedWriteFailsTheReceiveBeforeTheLineIsAcknowledged) {
    const std::vector<std::string> lines = Transfer(5);
    for (size_t full = 0; full < lines.size(); ++full) {
        SCOPED_TRACE(full);
        LineRun run(lines);
        // Room for the lines before `full` and part of that one.
        run.file.capacity = Joined(lines, full).size() + 3;
        EXPECT_EQ(run.Receive(), TransferResult::Failed);
        EXPECT_EQ(run.port.writes, std::vector<Bytes>(full, kAckLine))
            << "the refused line must not be acknowledged";
        EXPECT_EQ(run.callback.messages,
                  OnlyMessage(MessageCode::Error, WIDE_TEXT("System error 112")));
        EXPECT_EQ(run.protocol.FileError(), MemoryFile::kDiskFull);
        EXPECT_EQ(run.file.writeCalls, static_cast<int>(full) + 1) << "no write after the first";
        EXPECT_FALSE(run.file.open);
    }
}

TEST(LineProtocol, AFileThatFailsToCloseFailsTheReceiveBeforeTheEndLineIsAcknowledged) {
    LineRun run(Transfer(2));
    run.file.closeError = 1784;  // a delayed write that the disk refused at the flush
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_EQ(run.port.writes, std::vector<Bytes>(3, kAckLine)) << "the end line stays unanswered";
    EXPECT_EQ(run.callback.messages,
              OnlyMessage(MessageCode::Error, WIDE_TEXT("System error 1784")));
}

TEST(LineProtocol, AWriteFailureOfOneReceiveIsForgottenByTheNext) {
    LineRun run(Transfer(1));
    run.file.capacity = 4;
    ASSERT_EQ(run.Receive(), TransferResult::Failed);
    // The same driver receives again on a disk with room.
    run.file.capacity = SIZE_MAX;
    run.next = 0;
    run.attempt = 0;
    run.callback.messages.clear();
    EXPECT_EQ(run.Receive(), TransferResult::Complete);
    EXPECT_EQ(run.protocol.FileError(), kFileWritten);
    EXPECT_EQ(run.file.Text(), Joined(run.lines));
}

TEST(LineProtocol, AnOutputFileThatCannotBeCreatedIsReportedAndNothingIsAcknowledged) {
    LineRun run(Transfer(1));
    run.file.createError = 3;  // the temporary folder vanished
    EXPECT_EQ(run.Receive(), TransferResult::Failed);
    EXPECT_TRUE(run.port.writes.empty());
    EXPECT_EQ(run.callback.messages, OnlyMessage(MessageCode::Error, WIDE_TEXT("System error 3")));
    EXPECT_EQ(run.protocol.FileError(), 3u);
}
